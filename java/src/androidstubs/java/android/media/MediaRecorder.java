package android.media;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class MediaRecorder {
  /** Audio sources of AudioRecord. */
  public static final class AudioSource {
    public static final int VOICE_RECOGNITION = 6;
    public static final int UNPROCESSED = 9;

    private AudioSource() {}
  }
}
