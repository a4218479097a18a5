// The streaming DSSS receiver.
//
// Microphone blocks go in; the decoder mixes them to complex baseband around
// the coder's carrier, resamples to the baseband rate, low-pass filters, and
// keeps a bounded history of the baseband stream together with one
// acquisition score per baseband position (how strongly a code frame starts
// there, over the Doppler range). On request it smooths the scores, picks
// candidate frame starts, groups those that lie on one frame grid, scores
// every symbol at every frame of the best group (despreading, a fine Doppler
// search and a correlation with the symbol tones), and lets the token
// selector fold the frames onto one token period and pick the best symbol
// sequences, which become token bytes.
//
// Lifecycle: construct -> Initialize(rate, channels) -> ProcessSamples /
// DetectBroadcaster / GetToken in any order; Initialize again restarts.
// Calls before Initialize log an error and return a neutral value.
// Memory: bounded by max_buffer_duration. Buffers are reused: once they have
// reached the block size, ProcessSamples allocates nothing (except when a
// block longer than the whole buffer restarts the decoder); GetToken
// allocates only its results and one cache entry per newly scored frame.
// Cost: per baseband position the acquisition scorer's work (see
// AcquisitionScorer); per request the smoothing of the scores that arrived
// since the last one (and of the oldest frames after the history moved),
// one pass over the smoothed scores for candidate starts, and the symbol
// scores of frames not scored before.
// Not thread-safe: one thread at a time.

#ifndef AUDIO_VESKNET_VESKNET_DECODER_H_
#define AUDIO_VESKNET_VESKNET_DECODER_H_

#include <complex>
#include <cstdint>
#include <map>
#include <memory>
#include <vector>

#include "audio/dsp/matrix.h"
#include "audio/dsp/rational_factor_resampler.h"
#include "audio/dsp/signal_vector_util.h"
#include "audio/vesknet/acquisition_scorer.h"
#include "audio/vesknet/decoding_group.h"
#include "audio/vesknet/stream_buffer.h"
#include "audio/vesknet/symbol_wave_coder.h"
#include "audio/vesknet/token_selector.h"
#include "audio/vesknet/token_symbol_converter.h"

namespace audio_vesknet {

// Receiver tuning. Fields marked "host" are set through the library's entry
// points; the defaults of the others were measured on the project's channel
// simulator (tools/bench/dsss_robustness --tables tune: successes at -19 to
// -16 dB, at speed 0.997 and 1.003, in reverberation, and false tokens from
// unchecked noise) for both coder configurations in use, 44100 Hz /
// upsampling 15 / decimation 3 and 48000 Hz / 16 / 4. Each line says why.
struct VesknetDecoderParams {
  // m/s, covers speed 1 +- 0.003 (1 m/s); 0.6 loses every token there, 2.0
  // loses about 1 dB and lets noise through.
  float max_speed = 1.2f;
  // Keep the last 30 s of mono input for GetReceivedSamples().
  bool save_received_samples = false;
  // host. true: design the low-pass below; false: fixed taps 0.25, 0.5, 0.25.
  // Both measure the same.
  bool design_baseband_filter = false;
  // Taps of the designed low-pass.
  int baseband_filter_length = 9;
  // Normalised cut-off of the designed low-pass; at least 0.13 (44.1 kHz
  // coder) and 0.16 (48 kHz coder) keep the chip spectrum.
  float baseband_filter_cutoff = 0.2f;
  // Chunks per frame in acquisition; 8 and 32 measure the same.
  int acquisition_num_chunks = 16;
  // host (via the buffer length in tokens). Seconds of input held.
  float max_buffer_duration = 3.0f;
  // Cycles per frame between acquisition shifts; 0.25 and 1.0 measure the
  // same, and 0.5 costs half of 0.25.
  float acquisition_doppler_step = 0.5f;
  // Positions averaged by the acquisition background; 100 and 1000 measure
  // the same.
  int noise_smoothing_length = 300;
  // Box sum of acquisition scores along a frame; 3 loses a quarter of the
  // tokens at -18 dB, 9 loses 2 dB.
  int score_filter_length = 5;
  // ... and across successive frames; 3 loses a quarter at -18 dB, 7 gains
  // nothing.
  int score_filter_count = 5;
  // Box sums below length x count x this are zero. The critical one: 3.5 and
  // 4.0 let noise groups win (hundreds of unchecked false tokens in 3
  // minutes); 5.0 and 5.5 lose up to 1 dB.
  float score_threshold_factor = 4.5f;
  // host. Data symbols per token.
  int symbols_in_token = 16;
  // host. A checksum symbol follows the data symbols.
  bool use_checksum_symbol = false;
  // Fraction of a frame by which a candidate start may miss a group's grid:
  // covers the skew accumulated over three tokens at speed 1 +- 0.003.
  float group_offset_tolerance = 0.15f;
  // Baseband samples by which a candidate may follow a group's last member;
  // must exceed a frame plus the tolerance; 700 and 2000 measure the same.
  int group_max_gap = 1270;
  // Fraction of a frame added on each side when scoring a frame's symbols;
  // 1.0 decodes a fifth more tokens at -19 dB than 0.5.
  float frame_extension = 1.0f;
  // Cycles per frame between the fine Doppler shifts tried per frame; 0.1
  // and 0.4 measure the same.
  float decode_doppler_step = 0.2f;
  // host. DetectBroadcaster() is true at or above this normalised score.
  float broadcaster_threshold = 5.0f;
  // host. Seconds of scores integrated by DetectBroadcaster().
  float acquisition_window_duration = 0.75f;
  // Best symbol sequences checked for the spacer and checksum; 2 loses
  // tokens in reverberation, 12 gains nothing.
  int max_candidates_rank = 6;
  // host. Tokens returned per GetToken() at most.
  int max_candidates_to_return = 2;
};

// What GetToken() found.
struct VesknetDecodeResults {
  std::vector<TokenCandidate> token_candidates;  // Best first; bytes filled in.
  std::vector<float> frame_times;                // Seconds since Initialize, one per group member.
  std::vector<float> frame_scores;               // Their filtered acquisition scores.
  std::map<int, std::vector<float>> frame_symbol_scores;  // Frame number -> symbol scores.
  audio_dsp::MatrixXf scores_table;  // Alphabet x token period, from the token selector.
};

class VesknetDecoder {
 public:
  // The largest Doppler shift searched, in carrier cycles per frame, for a
  // coder of `carrier_cycles_per_frame`.
  static float MaxDopplerShift(int carrier_cycles_per_frame, const VesknetDecoderParams& params);

  // `symbol_wave_coder` must outlive the decoder.
  VesknetDecoder(const SymbolWaveCoder* symbol_wave_coder, const VesknetDecoderParams& params);
  // The decoder owns `symbol_wave_coder`.
  VesknetDecoder(std::unique_ptr<const SymbolWaveCoder> symbol_wave_coder,
                 const VesknetDecoderParams& params);
  ~VesknetDecoder();

  // (Re)starts all streaming state for input at `sample_rate` Hz (> 0) with
  // `num_channels` (>= 1) interleaved channels; other values, and a rate the
  // baseband resampler cannot take, are fatal.
  void Initialize(float sample_rate, int num_channels);

  // Takes in interleaved samples in the 16-bit range. Input that would
  // overrun the buffer drops the oldest history, or, beyond the whole buffer,
  // restarts the decoder on the block's tail (logged as warnings).
  void ProcessSamples(const std::vector<float>& received_samples);

  // Whether a DSSS transmitter is audible: the normalised broadcaster score
  // of the acquisition scorer reaches broadcaster_threshold.
  bool DetectBroadcaster();

  // The normalised broadcaster score itself; 0 before Initialize.
  float GetSignalScore();

  // Replaces *results with the tokens found in the history; true when there
  // is at least one.
  bool GetToken(VesknetDecodeResults* results);

  // The last 30 s of mono input (only with save_received_samples).
  std::vector<float> GetReceivedSamples() const;

  // Forgets the history, keeping the configuration (Initialize again).
  void WipeInternalData();

  // Largest number of input frames held.
  int max_buffer_size() const { return max_buffer_size_; }
  // Input frames the history now stands for.
  int buffered_input_frames() const;
  int num_channels() const { return num_channels_; }
  const VesknetDecoderParams& params() const { return params_; }
  const SymbolWaveCoder& symbol_wave_coder() const { return *coder_; }

  // The baseband history and its acquisition scores (score i belongs to the
  // position i), for tests.
  const StreamBuffer<float>& baseband_real() const { return baseband_real_; }
  const StreamBuffer<float>& baseband_imag() const { return baseband_imag_; }
  const StreamBuffer<float>& acquisition_scores() const { return scores_; }
  // The smoothed scores as of the last GetToken (box sums along and across
  // frames, below the threshold 0), one per acquisition score; for tests.
  const StreamBuffer<float>& smoothed_scores() const { return smoothed_; }

  // Symbol scores of one extended frame (extended_size() samples per part);
  // exposed for tests.
  void ScoreSymbols(const std::vector<float>& baseband_real_extended_frame,
                    const std::vector<float>& baseband_imaginary_extended_frame,
                    std::vector<float>* symbol_scores) const;
  int extended_size() const { return extended_size_; }
  int left_extension() const { return left_extension_; }
  int chunk_length() const { return chunk_length_; }
  int baseband_frame_size() const { return frame_size_; }
  float baseband_sample_rate() const { return baseband_rate_; }

 private:
  // The steps of ProcessSamples.
  // Drops the oldest history to make room for `input_frames` more frames.
  void DropHistory(int input_frames);
  // Keeps the last 30 s of mono input (save_received_samples).
  void SaveReceivedSamples(const float* mono, int count);
  // Mixes mono input down to complex baseband around the carrier, resamples
  // it to the baseband rate, low-pass filters it and appends it to the
  // baseband streams.
  void AppendBaseband(const float* mono, int count);
  // Scores the baseband positions not scored yet.
  void ScoreNewPositions();

  // The steps of GetToken.
  // Brings smoothed_ up to date with the scores: the box sums along each
  // frame and across successive frames, below the threshold set to 0.
  void SmoothScores();
  // Every maximal run of positive smoothed scores gives one candidate start
  // (its largest value); candidates join the first group whose grid they fit
  // or open a new one. Rebuilds groups_.
  void GroupCandidateStarts();
  // The times, scores and symbol scores of the group's frames.
  void ScoreGroupFrames(const DecodingGroup& group, VesknetDecodeResults* results);
  // Token selection over the frames' symbol scores; bytes and frame indices
  // filled in.
  void SelectTokens(const DecodingGroup& group, VesknetDecodeResults* results);

  // Smoothed scores of rows [first_row, end_row) of F positions each.
  void SmoothRows(int first_row, int end_row);
  int TokenPeriodFrames() const;

  std::unique_ptr<const SymbolWaveCoder> owned_coder_;  // May be empty.
  const SymbolWaveCoder* coder_;
  VesknetDecoderParams params_;
  TokenSelector token_selector_;
  std::unique_ptr<TokenSymbolConverter> converter_;
  std::vector<std::complex<float>> baseband_filter_taps_;
  std::unique_ptr<audio_dsp::StreamingFirFilter> baseband_filter_;
  std::vector<float> acquisition_shifts_;
  std::unique_ptr<AcquisitionScorer> scorer_;

  float baseband_rate_;
  int frame_size_;  // F, baseband samples per symbol.
  int chunk_length_;
  int extended_size_;
  int left_extension_;
  std::vector<float> frame_window_;
  std::vector<float> symbol_reference_;
  std::vector<float> despread_gain_;  // symbol_reference_ x frame_window_.
  std::vector<float> decode_shifts_;
  audio_dsp::MatrixXcf decode_phasors_;
  float score_threshold_;  // Smoothed scores below it are 0.

  // Streaming state.
  StreamBuffer<float> received_history_;
  std::complex<double> mixing_phasor_;
  std::complex<double> mixing_increment_;
  std::unique_ptr<audio_dsp::RationalFactorResampler<std::complex<float>>> baseband_resampler_;
  StreamBuffer<float> baseband_real_;
  StreamBuffer<float> baseband_imag_;
  StreamBuffer<float> scores_;
  int64_t samples_received_ = 0;
  int unscored_ = 0;  // Stream index of the first sample not yet scored.
  float received_rate_ = 0.0f;
  int num_channels_ = 1;
  float input_per_baseband_ = 1.0f;
  int max_buffer_size_ = 0;
  int token_size_ = 0;
  bool initialized_ = false;
  // Symbol scores of frames already scored, by absolute baseband position.
  std::map<int64_t, std::vector<float>> frame_cache_;

  // Smoothed scores, position by position like scores_ (dropped alike).
  // Values from smoothed_stale_ on (and the first smoothed_stale_head_ rows
  // after the history moved) wait for the next request.
  StreamBuffer<float> smoothed_;
  int smoothed_stale_ = 0;
  int smoothed_stale_head_ = 0;
  std::vector<DecodingGroup> groups_;

  // Per-block scratch, reused.
  std::vector<float> mono_;
  std::vector<std::complex<float>> mixed_;
  std::vector<std::complex<float>> resampled_;
  std::vector<std::complex<float>> filtered_;
  std::vector<float> new_real_;
  std::vector<float> new_imag_;
  std::vector<float> new_scores_;
  // Per-request scratch, reused.
  std::vector<float> row_sums_;
  std::vector<float> real_frame_;
  std::vector<float> imag_frame_;
  // ScoreSymbols scratch.
  mutable std::vector<std::complex<float>> despread_;
  mutable std::vector<std::complex<float>> chunk_sums_;
  mutable std::vector<float> aligned_;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_VESKNET_DECODER_H_
