package android.media;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public final class AudioFormat {
  public static final int ENCODING_PCM_16BIT = 2;
  public static final int CHANNEL_IN_MONO = 16;
  public static final int CHANNEL_OUT_MONO = 4;

  private AudioFormat() {}

  /** Builds formats. */
  public static class Builder {
    public Builder setSampleRate(int sampleRate) {
      throw new RuntimeException("Stub!");
    }

    public Builder setChannelMask(int channelMask) {
      throw new RuntimeException("Stub!");
    }

    public Builder setEncoding(int encoding) {
      throw new RuntimeException("Stub!");
    }

    public AudioFormat build() {
      throw new RuntimeException("Stub!");
    }
  }
}
