package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Random;
import org.junit.jupiter.api.Test;

/** The token stream over real decoders: encoder audio, silence and quiet noise as microphone. */
class TokenStreamTest {
  private static final int RATE = 48000;
  private static final byte[] FIRST = {0x0A, 0x1B, 0x2C, 0x3D, 0x4E, 0x5F};
  private static final byte[] SECOND = {0x61, 0x72, (byte) 0x83, (byte) 0x94, 0x05, 0x16};
  private static final DsssConfig DSSS = DsssConfig.defaults();
  private static final DecoderOptions MONO = DecoderOptions.builder().microphoneRate(RATE).build();

  /** Microphone input, mono at RATE: silence and played audio, under seeded quiet noise. */
  static final class Recording {
    private short[] samples = new short[0];

    Recording silence(double seconds) {
      samples = Arrays.copyOf(samples, samples.length + (int) Math.round(seconds * RATE));
      return this;
    }

    Recording play(short[] audio) {
      int start = samples.length;
      samples = Arrays.copyOf(samples, start + audio.length);
      System.arraycopy(audio, 0, samples, start, audio.length);
      return this;
    }

    /** Stream time at which what is played next starts, seconds. */
    double seconds() {
      return samples.length / (double) RATE;
    }

    short[] samples(int channels) {
      Random noise = new Random(samples.length);
      short[] out = new short[samples.length * channels];
      for (int i = 0; i < samples.length; i++) {
        int value = samples[i] + (int) (noise.nextGaussian() * 100);
        Arrays.fill(out, i * channels, (i + 1) * channels, (short) value);
      }
      return out;
    }
  }

  /** {@code message} encoded with the DSSS product configuration. */
  static EncodedToken dsssToken(byte[] message) {
    try (TokenEncoder encoder = TokenEncoder.create(DSSS)) {
      return encoder.encode(message);
    }
  }

  /** The start transition, then the token three times. */
  static short[] threeTimes(EncodedToken token) {
    return EncodedToken.toSamples(token.playback(3));
  }

  /** Everything a listener heard, in order. */
  static class Heard implements TokenListener {
    final List<Token> tokens = new ArrayList<>();
    final List<Boolean> broadcaster = new ArrayList<>();

    @Override
    public void onToken(Token token) {
      tokens.add(token);
    }

    @Override
    public void onBroadcaster(boolean heard) {
      broadcaster.add(heard);
    }
  }

  /** Feeds {@code input} in calls of {@code chunk} samples, as a recording loop would. */
  static void feed(TokenStream stream, short[] input, int chunk) {
    short[] buffer = new short[chunk];
    for (int start = 0; start < input.length; start += chunk) {
      int count = Math.min(chunk, input.length - start);
      System.arraycopy(input, start, buffer, 0, count);
      stream.feed(buffer, count);
    }
  }

  static Heard listen(TokenDecoder decoder, double holdSeconds, short[] input, int chunk) {
    Heard heard = new Heard();
    try (TokenStream stream = TokenStream.create(decoder, heard, holdSeconds)) {
      feed(stream, input, chunk);
      assertEquals(input.length / decoder.options().channels() / (double) RATE,
          stream.streamSeconds(), 1e-9);
    }
    return heard;
  }

  /** Stream time of the first quarter-second poll of a bare decoder that returns a token. */
  static double firstDecodeSeconds(short[] input) {
    try (TokenDecoder decoder = TokenDecoder.create(DSSS, MONO)) {
      int poll = RATE / 4;
      for (int end = poll; end <= input.length; end += poll) {
        decoder.process(input, end - poll, poll);
        if (!decoder.tokens().isEmpty()) {
          return end / (double) RATE;
        }
      }
    }
    return -1;
  }

  @Test
  void repetitionsOfOneTokenAreOneReport() {
    EncodedToken token = dsssToken(FIRST);
    Recording recording = new Recording().silence(1.1);
    double firstRepetition = recording.seconds() + token.startTransition().length / 2.0 / RATE;
    short[] input = recording.play(threeTimes(token)).silence(5).samples(1);

    Heard heard = listen(TokenDecoder.create(DSSS, MONO), 3, input, 960);
    assertEquals(1, heard.tokens.size(), heard.tokens.toString());
    Token report = heard.tokens.get(0);
    assertArrayEquals(FIRST, report.message());
    assertEquals(Token.DSSS, report.modem());
    assertEquals(report.firstHeardSeconds(), report.lastHeardSeconds());
    // Decodable once the first repetition is in, and the decoder confirms a token's last symbol
    // with the next frame (40 to 47 ms measured): within one poll of that.
    assertTrue(report.firstHeardSeconds() > firstRepetition, report.toString());
    assertTrue(report.firstHeardSeconds()
            <= firstRepetition + token.tokenSeconds() + TokenStream.POLL_SECONDS + 0.05,
        report.toString());
    assertEquals(firstDecodeSeconds(input), report.firstHeardSeconds());
    // Heard while the token plays, then not.
    assertEquals(Arrays.asList(true, false), heard.broadcaster);
  }

  @Test
  void theSameTokenAfterTheHoldIsReportedAgain() {
    short[] played = threeTimes(dsssToken(FIRST));
    Recording recording = new Recording().silence(1).play(played).silence(3);
    double secondStart = recording.seconds();
    short[] input = recording.play(played).silence(3).samples(1);

    // The decoder hears the first sighting until about 1.9 s into the pause; the second decodes
    // about 0.8 s after it starts: unheard for about 1.9 s in between.
    Heard shortHold = listen(TokenDecoder.create(DSSS, MONO), 1, input, 960);
    assertEquals(2, shortHold.tokens.size(), shortHold.tokens.toString());
    assertArrayEquals(FIRST, shortHold.tokens.get(1).message());
    assertTrue(shortHold.tokens.get(1).firstHeardSeconds() > secondStart);

    Heard longHold = listen(TokenDecoder.create(DSSS, MONO), 3, input, 960);
    assertEquals(shortHold.tokens.subList(0, 1), longHold.tokens);
  }

  /** One token played three times, a short pause, another token three times, a pause. */
  static short[] twoTokens(int channels) {
    return new Recording()
        .silence(0.5)
        .play(threeTimes(dsssToken(FIRST)))
        .silence(0.5)
        .play(threeTimes(dsssToken(SECOND)))
        .silence(3)
        .samples(channels);
  }

  @Test
  void differentTokensAreEachReported() {
    Heard heard = listen(TokenDecoder.create(DSSS, MONO), 3, twoTokens(1), 4096);
    assertEquals(2, heard.tokens.size(), heard.tokens.toString());
    assertArrayEquals(FIRST, heard.tokens.get(0).message());
    assertArrayEquals(SECOND, heard.tokens.get(1).message());
    assertTrue(heard.tokens.get(1).firstHeardSeconds() > heard.tokens.get(0).firstHeardSeconds());
  }

  @Test
  void reportsDoNotDependOnHowTheInputIsSplit() {
    DecoderOptions stereo = DecoderOptions.builder().microphoneRate(RATE).channels(2).build();
    short[] input = twoTokens(2);
    Heard reference = listen(TokenDecoder.create(DSSS, stereo), 3, input, 960);
    assertEquals(2, reference.tokens.size(), reference.tokens.toString());
    // Odd chunks of stereo split frames between calls.
    for (int chunk : new int[] {1, 441, 4096}) {
      Heard heard = listen(TokenDecoder.create(DSSS, stereo), 3, input, chunk);
      assertEquals(reference.tokens, heard.tokens, "chunks of " + chunk);
      assertEquals(reference.broadcaster, heard.broadcaster, "chunks of " + chunk);
    }
    // A direct buffer as AudioRecord fills it: the data starts at the buffer's position; what
    // lies before it (silence here) is not fed.
    Heard heard = new Heard();
    ByteBuffer buffer = ByteBuffer.allocateDirect(4 * 882).order(ByteOrder.LITTLE_ENDIAN);
    buffer.position(2 * 882);
    try (TokenStream stream = TokenStream.create(TokenDecoder.create(DSSS, stereo), heard)) {
      for (int start = 0; start < input.length; start += 882) {
        int count = Math.min(882, input.length - start);
        buffer.asShortBuffer().put(input, start, count);
        stream.feed(buffer, 2 * count);
        assertEquals(2 * 882, buffer.position());
        assertEquals(4 * 882, buffer.limit());
      }
    }
    assertEquals(reference.tokens, heard.tokens);
    assertEquals(reference.broadcaster, heard.broadcaster);
  }

  @Test
  void readResultsAreCheckedAsAudioRecordReturnsThem() {
    try (TokenStream stream = TokenStream.create(TokenDecoder.create(DSSS, MONO), token -> {})) {
      short[] shorts = new short[480];
      ByteBuffer bytes = ByteBuffer.allocateDirect(960);
      String[] names = {"ERROR (-1)", "ERROR_BAD_VALUE (-2)", "ERROR_INVALID_OPERATION (-3)",
          "ERROR_DEAD_OBJECT (-6)", "error -4"};
      int[] codes = {-1, -2, -3, -6, -4};
      for (int i = 0; i < codes.length; i++) {
        int code = codes[i];
        String expected = "AudioRecord.read failed: " + names[i];
        assertEquals(expected,
            assertThrows(IllegalStateException.class, () -> stream.feed(shorts, code))
                .getMessage());
        assertEquals(expected,
            assertThrows(IllegalStateException.class, () -> stream.feed(bytes, code)).getMessage());
      }
      stream.feed(shorts, 0);
      stream.feed(bytes, 0);
      assertEquals(0, stream.streamSeconds());
      assertThrows(IndexOutOfBoundsException.class, () -> stream.feed(shorts, 481));
      bytes.position(2);
      assertThrows(IndexOutOfBoundsException.class, () -> stream.feed(bytes, 960));
      assertThrows(IllegalArgumentException.class, () -> stream.feed(bytes, 3));
      stream.feed(shorts, 480);
      stream.feed(bytes, 958);
      assertEquals(959 / (double) RATE, stream.streamSeconds(), 1e-12);
    }
  }

  @Test
  void listeningModeAndDtmfWorkThroughTheStream() {
    DecoderOptions listening =
        DecoderOptions.builder().microphoneRate(RATE).listeningMode(true).build();
    short[] input =
        new Recording().silence(2).play(threeTimes(dsssToken(FIRST))).silence(3).samples(1);
    Heard heard = listen(TokenDecoder.create(DSSS, listening), 3, input, 960);
    assertEquals(1, heard.tokens.size(), heard.tokens.toString());
    assertArrayEquals(FIRST, heard.tokens.get(0).message());
    assertEquals(Arrays.asList(true, false), heard.broadcaster);

    DtmfConfig dtmf = DtmfConfig.builder().sampleRate(RATE).build();
    byte[] message = {1, 2, 3, 4, 5};
    short[] tones;
    try (TokenEncoder encoder = TokenEncoder.create(dtmf)) {
      tones = threeTimes(encoder.encode(message));
    }
    input = new Recording().silence(1).play(tones).silence(3).samples(1);
    heard = listen(TokenDecoder.create(dtmf, MONO), 3, input, 960);
    assertEquals(1, heard.tokens.size(), heard.tokens.toString());
    assertArrayEquals(message, heard.tokens.get(0).message());
    assertEquals(Token.DTMF, heard.tokens.get(0).modem());
    assertTrue(heard.broadcaster.isEmpty());
  }

  @Test
  void aThrowingListenerLeavesTheStreamUsable() {
    short[] input = twoTokens(1);
    Heard reference = listen(TokenDecoder.create(DSSS, MONO), 3, input, 960);
    RuntimeException thrown = new RuntimeException("listener failed");
    Heard heard = new Heard() {
      @Override
      public void onToken(Token token) {
        super.onToken(token);
        if (Arrays.equals(FIRST, token.message())) {
          throw thrown;
        }
      }
    };
    int failures = 0;
    try (TokenStream stream = TokenStream.create(TokenDecoder.create(DSSS, MONO), heard)) {
      // Polls fall inside these reads: the rest of a read must still be taken in.
      short[] buffer = new short[882];
      for (int start = 0; start < input.length; start += 882) {
        int count = Math.min(882, input.length - start);
        System.arraycopy(input, start, buffer, 0, count);
        try {
          stream.feed(buffer, count);
        } catch (RuntimeException e) {
          assertSame(thrown, e);
          failures++;
        }
        // The whole buffer was taken in, throw or not.
        assertEquals((start + count) / (double) RATE, stream.streamSeconds(), 1e-9);
      }
    }
    assertEquals(1, failures);
    assertEquals(reference.tokens, heard.tokens);
    assertEquals(reference.broadcaster, heard.broadcaster);
  }

  @Test
  void failuresInOneReadAreAllKept() {
    short[] input = twoTokens(1);
    Heard reference = listen(TokenDecoder.create(DSSS, MONO), 3, input, 960);
    // Every callback throws, all within one read: the first failure comes out, carrying the
    // others.
    Heard heard = new Heard() {
      @Override
      public void onToken(Token token) {
        super.onToken(token);
        throw new RuntimeException(Token.hex(token.message()));
      }

      @Override
      public void onBroadcaster(boolean on) {
        super.onBroadcaster(on);
        throw new RuntimeException("broadcaster " + on);
      }
    };
    List<String> failures = new ArrayList<>();
    try (TokenStream stream = TokenStream.create(TokenDecoder.create(DSSS, MONO), heard)) {
      RuntimeException e =
          assertThrows(RuntimeException.class, () -> stream.feed(input, input.length));
      failures.add(e.getMessage());
      for (Throwable suppressed : e.getSuppressed()) {
        failures.add(suppressed.getMessage());
      }
    }
    assertEquals(reference.tokens, heard.tokens);
    assertEquals(reference.broadcaster, heard.broadcaster);
    assertEquals(
        Arrays.asList("broadcaster true", "0a1b2c3d4e5f", "617283940516", "broadcaster false"),
        failures);

    // One exception thrown again and again is reported once.
    RuntimeException same = new IllegalStateException("same");
    try (TokenStream stream =
             TokenStream.create(TokenDecoder.create(DSSS, MONO), token -> { throw same; })) {
      assertSame(
          same, assertThrows(RuntimeException.class, () -> stream.feed(input, input.length)));
      assertEquals(0, same.getSuppressed().length);
    }
  }

  @Test
  void theStreamOwnsItsDecoder() {
    TokenDecoder decoder = TokenDecoder.create(DSSS, MONO);
    TokenStream stream = TokenStream.create(decoder, token -> {});
    assertEquals(TokenStream.DEFAULT_HOLD_SECONDS, stream.holdSeconds());
    stream.close();
    stream.close();
    assertThrows(IllegalStateException.class, decoder::tokens);
    assertThrows(IllegalStateException.class, () -> stream.feed(new short[4], 4));

    // A stream that cannot be made closes the decoder it was given.
    for (double hold : new double[] {-0.1, Double.NaN, Double.POSITIVE_INFINITY}) {
      TokenDecoder refused = TokenDecoder.create(DSSS, MONO);
      assertThrows(
          IllegalArgumentException.class, () -> TokenStream.create(refused, token -> {}, hold));
      assertThrows(IllegalStateException.class, refused::tokens);
    }
    assertThrows(NullPointerException.class,
        () -> TokenStream.create(TokenDecoder.create(DSSS, MONO), null));
  }

  @Test
  void theListenerMayCloseTheStream() {
    // It then hears nothing more, and the rest of that read is dropped. Here it closes at the
    // first token, or once a broadcaster is heard.
    short[] input = twoTokens(1);
    for (boolean onBroadcaster : new boolean[] {false, true}) {
      Heard heard = new Heard();
      TokenStream[] stream = new TokenStream[1];
      double[] closedAt = new double[1];
      TokenListener closing = new TokenListener() {
        @Override
        public void onToken(Token token) {
          heard.onToken(token);
          close();
        }

        @Override
        public void onBroadcaster(boolean on) {
          heard.onBroadcaster(on);
          if (onBroadcaster) {
            close();
          }
        }

        private void close() {
          closedAt[0] = stream[0].streamSeconds();
          stream[0].close();
        }
      };
      stream[0] = TokenStream.create(TokenDecoder.create(DSSS, MONO), closing, 0);
      stream[0].feed(input, input.length);
      assertThrows(IllegalStateException.class, () -> stream[0].feed(input, input.length));
      assertEquals(onBroadcaster ? 0 : 1, heard.tokens.size());
      assertEquals(Arrays.asList(true), heard.broadcaster);
      assertEquals(closedAt[0], stream[0].streamSeconds());
      assertTrue(closedAt[0] < 2, "closed at " + closedAt[0]);
    }
  }
}
