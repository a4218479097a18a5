package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNotEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.List;
import java.util.Random;
import org.junit.jupiter.api.Test;

/** Loopbacks through the real library: encoder audio straight into a decoder. */
class TokenDecoderTest {
  private static final byte[] MESSAGE = {0x0A, 0x1B, 0x2C, 0x3D, 0x4E, 0x5F};

  /** Silence, the start transition, the token three times, silence; optional quiet noise. */
  static short[] transmission(DsssConfig config, byte[] message, int channels, long seed) {
    byte[] pcm;
    try (TokenEncoder encoder = TokenEncoder.create(config)) {
      pcm = encoder.encode(message).playback(3);
    }
    short[] token = EncodedToken.toSamples(pcm);
    int lead = 4800;
    short[] out = new short[(lead + token.length + lead) * channels];
    Random random = new Random(seed);
    for (int i = 0; i < out.length / channels; i++) {
      int value = (int) (random.nextGaussian() * 100);
      if (i >= lead && i < lead + token.length) {
        value += token[i - lead];
      }
      for (int c = 0; c < channels; c++) {
        out[i * channels + c] = (short) Math.max(-32768, Math.min(32767, value));
      }
    }
    return out;
  }

  @Test
  void decodesTheProductToken() {
    DsssConfig config = DsssConfig.defaults();
    DecoderOptions options = DecoderOptions.builder().microphoneRate(48000).build();
    try (TokenDecoder decoder = TokenDecoder.create(config, options)) {
      decoder.process(transmission(config, MESSAGE, 1, 1));
      assertTrue(decoder.broadcasterDetected());
      List<byte[]> tokens = decoder.tokens();
      assertFalse(tokens.isEmpty());
      for (byte[] token : tokens) {
        assertArrayEquals(MESSAGE, token);
      }
      decoder.wipe();
      assertTrue(decoder.tokens().isEmpty());
    }
  }

  @Test
  void decodesStereoFromADirectBuffer() {
    DsssConfig config = DsssConfig.builder().coder44100().build();
    DecoderOptions options = DecoderOptions.builder().microphoneRate(48000).channels(2).build();
    short[] samples = transmission(config, MESSAGE, 2, 2);
    ByteBuffer direct = ByteBuffer.allocateDirect(2 * samples.length + 6);
    direct.order(ByteOrder.LITTLE_ENDIAN);
    direct.position(2);
    direct.asShortBuffer().put(samples);
    try (TokenDecoder decoder = TokenDecoder.create(config, options)) {
      decoder.process(direct, 4, 2 * samples.length);
      List<byte[]> tokens = decoder.tokens();
      assertFalse(tokens.isEmpty());
      assertArrayEquals(MESSAGE, tokens.get(0));
      assertThrows(IllegalArgumentException.class, () -> decoder.process(direct, 1, 4));
      assertThrows(IllegalArgumentException.class, () -> decoder.process(direct, 0, 6));
      assertThrows(
          IllegalArgumentException.class, () -> decoder.process(ByteBuffer.allocate(8), 0, 4));
    }
  }

  @Test
  void listeningModeWakesOnTheProductToken() {
    DsssConfig config = DsssConfig.defaults();
    DecoderOptions options =
        DecoderOptions.builder().microphoneRate(48000).channels(2).listeningMode(true).build();
    try (TokenDecoder decoder = TokenDecoder.create(config, options)) {
      short[] quiet = new short[2 * 48000];
      decoder.process(quiet);
      assertTrue(decoder.tokens().isEmpty());
      assertFalse(decoder.broadcasterDetected()); // Still listening: nothing woke it.
      decoder.process(transmission(config, MESSAGE, 2, 6));
      List<byte[]> tokens = decoder.tokens();
      assertFalse(tokens.isEmpty());
      assertArrayEquals(MESSAGE, tokens.get(0));
    }
  }

  @Test
  void noiseGivesNoToken() {
    try (TokenDecoder decoder =
        TokenDecoder.create(DsssConfig.defaults(), DecoderOptions.defaults())) {
      Random random = new Random(3);
      short[] noise = new short[44100 * 3];
      for (int i = 0; i < noise.length; i++) {
        noise[i] = (short) (random.nextGaussian() * 3000);
      }
      decoder.process(noise);
      assertTrue(decoder.tokens().isEmpty());
      assertFalse(decoder.broadcasterDetected());
      assertTrue(decoder.maxSafeInputSamples() > 0);
    }
  }

  @Test
  void idsAreReusedAndClosedDecodersRefuseWork() {
    TokenDecoder first = TokenDecoder.create(DsssConfig.defaults(), DecoderOptions.defaults());
    TokenDecoder second = TokenDecoder.create(DsssConfig.defaults(), DecoderOptions.defaults());
    first.close();
    first.close();
    assertThrows(IllegalStateException.class, first::tokens);
    assertThrows(IllegalStateException.class, () -> first.process(new short[4]));
    // The second keeps working after the first's id is released and reused.
    try (TokenDecoder third =
        TokenDecoder.create(DsssConfig.defaults(), DecoderOptions.defaults())) {
      second.process(new short[1000]);
      third.process(new short[1000]);
      assertTrue(second.tokens().isEmpty());
    }
    second.close();
  }

  @Test
  void optionsAreValidatedInJava() {
    assertThrows(
        IllegalArgumentException.class,
        () -> DecoderOptions.builder().listeningMode(true).microphoneRate(32000).build());
    assertThrows(
        IllegalArgumentException.class, () -> DecoderOptions.builder().maxTokensPerCall(7).build());
    assertThrows(IllegalArgumentException.class, () -> DecoderOptions.builder().channels(0).build());
    assertNotEquals(
        0, DecoderOptions.builder().listeningMode(true).microphoneRate(48000).build().channels());
    assertEquals(44100, DecoderOptions.defaults().microphoneRate());
  }
}
