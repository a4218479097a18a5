package android.media;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class AudioTrack {
  public static final int MODE_STATIC = 0;

  private AudioTrack() {}

  public int write(byte[] audioData, int offsetInBytes, int sizeInBytes) {
    throw new RuntimeException("Stub!");
  }

  public int setLoopPoints(int startInFrames, int endInFrames, int loopCount) {
    throw new RuntimeException("Stub!");
  }

  public int setVolume(float gain) {
    throw new RuntimeException("Stub!");
  }

  public void play() throws IllegalStateException {
    throw new RuntimeException("Stub!");
  }

  public void release() {
    throw new RuntimeException("Stub!");
  }

  /** Builds tracks. */
  public static class Builder {
    public Builder setAudioAttributes(AudioAttributes attributes) {
      throw new RuntimeException("Stub!");
    }

    public Builder setAudioFormat(AudioFormat format) {
      throw new RuntimeException("Stub!");
    }

    public Builder setTransferMode(int mode) {
      throw new RuntimeException("Stub!");
    }

    public Builder setBufferSizeInBytes(int bufferSizeInBytes) {
      throw new RuntimeException("Stub!");
    }

    public AudioTrack build() throws UnsupportedOperationException {
      throw new RuntimeException("Stub!");
    }
  }
}
