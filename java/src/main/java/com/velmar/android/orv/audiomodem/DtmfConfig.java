package com.velmar.android.orv.audiomodem;

import static com.velmar.android.orv.audiomodem.Checks.require;

import java.math.BigInteger;
import java.util.Arrays;

/**
 * What a DTMF transmitter and its receivers must agree on: the token layout, the tones and the
 * symbol envelope.
 *
 * <p>The defaults are the product configuration: 5 message bytes followed by a checksum symbol,
 * 44100 Hz, 50 ms symbols (baseband decimation 16: 2208 samples) of 2 tones from the default set
 * (a two-octave pentatonic scale from 740 Hz), under a 25 ms attack and 25 ms release envelope.
 * The checksum symbol is on by default because without a check the receiver regularly returns
 * the runner-up symbol sequence as a wrong token, and speech alone yields false ones; with it,
 * neither happened in the measurements (see the README). The symmetric envelope is as sensitive
 * as a half-sine window, while a 10/10/20/10 ms envelope with a half-level sustain costs 1.5 to 2
 * dB.
 *
 * <p>Immutable. {@link Builder#build()} validates every value, so that a bad value is an {@link
 * IllegalArgumentException} here rather than an abort inside the native library.
 */
public final class DtmfConfig {
  private final int messageBytes;
  private final int crcCheckBytes;
  private final boolean checksumSymbol;
  private final float sampleRate;
  private final int basebandDecimationFactor;
  private final float windowSeconds;
  private final int tonesPerSymbol;
  private final Envelope envelope;
  private final float[] toneFrequencies; // Empty: the default set.

  private DtmfConfig(Builder b) {
    messageBytes = b.messageBytes;
    crcCheckBytes = b.crcCheckBytes;
    checksumSymbol = b.checksumSymbol;
    sampleRate = b.sampleRate;
    basebandDecimationFactor = b.basebandDecimationFactor;
    windowSeconds = b.windowSeconds;
    tonesPerSymbol = b.tonesPerSymbol;
    envelope = b.envelope;
    toneFrequencies = b.toneFrequencies.clone();
  }

  /** The product configuration. */
  public static DtmfConfig defaults() {
    return builder().build();
  }

  /** A builder holding the product defaults. */
  public static Builder builder() {
    return new Builder();
  }

  /** Message bytes per token, without check bytes: 1 to 256 less the check bytes. */
  public int messageBytes() {
    return messageBytes;
  }

  /** CRC-16 check bytes per token: 0 or 2. */
  public int crcCheckBytes() {
    return crcCheckBytes;
  }

  /** Bytes per token: message plus check bytes. */
  public int tokenLengthBytes() {
    return messageBytes + crcCheckBytes;
  }

  /** Whether a checksum symbol follows the message symbols of each token. */
  public boolean checksumSymbol() {
    return checksumSymbol;
  }

  /** Sample rate of the modulation and of the encoded audio, Hz, in (0, 384000]. */
  public float sampleRate() {
    return sampleRate;
  }

  /** Modulation rate over the receiver's tone-analysis rate, at least 1. */
  public int basebandDecimationFactor() {
    return basebandDecimationFactor;
  }

  /** Nominal symbol length, seconds, positive; see {@link #frameSize()} for the exact one. */
  public float windowSeconds() {
    return windowSeconds;
  }

  /** Tones that sound together in each symbol, at least 1. */
  public int tonesPerSymbol() {
    return tonesPerSymbol;
  }

  /** The envelope that shapes every symbol. */
  public Envelope envelope() {
    return envelope;
  }

  /** The tone set, Hz, each in [0, sample rate / 2); empty for the default set. */
  public float[] toneFrequencies() {
    return toneFrequencies.clone();
  }

  /** Samples per symbol: the window rounded to whole decimated samples. */
  public int frameSize() {
    return frameSize(windowSeconds, sampleRate, basebandDecimationFactor);
  }

  /**
   * Symbols in one token on air: the message and check bytes written in base (symbols - 1), the
   * spacer and, when enabled, the checksum symbol.
   */
  public int framesPerToken() {
    int tones =
        toneFrequencies.length == 0 ? Limits.DEFAULT_DTMF_TONES.length : toneFrequencies.length;
    return framesPerToken(symbolCount(tones, tonesPerSymbol), tokenLengthBytes(), checksumSymbol);
  }

  /** Duration of one token on air, seconds, at most 30. */
  public double tokenSeconds() {
    return (double) framesPerToken() * frameSize() / sampleRate;
  }

  /**
   * The envelope of one symbol: a smooth rise over the attack to full amplitude, a smooth fall over
   * the decay to the sustain level, a hold for the sustain time, a smooth fall over the release to
   * silence, then silence to the end of the symbol. The four times add up to at most the window.
   * Immutable.
   */
  public static final class Envelope {
    private final float attackSeconds;
    private final float decaySeconds;
    private final float sustainSeconds;
    private final float releaseSeconds;
    private final float sustainLevel;

    private Envelope(float attackSeconds, float decaySeconds, float sustainSeconds,
        float releaseSeconds, float sustainLevel) {
      this.attackSeconds = attackSeconds;
      this.decaySeconds = decaySeconds;
      this.sustainSeconds = sustainSeconds;
      this.releaseSeconds = releaseSeconds;
      this.sustainLevel = sustainLevel;
    }

    /** Rise to full amplitude, seconds, finite and at least 0. */
    public float attackSeconds() {
      return attackSeconds;
    }

    /** Fall from full amplitude to the sustain level, seconds, finite and at least 0. */
    public float decaySeconds() {
      return decaySeconds;
    }

    /** Hold at the sustain level, seconds, finite and at least 0. */
    public float sustainSeconds() {
      return sustainSeconds;
    }

    /** Fall from the sustain level to silence, seconds, finite and at least 0. */
    public float releaseSeconds() {
      return releaseSeconds;
    }

    /** Amplitude held during the sustain, relative to full amplitude, in [0, 1]. */
    public float sustainLevel() {
      return sustainLevel;
    }
  }

  /** Builder with the product defaults. */
  public static final class Builder {
    private int messageBytes = 5;
    private int crcCheckBytes = 0;
    private boolean checksumSymbol = true;
    private float sampleRate = 44100f;
    private int basebandDecimationFactor = 16;
    private float windowSeconds = 0.05f;
    private int tonesPerSymbol = 2;
    private Envelope envelope = new Envelope(0.025f, 0f, 0f, 0.025f, 1f);
    private float[] toneFrequencies = new float[0];

    private Builder() {}

    /**
     * Message bytes per token, without check bytes: 1 to 256 less the check bytes, and few enough
     * that a token lasts at most 30 s on air (default 5).
     */
    public Builder messageBytes(int value) {
      messageBytes = value;
      return this;
    }

    /** Two CRC-16 bytes after the message (off by default; the checksum symbol is on). */
    public Builder crc(boolean enabled) {
      crcCheckBytes = enabled ? 2 : 0;
      return this;
    }

    /** Whether a checksum symbol follows the message symbols (default on). */
    public Builder checksumSymbol(boolean enabled) {
      checksumSymbol = enabled;
      return this;
    }

    /**
     * Sample rate of the modulation and of the encoded audio, Hz, in (0, 384000] and above twice
     * the highest tone (default 44100; the default tone set reaches 2489 Hz).
     */
    public Builder sampleRate(float hertz) {
      sampleRate = hertz;
      return this;
    }

    /**
     * Modulation rate over the receiver's tone-analysis rate, at least 1 (default 16); a symbol is
     * a whole number of such steps.
     */
    public Builder basebandDecimationFactor(int factor) {
      basebandDecimationFactor = factor;
      return this;
    }

    /**
     * Nominal symbol duration, seconds, positive and at least one decimated sample (default 0.05).
     */
    public Builder windowSeconds(float seconds) {
      windowSeconds = seconds;
      return this;
    }

    /**
     * The tone set (Hz, each in [0, sample rate / 2)) and how many tones sound together (at least
     * 1); every combination is a symbol, and there must be at least 3 symbols and no more than
     * pairs of tones. Default: 10 tones from 740 Hz, 2 per symbol.
     */
    public Builder tones(float[] frequencies, int perSymbol) {
      toneFrequencies = frequencies.clone();
      tonesPerSymbol = perSymbol;
      return this;
    }

    /**
     * The symbol envelope (see {@link Envelope}): segment times in seconds, finite, at least 0 and
     * adding up to at most the window, and the sustain level in [0, 1]. Default 0.025, 0, 0,
     * 0.025, 1.
     */
    public Builder envelope(float attack, float decay, float sustain, float release, float level) {
      envelope = new Envelope(attack, decay, sustain, release, level);
      return this;
    }

    /**
     * The configuration.
     *
     * @throws IllegalArgumentException naming the first value outside its range
     */
    public DtmfConfig build() {
      // DtmfWaveformConfigError (dtmf_waveform_config.cc), in its order, which both the encoder's
      // and the decoder's checks apply.
      int maxMessageBytes = Limits.MAX_TOKEN_BYTES - crcCheckBytes;
      require(messageBytes >= 1 && messageBytes <= maxMessageBytes,
          "messageBytes must be 1 to " + maxMessageBytes + (crcCheckBytes > 0 ? " with CRC" : "")
              + ", not " + messageBytes);
      require(sampleRate > 0 && sampleRate <= Limits.MAX_SAMPLE_RATE_HZ,
          "sampleRate must lie in (0, " + (int) Limits.MAX_SAMPLE_RATE_HZ + "] Hz, not "
              + sampleRate);
      require(basebandDecimationFactor >= 1, "basebandDecimationFactor must be positive");
      require(windowSeconds > 0, "windowSeconds must be positive");
      require(frameSize(windowSeconds, sampleRate, basebandDecimationFactor) >= 1,
          "the window must round to between one decimated sample and 2^31 samples");
      require(tonesPerSymbol >= 1, "tonesPerSymbol must be at least 1");
      boolean defaultTones = toneFrequencies.length == 0;
      require(!defaultTones || tonesPerSymbol == Limits.DEFAULT_DTMF_TONES_PER_SYMBOL,
          "the default tone set makes symbols of 2 tones");
      float[] tones = defaultTones ? Limits.DEFAULT_DTMF_TONES : toneFrequencies;
      require(tones.length <= Limits.MAX_DTMF_TONES,
          "a tone set may have at most " + Limits.MAX_DTMF_TONES + " tones, not " + tones.length);
      for (float f : tones) {
        if (!(f >= 0 && f < sampleRate / 2)) {
          throw new IllegalArgumentException(defaultTones
                  ? "the default tone set reaches " + Limits.MAX_DEFAULT_DTMF_TONE
                      + " Hz: the sampleRate must be above twice that, not " + sampleRate + " Hz"
                  : "every tone must lie in [0, sampleRate / 2): not " + f + " Hz at " + sampleRate
                      + " Hz");
        }
      }
      long symbols = symbolCount(tones.length, tonesPerSymbol);
      long pairs = (long) tones.length * (tones.length - 1) / 2;
      require(symbols >= Limits.MIN_DTMF_SYMBOLS, "the tones must make at least 3 symbols");
      require(symbols <= pairs, "there may be no more symbols than pairs of tones");
      require(symbols <= Limits.MAX_DTMF_SYMBOLS, "too many symbols");
      float[] times = {envelope.attackSeconds, envelope.decaySeconds, envelope.sustainSeconds,
          envelope.releaseSeconds};
      for (float time : times) {
        require(
            Float.isFinite(time) && time >= 0, "envelope times must be finite and non-negative");
      }
      require(envelope.sustainLevel >= 0 && envelope.sustainLevel <= 1,
          "the sustain level must lie in [0, 1]");
      float total = times[0] + times[1] + times[2] + times[3];
      require(total <= windowSeconds * Limits.ENVELOPE_TOLERANCE,
          "the envelope times add up to more than the window");
      // As DtmfTokenSeconds (dtmf_waveform_config.cc) computes it.
      double tokenSeconds =
          (double) framesPerToken(symbols, messageBytes + crcCheckBytes, checksumSymbol)
          * frameSize(windowSeconds, sampleRate, basebandDecimationFactor) / sampleRate;
      require(tokenSeconds <= Limits.MAX_TOKEN_SECONDS,
          "a token may last at most " + (int) Limits.MAX_TOKEN_SECONDS + " s on air, not "
              + tokenSeconds + " s");
      return new DtmfConfig(this);
    }
  }

  // Samples per symbol as GetFrameSize (dtmf_encoder_params.cc) computes them: the window in
  // decimated samples, rounded half away from zero in float, times the decimation; 0 beyond
  // 2^31 - 1.
  private static int frameSize(float windowSeconds, float sampleRate, int decimation) {
    float decimated = windowSeconds * sampleRate / decimation;
    // Floats from 2^23 up are whole already; below, Math.round is exact and cannot saturate.
    double rounded = Math.abs(decimated) >= (1 << 23) ? decimated : Math.round(decimated);
    double frame = rounded * decimation;
    return Math.abs(frame) <= Integer.MAX_VALUE ? (int) frame : 0;
  }

  // Symbols (tone combinations) of `tones` tones taken `perSymbol` at a time, or one more than
  // min(pairs of tones, Limits.MAX_DTMF_SYMBOLS) when there are more: CountCombinationsUpTo as
  // DtmfWaveformConfigError calls it (dtmf_waveform_config.cc).
  private static long symbolCount(long tones, long perSymbol) {
    long limit = Math.min(tones * (tones - 1) / 2, Limits.MAX_DTMF_SYMBOLS);
    if (perSymbol > tones) {
      return 0;
    }
    long k = Math.min(perSymbol, tones - perSymbol);
    long count = 1;
    for (long i = 1; i <= k; i++) {
      count = count * (tones - k + i) / i; // Exact: a binomial coefficient at every step.
      if (count > limit) {
        return limit + 1;
      }
    }
    return count;
  }

  // Digits of base `symbols - 1` (the spacer is no digit) that carry any `tokenBytes` bytes: the
  // length of the largest token, 256^tokenBytes - 1, written in that base (ByteSymbolConverter,
  // byte_symbol_converter.cc).
  private static int digitsPerToken(long symbols, int tokenBytes) {
    BigInteger values = BigInteger.ONE.shiftLeft(8 * tokenBytes);
    BigInteger base = BigInteger.valueOf(symbols - 1);
    int digits = 0;
    for (BigInteger reach = BigInteger.ONE; reach.compareTo(values) < 0;
         reach = reach.multiply(base)) {
      digits++;
    }
    return digits;
  }

  private static int framesPerToken(long symbols, int tokenBytes, boolean checksumSymbol) {
    return digitsPerToken(symbols, tokenBytes) + 1 + (checksumSymbol ? 1 : 0);
  }

  @Override
  public String toString() {
    return "DtmfConfig{" + tokenLengthBytes() + " bytes, " + Arrays.toString(toneFrequencies) + "}";
  }
}
