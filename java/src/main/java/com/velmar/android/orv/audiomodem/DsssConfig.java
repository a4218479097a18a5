package com.velmar.android.orv.audiomodem;

import static com.velmar.android.orv.audiomodem.Checks.require;

/**
 * What a DSSS transmitter and its receivers must agree on: the token layout and the waveform.
 *
 * <p>The defaults are the product configuration: 6 message bytes protected by 2 CRC-16 bytes, the
 * 7-tap code 0, a 48000 Hz coder with 16 samples per chip and baseband decimation 4 (2032-sample
 * frames), an 18500 Hz carrier, 4 bits per symbol, a 48000 Hz broadcast rate and a 5 ms start
 * transition. This is the configuration that the zintar listening mode hears; {@link
 * Builder#coder44100()} selects the older 44100 Hz coder (upsampling 15, decimation 3;
 * 1905-sample frames), which the listening mode does not hear.
 *
 * <p>Immutable. {@link Builder#build()} validates every value, so that a bad value is an {@link
 * IllegalArgumentException} here rather than an abort inside the native library.
 */
public final class DsssConfig {
  private final int messageBytes;
  private final int crcCheckBytes;
  private final boolean checksumSymbol;
  private final boolean singleSideband;
  private final int numberOfTaps;
  private final int codeNumber;
  private final float coderSampleRate;
  private final int upsamplingFactor;
  private final float carrierFrequency;
  private final int bitsPerSymbol;
  private final int minCyclesPerFrame;
  private final int basebandDecimationFactor;
  private final boolean quadratureCarrier;
  private final int broadcastSampleRate;
  private final float transitionSeconds;

  private DsssConfig(Builder b) {
    messageBytes = b.messageBytes;
    crcCheckBytes = b.crcCheckBytes;
    checksumSymbol = b.checksumSymbol;
    singleSideband = b.singleSideband;
    numberOfTaps = b.numberOfTaps;
    codeNumber = b.codeNumber;
    coderSampleRate = b.coderSampleRate;
    upsamplingFactor = b.upsamplingFactor;
    carrierFrequency = b.carrierFrequency;
    bitsPerSymbol = b.bitsPerSymbol;
    minCyclesPerFrame = b.minCyclesPerFrame;
    basebandDecimationFactor = b.basebandDecimationFactor;
    quadratureCarrier = b.quadratureCarrier;
    broadcastSampleRate = b.broadcastSampleRate;
    transitionSeconds = b.transitionSeconds;
  }

  /** The product configuration. */
  public static DsssConfig defaults() {
    return builder().build();
  }

  /** A builder holding the product defaults. */
  public static Builder builder() {
    return new Builder();
  }

  /** A builder holding this configuration's values, to derive a variant from it. */
  public Builder toBuilder() {
    Builder b = new Builder();
    b.messageBytes = messageBytes;
    b.crcCheckBytes = crcCheckBytes;
    b.checksumSymbol = checksumSymbol;
    b.singleSideband = singleSideband;
    b.numberOfTaps = numberOfTaps;
    b.codeNumber = codeNumber;
    b.coderSampleRate = coderSampleRate;
    b.upsamplingFactor = upsamplingFactor;
    b.carrierFrequency = carrierFrequency;
    b.bitsPerSymbol = bitsPerSymbol;
    b.minCyclesPerFrame = minCyclesPerFrame;
    b.basebandDecimationFactor = basebandDecimationFactor;
    b.quadratureCarrier = quadratureCarrier;
    b.broadcastSampleRate = broadcastSampleRate;
    b.transitionSeconds = transitionSeconds;
    return b;
  }

  /** Message bytes per token, without check bytes: 1 to 256 less the check bytes. */
  public int messageBytes() {
    return messageBytes;
  }

  /** CRC-16 check bytes per token: 0 or 2. */
  public int crcCheckBytes() {
    return crcCheckBytes;
  }

  /** Bytes on air per token: message plus check bytes. */
  public int tokenLengthBytes() {
    return messageBytes + crcCheckBytes;
  }

  /** Whether a checksum symbol follows the data symbols of each token. */
  public boolean checksumSymbol() {
    return checksumSymbol;
  }

  /** Whether the encoder removes everything below the carrier (receivers have no such setting). */
  public boolean singleSideband() {
    return singleSideband;
  }

  /** Register length of the pseudo-noise code, 5 to 11: the code has 2^taps - 1 chips. */
  public int numberOfTaps() {
    return numberOfTaps;
  }

  /** Which code of that register length: 0 to 2 for 5 or 6 taps, 0 to 3 otherwise. */
  public int codeNumber() {
    return codeNumber;
  }

  /** Sample rate at which the symbols are synthesised, Hz, in (0, 384000]. */
  public float coderSampleRate() {
    return coderSampleRate;
  }

  /**
   * Coder samples per chip, positive and a multiple of {@link #basebandDecimationFactor()}; a
   * frame ({@link #frameSize()}) holds at most 65536 samples.
   */
  public int upsamplingFactor() {
    return upsamplingFactor;
  }

  /**
   * Requested carrier, Hz, in (0, coder sample rate / 2] and below half the broadcast sample rate;
   * the coder snaps it to a whole number of cycles per frame.
   */
  public float carrierFrequency() {
    return carrierFrequency;
  }

  /** Data bits per symbol: 1, 2, 4 or 8. */
  public int bitsPerSymbol() {
    return bitsPerSymbol;
  }

  /** Cycles per frame of the tone that marks symbol 0 (symbol s has this + s), at least 0. */
  public int minCyclesPerFrame() {
    return minCyclesPerFrame;
  }

  /** Coder rate over the receiver's baseband rate, positive; divides the upsampling factor. */
  public int basebandDecimationFactor() {
    return basebandDecimationFactor;
  }

  /** Whether the symbol tone rides on the cosine carrier rather than the sine. */
  public boolean quadratureCarrier() {
    return quadratureCarrier;
  }

  /**
   * Sample rate of the encoded audio handed to the loudspeaker, Hz, 1 to 384000 and above twice the
   * carrier.
   */
  public int broadcastSampleRate() {
    return broadcastSampleRate;
  }

  /** Length of the fade-in played before the first repetition, seconds, 0 to 1. */
  public float transitionSeconds() {
    return transitionSeconds;
  }

  /** Coder samples per symbol: code length x upsampling factor. */
  public int frameSize() {
    return codeLength(numberOfTaps) * upsamplingFactor;
  }

  /** Symbols in one token on air: sync, data and, when enabled, checksum. */
  public int framesPerToken() {
    return framesPerToken(tokenLengthBytes(), checksumSymbol, bitsPerSymbol);
  }

  /** Duration of one token on air, seconds, at most 30. */
  public double tokenSeconds() {
    return tokenSeconds(tokenLengthBytes(), checksumSymbol, bitsPerSymbol, numberOfTaps,
        upsamplingFactor, coderSampleRate);
  }

  private static int codeLength(int numberOfTaps) {
    return (1 << numberOfTaps) - 1;
  }

  private static int framesPerToken(int tokenBytes, boolean checksumSymbol, int bitsPerSymbol) {
    return 1 + (8 / bitsPerSymbol) * tokenBytes + (checksumSymbol ? 1 : 0);
  }

  // As DsssTokenSeconds (dsss_waveform_config.cc) computes it, so that the limit on it cuts where
  // the native check does.
  private static double tokenSeconds(int tokenBytes, boolean checksumSymbol, int bitsPerSymbol,
      int numberOfTaps, int upsamplingFactor, float coderSampleRate) {
    return (double) framesPerToken(tokenBytes, checksumSymbol, bitsPerSymbol)
        * codeLength(numberOfTaps) * upsamplingFactor / coderSampleRate;
  }

  /** Builder with the product defaults. */
  public static final class Builder {
    private int messageBytes = 6;
    private int crcCheckBytes = 2;
    private boolean checksumSymbol = false;
    private boolean singleSideband = false;
    private int numberOfTaps = 7;
    private int codeNumber = 0;
    private float coderSampleRate = 48000f;
    private int upsamplingFactor = 16;
    private float carrierFrequency = 18500f;
    private int bitsPerSymbol = 4;
    private int minCyclesPerFrame = 4;
    private int basebandDecimationFactor = 4;
    private boolean quadratureCarrier = false;
    private int broadcastSampleRate = 48000;
    private float transitionSeconds = 0.005f;

    private Builder() {}

    /**
     * Message bytes per token, without check bytes: 1 to 256 less the check bytes, and few enough
     * that a token lasts at most 30 s on air (default 6).
     */
    public Builder messageBytes(int value) {
      messageBytes = value;
      return this;
    }

    /** Whether two CRC-16 bytes protect each token (the default). */
    public Builder crc(boolean enabled) {
      crcCheckBytes = enabled ? 2 : 0;
      return this;
    }

    /** Whether a checksum symbol follows the data symbols (default off; CRC-16 is on). */
    public Builder checksumSymbol(boolean enabled) {
      checksumSymbol = enabled;
      return this;
    }

    /** Whether the encoder removes everything below the carrier (default off). */
    public Builder singleSideband(boolean enabled) {
      singleSideband = enabled;
      return this;
    }

    /**
     * The pseudo-noise code: register length 5 to 11 and code number 0 to 2 (5 or 6 taps) or 0 to
     * 3 (default 7 taps, code 0: 127 chips).
     */
    public Builder code(int numberOfTaps, int codeNumber) {
      this.numberOfTaps = numberOfTaps;
      this.codeNumber = codeNumber;
      return this;
    }

    /**
     * The coder: its sample rate (Hz, in (0, 384000]), samples per chip (positive, at most 65536
     * per frame) and baseband decimation (positive, dividing the samples per chip). Default 48000
     * Hz, 16, 4.
     */
    public Builder coder(float sampleRate, int upsamplingFactor, int basebandDecimationFactor) {
      coderSampleRate = sampleRate;
      this.upsamplingFactor = upsamplingFactor;
      this.basebandDecimationFactor = basebandDecimationFactor;
      return this;
    }

    /** The 44100 Hz coder with upsampling 15 and decimation 3 (1905-sample frames). */
    public Builder coder44100() {
      return coder(44100f, 15, 3);
    }

    /**
     * Requested carrier, Hz, in (0, coder sample rate / 2] and below half the broadcast sample rate
     * (default 18500).
     */
    public Builder carrierFrequency(float hertz) {
      carrierFrequency = hertz;
      return this;
    }

    /** Data bits per symbol: 1, 2, 4 or 8 (default 4). */
    public Builder bitsPerSymbol(int value) {
      bitsPerSymbol = value;
      return this;
    }

    /** Cycles per frame of the tone that marks symbol 0, at least 0 (default 4). */
    public Builder minCyclesPerFrame(int value) {
      minCyclesPerFrame = value;
      return this;
    }

    /** Whether the symbol tone rides on the cosine carrier (default off). */
    public Builder quadratureCarrier(boolean enabled) {
      quadratureCarrier = enabled;
      return this;
    }

    /**
     * Sample rate of the encoded audio, Hz, 1 to 384000 and above twice the carrier (default
     * 48000).
     */
    public Builder broadcastSampleRate(int hertz) {
      broadcastSampleRate = hertz;
      return this;
    }

    /** Length of the fade-in before the first repetition, seconds, 0 to 1 (default 0.005). */
    public Builder transitionSeconds(float seconds) {
      transitionSeconds = seconds;
      return this;
    }

    /**
     * The configuration.
     *
     * @throws IllegalArgumentException naming the first value outside its range
     */
    public DsssConfig build() {
      // The token: DsssEncoderConfigError and DsssDecoderConfigError (audio_modem_*.cc).
      int maxMessageBytes = Limits.MAX_TOKEN_BYTES - crcCheckBytes;
      require(messageBytes >= 1 && messageBytes <= maxMessageBytes,
          "messageBytes must be 1 to " + maxMessageBytes + (crcCheckBytes > 0 ? " with CRC" : "")
              + ", not " + messageBytes);
      // The waveform: DsssWaveformConfigError (dsss_waveform_config.cc).
      require(numberOfTaps >= Limits.MIN_TAPS && numberOfTaps <= Limits.MAX_TAPS,
          "numberOfTaps must be " + Limits.MIN_TAPS + " to " + Limits.MAX_TAPS);
      require(codeNumber >= 0 && codeNumber <= (numberOfTaps <= 6 ? 2 : 3),
          "codeNumber must be 0 to 2 for 5 or 6 taps, 0 to 3 otherwise");
      require(coderSampleRate > 0 && coderSampleRate <= Limits.MAX_SAMPLE_RATE_HZ,
          "the coder sample rate must lie in (0, " + (int) Limits.MAX_SAMPLE_RATE_HZ + "] Hz, not "
              + coderSampleRate);
      require(upsamplingFactor > 0, "upsamplingFactor must be positive");
      require((long) codeLength(numberOfTaps) * upsamplingFactor <= Limits.MAX_DSSS_FRAME_SAMPLES,
          "a frame (code length " + codeLength(numberOfTaps)
              + " x upsamplingFactor) may hold at most " + Limits.MAX_DSSS_FRAME_SAMPLES
              + " samples");
      require(basebandDecimationFactor > 0, "basebandDecimationFactor must be positive");
      require(upsamplingFactor % basebandDecimationFactor == 0,
          "upsamplingFactor must be a multiple of basebandDecimationFactor");
      require(carrierFrequency > 0 && carrierFrequency <= coderSampleRate / 2,
          "carrierFrequency (" + carrierFrequency + " Hz) must lie in (0, coder sample rate / 2]");
      require(bitsPerSymbol == 1 || bitsPerSymbol == 2 || bitsPerSymbol == 4 || bitsPerSymbol == 8,
          "bitsPerSymbol must be 1, 2, 4 or 8");
      require(minCyclesPerFrame >= 0, "minCyclesPerFrame must not be negative");
      // The transmitter: DsssEncoderConfigError (audio_modem_encoder.cc); receivers refuse the
      // same token duration (HistoryError, audio_modem_decoder.cc).
      double tokenSeconds = tokenSeconds(messageBytes + crcCheckBytes, checksumSymbol,
          bitsPerSymbol, numberOfTaps, upsamplingFactor, coderSampleRate);
      require(tokenSeconds <= Limits.MAX_TOKEN_SECONDS,
          "a token may last at most " + (int) Limits.MAX_TOKEN_SECONDS + " s on air, not "
              + tokenSeconds + " s");
      require(broadcastSampleRate >= 1 && broadcastSampleRate <= Limits.MAX_SAMPLE_RATE_HZ,
          "broadcastSampleRate must be 1 to " + (int) Limits.MAX_SAMPLE_RATE_HZ + " Hz, not "
              + broadcastSampleRate);
      require(tokenSeconds * broadcastSampleRate >= 1,
          "a token must last at least one sample at the broadcast rate, not "
              + tokenSeconds * broadcastSampleRate);
      require(carrierFrequency < broadcastSampleRate / 2.0f,
          "carrierFrequency (" + carrierFrequency
              + " Hz) must lie below half the broadcast sample rate (" + broadcastSampleRate
              + " Hz)");
      require(transitionSeconds >= 0 && transitionSeconds <= Limits.MAX_TRANSITION_SECONDS,
          "transitionSeconds must lie in [0, " + (int) Limits.MAX_TRANSITION_SECONDS + "], not "
              + transitionSeconds);
      return new DsssConfig(this);
    }
  }
}
