package android.media.audiofx;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class NoiseSuppressor extends AudioEffect {
  private NoiseSuppressor() {}

  public static boolean isAvailable() {
    throw new RuntimeException("Stub!");
  }

  public static NoiseSuppressor create(int audioSession) {
    throw new RuntimeException("Stub!");
  }
}
