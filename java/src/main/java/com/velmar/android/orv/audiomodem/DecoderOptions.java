package com.velmar.android.orv.audiomodem;

import static com.velmar.android.orv.audiomodem.Checks.require;

/**
 * How a receiver listens: the microphone format and the decoder's tuning. Immutable.
 *
 * <p>Defaults were chosen by measurement on the project's channel simulator (see the README): a
 * 0.75 s acquisition window and a broadcaster threshold of 5 for {@link
 * TokenDecoder#broadcasterDetected()}, a history of 4 token durations, and at most 2 tokens per
 * {@link TokenDecoder#tokens()} call.
 */
public final class DecoderOptions {
  private final int microphoneRate;
  private final int channels;
  private final float acquisitionWindowSeconds;
  private final float broadcasterThreshold;
  private final float bufferLengthTokens;
  private final int maxTokensPerCall;
  private final boolean designBasebandFilter;
  private final boolean listeningMode;

  private DecoderOptions(Builder b) {
    microphoneRate = b.microphoneRate;
    channels = b.channels;
    acquisitionWindowSeconds = b.acquisitionWindowSeconds;
    broadcasterThreshold = b.broadcasterThreshold;
    bufferLengthTokens = b.bufferLengthTokens;
    maxTokensPerCall = b.maxTokensPerCall;
    designBasebandFilter = b.designBasebandFilter;
    listeningMode = b.listeningMode;
  }

  /** The measured defaults, for a 44100 Hz mono microphone. */
  public static DecoderOptions defaults() {
    return builder().build();
  }

  /** A builder holding the defaults. */
  public static Builder builder() {
    return new Builder();
  }

  /** Sample rate of the microphone input, Hz, 1000 to 384000. */
  public int microphoneRate() {
    return microphoneRate;
  }

  /** Interleaved channels of the microphone input, 1 to 64. */
  public int channels() {
    return channels;
  }

  /**
   * Span of acquisition scores that broadcaster detection integrates, seconds, in (0, 60]. DSSS.
   */
  public float acquisitionWindowSeconds() {
    return acquisitionWindowSeconds;
  }

  /** Integrated acquisition score above which a broadcaster counts as heard. DSSS. */
  public float broadcasterThreshold() {
    return broadcasterThreshold;
  }

  /**
   * Input history that the decoder keeps, in token durations, 1 to 100 and at most 60 s of audio.
   */
  public float bufferLengthTokens() {
    return bufferLengthTokens;
  }

  /** Most tokens that one {@link TokenDecoder#tokens()} call returns, 1 to 6. */
  public int maxTokensPerCall() {
    return maxTokensPerCall;
  }

  /** Whether the DSSS decoder designs its baseband low-pass instead of using fixed taps. */
  public boolean designBasebandFilter() {
    return designBasebandFilter;
  }

  /** Whether the cheap zintar detector listens in front of the DSSS decoder. */
  public boolean listeningMode() {
    return listeningMode;
  }

  /** Lowest microphone rate at which the listening mode's 18496 Hz detector fits below Nyquist. */
  public static final int MIN_LISTENING_RATE = Limits.MIN_LISTENING_RATE_HZ;

  public static final class Builder {
    private int microphoneRate = 44100;
    private int channels = 1;
    private float acquisitionWindowSeconds = 0.75f;
    private float broadcasterThreshold = 5f;
    private float bufferLengthTokens = 4f;
    private int maxTokensPerCall = 2;
    private boolean designBasebandFilter = false;
    private boolean listeningMode = false;

    private Builder() {}

    /** Microphone sample rate, Hz, 1000 to 384000 (default 44100). */
    public Builder microphoneRate(int hertz) {
      microphoneRate = hertz;
      return this;
    }

    /** Interleaved microphone channels, 1 to 64; mixed to mono (default 1). */
    public Builder channels(int count) {
      channels = count;
      return this;
    }

    /**
     * Span of acquisition scores that {@link TokenDecoder#broadcasterDetected()} integrates,
     * seconds, in (0, 60] (default 0.75). DSSS only.
     */
    public Builder acquisitionWindowSeconds(float seconds) {
      acquisitionWindowSeconds = seconds;
      return this;
    }

    /**
     * Integrated score above which a broadcaster counts as heard (default 5: noise peaks near 3.5,
     * a token at -20 dB scores 8 to 9). DSSS only.
     */
    public Builder broadcasterThreshold(float threshold) {
      broadcasterThreshold = threshold;
      return this;
    }

    /**
     * History kept, in token durations, 1 to 100 (default 4; 2 loses about 1 dB). The decoder's
     * factory also refuses a history of more than 60 s (this times the token's duration).
     */
    public Builder bufferLengthTokens(float tokens) {
      bufferLengthTokens = tokens;
      return this;
    }

    /** Most tokens that one {@link TokenDecoder#tokens()} call returns, 1 to 6 (default 2). */
    public Builder maxTokensPerCall(int count) {
      maxTokensPerCall = count;
      return this;
    }

    /**
     * Whether the DSSS decoder designs its baseband low-pass (true) or uses the fixed taps 0.25,
     * 0.5, 0.25 (false, the default); both measure the same. DSSS only.
     */
    public Builder designBasebandFilter(boolean enabled) {
      designBasebandFilter = enabled;
      return this;
    }

    /**
     * Listen with the cheap zintar detector and wake the DSSS decoder only when a transmitter is
     * heard. It hears only the product waveform ({@link DsssConfig#defaults()}: 48000 Hz coder,
     * upsampling 16), needs a microphone rate of at least {@link #MIN_LISTENING_RATE} Hz and has
     * no Doppler tolerance: beyond about 0.1% of relative speed (or clock skew) it stops waking.
     */
    public Builder listeningMode(boolean enabled) {
      listeningMode = enabled;
      return this;
    }

    /**
     * The options.
     *
     * @throws IllegalArgumentException naming the first value outside its range
     */
    public DecoderOptions build() {
      // MicrophoneError (audio_modem_decoder.cc), which both decoder kinds apply.
      require(microphoneRate >= Limits.MIN_MICROPHONE_RATE_HZ
              && microphoneRate <= Limits.MAX_SAMPLE_RATE_HZ,
          "microphoneRate must be " + Limits.MIN_MICROPHONE_RATE_HZ + " to "
              + (int) Limits.MAX_SAMPLE_RATE_HZ + " Hz, not " + microphoneRate);
      require(channels >= 1 && channels <= Limits.MAX_CHANNELS,
          "channels must be 1 to " + Limits.MAX_CHANNELS + ", not " + channels);
      // DsssDecoderConfigError (audio_modem_decoder.cc).
      require(acquisitionWindowSeconds > 0
              && acquisitionWindowSeconds <= Limits.MAX_ACQUISITION_WINDOW_SECONDS,
          "acquisitionWindowSeconds must lie in (0, " + (int) Limits.MAX_ACQUISITION_WINDOW_SECONDS
              + "], not " + acquisitionWindowSeconds);
      // HistoryError (audio_modem_decoder.cc); the factories of TokenDecoder check the history's
      // duration, which depends on the transmitter's configuration too.
      require(bufferLengthTokens >= Limits.MIN_BUFFER_LENGTH_TOKENS
              && bufferLengthTokens <= Limits.MAX_BUFFER_LENGTH_TOKENS,
          "bufferLengthTokens must lie in [" + (int) Limits.MIN_BUFFER_LENGTH_TOKENS + ", "
              + (int) Limits.MAX_BUFFER_LENGTH_TOKENS + "], not " + bufferLengthTokens);
      // DsssDecoderConfigError and DtmfDecoderConfigError (audio_modem_decoder.cc).
      require(maxTokensPerCall >= 1 && maxTokensPerCall <= Limits.MAX_TOKENS_PER_CALL,
          "maxTokensPerCall must be 1 to " + Limits.MAX_TOKENS_PER_CALL + ", not "
              + maxTokensPerCall);
      // DsssDecoderConfigError (audio_modem_decoder.cc), through the detector it asks for.
      require(!listeningMode || microphoneRate >= MIN_LISTENING_RATE,
          "the listening mode needs a microphone rate of at least " + MIN_LISTENING_RATE
              + " Hz, not " + microphoneRate);
      return new DecoderOptions(this);
    }
  }
}
