package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.List;
import java.util.Random;
import org.junit.jupiter.api.Test;

/** The DTMF modem through the real library. */
class DtmfTest {
  private static final byte[] MESSAGE = {0x11, 0x22, 0x33, 0x44, 0x55};

  static short[] transmission(DtmfConfig config, byte[] message, int channels, long seed) {
    short[] token;
    try (TokenEncoder encoder = TokenEncoder.create(config)) {
      token = EncodedToken.toSamples(encoder.encode(message).playback(3));
    }
    int lead = 3000;
    short[] out = new short[(lead + token.length + lead) * channels];
    Random random = new Random(seed);
    for (int i = 0; i < out.length / channels; i++) {
      int value = (int) (random.nextGaussian() * 200);
      if (i >= lead && i < lead + token.length) {
        value += token[i - lead] / 2;
      }
      for (int c = 0; c < channels; c++) {
        out[i * channels + c] = (short) value;
      }
    }
    return out;
  }

  @Test
  void productTokenRoundTrip() {
    DtmfConfig config = DtmfConfig.defaults();
    assertEquals(2208, config.frameSize());
    try (TokenEncoder encoder = TokenEncoder.create(config)) {
      EncodedToken token = encoder.encode(MESSAGE);
      assertEquals(0, token.startTransition().length); // DTMF has no start transition.
      assertEquals(10 * 2208, token.tokenAudio().length / 2); // Spacer, 8 symbols, checksum.
      assertEquals(44100f, token.sampleRate());
    }
    // The microphone runs at the modulation's rate here (the loopback tests in C++ cover
    // resampling from other microphone rates).
    for (float rate : new float[] {44100f, 48000f}) {
      DtmfConfig at = DtmfConfig.builder().sampleRate(rate).build();
      DecoderOptions options =
          DecoderOptions.builder().microphoneRate((int) rate).channels(2).build();
      try (TokenDecoder decoder = TokenDecoder.create(at, options)) {
        decoder.process(transmission(at, MESSAGE, 2, (long) rate));
        List<byte[]> tokens = decoder.tokens();
        assertFalse(tokens.isEmpty(), "microphone at " + rate + " Hz");
        assertArrayEquals(MESSAGE, tokens.get(0));
        assertFalse(decoder.broadcasterDetected()); // A DSSS notion only.
      }
    }
  }

  @Test
  void ownToneSetWithCrc() {
    DtmfConfig config =
        DtmfConfig.builder()
            .tones(new float[] {600, 900, 1300, 1800, 2400}, 3)
            .messageBytes(3)
            .crc(true)
            .build();
    try (TokenDecoder decoder = TokenDecoder.create(config, DecoderOptions.defaults())) {
      decoder.process(transmission(config, new byte[] {7, 8, 9}, 1, 3));
      List<byte[]> tokens = decoder.tokens();
      assertFalse(tokens.isEmpty());
      assertArrayEquals(new byte[] {7, 8, 9}, tokens.get(0));
    }
  }

  @Test
  void invalidConfigurationsAreRefusedInJava() {
    assertThrows(
        IllegalArgumentException.class,
        () -> DtmfConfig.builder().envelope(0.03f, 0.03f, 0f, 0f, 1f).build());
    assertThrows(
        IllegalArgumentException.class,
        () -> DtmfConfig.builder().tones(new float[] {500, 600, 22050}, 2).build());
    assertThrows(
        IllegalArgumentException.class,
        () -> DtmfConfig.builder().tones(new float[] {500, 600, 700, 800, 900, 1000}, 3).build());
    assertThrows(
        IllegalArgumentException.class,
        () -> DtmfConfig.builder().tones(new float[] {500, 600}, 1).build()); // 2 symbols.
    assertThrows(
        IllegalArgumentException.class,
        () ->
            TokenDecoder.create(
                DtmfConfig.defaults(),
                DecoderOptions.builder().microphoneRate(48000).listeningMode(true).build()));
    assertTrue(DtmfConfig.builder().envelope(0.025f, 0f, 0f, 0.025f, 1f).build() != null);
  }

  @Test
  void refusedEnvelopeKeepsThePreviousDecoderServing() {
    NativeDecoder peer = new NativeDecoder();
    assertTrue(
        peer.nativeInitializeDtmf(
            9, 5, true, 44100f, 16, 0.05f, 2, 0, 2, 44100f, 1, 0.025f, 0f, 0f, 0.025f, 1f, 4f,
            new float[0]));
    assertFalse(
        peer.nativeInitializeDtmf(
            9, 5, true, 44100f, 16, 0.05f, 2, 0, 2, 44100f, 1, 0.03f, 0.03f, 0f, 0f, 1f, 4f,
            new float[0]));
    short[] samples = transmission(DtmfConfig.defaults(), MESSAGE, 1, 9);
    java.nio.ByteBuffer buffer =
        java.nio.ByteBuffer.allocateDirect(2 * samples.length)
            .order(java.nio.ByteOrder.LITTLE_ENDIAN);
    buffer.asShortBuffer().put(samples);
    peer.nativeProcessSamples(9, buffer, 0, 2 * samples.length);
    List<byte[]> tokens = new java.util.ArrayList<>();
    peer.nativeGetTokens(9, (TokenReceiver) tokens::add, 5, 0);
    assertFalse(tokens.isEmpty());
    assertArrayEquals(MESSAGE, tokens.get(0));
    peer.nativeRelease(9);
  }
}
