package com.velmar.android.orv.audiomodem;

import java.nio.ByteBuffer;

/**
 * JNI peer of libVesk's decoder entry points.
 *
 * <p>Decoders live in a process-wide table under integer ids that the caller chooses ({@code -1}
 * and any id from 0 up). Invalid parameters, an id that was never initialised beyond the table's
 * size, or a bad buffer region end the process inside the library, so prefer {@link
 * TokenDecoder}, which validates everything and manages ids.
 *
 * <p>Not thread-safe: the table has no lock. An initialisation or release must not overlap with
 * any other call.
 */
public final class NativeDecoder {
  static {
    VeskLibrary.load();
  }

  /** Builds a DSSS decoder under {@code id}, replacing any decoder there. Returns true. */
  public native boolean nativeInitializeDsss(
      int id,
      int tokenLengthBytes,
      boolean useChecksumSymbol,
      boolean designBasebandFilter,
      int numberOfTaps,
      int codeNumber,
      float sampleRate,
      int upsamplingFactor,
      float carrierFrequency,
      int bitsPerSymbol,
      int minCyclesPerFrame,
      int basebandDecimationFactor,
      boolean useQuadratureCarrier,
      float acquisitionWindowSeconds,
      float broadcasterThreshold,
      int maxTokensPerCall,
      float inputSampleRate,
      int numChannels,
      float bufferLengthTokens,
      boolean useZintar);

  /**
   * Builds a DTMF decoder under {@code id}. Returns false, keeping the id's previous decoder, when
   * the envelope times are rejected.
   */
  public native boolean nativeInitializeDtmf(
      int id,
      int bytesInToken,
      boolean appendChecksumSymbol,
      float sampleRate,
      int basebandDecimationFactor,
      float windowDuration,
      int tonesPerSymbol,
      int unused,
      int maxTokensPerCall,
      float inputSampleRate,
      int numChannels,
      float attackTime,
      float decayTime,
      float sustainTime,
      float releaseTime,
      float sustainAmplitude,
      float bufferLengthTokens,
      float[] toneFrequencies);

  /**
   * Feeds {@code lengthBytes} bytes of 16-bit little-endian interleaved PCM from a direct buffer,
   * starting {@code offsetBytes} into it (both even).
   */
  public native void nativeProcessSamples(
      int id, ByteBuffer buffer, int offsetBytes, int lengthBytes);

  /** As {@link #nativeProcessSamples}, for a decoder in the zintar listening mode. */
  public native void nativeProcessSamplesWithZintar(
      int id, ByteBuffer buffer, int offsetBytes, int lengthBytes);

  /** Calls {@code receiver.addToken(byte[])} once per token heard. */
  public native void nativeGetTokens(
      int id, Object receiver, int numMessageBytes, int numCrcCheckBytes);

  public native boolean nativeDetectBroadcaster(int id);

  public native void nativeWipeInternalData(int id);

  /** Bytes of PCM that the next call may carry without dropping history. */
  public native int nativeGetMaxSafeInputSize(int id);

  public native void nativeRelease(int id);
}
