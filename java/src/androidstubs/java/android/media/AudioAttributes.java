package android.media;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public final class AudioAttributes {
  public static final int USAGE_MEDIA = 1;
  public static final int CONTENT_TYPE_SONIFICATION = 4;

  private AudioAttributes() {}

  /** Builds attributes. */
  public static class Builder {
    public Builder setUsage(int usage) {
      throw new RuntimeException("Stub!");
    }

    public Builder setContentType(int contentType) {
      throw new RuntimeException("Stub!");
    }

    public AudioAttributes build() {
      throw new RuntimeException("Stub!");
    }
  }
}
