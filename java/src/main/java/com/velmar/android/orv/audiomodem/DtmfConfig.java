package com.velmar.android.orv.audiomodem;

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
  private final float[] envelope; // attack, decay, sustain, release (s), sustain level
  private final float[] toneFrequencies; // Empty: the default set.

  private DtmfConfig(Builder b) {
    messageBytes = b.messageBytes;
    crcCheckBytes = b.crcCheckBytes;
    checksumSymbol = b.checksumSymbol;
    sampleRate = b.sampleRate;
    basebandDecimationFactor = b.basebandDecimationFactor;
    windowSeconds = b.windowSeconds;
    tonesPerSymbol = b.tonesPerSymbol;
    envelope = b.envelope.clone();
    toneFrequencies = b.toneFrequencies.clone();
  }

  public static DtmfConfig defaults() {
    return builder().build();
  }

  public static Builder builder() {
    return new Builder();
  }

  public int messageBytes() {
    return messageBytes;
  }

  public int crcCheckBytes() {
    return crcCheckBytes;
  }

  /** Bytes per token: message plus check bytes. */
  public int tokenLengthBytes() {
    return messageBytes + crcCheckBytes;
  }

  public boolean checksumSymbol() {
    return checksumSymbol;
  }

  public float sampleRate() {
    return sampleRate;
  }

  public int basebandDecimationFactor() {
    return basebandDecimationFactor;
  }

  public float windowSeconds() {
    return windowSeconds;
  }

  public int tonesPerSymbol() {
    return tonesPerSymbol;
  }

  /** Attack, decay, sustain and release times (s) and the sustain level. */
  public float[] envelope() {
    return envelope.clone();
  }

  /** The tone set, Hz; empty for the default set. */
  public float[] toneFrequencies() {
    return toneFrequencies.clone();
  }

  /** Samples per symbol: the window rounded to whole decimated samples. */
  public int frameSize() {
    return Math.round(windowSeconds * sampleRate / basebandDecimationFactor)
        * basebandDecimationFactor;
  }

  public static final class Builder {
    private int messageBytes = 5;
    private int crcCheckBytes = 0;
    private boolean checksumSymbol = true;
    private float sampleRate = 44100f;
    private int basebandDecimationFactor = 16;
    private float windowSeconds = 0.05f;
    private int tonesPerSymbol = 2;
    private float[] envelope = {0.025f, 0f, 0f, 0.025f, 1f};
    private float[] toneFrequencies = new float[0];

    private Builder() {}

    public Builder messageBytes(int value) {
      messageBytes = value;
      return this;
    }

    /** Two CRC-16 bytes after the message (off by default; the checksum symbol is on). */
    public Builder crc(boolean enabled) {
      crcCheckBytes = enabled ? 2 : 0;
      return this;
    }

    public Builder checksumSymbol(boolean enabled) {
      checksumSymbol = enabled;
      return this;
    }

    /** Sample rate of the audio, Hz. */
    public Builder sampleRate(float hertz) {
      sampleRate = hertz;
      return this;
    }

    public Builder basebandDecimationFactor(int factor) {
      basebandDecimationFactor = factor;
      return this;
    }

    /** Nominal symbol duration, seconds. */
    public Builder windowSeconds(float seconds) {
      windowSeconds = seconds;
      return this;
    }

    /** The tone set (Hz) and how many tones sound together; every combination is a symbol. */
    public Builder tones(float[] frequencies, int perSymbol) {
      toneFrequencies = frequencies.clone();
      tonesPerSymbol = perSymbol;
      return this;
    }

    /** The symbol envelope: segment times in seconds (adding up to at most the window). */
    public Builder envelope(float attack, float decay, float sustain, float release, float level) {
      envelope = new float[] {attack, decay, sustain, release, level};
      return this;
    }

    public DtmfConfig build() {
      require(messageBytes >= 1, "messageBytes must be at least 1");
      require(sampleRate > 0, "sampleRate must be positive");
      require(basebandDecimationFactor >= 1, "basebandDecimationFactor must be positive");
      require(windowSeconds > 0, "windowSeconds must be positive");
      require(
          Math.round(windowSeconds * sampleRate / basebandDecimationFactor) >= 1,
          "the window must span at least one decimated sample");
      require(tonesPerSymbol >= 1, "tonesPerSymbol must be at least 1");
      int tones = toneFrequencies.length == 0 ? 10 : toneFrequencies.length;
      require(
          toneFrequencies.length > 0 || tonesPerSymbol == 2,
          "the default tone set makes symbols of 2 tones");
      for (float f : toneFrequencies) {
        require(f >= 0 && f < sampleRate / 2, "every tone must lie in [0, sampleRate / 2)");
      }
      long pairs = (long) tones * (tones - 1) / 2;
      long symbols = combinations(tones, tonesPerSymbol, pairs + 1);
      require(symbols >= 3, "the tones must make at least 3 symbols");
      require(symbols <= pairs, "there may be no more symbols than pairs of tones");
      require(symbols <= (1 << 30) / 256 + 1, "too many symbols");
      for (int i = 0; i < 4; i++) {
        require(
            Float.isFinite(envelope[i]) && envelope[i] >= 0,
            "envelope times must be finite and non-negative");
      }
      require(envelope[4] >= 0 && envelope[4] <= 1, "the sustain level must lie in [0, 1]");
      float total = envelope[0] + envelope[1] + envelope[2] + envelope[3];
      require(
          total <= windowSeconds * (1 + 4 * Math.ulp(1f)),
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

    private static void require(boolean condition, String message) {
      if (!condition) {
        throw new IllegalArgumentException(message);
      }
    }
  }

  @Override
  public String toString() {
    return "DtmfConfig{" + tokenLengthBytes() + " bytes, " + Arrays.toString(toneFrequencies) + "}";
  }
}
