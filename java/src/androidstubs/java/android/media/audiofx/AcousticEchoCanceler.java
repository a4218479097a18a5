package android.media.audiofx;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class AcousticEchoCanceler extends AudioEffect {
  private AcousticEchoCanceler() {}

  public static boolean isAvailable() {
    throw new RuntimeException("Stub!");
  }

  public static AcousticEchoCanceler create(int audioSession) {
    throw new RuntimeException("Stub!");
  }
}
