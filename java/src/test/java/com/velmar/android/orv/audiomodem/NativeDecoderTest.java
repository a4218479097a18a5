package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.ArrayList;
import java.util.List;
import org.junit.jupiter.api.Test;

/** The raw peer's contract, through the real library. */
class NativeDecoderTest {
  private static final byte[] MESSAGE = {1, 2, 3, 4, 5, 6};
  private final NativeDecoder decoder = new NativeDecoder();

  private void initialize(int id, float microphoneRate) {
    assertTrue(
        decoder.nativeInitializeDsss(
            id, 8, false, false, 7, 0, 48000f, 16, 18500f, 4, 4, 4, false, 0.75f, 5f, 2,
            microphoneRate, 1, 4f, false));
  }

  private static ByteBuffer direct(short[] samples) {
    ByteBuffer buffer = ByteBuffer.allocateDirect(2 * samples.length).order(ByteOrder.LITTLE_ENDIAN);
    buffer.asShortBuffer().put(samples);
    return buffer;
  }

  @Test
  void extraSlotDecodesThroughCallbacksWithAndWithoutCrc() {
    initialize(-1, 48000f);
    short[] samples = TokenDecoderTest.transmission(DsssConfig.defaults(), MESSAGE, 1, 4);
    ByteBuffer buffer = direct(samples);
    // Chunks of 4096 bytes, as an app's recording loop delivers them.
    for (int offset = 0; offset < 2 * samples.length; offset += 4096) {
      decoder.nativeProcessSamples(-1, buffer, offset, Math.min(4096, 2 * samples.length - offset));
    }
    assertTrue(decoder.nativeDetectBroadcaster(-1));
    List<byte[]> verified = new ArrayList<>();
    decoder.nativeGetTokens(-1, (TokenReceiver) verified::add, 6, 2);
    assertFalse(verified.isEmpty());
    assertArrayEquals(MESSAGE, verified.get(0));
    // Without CRC checking the whole 8-byte token comes back.
    List<byte[]> raw = new ArrayList<>();
    decoder.nativeGetTokens(-1, (TokenReceiver) raw::add, 8, 0);
    assertEquals(8, raw.get(0).length);
    // A wrong geometry, or a receiver without addToken, delivers nothing.
    List<byte[]> none = new ArrayList<>();
    decoder.nativeGetTokens(-1, (TokenReceiver) none::add, 7, 0);
    decoder.nativeGetTokens(-1, new Object(), 6, 2);
    assertTrue(none.isEmpty());
    decoder.nativeRelease(-1);
    decoder.nativeRelease(-1);
  }

  @Test
  void reinitialisingStartsEmpty() {
    initialize(5, 48000f);
    short[] samples = TokenDecoderTest.transmission(DsssConfig.defaults(), MESSAGE, 1, 5);
    decoder.nativeProcessSamples(5, direct(samples), 0, 2 * samples.length);
    int safeBefore = decoder.nativeGetMaxSafeInputSize(5);
    initialize(5, 48000f);
    List<byte[]> tokens = new ArrayList<>();
    decoder.nativeGetTokens(5, (TokenReceiver) tokens::add, 6, 2);
    assertTrue(tokens.isEmpty());
    assertTrue(decoder.nativeGetMaxSafeInputSize(5) > safeBefore);
    assertEquals(0, decoder.nativeGetMaxSafeInputSize(5) % 2);
    decoder.nativeWipeInternalData(5);
    decoder.nativeProcessSamplesWithZintar(5, direct(new short[64]), 0, 128); // Ignored.
    decoder.nativeRelease(5);
  }

  @Test
  void dtmfInitialisationFailsSoftly() {
    assertFalse(
        decoder.nativeInitializeDtmf(
            0, 5, true, 44100f, 16, 0.05f, 2, 0, 2, 44100f, 1, 0.03f, 0.03f, 0f, 0f, 0.5f, 4f,
            new float[0]));
  }
}
