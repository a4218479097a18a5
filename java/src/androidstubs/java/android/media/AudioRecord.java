package android.media;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class AudioRecord {
  public static final int STATE_INITIALIZED = 1;

  public AudioRecord(int audioSource, int sampleRateInHz, int channelConfig, int audioFormat,
      int bufferSizeInBytes) throws IllegalArgumentException {
    throw new RuntimeException("Stub!");
  }

  public static int getMinBufferSize(int sampleRateInHz, int channelConfig, int audioFormat) {
    throw new RuntimeException("Stub!");
  }

  public int getState() {
    throw new RuntimeException("Stub!");
  }

  public int getAudioSessionId() {
    throw new RuntimeException("Stub!");
  }

  public void startRecording() throws IllegalStateException {
    throw new RuntimeException("Stub!");
  }

  public void release() {
    throw new RuntimeException("Stub!");
  }

  public int read(short[] audioData, int offsetInShorts, int sizeInShorts) {
    throw new RuntimeException("Stub!");
  }
}
