// The decoder object that the JNI registry holds under each decoder id: one
// lower decoder (DSSS, DSSS behind the zintar listening mode, or DTMF) behind
// one interface. Collecting tokens is where it does its own
// work: it checks the requested token geometry, verifies and strips CRC-16
// bytes, and builds the list of results. In front of the DSSS and DTMF
// decoders it may run a narrowband excision stage (audio_dsp::
// NarrowbandExcision) that notches steady interfering tones out of the input.
//
// Not thread-safe: one thread at a time, like everything the JNI layer owns.

#ifndef SOCIAL_TANDRY_AUDIO_AUDIO_MODEM_DECODER_H_
#define SOCIAL_TANDRY_AUDIO_AUDIO_MODEM_DECODER_H_

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "audio/dsp/narrowband_excision.h"
#include "audio/vesknet/dtmf/dtmf_decoder.h"
#include "audio/vesknet/vesknet_decoder.h"
#include "social/tandry/audio/dsss_waveform_config.h"
#include "social/tandry/audio/dtmf_waveform_config.h"
#include "social/tandry/audio/zintar_decoder.h"

namespace audio_modem {

// One decoded token.
struct TokenResult {
  std::vector<uint8_t> bytes;  // Message bytes (check bytes stripped when verified).
  int frame_index = 0;         // Index into the frame lists of the token's first frame.
  float score = 0.0f;          // Selector score; unspecified for CRC-verified tokens.
};

struct DecodeResults {
  std::vector<TokenResult> tokens;  // In the order the lower decoder found them.
  std::vector<float> frame_times;   // DSSS: seconds of the chosen group's frames; DTMF: empty.
  std::vector<float> frame_scores;  // DSSS: their filtered acquisition scores; DTMF: empty.
};

class AudioModemDecoder {
 public:
  enum Kind { kDsss = 0, kZintar = 1, kDtmf = 2 };

  // Takes ownership of a DSSS decoder.
  explicit AudioModemDecoder(std::unique_ptr<audio_vesknet::VesknetDecoder> dsss_decoder);
  // Takes ownership of a DSSS decoder behind the zintar listening mode.
  explicit AudioModemDecoder(std::unique_ptr<ZintarDecoder> zintar_decoder);
  // Takes ownership of a DTMF decoder; token size = its bytes_in_token.
  explicit AudioModemDecoder(std::unique_ptr<audio_vesknet::DtmfDecoder> dtmf_decoder);
  ~AudioModemDecoder();

  // Input at `sample_rate` Hz with `num_channels` interleaved channels.
  void Initialize(float sample_rate, int num_channels);
  // Interleaved samples in the 16-bit range, as floats (the zintar kind
  // truncates them back to 16-bit values).
  void ProcessSamples(const std::vector<float>& samples);
  // Interleaved 16-bit samples (read byte-wise: no alignment assumed), for
  // every kind: what ProcessSamples does with them as floats, converted into
  // a buffer that this object keeps, so that a block costs no allocation once
  // the buffer has reached the block size.
  void ProcessPcm16(const int16_t* samples, int count);
  // Raw 16-bit samples for the zintar listening mode; other kinds ignore them.
  // The buffer may be overwritten (mixed down in place).
  void ProcessSamplesWithZintar(int16_t* samples, int count);
  // DSSS: whether a transmitter is audible; DTMF: always false.
  bool DetectBroadcaster();
  // Forgets the audio heard so far.
  void WipeInternalData();
  // 16-bit samples (all channels) that the next block may hold without
  // dropping history.
  int GetMaxSafeInputSize() const;
  // Whether only the listening mode's detector hears the input (the zintar
  // kind before a wake-up or after falling back); false for other kinds.
  bool listening() const;

  // Puts the narrowband excision stage in front of the lower decoder (DSSS
  // and DTMF kinds; the listening mode takes its input unchanged): steady
  // lines in params' band are notched. Its sample rate and channels are set
  // by every Initialize, which (like WipeInternalData) restarts it; call
  // Initialize after this. Costs one spectrum per analysis interval while
  // no line is present; allocates only here and in Initialize.
  void SetNarrowbandExcision(const audio_dsp::NarrowbandExcisionParams& params);
  // The stage, or null without one.
  const audio_dsp::NarrowbandExcision* narrowband_excision() const { return excision_.get(); }

  // Replaces the token list of *decode_results with the tokens heard, each of
  // num_message_bytes + num_crc_check_bytes bytes (0 or 2 check bytes, which
  // are verified and stripped). False when nothing was found, when every
  // token failed its CRC, or, logged at ERROR, for a geometry that does not
  // match token_size().
  bool GetTokens(DecodeResults* decode_results, int num_message_bytes, int num_crc_check_bytes);

  // Bytes per token, check bytes included.
  int token_size() const { return token_size_; }
  Kind kind() const { return kind_; }

 private:
  // Exactly one is set.
  std::unique_ptr<audio_vesknet::VesknetDecoder> dsss_decoder_;
  std::unique_ptr<ZintarDecoder> zintar_decoder_;
  std::unique_ptr<audio_vesknet::DtmfDecoder> dtmf_decoder_;
  Kind kind_;
  std::vector<int16_t> raw_;    // Scratch for the zintar kind.
  std::vector<float> samples_;  // ProcessPcm16's samples as floats.
  int token_size_;
  // The excision stage: its parameters (rate and channels from Initialize)
  // when there is one, the stage, and the notched copy of a caller's block.
  std::unique_ptr<audio_dsp::NarrowbandExcisionParams> excision_params_;
  std::unique_ptr<audio_dsp::NarrowbandExcision> excision_;
  std::vector<float> conditioned_;

  // `samples` as the lower decoder takes them: analysed by the excision
  // stage and, while it has notches in place, notched (in place when they
  // are samples_, else in conditioned_).
  const std::vector<float>& Condition(const std::vector<float>& samples);
};

// Everything a host chooses about a DSSS decoder, in plain values; the
// defaults hear the product transmitter (see DsssEncoderConfig).
struct DsssDecoderConfig {
  int token_length_bytes = 8;  // Check bytes included, >= 1.
  bool use_checksum_symbol = false;
  bool design_baseband_filter = false;
  DsssWaveformConfig waveform;  // Must match the transmitter's.
  // Receiver settings, measured with tools/bench/dsss_robustness --tables host.
  // A 0.75 s window with threshold 5 detects every transmission down to
  // -15 dB within 0.15 s and never answers true in noise (threshold 3, or 4
  // with a 1 s window, does).
  float acquisition_window_seconds = 0.75f;  // > 0.
  float broadcaster_threshold = 5.0f;        // Normalised broadcaster score.
  // 1 to 6. Two let a second candidate pass the CRC when the best one fails;
  // without a CRC the second is usually wrong, so unchecked hosts ask for 1.
  int max_tokens_per_call = 2;
  float input_sample_rate = 44100.0f;  // Microphone rate, Hz, > 0.
  int num_channels = 1;                // Interleaved microphone channels, >= 1.
  // History held, in token durations, >= 1: 3 or more integrate a repeated
  // token equally (2 loses about 1 dB); 4 leaves room for a host that asks late.
  float buffer_length_tokens = 4.0f;
  // The zintar listening mode in front: a cheap detector wakes the decoder
  // (see ZintarDecoder for what it hears). Needs input_sample_rate >= 36994.
  bool use_zintar = false;
  // Notch steady tones in the DSSS band (the carrier +- the chip rate) out
  // of the input (AudioModemDecoder::SetNarrowbandExcision; not in the
  // listening mode). On: a tone 20 dB over the token costs nothing with it
  // and every token without it; the white-noise tables are the same either
  // way (tools/bench/dsss_robustness --tables tone,tones2,snr).
  bool narrowband_excision = true;
};

// Empty when `config` can be built; otherwise a sentence saying what is wrong.
std::string DsssDecoderConfigError(const DsssDecoderConfig& config);

// Builds the coder, the DSSS decoder and the front object, initialised for
// the configured input. A configuration that the lower constructors reject
// aborts; check DsssDecoderConfigError first when it comes from a user.
std::unique_ptr<AudioModemDecoder> MakeDsssAudioModemDecoder(const DsssDecoderConfig& config);

// As above, with the receiver's tuning taken from `tuning` wherever `config`
// does not set it (for measurements of the tuning itself), and, for the
// listening mode, `clock` as its fall-back timer (empty: the steady clock).
std::unique_ptr<AudioModemDecoder> MakeDsssAudioModemDecoder(
    const DsssDecoderConfig& config, const audio_vesknet::VesknetDecoderParams& tuning,
    ZintarDecoder::Clock clock = ZintarDecoder::Clock());

// Tokens per call a DTMF decoder configuration may ask for, as for DSSS.
constexpr int kMaxDtmfTokensPerCall = 6;

// Everything a host chooses about a DTMF decoder, in plain values: the
// waveform, which must match the transmitter's (the defaults hear the
// product transmitter, see DtmfWaveformConfig), and the microphone.
struct DtmfDecoderConfig : DtmfWaveformConfig {
  // 1 to kMaxDtmfTokensPerCall; above the tuning's max_candidates_rank (3 by
  // default) the rank is raised to match.
  int max_tokens_per_call = 2;
  float input_sample_rate = 44100.0f;  // Microphone rate, Hz, > 0.
  int num_channels = 1;                // Interleaved microphone channels, >= 1.
  // History held, in token durations, 1 to 100. Four: three repetitions of a
  // token and the one being received.
  float buffer_length_tokens = 4.0f;
  // Notch steady tones between the lowest and highest tone of the set
  // (widened by 100 Hz) out of the input, never within 10 Hz of a tone of
  // the set (AudioModemDecoder::SetNarrowbandExcision). On: see
  // tools/bench/dtmf_robustness --tables tone,tones2,snr.
  bool narrowband_excision = true;
};

// The excision stage's band for a DSSS waveform (carrier +- chip rate) and
// for a DTMF tone set (the tones +- 100 Hz, the tones protected); the rate
// and channels are the decoder's to set.
audio_dsp::NarrowbandExcisionParams DsssExcisionParams(const DsssWaveformConfig& waveform);
audio_dsp::NarrowbandExcisionParams DtmfExcisionParams(const std::vector<float>& tones_hz);

// Empty when `config` can be built; otherwise a sentence saying what is wrong.
std::string DtmfDecoderConfigError(const DtmfDecoderConfig& config);

// Builds the DTMF parameter record, the DTMF decoder and the front object,
// initialised for the configured input. Returns null, having logged why, when
// the envelope is refused (see audio_vesknet::SetAdsrWindow); any other
// invalid field aborts in the decoder's checks (check DtmfDecoderConfigError
// first when the configuration comes from a user).
std::unique_ptr<AudioModemDecoder> MakeDtmfAudioModemDecoder(const DtmfDecoderConfig& config);

// As above, with the receiver's tuning (the fields after the transmitter's
// record) taken from `tuning` wherever `config` does not set it (for
// measurements of the tuning itself).
std::unique_ptr<AudioModemDecoder> MakeDtmfAudioModemDecoder(
    const DtmfDecoderConfig& config, const audio_vesknet::DtmfDecoderParams& tuning);

}  // namespace audio_modem

#endif  // SOCIAL_TANDRY_AUDIO_AUDIO_MODEM_DECODER_H_
