package com.velmar.android.orv.audiomodem;

/**
 * Argument checks shared by the configuration builders and the stream, so that a bad value is an
 * exception in Java rather than an abort inside the native library.
 */
final class Checks {
  private Checks() {}

  /** Throws {@link IllegalArgumentException} with {@code message} unless {@code condition}. */
  static void require(boolean condition, String message) {
    if (!condition) {
      throw new IllegalArgumentException(message);
    }
  }
}
