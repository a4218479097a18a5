package com.velmar.android.orv.audiomodem;

/** Loads libVesk.so once per process. */
final class VeskLibrary {
  private static boolean loaded;

  private VeskLibrary() {}

  static synchronized void load() {
    if (!loaded) {
      System.loadLibrary("Vesk");
      loaded = true;
    }
  }
}
