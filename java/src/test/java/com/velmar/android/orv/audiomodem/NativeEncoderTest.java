package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.ArrayList;
import java.util.List;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;

/** The raw peer's contract, through the real library. */
class NativeEncoderTest {
  private final NativeEncoder encoder = new NativeEncoder();
  private final Recorder recorder = new Recorder();

  static final class Recorder implements EncodeResultReceiver {
    final List<byte[][]> calls = new ArrayList<>();
    final List<Float> rates = new ArrayList<>();

    @Override
    public void setEncodeResults(byte[] startTransition, byte[] tokenAudio, float sampleRate) {
      calls.add(new byte[][] {startTransition, tokenAudio});
      rates.add(sampleRate);
    }
  }

  private void initialize(int tokenLengthBytes) {
    assertTrue(
        encoder.nativeInitializeDsss(
            tokenLengthBytes, false, false, 7, 0, 48000f, 16, 18500f, 4, 4, 4, false, 48000,
            0.005f));
  }

  @AfterEach
  void release() {
    encoder.nativeRelease();
  }

  @Test
  void encodesProductTokenWithTransition() {
    initialize(8);
    encoder.nativeEncode(new byte[] {1, 2, 3, 4, 5, 6}, recorder, 2);
    assertEquals(1, recorder.calls.size());
    assertEquals(240 * 2, recorder.calls.get(0)[0].length);
    assertEquals(17 * 2032 * 2, recorder.calls.get(0)[1].length);
    assertEquals(48000f, recorder.rates.get(0));
    // Peak amplitude 0.5 of full scale.
    int peak = 0;
    for (short s : EncodedToken.toSamples(recorder.calls.get(0)[1])) {
      peak = Math.max(peak, Math.abs(s));
    }
    assertEquals(16384, peak);
  }

  @Test
  void emptyTokenGivesNoCallback() {
    initialize(8);
    encoder.nativeEncode(new byte[0], recorder, 2);
    assertTrue(recorder.calls.isEmpty());
  }

  @Test
  void wrongSizeGivesEmptyArrays() {
    initialize(8);
    encoder.nativeEncode(new byte[] {1, 2, 3}, recorder, 2);
    assertEquals(1, recorder.calls.size());
    assertEquals(0, recorder.calls.get(0)[0].length);
    assertEquals(0, recorder.calls.get(0)[1].length);
  }

  @Test
  void secondInitializationServes() {
    initialize(8);
    initialize(4);
    encoder.nativeEncode(new byte[] {1, 2, 3, 4, 5, 6}, recorder, 2); // 8 bytes: refused now.
    encoder.nativeEncode(new byte[] {1, 2}, recorder, 2); // 4 bytes: accepted.
    assertEquals(2, recorder.calls.size());
    assertEquals(0, recorder.calls.get(0)[1].length);
    assertEquals(9 * 2032 * 2, recorder.calls.get(1)[1].length);
  }

  @Test
  void receiverWithoutCallbackIsIgnored() {
    initialize(8);
    encoder.nativeEncode(new byte[] {1, 2, 3, 4, 5, 6}, new Object(), 2);
    encoder.nativeEncode(new byte[] {1, 2, 3, 4, 5, 6}, recorder, 2); // Still usable.
    assertEquals(1, recorder.calls.size());
  }
}
