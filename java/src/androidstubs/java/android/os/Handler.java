package android.os;

/** Stand-in for the Android SDK class of the same name: the signatures the guide uses. */
public class Handler {
  public Handler(Looper looper) {
    throw new RuntimeException("Stub!");
  }

  public final boolean post(Runnable r) {
    throw new RuntimeException("Stub!");
  }
}
