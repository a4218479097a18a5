package android.media.audiofx;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class AutomaticGainControl extends AudioEffect {
  private AutomaticGainControl() {}

  public static boolean isAvailable() {
    throw new RuntimeException("Stub!");
  }

  public static AutomaticGainControl create(int audioSession) {
    throw new RuntimeException("Stub!");
  }
}
