package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.function.Supplier;
import org.junit.jupiter.api.Test;

/**
 * The builders and factories cut exactly where the library's configuration checks do: a value just
 * inside a limit builds, encodes, decodes and closes; one just beyond it is an {@link
 * IllegalArgumentException} that says why.
 */
class LimitsTest {
  private static final DecoderOptions MIC_48K =
      DecoderOptions.builder().microphoneRate(48000).build();

  /** Encodes a token, feeds up to a quarter second of it to a decoder, asks for tokens, closes. */
  private static void runs(DsssConfig config, DecoderOptions options) {
    EncodedToken token;
    try (TokenEncoder encoder = TokenEncoder.create(config)) {
      token = encoder.encode(new byte[config.messageBytes()]);
    }
    if (config.broadcastSampleRate() == config.coderSampleRate()) {
      // The token lasts as long as the limit on its duration assumes.
      assertEquals(config.tokenSeconds(), token.tokenSeconds(), 1e-9);
    }
    try (TokenDecoder decoder = TokenDecoder.create(config, options)) {
      feed(decoder, token, options);
      for (byte[] heard : decoder.tokens()) {
        assertEquals(config.messageBytes(), heard.length);
      }
    }
  }

  private static void runs(DtmfConfig config, DecoderOptions options) {
    EncodedToken token;
    try (TokenEncoder encoder = TokenEncoder.create(config)) {
      token = encoder.encode(new byte[config.messageBytes()]);
    }
    assertEquals(config.framesPerToken() * config.frameSize(), token.tokenAudio().length / 2);
    assertEquals(config.tokenSeconds(), token.tokenSeconds(), 1e-9);
    try (TokenDecoder decoder = TokenDecoder.create(config, options)) {
      feed(decoder, token, options);
      for (byte[] heard : decoder.tokens()) {
        assertEquals(config.messageBytes(), heard.length);
      }
    }
  }

  private static void feed(TokenDecoder decoder, EncodedToken token, DecoderOptions options) {
    short[] audio = EncodedToken.toSamples(token.tokenAudio());
    int frames = Math.min(audio.length, options.microphoneRate() / 4);
    short[] input = new short[frames * options.channels()];
    for (int i = 0; i < input.length; i++) {
      input[i] = audio[i / options.channels()];
    }
    decoder.process(input);
    assertTrue(decoder.maxSafeInputSamples() >= 0);
  }

  /** The builder's or factory's refusal, whose message must contain {@code why}. */
  private static void refused(String why, Supplier<?> build) {
    IllegalArgumentException e = assertThrows(IllegalArgumentException.class, build::get);
    assertTrue(e.getMessage().contains(why), e.getMessage());
  }

  @Test
  void dsssTokenLengthAndDuration() {
    DsssConfig.Builder longest = DsssConfig.builder().messageBytes(254); // 256 with the CRC.
    runs(longest.build(),
        DecoderOptions.builder().microphoneRate(48000).bufferLengthTokens(2).build());
    refused("messageBytes must be 1 to 254 with CRC, not 255",
        () -> DsssConfig.builder().messageBytes(255).build());
    refused("messageBytes must be 1 to 256, not 257",
        () -> DsssConfig.builder().crc(false).messageBytes(257).build());
    refused("not 0", () -> DsssConfig.builder().messageBytes(0).build());
    // 8000 Hz: 58 bytes are 117 frames of 2032 samples (29.7 s), 59 bytes 119 (30.2 s).
    DsssConfig.Builder slow =
        DsssConfig.builder().crc(false).coder(8000f, 16, 4).carrierFrequency(3000f);
    DsssConfig thirty = slow.messageBytes(58).broadcastSampleRate(8000).build();
    assertEquals(117 * 2032 / 8000.0, thirty.tokenSeconds(), 1e-12);
    runs(thirty, DecoderOptions.builder().microphoneRate(8000).bufferLengthTokens(2).build());
    refused("a token may last at most 30 s on air", () -> slow.messageBytes(59).build());
  }

  @Test
  void dsssRatesFrameAndTransition() {
    // Rates up to 384000 Hz; the carrier up to half the coder rate and below half the broadcast
    // rate.
    runs(DsssConfig.builder().coder(384000f, 16, 4).broadcastSampleRate(384000).build(),
        DecoderOptions.builder().microphoneRate(384000).build());
    refused("the coder sample rate must lie in (0, 384000] Hz",
        () -> DsssConfig.builder().coder(Math.nextUp(384000f), 16, 4).build());
    refused("broadcastSampleRate must be 1 to 384000 Hz, not 384001",
        () -> DsssConfig.builder().broadcastSampleRate(384001).build());
    runs(DsssConfig.builder()
             .coder(8000f, 16, 4)
             .carrierFrequency(4000f)
             .broadcastSampleRate(8001)
             .build(),
        DecoderOptions.builder().microphoneRate(8001).build());
    refused("must lie in (0, coder sample rate / 2]",
        ()
            -> DsssConfig.builder()
                   .coder(8000f, 16, 4)
                   .carrierFrequency(Math.nextUp(4000f))
                   .build());
    runs(DsssConfig.builder().broadcastSampleRate(37001).build(),
        DecoderOptions.builder().microphoneRate(37001).build());
    refused(
        "carrierFrequency (18500.0 Hz) must lie below half the broadcast sample rate (37000 Hz)",
        () -> DsssConfig.builder().broadcastSampleRate(37000).build());
    // Frames of at most 65536 coder samples: 2047 chips x 32.
    DsssConfig widest =
        DsssConfig.builder().code(11, 0).coder(48000f, 32, 8).messageBytes(2).build();
    assertEquals(65504, widest.frameSize());
    runs(widest, MIC_48K);
    refused("may hold at most 65536 samples",
        () -> DsssConfig.builder().code(11, 0).coder(48000f, 33, 3).build());
    runs(DsssConfig.builder().transitionSeconds(1f).build(), MIC_48K);
    refused("transitionSeconds must lie in [0, 1]",
        () -> DsssConfig.builder().transitionSeconds(Math.nextUp(1f)).build());
    refused("transitionSeconds", () -> DsssConfig.builder().transitionSeconds(Float.NaN).build());
  }

  @Test
  void shortestTokenMemoryOfTheSearchAndToneCount() {
    // The shortest token (5 taps, upsampling 1, one byte of 8 one-bit symbols and the sync: 279
    // samples at 48 kHz, 5.8 ms) leaves one sample at 173 Hz, none at 171 Hz.
    DsssConfig.Builder shortest = DsssConfig.builder()
                                      .code(5, 0)
                                      .coder(48000f, 1, 1)
                                      .bitsPerSymbol(1)
                                      .messageBytes(1)
                                      .crc(false)
                                      .carrierFrequency(10f);
    runs(shortest.broadcastSampleRate(173).build(), MIC_48K);
    refused("a token must last at least one sample at the broadcast rate",
        () -> shortest.broadcastSampleRate(171).build());
    // 11 taps at 48 kHz search 179 Doppler shifts (192 per history row): a 5 s acquisition window
    // keeps 65536 rows (48 MiB), 6 s keep 131072 (96 MiB, over the 64 MiB bound).
    DsssConfig longCode = DsssConfig.builder().code(11, 0).messageBytes(1).build();
    runs(longCode,
        DecoderOptions.builder().microphoneRate(48000).acquisitionWindowSeconds(5f).build());
    refused("would take more than 64 MiB",
        ()
            -> TokenDecoder.create(longCode,
                DecoderOptions.builder()
                    .microphoneRate(48000)
                    .acquisitionWindowSeconds(6f)
                    .build()));
    // At most 64 tones.
    float[] tones = new float[64];
    for (int i = 0; i < tones.length; i++) {
      tones[i] = 500f + 100f * i;
    }
    runs(DtmfConfig.builder().tones(tones, 2).build(), DecoderOptions.defaults());
    float[] tooMany = java.util.Arrays.copyOf(tones, 65);
    tooMany[64] = 9000f;
    refused("a tone set may have at most 64 tones",
        () -> DtmfConfig.builder().tones(tooMany, 2).build());
  }

  @Test
  void decoderOptionsAndHistory() {
    DsssConfig product = DsssConfig.defaults();
    runs(product, DecoderOptions.builder().microphoneRate(1000).channels(64).build());
    refused("microphoneRate must be 1000 to 384000 Hz, not 999",
        () -> DecoderOptions.builder().microphoneRate(999).build());
    refused("not 384001", () -> DecoderOptions.builder().microphoneRate(384001).build());
    refused(
        "channels must be 1 to 64, not 65", () -> DecoderOptions.builder().channels(65).build());
    runs(product,
        DecoderOptions.builder().acquisitionWindowSeconds(60f).maxTokensPerCall(6).build());
    runs(product, DecoderOptions.builder().acquisitionWindowSeconds(Float.MIN_VALUE).build());
    refused("acquisitionWindowSeconds must lie in (0, 60]",
        () -> DecoderOptions.builder().acquisitionWindowSeconds(Math.nextUp(60f)).build());
    refused("maxTokensPerCall must be 1 to 6, not 7",
        () -> DecoderOptions.builder().maxTokensPerCall(7).build());
    refused("bufferLengthTokens must lie in [1, 100]",
        () -> DecoderOptions.builder().bufferLengthTokens(Math.nextUp(100f)).build());
    refused("bufferLengthTokens", () -> DecoderOptions.builder().bufferLengthTokens(0.99f).build());
    // A coder of 2159 Hz makes the product token last 17 x 2032 / 2159 = 16 s exactly: 3.75 of
    // them are the longest history, 60 s.
    DsssConfig sixteen = DsssConfig.builder()
                             .coder(2159f, 16, 4)
                             .carrierFrequency(1000f)
                             .broadcastSampleRate(2159)
                             .build();
    assertEquals(16.0, sixteen.tokenSeconds());
    DecoderOptions.Builder mic = DecoderOptions.builder().microphoneRate(2159);
    runs(sixteen, mic.bufferLengthTokens(3.75f).build());
    DecoderOptions beyond = mic.bufferLengthTokens(Math.nextUp(3.75f)).build();
    refused("the history (bufferLengthTokens x 16.0 s per token) may last at most 60 s",
        () -> TokenDecoder.create(sixteen, beyond));
  }

  @Test
  void dtmfDefaultTonesNeedTwiceTheirHighestRate() {
    // The example: 4000 Hz cannot carry the default set, which reaches 2489 Hz.
    refused("the default tone set reaches 2489.0535 Hz",
        () -> DtmfConfig.builder().sampleRate(4000f).build());
    float lowest = Math.nextUp(2 * Limits.MAX_DEFAULT_DTMF_TONE);
    refused("the default tone set",
        () -> DtmfConfig.builder().sampleRate(Math.nextDown(lowest)).build());
    runs(DtmfConfig.builder().sampleRate(lowest).build(),
        DecoderOptions.builder().microphoneRate(4979).build());
    // The table mirrored in Java is the library's own: spelled out, it sounds the same.
    byte[] message = {1, 2, 3, 4, 5};
    DtmfConfig spelled = DtmfConfig.builder().tones(Limits.DEFAULT_DTMF_TONES, 2).build();
    byte[] defaultAudio;
    byte[] spelledAudio;
    try (TokenEncoder encoder = TokenEncoder.create(DtmfConfig.defaults())) {
      defaultAudio = encoder.encode(message).tokenAudio();
    }
    try (TokenEncoder encoder = TokenEncoder.create(spelled)) {
      spelledAudio = encoder.encode(message).tokenAudio();
    }
    assertArrayEquals(defaultAudio, spelledAudio);
  }

  @Test
  void dtmfRatesTonesAndFrames() {
    float[] low = {50f, 100f, 150f};
    runs(DtmfConfig.builder().sampleRate(384000f).build(),
        DecoderOptions.builder().microphoneRate(384000).build());
    refused("sampleRate must lie in (0, 384000] Hz",
        () -> DtmfConfig.builder().sampleRate(Math.nextUp(384000f)).build());
    runs(DtmfConfig.builder().tones(new float[] {600f, 900f, Math.nextDown(22050f)}, 1).build(),
        DecoderOptions.defaults());
    refused("every tone must lie in [0, sampleRate / 2): not 22050.0 Hz at 44100.0 Hz",
        () -> DtmfConfig.builder().tones(new float[] {600f, 900f, 22050f}, 1).build());
    // The microphone within a factor 1000 of the modulation: 384000 Hz hears 384 Hz, not less.
    DecoderOptions fastest = DecoderOptions.builder().microphoneRate(384000).build();
    runs(DtmfConfig.builder().sampleRate(384f).tones(low, 1).build(), fastest);
    DtmfConfig slower = DtmfConfig.builder().sampleRate(Math.nextDown(384f)).tones(low, 1).build();
    refused("within a factor 1000", () -> TokenDecoder.create(slower, fastest));
    // A window of half a decimated sample rounds up to one (2^-11 s x 16384 Hz / 16 = 0.5): the
    // shortest frame; just below it rounds to none.
    float half = 1f / 2048;
    DtmfConfig.Builder shortest =
        DtmfConfig.builder().sampleRate(16384f).envelope(0f, 0f, 0f, 0f, 1f);
    DtmfConfig one = shortest.windowSeconds(half).build();
    assertEquals(16, one.frameSize());
    runs(one, DecoderOptions.builder().microphoneRate(16384).build());
    refused("the window must round to between one decimated sample and 2^31 samples",
        () -> shortest.windowSeconds(Math.nextDown(half)).build());
    refused("the window must round",
        ()
            -> DtmfConfig.builder()
                   .sampleRate(384000f)
                   .basebandDecimationFactor(1)
                   .windowSeconds(1e4f)
                   .build());
  }

  @Test
  void dtmfEnvelopeAndDuration() {
    // The envelope may exceed the window by the library's tolerance of four float ulps.
    float most = 0.05f * Limits.ENVELOPE_TOLERANCE;
    runs(DtmfConfig.builder().envelope(most, 0f, 0f, 0f, 0.5f).build(), DecoderOptions.defaults());
    refused("the envelope times add up to more than the window",
        () -> DtmfConfig.builder().envelope(Math.nextUp(most), 0f, 0f, 0f, 0.5f).build());
    refused("the sustain level must lie in [0, 1]",
        () -> DtmfConfig.builder().envelope(0f, 0f, 0f, 0f, Math.nextUp(1f)).build());
    // 0.1 s symbols (decimation 10: 4410 samples): 203 bytes are 298 digits of base 44, plus the
    // spacer and the checksum 300 frames, 30 s exactly, which is allowed; 204 bytes need 299
    // digits.
    DtmfConfig.Builder tenth =
        DtmfConfig.builder().windowSeconds(0.1f).basebandDecimationFactor(10);
    DtmfConfig thirty = tenth.messageBytes(203).build();
    assertEquals(4410, thirty.frameSize());
    assertEquals(300, thirty.framesPerToken());
    assertEquals(30.0, thirty.tokenSeconds());
    DecoderOptions.Builder mic = DecoderOptions.builder();
    runs(thirty, mic.bufferLengthTokens(2f).build());
    DecoderOptions beyond = mic.bufferLengthTokens(Math.nextUp(2f)).build();
    refused("may last at most 60 s", () -> TokenDecoder.create(thirty, beyond));
    refused(
        "a token may last at most 30 s on air, not 30.1 s", () -> tenth.messageBytes(204).build());
  }

  @Test
  void listeningModeRates() {
    refused("the listening mode needs a microphone rate of at least 36994 Hz, not 36993",
        () -> DecoderOptions.builder().listeningMode(true).microphoneRate(36993).build());
    refused("the listening mode hears DSSS transmitters only",
        ()
            -> TokenDecoder.create(DtmfConfig.defaults(),
                DecoderOptions.builder().listeningMode(true).microphoneRate(48000).build()));
    // Both ends run; the top one used to overflow natively (rate x 2032 beyond 2^31).
    for (int rate : new int[] {36994, 384000}) {
      DecoderOptions options =
          DecoderOptions.builder().listeningMode(true).microphoneRate(rate).build();
      runs(DsssConfig.defaults(), options);
    }
  }

  @Test
  void decodedLengthsMatchTheLimitArithmetic() {
    // Independent of the builders: 6 + 2 bytes of 4 bits are 16 symbols, with sync 17 frames of
    // 127 chips x 16 samples.
    DsssConfig product = DsssConfig.defaults();
    assertEquals(17, product.framesPerToken());
    assertEquals(17 * 127 * 16 / 48000.0, product.tokenSeconds(), 1e-12);
    // 5 bytes are below 44^8: 8 digits, the spacer and the checksum.
    DtmfConfig dtmf = DtmfConfig.defaults();
    assertEquals(10, dtmf.framesPerToken());
    assertEquals(10 * 2208 / 44100.0, dtmf.tokenSeconds(), 1e-12);
  }
}
