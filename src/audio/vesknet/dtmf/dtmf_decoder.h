// The streaming DTMF receiver.
//
// Microphone blocks at any rate and channel count go in; the decoder mixes
// them to mono, resamples them to the modulation's sample_rate when needed,
// and runs one ToneStrengthFilter per tone frequency, keeping a bounded
// history of one strength per tone per baseband sample (sample_rate /
// baseband_decimation_factor; a symbol is P = frame_size /
// baseband_decimation_factor baseband samples, 138 with the defaults).
//
// On request (GetToken) it scores that whole history:
//   1. normalisation: each tone's strength is divided by a running maximum
//      over window_size symbols, pulled towards the strongest tone's running
//      maximum by cross_frequency_weight, plus division_floor;
//   2. acquisition: per baseband sample, the tones_per_symbol-th largest
//      normalised strength over the mean of the weaker tones (the noise,
//      smoothed by a gamma filter and aligned for its delay);
//   3. timing: the phase of the acquisition scores folded by P gives the
//      symbol grid;
//   4. candidates: grid points whose acquisition score, and that of both
//      grid neighbours, reaches acquisition_threshold, each with one score per
//      symbol (its weakest tone), keyed by symbol index;
//   5. the TokenSelector folds the candidates onto the token period and picks
//      symbol sequences, which become bytes.
//
// Lifecycle: construct -> Init(rate, channels) -> ProcessSamples / GetToken in
// any order; Init or Reset again restarts. Calls before Init log an error and
// do nothing. Memory: bounded by max_buffer_duration_in_seconds; allocation
// happens at construction and Init, and the per-block and per-request paths
// reuse member buffers once they have reached the history's size (a request
// builds only its candidate map, a few dozen entries, and its results).
// Cost: per input sample one filter step per tone (up to ten tones side by
// side, see ToneStrengthFilter::ProcessAll); per request, normalisation and
// peak selection of the times that new strengths reach (and, after the
// history moved, of the oldest window), four times per vector, then
// O(history) for the noise smoothing (a recursion, one step per time and
// stage, that no vector shortens), the timing and the candidates.
// Not thread-safe: one thread at a time.

#ifndef AUDIO_VESKNET_DTMF_DTMF_DECODER_H_
#define AUDIO_VESKNET_DTMF_DTMF_DECODER_H_

#include <cstdint>
#include <map>
#include <memory>
#include <vector>

#include "audio/dsp/gamma_filter.h"
#include "audio/dsp/matrix.h"
#include "audio/dsp/rational_factor_resampler.h"
#include "audio/dsp/simd.h"
#include "audio/vesknet/dtmf/byte_symbol_converter.h"
#include "audio/vesknet/dtmf/dtmf_encoder_params.h"
#include "audio/vesknet/dtmf/tone_strength_filter.h"
#include "audio/vesknet/stream_buffer.h"
#include "audio/vesknet/token_selector.h"

namespace audio_vesknet {

// The transmitter's record followed by the receiver's tuning. It derives from
// DtmfEncoderParams (rather than holding it as a member) so that the waveform
// fields read alike on both sides (params.sample_rate, params.symbol_table)
// and the record can be handed as it is to everything that takes the
// transmitter's record (validation, frame size, token duration): a decoder
// hears exactly what an encoder built from the same base record sends.
//
// Receiver defaults were measured with tools/bench/dtmf_robustness on the
// project's channel simulator (44.1 and 48 kHz microphones, the default tone
// set, the half-sine and the product envelope); each line gives the reason.
struct DtmfDecoderParams : DtmfEncoderParams {
  DtmfDecoderParams() = default;
  // The transmitter's record with the receiver defaults below.
  explicit DtmfDecoderParams(const DtmfEncoderParams& encoder_params)
      : DtmfEncoderParams(encoder_params) {}

  // m/s, >= 0: Doppler allowance added to the tone filters' bandwidth
  // (f_max x speed / 340 Hz). Each m/s costs about 0.5 to 1 dB, and at 0 a
  // clock skew or Doppler shift of +-0.3 % still decodes.
  float max_meters_per_second = 0.0f;
  // Seconds of tone strengths held, > 0. Four default tokens with their
  // checksum symbol: three repetitions and the one arriving (3 or 6 tokens
  // measured no better).
  float max_buffer_duration_in_seconds = 2.0f;

  struct ToneNormalizationParams {
    // Symbols, >= 0: width of each tone's running maximum (at least one
    // baseband sample is used). 2 and 6 both lose about 0.5 dB.
    float window_size = 4.0f;
    // >= 0: weight of the strongest tone's running maximum in each tone's
    // divisor. At 0 quiet tones are blown up to the loud ones (3 dB lost and
    // more); 0.25 and 0.75 are no better.
    float cross_frequency_weight = 0.5f;
    // 16-bit power units, >= 0: added to the divisor. Positive so that
    // digital silence gives 0, not 0 / 0, whose NaN spreads through the
    // noise smoother and blinds the decoder until the silence has left the
    // buffer. 1.0 is far below any microphone's noise floor.
    float division_floor = 1.0f;
  };
  ToneNormalizationParams tone_normalization_params;

  // Stages of the noise smoother, > 0. 1 and 4 measured the same or
  // slightly worse.
  int32_t noise_estimate_filter_order = 2;
  // Symbols, > 0: width (standard deviation) of the noise smoother. 1 is the
  // same, 4 slightly worse.
  float noise_estimate_filter_stddev = 2.0f;
  // >= 0: least acquisition score of a candidate. 2.5 gains 0.3 dB but lets
  // noise through (false tokens from white noise); 3.5 costs about 1 dB.
  float acquisition_threshold = 3.0f;
  // > 0: best symbol sequences checked for the spacer and checksum. With 3
  // none differs from the best in two symbols, a pair of errors that the
  // checksum misses when one symbol index goes up and another down (a tone
  // read as its neighbour); 6 lets such wrong tokens through at -12 dB SNR
  // and with babble, 3 costs under 0.5 dB.
  int32_t max_candidates_rank = 3;
  // > 0, at most max_candidates_rank: most tokens returned per GetToken call
  // (the host's tokens per call). With rank 3 and a checksum symbol a second
  // token is rare.
  int32_t max_candidates_per_decode_token_call = 2;
  // >= 0: share of a candidate's best symbol score removed from all its
  // scores: with 1/3 only symbols above a third of the best count. 0.2 is
  // the same, 0.5 loses about 0.5 dB.
  float token_threshold_factor = 1.0f / 3;
};

// One token heard.
struct DtmfDecodedToken {
  std::vector<uint8_t> bytes;  // Exactly bytes_in_token bytes.
  float score = 0.0f;          // The token selector's sequence score, larger is better.
};

class DtmfDecoder {
 public:
  // Validates `params` (fatal on failure: first the transmitter's checks,
  // then the receiver fields' ranges) and builds the tone filters, the byte
  // converter and the token selector. Usable after Init.
  explicit DtmfDecoder(const DtmfDecoderParams& params);
  ~DtmfDecoder();
  DtmfDecoder(const DtmfDecoder&) = delete;
  DtmfDecoder& operator=(const DtmfDecoder&) = delete;

  // (Re)starts for input at `received_sample_rate` Hz (> 0) with
  // `num_channels` (>= 1) interleaved channels: clears the history and, when
  // the rate is not sample_rate, builds a resampler to it (fatal checks).
  void Init(float received_sample_rate, int num_channels);

  // Empties the history and Inits again with the same rate and channels
  // (only empties it before the first Init).
  void Reset();

  // Takes in interleaved samples in the 16-bit range, num_channels per
  // frame (fatal otherwise). Channels are averaged. History that the block
  // would push beyond the buffer is dropped oldest first, in whole symbols; a
  // block longer than the whole buffer restarts the decoder on its tail
  // (warnings logged).
  void ProcessSamples(const std::vector<float>& received_samples);

  // The tokens in the history, best first, at most
  // max_candidates_per_decode_token_call; empty when none (or before Init).
  std::vector<DtmfDecodedToken> GetToken();

  // Most received frames (samples per channel) the history may stand for.
  int64_t max_buffer_size() const { return max_buffer_size_; }
  // Received frames the history now stands for: ceil((strengths held + 1) x
  // received rate / baseband rate).
  int64_t buffered_received_samples() const;
  int num_channels() const { return num_channels_; }
  bool initialized() const { return initialized_; }
  const DtmfDecoderParams& params() const { return params_; }
  const ByteSymbolConverter& converter() const { return converter_; }
  const TokenSelector& token_selector() const { return token_selector_; }
  int num_frequencies() const { return num_frequencies_; }
  // Symbol length in samples at sample_rate, and P in baseband samples.
  int frame_size() const { return frame_size_; }
  int samples_per_symbol() const { return samples_per_symbol_; }
  float baseband_sample_rate() const { return baseband_rate_; }
  float tone_filter_bandwidth() const { return tone_bandwidth_; }
  // Strengths held per tone (all tones hold the same number).
  int tone_strength_buffer_size() const { return tone_strength_buffer_size_; }
  // The strengths of tone `tone` held now, oldest first; tests only.
  std::vector<float> ToneStrengths(int tone) const;
  bool has_resampler() const { return received_resampler_ != nullptr; }
  int64_t token_length_received_samples() const { return token_length_; }

  // The acquisition scores of the last GetToken call, one per time held
  // then; for tests.
  const std::vector<float>& last_acquisition_scores() const { return acquisition_scores_; }

  // The steps of GetToken, public for tests.

  // Replaces *tone_scores with the normalised history: num_frequencies() rows,
  // tone_strength_buffer_size() columns.
  void NormalizeToneStrengths(audio_dsp::MatrixXf* tone_scores);
  // Replaces *acquisition_scores with one score per column of `tone_scores`
  // (which must be this decoder's shape; fatal otherwise).
  void ComputeAcquisitionScores(const audio_dsp::MatrixXf& tone_scores,
                                std::vector<float>* acquisition_scores);
  // Smooths a noise estimate in place with the gamma filter, advanced by its
  // delay; the ends are padded with the means of the first and last delay
  // values. A vector not longer than the delay becomes its mean.
  void SmoothNoiseEstimate(std::vector<float>* noise);
  // The symbol phase in [0, P): the position inside a symbol where the
  // acquisition scores peak on average (phase of their first Fourier
  // coefficient after folding by P; a trailing partial symbol is unused).
  int ComputeStartOffset(const std::vector<float>& acquisition_scores) const;
  // Replaces *candidates with the grid points start, start + P, ... whose
  // score (the least of their own and both neighbours', where both exist)
  // reaches acquisition_threshold: symbol index (t / P) -> one score per
  // symbol, its weakest tone's normalised strength.
  void FindCandidates(const audio_dsp::MatrixXf& tone_scores,
                      const std::vector<float>& acquisition_scores, int start,
                      std::map<int, std::vector<float>>* candidates) const;

 private:
  // A queue of tone strengths: append at the back, drop from the front, read
  // as one contiguous array (compacted lazily, see StreamBuffer).
  class ToneStrengthQueue {
   public:
    int Size() const { return buffer_.size(); }
    const float* data() const { return buffer_.data(); }
    float* mutable_data() { return buffer_.mutable_data(); }
    void Append(const std::vector<float>& values) { buffer_.Append(values); }
    void AppendZeros(int count) { buffer_.AppendZeros(count); }
    void DropFront(int count) { buffer_.DropOldest(count); }
    void Clear() { buffer_.Clear(); }

   private:
    StreamBuffer<float> buffer_;
  };

  void DropHistory(int64_t received_samples);
  void FeedMono(const std::vector<float>& mono);
  // Brings normalized_rows_, peak_ and noise_sum_ up to date with the tone
  // strengths: only the times that new strengths can reach, and the oldest
  // ones after the history moved, are scored again.
  void UpdateToneScores();
  // Scores times [first, end): running maxima, normalisation, peak and noise.
  void ScoreTimes(int first, int end);
  void ClearToneScores();
  // For `count` times of the tone rows rows[i][0 .. count): the
  // tones_per_symbol-th largest value into peak and the mean of the values
  // below it into noise (not smoothed).
  void SelectPeaks(const float* const* rows, int count, float* peak, float* noise);
  // Smooths noise_ and sets *acquisition_scores to peak / (smoothed noise +
  // a floor), for every time held.
  void FinishAcquisitionScores(const float* peak, std::vector<float>* acquisition_scores);
  // FindCandidates reading tone scores through tone_score(tone, t).
  template <typename ToneScore>
  void FindCandidatesIn(ToneScore tone_score, const std::vector<float>& acquisition_scores,
                        int start, std::map<int, std::vector<float>>* candidates) const;

  const DtmfDecoderParams params_;
  const ByteSymbolConverter converter_;
  const TokenSelector token_selector_;
  const int num_frequencies_;
  const int frame_size_;
  const int samples_per_symbol_;  // P.
  const float symbol_duration_;   // Seconds.
  const float baseband_rate_;     // Hz.
  const float tone_bandwidth_;    // Hz.
  std::vector<ToneStrengthFilter> tone_filters_;
  std::vector<ToneStrengthQueue> tone_strength_buffers_;
  int tone_strength_buffer_size_ = 0;
  audio_dsp::GammaFilter noise_filter_;

  // Set by Init.
  float received_sample_rate_ = 0.0f;
  int32_t num_channels_ = 1;
  float ratio_ = 1.0f;        // Received samples per baseband sample.
  int64_t token_length_ = 0;  // Received samples of one token with its spacer.
  int64_t max_buffer_size_ = 0;
  std::unique_ptr<audio_dsp::RationalFactorResampler<float>> received_resampler_;
  bool initialized_ = false;

  // Scores per time kept between requests, time after time like the tone
  // strengths and dropped alike: each tone's normalised strength, the
  // tones_per_symbol-th largest of them and the mean of the weaker ones.
  // Times from scores_stale_ on, and below scores_stale_head_ after the
  // history moved, wait for the next request.
  std::vector<ToneStrengthQueue> normalized_rows_;
  ToneStrengthQueue peak_;
  ToneStrengthQueue noise_sum_;
  int scores_stale_ = 0;
  int scores_stale_head_ = 0;
  int normalization_window_ = 1;  // Width of the running maxima, samples.

  // Per-block and per-request scratch, reused.
  std::vector<float> mono_;
  std::vector<float> resampled_;
  std::vector<std::vector<float>> filter_outputs_;  // One per tone.
  std::vector<audio_dsp::Float4> tone_lanes_;       // Four tones' strengths per time.
  std::vector<audio_dsp::Float4> running_max_;      // Their running maxima.
  std::vector<audio_dsp::Float4> max_filter_scratch_;
  std::vector<float> column_max_;
  std::vector<const float*> rows_;      // Tone rows handed to SelectPeaks.
  std::vector<float> tone_major_;       // ComputeAcquisitionScores' input, tone after tone.
  std::vector<audio_dsp::Float4> top_;  // SelectPeaks' ranks, for many tones per symbol.
  std::vector<float> noise_;
  std::vector<float> acquisition_scores_;
  audio_dsp::MatrixXf scores_table_;
  mutable std::vector<double> folded_;  // Scratch of ComputeStartOffset.
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_DTMF_DTMF_DECODER_H_
