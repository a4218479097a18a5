package android.os;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public final class Looper {
  private Looper() {}

  public static Looper getMainLooper() {
    throw new RuntimeException("Stub!");
  }
}
