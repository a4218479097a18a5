package com.velmar.android.orv.audiomodem;

/**
 * The bounds that the native library's configuration checks put on what hosts may ask for, named
 * once on the Java side. The builders ({@link DsssConfig.Builder#build()}, {@link
 * DtmfConfig.Builder#build()}, {@link DecoderOptions.Builder#build()}) and the factories of {@link
 * TokenDecoder} refuse exactly what those checks refuse, so that every configuration they accept
 * runs: the JNI entry points trust Java and end the process on a value that a native check
 * rejects. Each value names its C++ twin after the colon; change both together.
 */
final class Limits {
  private Limits() {}

  // Bytes per token, check bytes included: audio_modem::kMaxTokenBytes, config_limits.h.
  static final int MAX_TOKEN_BYTES = 256;

  // Any sample rate (coder, broadcast, microphone, DTMF), Hz: audio_modem::kMaxSampleRateHz,
  // config_limits.h.
  static final float MAX_SAMPLE_RATE_HZ = 384000f;

  // Interleaved microphone channels: audio_modem::kMaxChannels, config_limits.h.
  static final int MAX_CHANNELS = 64;

  // One token on air, seconds: audio_modem::kMaxTokenSeconds, config_limits.h.
  static final double MAX_TOKEN_SECONDS = 30.0;

  // The history a decoder keeps (buffer length in tokens x token duration), seconds:
  // audio_modem::kMaxHistorySeconds, config_limits.h.
  static final double MAX_HISTORY_SECONDS = 60.0;

  // Coder samples per DSSS frame (code length x upsampling factor):
  // audio_modem::kMaxDsssFrameSamples, config_limits.h.
  static final int MAX_DSSS_FRAME_SAMPLES = 65536;

  // Tones of a DTMF tone set: audio_modem::kMaxDtmfTones, config_limits.h.
  static final int MAX_DTMF_TONES = 64;

  // Floats of acquisition history a DSSS decoder may keep (64 MiB):
  // audio_modem::kMaxAcquisitionFloats, config_limits.h.
  static final long MAX_ACQUISITION_FLOATS = 1L << 24;

  // Register length of the DSSS code: DsssWaveformConfigError, dsss_waveform_config.cc.
  static final int MIN_TAPS = 5;
  static final int MAX_TAPS = 11;

  // Length of the DSSS start transition, seconds, from 0: DsssEncoderConfigError,
  // audio_modem_encoder.cc.
  static final float MAX_TRANSITION_SECONDS = 1f;

  // Lowest microphone rate, Hz: MicrophoneError, audio_modem_decoder.cc.
  static final int MIN_MICROPHONE_RATE_HZ = 1000;

  // Longest acquisition window, seconds, above 0: DsssDecoderConfigError, audio_modem_decoder.cc.
  static final float MAX_ACQUISITION_WINDOW_SECONDS = 60f;

  // Decoder history in token durations: HistoryError, audio_modem_decoder.cc.
  static final float MIN_BUFFER_LENGTH_TOKENS = 1f;
  static final float MAX_BUFFER_LENGTH_TOKENS = 100f;

  // Most tokens per call: audio_vesknet::VesknetDecoderParams::max_candidates_rank,
  // vesknet_decoder.h (DSSS), and audio_modem::kMaxDtmfTokensPerCall, audio_modem_decoder.h
  // (DTMF).
  static final int MAX_TOKENS_PER_CALL = 6;

  // Lowest microphone rate of the listening mode, Hz: the detector's 18496.0625 Hz centre must lie
  // at most at half the rate in whole hertz: ZintarDetectorHolder::Create, zintar_decoder.cc, as
  // DsssDecoderConfigError asks it.
  static final int MIN_LISTENING_RATE_HZ = 36994;

  // DTMF microphone rate over the DTMF sample rate: DtmfDecoderConfigError,
  // audio_modem_decoder.cc.
  static final float MIN_DTMF_RATE_RATIO = 0.001f;
  static final float MAX_DTMF_RATE_RATIO = 1000f;

  // DTMF symbols (tone combinations, the spacer included): DtmfWaveformConfigError and its
  // kMaxAlphabetSize, dtmf_waveform_config.cc.
  static final long MIN_DTMF_SYMBOLS = 3;
  static final long MAX_DTMF_SYMBOLS = (1 << 30) / 256 + 1;

  // How far the DTMF envelope times may add up beyond the window, four float ulps of 1:
  // kDurationTolerance, dtmf_encoder_params.cc.
  static final float ENVELOPE_TOLERANCE = 1 + 4 * Math.ulp(1f);

  // The default DTMF tone set, Hz, and its tones per symbol: a two-octave pentatonic scale from
  // 740 Hz (up to about 2489 Hz), computed to the last bit as SetDefaultToneTable,
  // dtmf_encoder_params.cc, does.
  static final float[] DEFAULT_DTMF_TONES = defaultDtmfTones();
  static final float MAX_DEFAULT_DTMF_TONE = DEFAULT_DTMF_TONES[DEFAULT_DTMF_TONES.length - 1];
  static final int DEFAULT_DTMF_TONES_PER_SYMBOL = 2;

  /**
   * Floats of acquisition history of a DSSS decoder (window x Doppler shifts), computed as
   * AcquisitionFloats (audio_modem_decoder.cc) computes it from the decoder's default tuning:
   * SymbolWaveCoder::CarrierCyclesPerFrame, VesknetDecoder::MaxDopplerShift (1.2 m/s at 340 m/s),
   * MakeFrequencyOffsets (steps of 0.5 cycles per frame) and AcquisitionScorer::HistoryFloats
   * (noise length 300, rows of whole sixteens of shifts, a power-of-two history).
   */
  static long acquisitionHistoryFloats(int numberOfTaps, float coderSampleRate,
      int upsamplingFactor, int basebandDecimationFactor, float carrierFrequency,
      float acquisitionWindowSeconds) {
    int frame = ((1 << numberOfTaps) - 1) * upsamplingFactor;
    int cycles = (int) Math.floor((float) frame * carrierFrequency / coderSampleRate);
    float maxShift = (float) (cycles * 1.2f / 340.0);
    int shifts = 2 * Math.round(maxShift / 0.5f) + 1;
    float basebandRate = coderSampleRate / basebandDecimationFactor;
    int window = Math.round(acquisitionWindowSeconds * basebandRate);
    double q = 300.0 * 300.0 / 24.0;
    double pole = 1.0 + (1.0 - Math.sqrt(2.0 * q + 1.0)) / q;
    int delay = (int) Math.round(2.0 * pole / (1.0 - pole));
    int span = Math.max(2 * (frame / basebandDecimationFactor) - 1, window);
    int needed = Math.max(Math.max(delay + 1, span), Math.max(delay, 10));
    long history = Long.highestOneBit(needed);
    if (history < needed) {
      history <<= 1;
    }
    return history * ((shifts + 15) / 16 * 16);
  }

  private static float[] defaultDtmfTones() {
    int[] semitoneOffsets = {0, 2, 4, 7, 9};
    float[] tones = new float[2 * semitoneOffsets.length];
    float multiplier = 740f;
    for (int octave = 0; octave < 2; octave++) {
      for (int i = 0; i < semitoneOffsets.length; i++) {
        float ratio = (float) Math.pow(2.0, semitoneOffsets[i] / 12.0);
        tones[octave * semitoneOffsets.length + i] = ratio * multiplier;
      }
      multiplier *= 2f;
    }
    return tones;
  }
}
