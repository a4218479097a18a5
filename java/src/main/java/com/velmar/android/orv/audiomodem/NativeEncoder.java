package com.velmar.android.orv.audiomodem;

/**
 * JNI peer of libVesk's encoder entry points.
 *
 * <p>The library holds at most one encoder per process: each successful initialisation replaces
 * the previous encoder, whichever {@code NativeEncoder} instance made it, and {@link
 * #nativeRelease} frees it. Invalid parameters end the process inside the library, so prefer
 * {@link TokenEncoder}, which validates them and owns the encoder's lifetime.
 *
 * <p>Not thread-safe: call from one thread at a time.
 */
public final class NativeEncoder {
  static {
    VeskLibrary.load();
  }

  /**
   * Builds a DSSS encoder. Returns true. Symbols per token are {@code (8 / bitsPerSymbol) x
   * tokenLengthBytes}.
   */
  public native boolean nativeInitializeDsss(
      int tokenLengthBytes,
      boolean appendChecksumSymbol,
      boolean singleSideband,
      int numberOfTaps,
      int codeNumber,
      float sampleRate,
      int upsamplingFactor,
      float carrierFrequency,
      int bitsPerSymbol,
      int minCyclesPerFrame,
      int basebandDecimationFactor,
      boolean useQuadratureCarrier,
      int broadcastSampleRate,
      float transitionDuration);

  /**
   * Builds a DTMF encoder. Returns false, keeping the previous encoder, when the envelope times
   * are rejected.
   */
  public native boolean nativeInitializeDtmf(
      int bytesInToken,
      boolean appendChecksumSymbol,
      float sampleRate,
      int basebandDecimationFactor,
      float windowDuration,
      int tonesPerSymbol,
      float attackTime,
      float decayTime,
      float sustainTime,
      float releaseTime,
      float sustainAmplitude,
      float[] toneFrequencies);

  /**
   * Encodes {@code token} (message bytes; {@code numCrcCheckBytes} CRC bytes, 0 or 2, are
   * appended) and calls {@code resultReceiver.setEncodeResults(byte[], byte[], float)}. An empty
   * token produces no callback; a refused token produces a callback with empty arrays.
   */
  public native void nativeEncode(byte[] token, Object resultReceiver, int numCrcCheckBytes);

  /** Frees the process's encoder, if any. */
  public native void nativeRelease();
}
