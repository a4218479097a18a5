package android.os;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class Process {
  public static final int THREAD_PRIORITY_URGENT_AUDIO = -19;

  public static final void setThreadPriority(int priority)
      throws IllegalArgumentException, SecurityException {
    throw new RuntimeException("Stub!");
  }
}
