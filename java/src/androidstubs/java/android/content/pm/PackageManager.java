package android.content.pm;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public abstract class PackageManager {
  public static final int PERMISSION_GRANTED = 0;
}
