package com.velmar.android.orv.audiomodem;

import static com.velmar.android.orv.audiomodem.Checks.require;

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

  /** Message bytes per token, without check bytes: at least 1. */
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

  /** Sample rate of the modulation and of the encoded audio, Hz, positive. */
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
    return Math.round(windowSeconds * sampleRate / basebandDecimationFactor)
        * basebandDecimationFactor;
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

    /** Message bytes per token, without check bytes: at least 1 (default 5). */
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

    /** Sample rate of the modulation and of the encoded audio, Hz, positive (default 44100). */
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
      require(messageBytes >= 1, "messageBytes must be at least 1");
      require(sampleRate > 0, "sampleRate must be positive");
      require(basebandDecimationFactor >= 1, "basebandDecimationFactor must be positive");
      require(windowSeconds > 0, "windowSeconds must be positive");
      require(Math.round(windowSeconds * sampleRate / basebandDecimationFactor) >= 1,
          "the window must span at least one decimated sample");
      require(tonesPerSymbol >= 1, "tonesPerSymbol must be at least 1");
      int tones = toneFrequencies.length == 0 ? 10 : toneFrequencies.length;
      require(toneFrequencies.length > 0 || tonesPerSymbol == 2,
          "the default tone set makes symbols of 2 tones");
      for (float f : toneFrequencies) {
        require(f >= 0 && f < sampleRate / 2, "every tone must lie in [0, sampleRate / 2)");
      }
      long pairs = (long) tones * (tones - 1) / 2;
      long symbols = combinations(tones, tonesPerSymbol, pairs + 1);
      require(symbols >= 3, "the tones must make at least 3 symbols");
      require(symbols <= pairs, "there may be no more symbols than pairs of tones");
      require(symbols <= (1 << 30) / 256 + 1, "too many symbols");
      float[] times = {envelope.attackSeconds, envelope.decaySeconds, envelope.sustainSeconds,
          envelope.releaseSeconds};
      for (float time : times) {
        require(
            Float.isFinite(time) && time >= 0, "envelope times must be finite and non-negative");
      }
      require(envelope.sustainLevel >= 0 && envelope.sustainLevel <= 1,
          "the sustain level must lie in [0, 1]");
      float total = times[0] + times[1] + times[2] + times[3];
      require(total <= windowSeconds * (1 + 4 * Math.ulp(1f)),
          "the envelope times add up to more than the window");
      return new DtmfConfig(this);
    }

    // n choose k, or `cap` once it would exceed it.
    private static long combinations(int n, int k, long cap) {
      if (k > n) {
        return 0;
      }
      long result = 1;
      for (int i = 1; i <= k; i++) {
        result = result * (n - k + i) / i;
        if (result >= cap) {
          return cap;
        }
      }
      return result;
    }
  }

  @Override
  public String toString() {
    return "DtmfConfig{" + tokenLengthBytes() + " bytes, " + Arrays.toString(toneFrequencies) + "}";
  }
}
