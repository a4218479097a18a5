package android.util;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public final class Log {
  private Log() {}

  public static int e(String tag, String msg, Throwable tr) {
    throw new RuntimeException("Stub!");
  }
}
