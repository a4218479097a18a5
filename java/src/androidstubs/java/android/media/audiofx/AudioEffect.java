package android.media.audiofx;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class AudioEffect {
  AudioEffect() {}

  public int setEnabled(boolean enabled) throws IllegalStateException {
    throw new RuntimeException("Stub!");
  }

  public void release() {
    throw new RuntimeException("Stub!");
  }
}
