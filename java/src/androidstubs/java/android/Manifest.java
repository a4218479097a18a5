package android;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public final class Manifest {
  private Manifest() {}

  /** Permission names. */
  public static final class permission {
    public static final String RECORD_AUDIO = "android.permission.RECORD_AUDIO";

    private permission() {}
  }
}
