package com.velmar.android.orv.audiomodem;

import static org.junit.jupiter.api.Assertions.assertTrue;
import static org.junit.jupiter.api.Assertions.fail;

import java.io.File;
import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.util.ArrayList;
import java.util.List;
import java.util.Random;
import java.util.concurrent.TimeUnit;
import org.junit.jupiter.api.Test;

/**
 * Accepted means it runs: seeded random configurations drawn around the edges of what the
 * builders accept (rates, tones near half the rate, carrier against both rates, frame sizes,
 * decimation, token lengths near the duration limit, CRC and checksum, codes, channels, the
 * listening mode, envelopes), each one that the builders and factories accept encoded, decoded
 * from a short stream and closed. The configurations run in child JVMs, a batch each, so that a
 * native abort fails the test with the configuration the child announced last instead of ending
 * the test run.
 *
 * <p>{@code -Dvesk.property.seed=S -Dvesk.property.configurations=N} run another campaign.
 */
class ConfigPropertyTest {
  private static final long SEED = Long.getLong("vesk.property.seed", 13);
  // 2000 configurations (about half of them run, half refused) take about 60 s on two cores,
  // two children at a time.
  private static final int CONFIGURATIONS =
      Integer.getInteger("vesk.property.configurations", 2000);
  private static final int BATCH = 250; // Configurations per child JVM: start-up is ~0.5 s.
  private static final int PARALLEL = 2;
  private static final long CHILD_TIMEOUT_SECONDS = 300;
  // Longest token drawn, in samples at the transmitter's highest rate.
  private static final double MAX_TOKEN_SAMPLES = 5e5;
  // Samples at the receiver's baseband rate: fed at most, and in the acquisition window at most.
  private static final double MAX_BASEBAND_SAMPLES = 24000;
  private static final double MAX_ACQUISITION_SAMPLES = 1e6;

  // What a child prints: "run I CONFIGURATION" before configuration I, one "done ..." at the end.
  private static final String RUN = "run ";
  private static final String DONE = "done ";

  /** Child entry point: runs configurations FIRST to END - 1 of SEED. */
  public static void main(String[] args) {
    long seed = Long.parseLong(args[0]);
    int first = Integer.parseInt(args[1]);
    int end = Integer.parseInt(args[2]);
    int ran = 0;
    int refused = 0;
    for (int i = first; i < end; i++) {
      Case c = Case.draw(seed, i);
      System.out.println(RUN + i + " " + c.text);
      System.out.flush();
      try {
        if (c.run()) {
          ran++;
        } else {
          refused++;
        }
      } catch (Throwable t) {
        t.printStackTrace();
        System.exit(3);
      }
    }
    System.out.println(DONE + ran + " " + refused);
    System.exit(0);
  }

  @Test
  void everyAcceptedConfigurationRuns() throws Exception {
    List<String> failures = new ArrayList<>();
    int[] totals = new int[2];
    List<Batch> running = new ArrayList<>();
    int next = 0;
    while (next < CONFIGURATIONS || !running.isEmpty()) {
      while (running.size() < PARALLEL && next < CONFIGURATIONS) {
        running.add(new Batch(next, Math.min(next + BATCH, CONFIGURATIONS)));
        next += BATCH;
      }
      Batch batch = running.remove(0);
      int resume = batch.finish(failures, totals);
      if (resume < batch.end) {
        running.add(new Batch(resume, batch.end)); // Go on after the one that failed.
      }
    }
    if (!failures.isEmpty()) {
      fail(failures.size() + " of " + CONFIGURATIONS + " configurations (seed " + SEED
          + ") failed:\n" + String.join("\n", failures));
    }
    // The draws must reach both sides of the limits.
    assertTrue(totals[0] > CONFIGURATIONS / 4, totals[0] + " configurations ran");
    assertTrue(totals[1] > CONFIGURATIONS / 4, totals[1] + " configurations were refused");
    System.out.println(totals[0] + " configurations ran, " + totals[1] + " were refused");
  }

  /** One child JVM running configurations [start, end). */
  private static final class Batch {
    final int start;
    final int end;
    final File out;
    final File err;
    final Process child;

    Batch(int start, int end) throws IOException {
      this.start = start;
      this.end = end;
      out = File.createTempFile("vesk-property", ".out");
      err = File.createTempFile("vesk-property", ".err");
      child = ChildJvm
                  .of(ConfigPropertyTest.class, Long.toString(SEED), Integer.toString(start),
                      Integer.toString(end))
                  .redirectOutput(out)
                  .redirectError(err)
                  .start();
    }

    // Waits for the child; adds its counts to totals and its failure, if any, to failures.
    // Returns where a new child should go on: `end` when the batch is complete.
    int finish(List<String> failures, int[] totals) throws Exception {
      boolean exited = child.waitFor(CHILD_TIMEOUT_SECONDS, TimeUnit.SECONDS);
      if (!exited) {
        child.destroyForcibly().waitFor();
      }
      List<String> lines = Files.readAllLines(out.toPath(), StandardCharsets.UTF_8);
      String stderr = new String(Files.readAllBytes(err.toPath()), StandardCharsets.UTF_8);
      out.delete();
      err.delete();
      String last = null;
      for (String line : lines) {
        if (line.startsWith(DONE) && exited && child.exitValue() == 0) {
          String[] counts = line.substring(DONE.length()).split(" ");
          totals[0] += Integer.parseInt(counts[0]);
          totals[1] += Integer.parseInt(counts[1]);
          return end;
        }
        if (line.startsWith(RUN)) {
          last = line.substring(RUN.length());
        }
      }
      String why = exited ? "ended with status " + child.exitValue()
                          : "did not finish in " + CHILD_TIMEOUT_SECONDS + " s";
      String tail = stderr.length() > 2000 ? stderr.substring(stderr.length() - 2000) : stderr;
      if (last == null) {
        failures.add(
            "a child (" + start + " to " + end + ") " + why + " before its first: " + tail);
        return end;
      }
      failures.add("configuration " + last + "\n  " + why + ": " + tail.trim());
      return Integer.parseInt(last.substring(0, last.indexOf(' '))) + 1;
    }
  }

  /**
   * One drawn configuration: the builder calls as Java text (to reproduce it) and what running it
   * does. Every value is drawn from the edges that the limits allow; in about half of the draws one
   * value, chosen at random, comes from just beyond them instead.
   */
  static final class Case {
    final Random random;
    final StringBuilder text = new StringBuilder();
    boolean dtmf;
    DsssConfig.Builder dsss;
    DtmfConfig.Builder dtmfBuilder;
    DecoderOptions.Builder options;
    int messageBytes;
    float workRate; // The transmitter's highest sample rate, Hz.
    double basebandRate; // The receiver's working rate, Hz.
    boolean stream; // Through a TokenStream rather than TokenDecoder calls.
    private final int corrupt; // Which drawn value is drawn from beyond the limits, or -1.
    private int drawn; // Values drawn so far.

    private Case(Random random) {
      this.random = random;
      corrupt = random.nextInt(5) < 2 ? random.nextInt(20) : -1;
    }

    static Case draw(long seed, int index) {
      Random random = new Random(seed * 1_000_003L + index);
      while (true) {
        Case c = new Case(random);
        c.dtmf = random.nextInt(5) < 2;
        float rate = c.dtmf ? c.drawDtmf() : c.drawDsss();
        if (c.dtmf) {
          c.dtmfBuilder.messageBytes(c.messageBytes);
        } else {
          c.dsss.messageBytes(c.messageBytes);
        }
        c.text.append(".messageBytes(" + c.messageBytes + ")");
        double tokenSeconds = c.tokenSeconds();
        // Long tokens only where they stay cheap: one of 30 s at 384000 Hz takes seconds to
        // encode, one of 30 s at 48000 Hz a fraction of a second.
        if (tokenSeconds * c.workRate > MAX_TOKEN_SAMPLES) {
          continue;
        }
        // A broadcast rate so low that the token has no sample at all is accepted natively, and
        // the token encodes to nothing (TokenEncoder.encode throws IllegalStateException).
        if (!c.dtmf && tokenSeconds > 0 && tokenSeconds * rate < 2) {
          continue;
        }
        c.drawOptions(rate, tokenSeconds);
        c.stream = random.nextBoolean();
        return c;
      }
    }

    // The token duration of the transmitter, or 0 s if it does not build.
    private double tokenSeconds() {
      try {
        return dtmf ? dtmfBuilder.build().tokenSeconds() : dsss.build().tokenSeconds();
      } catch (IllegalArgumentException refused) {
        return 0;
      }
    }

    // The DSSS transmitter; returns its broadcast rate.
    private float drawDsss() {
      dsss = DsssConfig.builder();
      text.append("DsssConfig.builder()");
      boolean crc = random.nextBoolean();
      boolean checksum = random.nextInt(4) == 0;
      boolean quadrature = random.nextBoolean();
      dsss.crc(crc).checksumSymbol(checksum).quadratureCarrier(quadrature);
      text.append(".crc(" + crc + ").checksumSymbol(" + checksum + ").quadratureCarrier("
          + quadrature + ")");
      int taps = edge(ints(7, 7, 7, 5, 6, 8, 9, 10, 11), ints(4, 12));
      int code = edge(ints(0, 0, 1, taps <= 6 ? 2 : 3), ints(-1, taps <= 6 ? 3 : 4));
      dsss.code(taps, code);
      text.append(".code(" + taps + ", " + code + ")");
      float coderRate = edge(floats(48000f, 48000f, 44100f, 8000f, 1000f, 96000f, 22050f, 384000f,
                                 1f + random.nextInt(383999)),
          floats(Math.nextUp(384000f), 0f, Float.NaN));
      int codeLength = taps >= 1 && taps <= 30 ? (1 << taps) - 1 : 127;
      int maxUpsampling = Limits.MAX_DSSS_FRAME_SAMPLES / codeLength;
      int upsampling =
          edge(ints(16, 16, 15, 1, 2, 3, 4, 8, 32, maxUpsampling, 1 + random.nextInt(64)),
              ints(maxUpsampling + 1, 0));
      int decimation = edge(ints(divisorOf(upsampling), divisorOf(upsampling), 1, upsampling,
                                upsampling % 4 == 0 ? 4 : 1, upsampling % 3 == 0 ? 3 : 1),
          ints(upsampling + 1, 0));
      dsss.coder(coderRate, upsampling, decimation);
      text.append(".coder(" + f(coderRate) + ", " + upsampling + ", " + decimation + ")");
      float half = coderRate / 2;
      float carrier = edge(floats(Math.min(18500f, half), Math.min(18500f, half), half,
                               Math.nextDown(half), half / 2, 1f, half * random.nextFloat()),
          floats(Math.nextUp(half), 0f, -1f, Float.NaN));
      dsss.carrierFrequency(carrier);
      text.append(".carrierFrequency(" + f(carrier) + ")");
      // Single sideband with the carrier within a cycle per frame of half the coder rate ends the
      // process natively: the carrier snapped to whole cycles can land above half the rate, and
      // the encoder's high-pass refuses it ("Check failed: low_band_edge <= high_band_edge").
      // Until the native check refuses such carriers, the draws keep away from them.
      boolean sideband =
          random.nextBoolean() && carrier < half - coderRate / codeLength / upsampling;
      dsss.singleSideband(sideband);
      text.append(".singleSideband(" + sideband + ")");
      int bits = edge(ints(4, 4, 1, 2, 8), ints(3, 0));
      dsss.bitsPerSymbol(bits);
      text.append(".bitsPerSymbol(" + bits + ")");
      int cycles = edge(ints(4, 4, 0, 1, 10, 100, 1000), ints(-1));
      dsss.minCyclesPerFrame(cycles);
      text.append(".minCyclesPerFrame(" + cycles + ")");
      // The carrier must lie below half the broadcast rate: 2 x carrier itself is refused.
      int twice = (int) Math.max(0, Math.min(Integer.MAX_VALUE, 2.0 * carrier));
      int lowest = twice + 1;
      int broadcast =
          edge(ints(Math.max(lowest, 48000), Math.max(lowest, 48000), Math.max(lowest, 44100),
                   Math.max(lowest, (int) coderRate), lowest, Math.max(lowest, 384000)),
              ints(twice, 384001, 0));
      dsss.broadcastSampleRate(broadcast);
      text.append(".broadcastSampleRate(" + broadcast + ")");
      float transition =
          edge(floats(0.005f, 0.005f, 0f, 1f, 0.1f), floats(Math.nextUp(1f), -0.001f, Float.NaN));
      dsss.transitionSeconds(transition);
      text.append(".transitionSeconds(" + f(transition) + ")");
      // Token lengths up to the longest that lasts at most 30 s on air.
      int perByte = bits >= 1 && bits <= 8 ? 8 / bits : 2;
      double frameSeconds = (double) codeLength * upsampling / coderRate;
      int longest = (int) Math.max(1,
          Math.min(Limits.MAX_TOKEN_BYTES,
              ((Limits.MAX_TOKEN_SECONDS / frameSeconds - 1 - (checksum ? 1 : 0)) / perByte)));
      int crcBytes = crc ? 2 : 0;
      boolean tooLong = corrupt == drawn;
      messageBytes = edge(ints(6, 6, 1, 2, 8, 1 + random.nextInt(16), longest),
                         ints(longest + 1, Limits.MAX_TOKEN_BYTES + 1, 0))
          - crcBytes;
      if (!tooLong) {
        messageBytes = Math.max(1, Math.min(longest - crcBytes, messageBytes));
      }
      workRate = Math.max(coderRate, broadcast);
      basebandRate = coderRate / Math.max(1, decimation);
      return broadcast;
    }

    // The DTMF transmitter; returns its sample rate.
    private float drawDtmf() {
      dtmfBuilder = DtmfConfig.builder();
      text.append("DtmfConfig.builder()");
      boolean crc = random.nextInt(4) == 0;
      boolean checksum = random.nextInt(4) != 0;
      dtmfBuilder.crc(crc).checksumSymbol(checksum);
      text.append(".crc(" + crc + ").checksumSymbol(" + checksum + ")");
      boolean defaultTones = random.nextBoolean();
      // The default tones need more than twice the highest of them.
      float lowest = Math.nextUp(2 * Limits.MAX_DEFAULT_DTMF_TONE);
      float rate = edge(floats(44100f, 44100f, 48000f, 8000f, 16000f, lowest, 384000f,
                            defaultTones ? lowest : 1000f, lowest + random.nextInt(383999)),
          floats(Math.nextUp(384000f), 0f, defaultTones ? Math.nextDown(lowest) : Float.NaN,
              defaultTones ? 4000f : -1f));
      dtmfBuilder.sampleRate(rate);
      text.append(".sampleRate(" + f(rate) + ")");
      int decimation = edge(ints(16, 16, 1, 2, 8, 100, 1000), ints(0, -16));
      dtmfBuilder.basebandDecimationFactor(decimation);
      text.append(".basebandDecimationFactor(" + decimation + ")");
      // Windows around whole decimated samples: halfway between two, exactly one, the halfway
      // point below one (which rounds up to it) and just below that (which rounds to none).
      float step = decimation / Math.max(rate, 1f);
      float window = edge(
          floats(0.05f, 0.05f, 0.02f, 0.1f, (random.nextInt(20) + 1.5f) * step, step, 0.5f * step),
          floats(Math.nextDown(0.5f * step), 0f, -0.01f, Float.NaN));
      dtmfBuilder.windowSeconds(window);
      text.append(".windowSeconds(" + f(window) + ")");
      if (!defaultTones) {
        int count = 2 + random.nextInt(11);
        float[] tones = new float[count];
        float half = rate / 2;
        StringBuilder list = new StringBuilder();
        int bad = corrupt == drawn++ ? random.nextInt(count) : -1;
        for (int i = 0; i < count; i++) {
          tones[i] = i == bad ? pick(half, Math.nextUp(half), -1f, Float.NaN)
                              : pick(half * random.nextFloat(), half * random.nextFloat(),
                                  300 + 200f * i, Math.nextDown(half), 0f);
          list.append(i == 0 ? "" : ", ").append(f(tones[i]));
        }
        // At least 3 symbols and no more than pairs of tones.
        int perSymbol = edge(
            ints(1, 2, 2, 3, count - 1), ints(count, count + 1, count == 3 || count == 4 ? 2 : 0));
        dtmfBuilder.tones(tones, perSymbol);
        text.append(".tones(new float[] {" + list + "}, " + perSymbol + ")");
      } else {
        int perSymbol = edge(ints(2), ints(1, 3));
        dtmfBuilder.tones(new float[0], perSymbol);
        text.append(".tones(new float[0], " + perSymbol + ")");
      }
      // The default envelope needs a window of 0.05 s.
      if (random.nextBoolean() || !(window >= 0.05f)) {
        // Segments that share a total around the window: none of it, all of it, the tolerance.
        float total = edge(floats(0f, window, window / 2, window * Limits.ENVELOPE_TOLERANCE),
            floats(Math.nextUp(window * Limits.ENVELOPE_TOLERANCE), 2 * window));
        float[] times = new float[4];
        float left = total;
        for (int i = 0; i < 3; i++) {
          times[i] = random.nextInt(3) == 0 ? 0 : left * random.nextFloat();
          left -= times[i];
        }
        times[3] = Math.max(0, left);
        times[random.nextInt(4)] =
            edge(floats(times[0]), floats(-0.001f, Float.NaN, Float.POSITIVE_INFINITY));
        float level = edge(
            floats(1f, 0.5f, 0f, random.nextFloat()), floats(Math.nextUp(1f), -0.1f, Float.NaN));
        dtmfBuilder.envelope(times[0], times[1], times[2], times[3], level);
        text.append(".envelope(" + f(times[0]) + ", " + f(times[1]) + ", " + f(times[2]) + ", "
            + f(times[3]) + ", " + f(level) + ")");
      }
      int crcBytes = crc ? 2 : 0;
      messageBytes = edge(ints(5, 5, 1, 2, 3, 8, 1 + random.nextInt(32), 1 + random.nextInt(254),
                              Limits.MAX_TOKEN_BYTES - crcBytes),
          ints(Limits.MAX_TOKEN_BYTES + 1 - crcBytes, 0));
      workRate = rate;
      basebandRate = rate / Math.max(1, decimation);
      return rate;
    }

    // The receiver, around the transmitter's rate and the limits.
    private void drawOptions(float transmitterRate, double tokenSeconds) {
      options = DecoderOptions.builder();
      text.append("; DecoderOptions.builder()");
      boolean listening = random.nextInt(dtmf ? 20 : 4) == 0;
      int near = (int) Math.max(1000, Math.min(384000, transmitterRate));
      // DTMF: the microphone within a factor 1000 of the modulation rate.
      int thousandfold = (int) Math.min(Integer.MAX_VALUE, transmitterRate * 1000f);
      int thousandth = (int) Math.ceil(transmitterRate / 1000f);
      int rate = edge(ints(near, near, 44100, 48000, listening ? 36994 : 1000, 384000,
                          Math.max(1000, Math.min(384000, thousandfold)),
                          Math.max(1000, thousandth), 1000 + random.nextInt(383001)),
          ints(999, 384001, listening ? 36993 : 0, thousandfold + 1000, thousandth - 1));
      int channels = edge(ints(1, 1, 1, 2, 2, 3, 7, 8, 11, 13, 64), ints(0, 65));
      options.microphoneRate(rate).channels(channels).listeningMode(listening);
      text.append(".microphoneRate(" + rate + ").channels(" + channels + ").listeningMode("
          + listening + ")");
      // The acquisition scores of the whole window are kept for every Doppler shift: a window of
      // 60 s at a baseband of 384000 Hz takes gigabytes, so long ones only at slow basebands.
      float longestWindow = (float) Math.min(60, MAX_ACQUISITION_SAMPLES / basebandRate);
      float window = edge(
          floats(0.75f, 0.75f, 0.1f, Math.min(5f, longestWindow), longestWindow, Float.MIN_VALUE),
          floats(Math.nextUp(60f), 0f, Float.NaN));
      float threshold = pick(5f, 5f, 0f, -1f, 100f, Float.NaN, Float.POSITIVE_INFINITY);
      // Histories of at most 60 s: the longest one and just beyond it.
      float longest = (float) (Limits.MAX_HISTORY_SECONDS / tokenSeconds);
      while (longest * tokenSeconds > Limits.MAX_HISTORY_SECONDS) {
        longest = Math.nextDown(longest);
      }
      float buffer = edge(floats(4f, 4f, 1f, 2.5f, 100f, Math.max(1f, Math.min(100f, longest))),
          floats(Math.nextUp(100f), 0.99f, Float.NaN, Math.nextUp(longest)));
      int perCall = edge(ints(2, 2, 1, 3, 6), ints(7, 0));
      boolean design = random.nextBoolean();
      options.acquisitionWindowSeconds(window)
          .broadcasterThreshold(threshold)
          .bufferLengthTokens(buffer)
          .maxTokensPerCall(perCall)
          .designBasebandFilter(design);
      text.append(".acquisitionWindowSeconds(" + f(window) + ").broadcasterThreshold("
          + f(threshold) + ").bufferLengthTokens(" + f(buffer) + ").maxTokensPerCall(" + perCall
          + ").designBasebandFilter(" + design + ")");
    }

    // A value from `good`, or from `bad` when this is the value to draw beyond the limits.
    private int edge(int[] good, int[] bad) {
      int[] values = corrupt == drawn++ ? bad : good;
      return values[random.nextInt(values.length)];
    }

    private float edge(float[] good, float[] bad) {
      float[] values = corrupt == drawn++ ? bad : good;
      return values[random.nextInt(values.length)];
    }

    private static int[] ints(int... values) {
      return values;
    }

    private static float[] floats(float... values) {
      return values;
    }

    /**
     * Builds, encodes, decodes and closes. False when the builders or the decoder's factory
     * refused the configuration (with a message); an error for anything else going wrong.
     */
    boolean run() {
      DsssConfig dsssConfig = null;
      DtmfConfig dtmfConfig = null;
      DecoderOptions decoderOptions;
      try {
        if (dtmf) {
          dtmfConfig = dtmfBuilder.build();
        } else {
          dsssConfig = dsss.build();
        }
        decoderOptions = options.build();
      } catch (IllegalArgumentException refused) {
        return isExplained(refused);
      }
      byte[] message = new byte[messageBytes];
      random.nextBytes(message);
      EncodedToken token;
      try (TokenEncoder encoder =
               dtmf ? TokenEncoder.create(dtmfConfig) : TokenEncoder.create(dsssConfig)) {
        token = encoder.encode(message);
      }
      int expected = dtmf ? dtmfConfig.framesPerToken() * dtmfConfig.frameSize()
                          : dsssConfig.framesPerToken() * dsssConfig.frameSize();
      int samples = token.tokenAudio().length / 2;
      boolean resampled = !dtmf && dsssConfig.broadcastSampleRate() != dsssConfig.coderSampleRate();
      if (!resampled && samples != expected) {
        throw new AssertionError(samples + " samples of token audio, " + expected + " expected");
      }
      TokenDecoder decoder;
      try {
        decoder = dtmf ? TokenDecoder.create(dtmfConfig, decoderOptions)
                       : TokenDecoder.create(dsssConfig, decoderOptions);
      } catch (IllegalArgumentException refused) {
        return isExplained(refused);
      }
      short[] input = microphone(token, decoderOptions);
      List<byte[]> heard = new ArrayList<>();
      if (stream) {
        try (TokenStream tokens = TokenStream.create(decoder, t -> heard.add(t.message()))) {
          for (int at = 0; at < input.length;) {
            int count = Math.min(input.length - at, random.nextInt(20000));
            short[] read = new short[count + random.nextInt(100)];
            System.arraycopy(input, at, read, 0, count);
            tokens.feed(read, count);
            at += count;
          }
        }
      } else {
        try {
          int frame = decoderOptions.channels();
          for (int at = 0; at < input.length;) {
            int count = Math.min(input.length - at, frame * random.nextInt(30000 / frame + 1));
            decoder.process(input, at, count);
            at += count;
            if (random.nextInt(4) == 0) {
              heard.addAll(decoder.tokens());
              decoder.broadcasterDetected();
            }
          }
          heard.addAll(decoder.tokens());
          if (decoder.maxSafeInputSamples() < 0) {
            throw new AssertionError("negative safe input size");
          }
          decoder.wipe();
          heard.addAll(decoder.tokens());
        } finally {
          decoder.close();
        }
      }
      for (byte[] heardMessage : heard) {
        if (heardMessage.length != messageBytes) {
          throw new AssertionError("a token of " + heardMessage.length + " bytes");
        }
      }
      return true;
    }

    // The token audio played once, as the microphone's interleaved channels, the later ones
    // quieter: at most two seconds of it, and less where the receiver's baseband runs fast (its
    // cost grows with that rate: 0.4 s at 384000 Hz take seconds).
    private short[] microphone(EncodedToken token, DecoderOptions options) {
      short[] audio = EncodedToken.toSamples(token.playback(1));
      double seconds = Math.min(2, MAX_BASEBAND_SAMPLES / basebandRate);
      int frames = (int) Math.max(1, Math.min(audio.length, seconds * options.microphoneRate()));
      int channels = options.channels();
      short[] out = new short[frames * channels];
      for (int i = 0; i < frames; i++) {
        for (int c = 0; c < channels; c++) {
          out[i * channels + c] = (short) (audio[i] >> Math.min(c, 8));
        }
      }
      return out;
    }

    private static boolean isExplained(IllegalArgumentException refused) {
      if (refused.getMessage() == null || refused.getMessage().isEmpty()) {
        throw new AssertionError("refused without a reason", refused);
      }
      return false;
    }

    private float pick(float... values) {
      return values[random.nextInt(values.length)];
    }

    private int divisorOf(int n) {
      if (n < 1) {
        return 1;
      }
      int d = 1 + random.nextInt(n);
      while (n % d != 0) {
        d--;
      }
      return d;
    }

    // A float as Java source.
    private static String f(float value) {
      if (Float.isNaN(value)) {
        return "Float.NaN";
      }
      if (Float.isInfinite(value)) {
        return value > 0 ? "Float.POSITIVE_INFINITY" : "Float.NEGATIVE_INFINITY";
      }
      return value + "f";
    }
  }
}
