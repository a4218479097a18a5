package android.content;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public abstract class Context {
  public static final String AUDIO_SERVICE = "audio";

  public abstract Object getSystemService(String name);

  public abstract int checkSelfPermission(String permission);
}
