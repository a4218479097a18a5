#include "audio/vesknet/vesknet_decoder.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <utility>

#include "audio/dsp/number_util.h"
#include "audio/dsp/resampling_kernel.h"
#include "audio/dsp/simd.h"
#include "audio/vesknet/stream_intake.h"
#include "audio/vesknet/vesknet_util.h"
#include "base/logging.h"

// Some checks compare a vector's size with an int, as their texts read.
#pragma GCC diagnostic ignored "-Wsign-compare"

namespace audio_vesknet {
namespace {

constexpr double kSpeedOfSound = 340.0;  // m/s.
constexpr float kSavedSeconds = 30.0f;

TokenSelectorParams MakeTokenSelectorParams(const SymbolWaveCoder& coder,
                                            const VesknetDecoderParams& params) {
  TokenSelectorParams selector;
  selector.alphabet_size = coder.alphabet_size();
  selector.spacer = coder.alphabet_size() - 1;  // The sync symbol separates repetitions.
  selector.symbols_in_token = params.symbols_in_token;
  selector.use_checksum_symbol = params.use_checksum_symbol;
  selector.max_candidates_rank = params.max_candidates_rank;
  selector.max_candidates_to_return = params.max_candidates_to_return;
  return selector;
}

const SymbolWaveCoder& CheckedCoder(const SymbolWaveCoder* symbol_wave_coder) {
  CHECK(symbol_wave_coder);
  return *symbol_wave_coder;
}

}  // namespace

VesknetDecoder::VesknetDecoder(const SymbolWaveCoder* symbol_wave_coder,
                               const VesknetDecoderParams& params)
    : coder_(symbol_wave_coder),
      params_(params),
      token_selector_(MakeTokenSelectorParams(CheckedCoder(symbol_wave_coder), params)) {
  const SymbolWaveCoderParams& coder_params = coder_->params();
  converter_ = std::make_unique<TokenSymbolConverter>(coder_params.bits_per_symbol);
  baseband_rate_ = coder_params.sample_rate / coder_params.baseband_decimation_factor;
  frame_size_ = coder_->frame_size() / coder_params.baseband_decimation_factor;

  if (params_.design_baseband_filter) {
    // Sharpness: one chip in baseband samples.
    baseband_filter_taps_ =
        MakeComplexLowpassFilter(params_.baseband_filter_length, params_.baseband_filter_cutoff,
                                 static_cast<float>(coder_params.upsampling_factor /
                                                    coder_params.baseband_decimation_factor));
  } else {
    baseband_filter_taps_ = {0.25f, 0.5f, 0.25f};
  }
  baseband_filter_ = std::make_unique<audio_dsp::StreamingFirFilter>(baseband_filter_taps_);

  // The largest Doppler shift, in carrier cycles per frame.
  const float max_shift = MaxDopplerShift(coder_->carrier_cycles_per_frame(), params_);
  MakeFrequencyOffsets(params_.acquisition_doppler_step, max_shift, &acquisition_shifts_);
  scorer_ = std::make_unique<AcquisitionScorer>(
      coder_->baseband_code(), acquisition_shifts_, params_.acquisition_num_chunks,
      static_cast<float>(params_.noise_smoothing_length),
      static_cast<int>(std::round(params_.acquisition_window_duration * baseband_rate_)));

  // Chunks short enough that the largest shift turns the phase by at most a
  // sixteenth of a cycle within one.
  chunk_length_ =
      std::max(1, static_cast<int>(std::ceil(frame_size_ / std::max(16.0f * max_shift, 1.0f))));
  const int extension = static_cast<int>(std::ceil(frame_size_ * params_.frame_extension));
  extended_size_ = audio_dsp::RoundUpToMultiple(frame_size_ + 2 * extension, chunk_length_);
  left_extension_ = (extended_size_ - frame_size_) / 2;

  frame_window_.resize(extended_size_);
  for (int n = 0; n < extended_size_; ++n) {
    frame_window_[n] = static_cast<float>(std::sin(M_PI * n / extended_size_));
  }
  // The code continues periodically into both extensions.
  CircularPad(coder_->baseband_code(), left_extension_,
              extended_size_ - frame_size_ - left_extension_, &symbol_reference_);
  despread_gain_.resize(extended_size_);
  for (int n = 0; n < extended_size_; ++n) {
    despread_gain_[n] = symbol_reference_[n] * frame_window_[n];
  }

  MakeFrequencyOffsets(params_.decode_doppler_step, max_shift, &decode_shifts_);
  MakePhasorMatrix(-2.0 * M_PI * chunk_length_ / frame_size_, decode_shifts_,
                   extended_size_ / chunk_length_, &decode_phasors_);
  // Box sums are not normalised.
  score_threshold_ =
      params_.score_filter_length * params_.score_filter_count * params_.score_threshold_factor;
}

VesknetDecoder::VesknetDecoder(std::unique_ptr<const SymbolWaveCoder> symbol_wave_coder,
                               const VesknetDecoderParams& params)
    : VesknetDecoder(symbol_wave_coder.get(), params) {
  owned_coder_ = std::move(symbol_wave_coder);
}

VesknetDecoder::~VesknetDecoder() = default;

float VesknetDecoder::MaxDopplerShift(int carrier_cycles_per_frame,
                                      const VesknetDecoderParams& params) {
  return static_cast<float>(carrier_cycles_per_frame * params.max_speed / kSpeedOfSound);
}

int VesknetDecoder::TokenPeriodFrames() const {
  return params_.symbols_in_token + (params_.use_checksum_symbol ? 1 : 0) + 1;
}

void VesknetDecoder::Initialize(float sample_rate, int num_channels) {
  // The downmix divides by the channel count and the buffer sizes scale with
  // the rate: neither may be zero or negative (configuration checks in front
  // keep callers within both).
  CHECK(sample_rate > 0.0);
  CHECK(num_channels >= 1);
  received_rate_ = sample_rate;
  num_channels_ = num_channels;
  input_per_baseband_ = sample_rate / baseband_rate_;
  max_buffer_size_ = static_cast<int>(std::round(params_.max_buffer_duration * sample_rate));
  const double frame_seconds =
      static_cast<double>(coder_->frame_size()) / coder_->params().sample_rate;
  token_size_ = static_cast<int>(std::round(TokenPeriodFrames() * sample_rate * frame_seconds));

  mixing_phasor_ = 1.0;
  mixing_increment_ = std::polar(1.0, -2.0 * M_PI * coder_->carrier_frequency() / sample_rate);

  received_history_.Clear();
  baseband_filter_->Reset();
  const audio_dsp::DefaultResamplingKernel kernel(sample_rate, baseband_rate_);
  baseband_resampler_ =
      std::make_unique<audio_dsp::RationalFactorResampler<std::complex<float>>>(kernel, 2000);
  CHECK(baseband_resampler_->Valid()) << "Failed to initialize RationalFactorResampler.";

  baseband_real_.Clear();
  baseband_imag_.Clear();
  scores_.Clear();
  scorer_->Reset();
  frame_cache_.clear();
  smoothed_.Clear();
  smoothed_stale_ = 0;
  smoothed_stale_head_ = 0;
  samples_received_ = 0;
  unscored_ = 0;
  initialized_ = true;
}

void VesknetDecoder::WipeInternalData() {
  if (initialized_) Initialize(received_rate_, num_channels_);
}

int VesknetDecoder::buffered_input_frames() const {
  return static_cast<int>(std::ceil((baseband_real_.size() + 1) * input_per_baseband_));
}

void VesknetDecoder::ProcessSamples(const std::vector<float>& received_samples) {
  if (!initialized_) {
    LOG(ERROR) << "ProcessSamples() called before call to Initialize().";
    return;
  }
  const int count = static_cast<int>(received_samples.size());
  if (count == 0) return;
  const int first = static_cast<int>(AdmitBlock(
      count, num_channels_, token_size_, max_buffer_size_,
      [this] { return buffered_input_frames(); },
      [this] { Initialize(received_rate_, num_channels_); },
      [this](int frames) { DropHistory(frames); }));
  if (first == count) return;

  // Mono: the plain sum of the channels, not their mean.
  const float* mono = received_samples.data() + first;
  int mono_count = count - first;
  if (num_channels_ > 1) {
    CHECK(received_samples.size() % num_channels_ == 0);
    mono_count /= num_channels_;
    DownmixChannels(mono, mono_count, num_channels_, Downmix::kSum, &mono_);
    mono = mono_.data();
  }
  if (params_.save_received_samples) SaveReceivedSamples(mono, mono_count);
  AppendBaseband(mono, mono_count);
  ScoreNewPositions();
}

void VesknetDecoder::SaveReceivedSamples(const float* mono, int count) {
  received_history_.Append(mono, count);
  const int keep = static_cast<int>(std::round(kSavedSeconds * received_rate_));
  if (received_history_.size() > keep)
    received_history_.DropOldest(received_history_.size() - keep);
}

void VesknetDecoder::AppendBaseband(const float* mono, int count) {
  // Down to complex baseband around the carrier. The phasor advances by one
  // complex product per sample, in four interleaved chains (sample i + 4 from
  // sample i, by the fourth power of the step) so that the products do not
  // wait on each other; the chains drift apart by rounding in double only.
  // The products are written out: std::complex would test each for NaN.
  mixed_.resize(count);
  const double step_real = mixing_increment_.real(), step_imag = mixing_increment_.imag();
  const double square_real = step_real * step_real - step_imag * step_imag;
  const double square_imag = 2.0 * step_real * step_imag;
  const double step4_real = square_real * square_real - square_imag * square_imag;
  const double step4_imag = 2.0 * square_real * square_imag;
  double phasor_real[4], phasor_imag[4];
  phasor_real[0] = mixing_phasor_.real();
  phasor_imag[0] = mixing_phasor_.imag();
  for (int k = 1; k < 4; ++k) {
    phasor_real[k] = phasor_real[k - 1] * step_real - phasor_imag[k - 1] * step_imag;
    phasor_imag[k] = phasor_real[k - 1] * step_imag + phasor_imag[k - 1] * step_real;
  }
  // Chains 0, 1 and 2, 3 in two-lane vectors: each lane computes what the
  // scalar chain would (and the 32-bit build keeps them in registers).
  using audio_dsp::Double2;
  Double2 real01 = {phasor_real[0], phasor_real[1]}, real23 = {phasor_real[2], phasor_real[3]};
  Double2 imag01 = {phasor_imag[0], phasor_imag[1]}, imag23 = {phasor_imag[2], phasor_imag[3]};
  const Double2 step4_re = {step4_real, step4_real}, step4_im = {step4_imag, step4_imag};
  float* mixed = reinterpret_cast<float*>(mixed_.data());
  int i = 0;
  for (; i + 4 <= count; i += 4) {
    const Double2 x01 = {mono[i], mono[i + 1]}, x23 = {mono[i + 2], mono[i + 3]};
    const Double2 mixed_real01 = x01 * real01, mixed_imag01 = x01 * imag01;
    const Double2 mixed_real23 = x23 * real23, mixed_imag23 = x23 * imag23;
    // Interleaved (real, imaginary) pairs, rounded to float.
    audio_dsp::Store4(
        mixed + 2 * i,
        audio_dsp::ToFloat4(__builtin_shufflevector(mixed_real01, mixed_imag01, 0, 2),
                            __builtin_shufflevector(mixed_real01, mixed_imag01, 1, 3)));
    audio_dsp::Store4(
        mixed + 2 * i + 4,
        audio_dsp::ToFloat4(__builtin_shufflevector(mixed_real23, mixed_imag23, 0, 2),
                            __builtin_shufflevector(mixed_real23, mixed_imag23, 1, 3)));
    const Double2 next_real01 = real01 * step4_re - imag01 * step4_im;
    imag01 = real01 * step4_im + imag01 * step4_re;
    real01 = next_real01;
    const Double2 next_real23 = real23 * step4_re - imag23 * step4_im;
    imag23 = real23 * step4_im + imag23 * step4_re;
    real23 = next_real23;
  }
  phasor_real[0] = real01[0];
  phasor_real[1] = real01[1];
  phasor_real[2] = real23[0];
  phasor_real[3] = real23[1];
  phasor_imag[0] = imag01[0];
  phasor_imag[1] = imag01[1];
  phasor_imag[2] = imag23[0];
  phasor_imag[3] = imag23[1];
  const int rest = count - i;
  for (int k = 0; k < rest; ++k) {
    mixed_[i + k] = std::complex<float>(static_cast<float>(mono[i + k] * phasor_real[k]),
                                        static_cast<float>(mono[i + k] * phasor_imag[k]));
  }
  // The phasor of the next block's first sample.
  const std::complex<double> phasor(phasor_real[rest], phasor_imag[rest]);
  mixing_phasor_ = phasor / std::abs(phasor);
  baseband_resampler_->ProcessSamples(mixed_, &resampled_);
  baseband_filter_->ProcessSamples(resampled_, &filtered_);
  new_real_.resize(filtered_.size());
  new_imag_.resize(filtered_.size());
  for (size_t j = 0; j < filtered_.size(); ++j) {
    new_real_[j] = filtered_[j].real();
    new_imag_[j] = filtered_[j].imag();
  }
  baseband_real_.Append(new_real_);
  baseband_imag_.Append(new_imag_);
  samples_received_ += count;
}

void VesknetDecoder::ScoreNewPositions() {
  const int length = baseband_real_.size();
  scorer_->ComputeScores(baseband_real_.data() + unscored_, baseband_imag_.data() + unscored_,
                         length - unscored_, &new_scores_);
  scores_.Append(new_scores_);
  unscored_ = length;
}

void VesknetDecoder::DropHistory(int input_frames) {
  int drop = static_cast<int>(std::ceil(input_frames / input_per_baseband_));
  drop = audio_dsp::RoundUpToMultiple(drop, frame_size_);
  drop = std::min(drop, baseband_real_.size());
  // The score stream trails the baseband by the scorer's look-ahead; the three
  // streams drop alike so that score i stays the score of baseband sample i.
  drop = std::min(drop, scores_.size());
  if (drop <= 0) return;
  baseband_real_.DropOldest(drop);
  baseband_imag_.DropOldest(drop);
  scores_.DropOldest(drop);
  unscored_ -= drop;
  const int64_t oldest_kept = baseband_real_.dropped() + left_extension_;
  frame_cache_.erase(frame_cache_.begin(), frame_cache_.lower_bound(oldest_kept));

  // The smoothed scores move with the scores. The oldest frames kept lose
  // their neighbours and wait for the next request; so does everything when
  // the frame rows no longer line up.
  smoothed_.DropOldest(std::min(drop, smoothed_.size()));
  smoothed_stale_ = std::max(0, smoothed_stale_ - drop);
  if (drop % frame_size_ == 0) {
    const int rows_before = params_.score_filter_count - (params_.score_filter_count - 1) / 2;
    smoothed_stale_head_ = std::max(smoothed_stale_head_, rows_before);
  } else {
    smoothed_stale_ = 0;
  }
}

bool VesknetDecoder::DetectBroadcaster() {
  if (!initialized_) {
    LOG(ERROR) << "DetectBroadcaster() called before call to Initialize().";
    return false;
  }
  return scorer_->GetBroadcasterScore(true) >= params_.broadcaster_threshold;
}

float VesknetDecoder::GetSignalScore() {
  if (!initialized_) {
    LOG(ERROR) << "GetSignalScore called before call to Initialize().";
    return 0.0f;
  }
  return scorer_->GetBroadcasterScore(true);
}

std::vector<float> VesknetDecoder::GetReceivedSamples() const {
  if (!params_.save_received_samples) {
    LOG(ERROR) << "GetReceivedSamples() called but save_received_samples is false.";
    return {};
  }
  return std::vector<float>(received_history_.data(),
                            received_history_.data() + received_history_.size());
}

void VesknetDecoder::ScoreSymbols(const std::vector<float>& baseband_real_extended_frame,
                                  const std::vector<float>& baseband_imaginary_extended_frame,
                                  std::vector<float>* symbol_scores) const {
  const int extended_size = extended_size_;
  CHECK(baseband_real_extended_frame.size() == extended_size);
  CHECK(baseband_imaginary_extended_frame.size() == extended_size);
  CHECK(symbol_scores);

  // Despread and taper, four samples at a time into interleaved pairs.
  std::vector<std::complex<float>>& frame = despread_;
  frame.resize(extended_size);
  {
    const float* real = baseband_real_extended_frame.data();
    const float* imag = baseband_imaginary_extended_frame.data();
    const float* gain = despread_gain_.data();
    float* out = reinterpret_cast<float*>(frame.data());
    int n = 0;
    for (; n + 4 <= extended_size; n += 4) {
      const audio_dsp::Float4 g = audio_dsp::Load4(gain + n);
      const audio_dsp::Float4 re = audio_dsp::Load4(real + n) * g;
      const audio_dsp::Float4 im = audio_dsp::Load4(imag + n) * g;
      audio_dsp::Store4(out + 2 * n, __builtin_shufflevector(re, im, 0, 4, 1, 5));
      audio_dsp::Store4(out + 2 * n + 4, __builtin_shufflevector(re, im, 2, 6, 3, 7));
    }
    for (; n < extended_size; ++n)
      frame[n] = std::complex<float>(real[n] * gain[n], imag[n] * gain[n]);
  }

  // The Doppler shift that best lines up the chunk sums of the whole
  // extended frame.
  const int num_chunks = extended_size / chunk_length_;
  chunk_sums_.resize(num_chunks);
  for (int c = 0; c < num_chunks; ++c) {
    std::complex<float> sum = 0.0f;
    for (int n = c * chunk_length_; n < (c + 1) * chunk_length_; ++n) sum += frame[n];
    chunk_sums_[c] = sum;
  }
  const float shift = decode_shifts_[BestFilterRow(decode_phasors_, chunk_sums_).first];

  // Remove that rotation from the central frame, then its constant phase.
  // The rotation advances by one complex product per sample (in double; the
  // drift over a frame stays far below single precision).
  const std::complex<double> step = std::polar(1.0, -2.0 * M_PI * shift / frame_size_);
  double turn_real = 1.0, turn_imag = 0.0;
  std::complex<float>* central = frame.data() + left_extension_;
  double correlation_real = 0.0, correlation_imag = 0.0;
  for (int n = 0; n < frame_size_; ++n) {
    const double x = central[n].real(), y = central[n].imag();
    const double rotated_real = x * turn_real - y * turn_imag;
    const double rotated_imag = x * turn_imag + y * turn_real;
    central[n] =
        std::complex<float>(static_cast<float>(rotated_real), static_cast<float>(rotated_imag));
    correlation_real += rotated_real;
    correlation_imag += rotated_imag;
    const double next_real = turn_real * step.real() - turn_imag * step.imag();
    turn_imag = turn_real * step.imag() + turn_imag * step.real();
    turn_real = next_real;
  }
  double phase = std::atan2(correlation_imag, correlation_real);
  // With the quadrature carrier the tones ride a quarter cycle from the pedestal.
  if (coder_->params().use_quadrature_carrier) phase += M_PI / 2;
  const std::complex<float> derotate(std::polar(1.0, -phase));
  const float derotate_real = derotate.real(), derotate_imag = derotate.imag();
  aligned_.resize(frame_size_);
  for (int n = 0; n < frame_size_; ++n) {
    aligned_[n] = central[n].real() * derotate_real - central[n].imag() * derotate_imag;
  }

  audio_dsp::MultiplyMatrixVector(coder_->baseband_tones(), aligned_.data(), symbol_scores);
}

bool VesknetDecoder::GetToken(VesknetDecodeResults* results) {
  if (!initialized_) {
    LOG(ERROR) << "GetToken() called before call to Initialize().";
    return false;
  }
  CHECK(results);
  *results = VesknetDecodeResults();
  SmoothScores();
  GroupCandidateStarts();
  const DecodingGroup* group = SelectGroup(groups_, TokenPeriodFrames());
  if (group == nullptr) return false;
  ScoreGroupFrames(*group, results);
  SelectTokens(*group, results);
  return !results->token_candidates.empty();
}

void VesknetDecoder::SmoothScores() {
  const int n = scores_.size();
  const int rows = n / frame_size_;
  const int known = smoothed_.size();
  if (known < n) smoothed_.AppendZeros(n - known);
  // Rows whose box reaches the oldest frame after the history moved, and
  // every row from the first one that new scores can reach.
  SmoothRows(0, std::min(smoothed_stale_head_, rows));
  SmoothRows(std::min(smoothed_stale_, known) / frame_size_, rows);
  // The positions that do not fill a frame are not smoothed.
  float* smoothed = smoothed_.mutable_data();
  std::fill(smoothed + static_cast<int64_t>(rows) * frame_size_, smoothed + n, 0.0f);

  // What new scores will reach: rows from h + 1 before the one that holds
  // the last position whose row box extends past the end.
  const int row_after = (params_.score_filter_length - 1) / 2;
  const int column_after = (params_.score_filter_count - 1) / 2;
  const int first_open = std::max(0, n - row_after) / frame_size_ - column_after;
  smoothed_stale_ = std::max(0, first_open) * frame_size_;
  smoothed_stale_head_ = 0;
}

void VesknetDecoder::SmoothRows(int first_row, int end_row) {
  using audio_dsp::Double2;
  using audio_dsp::Float4;
  using audio_dsp::HighToDouble;
  using audio_dsp::Load4;
  using audio_dsp::LowToDouble;
  using audio_dsp::Store4;
  using audio_dsp::ToFloat4;
  if (first_row >= end_row) return;
  // The box sums of BoxFilter2D over the whole history, for these rows only:
  // first along the flat stream (across row ends, up to its last score), then
  // down each column over the complete rows. Each box is summed in double,
  // oldest value first, and stored as float; four outputs at a time.
  const int f = frame_size_;
  const int n = scores_.size();
  const int rows = n / f;
  const int row_after = (params_.score_filter_length - 1) / 2;
  const int row_before = params_.score_filter_length - row_after;  // Including k.
  const int column_after = (params_.score_filter_count - 1) / 2;
  const int column_before = params_.score_filter_count - column_after;
  const int sum_first = std::max(0, first_row - column_before + 1);
  const int sum_end = std::min(rows, end_row + column_after);
  const float* scores = scores_.data();
  const int begin = sum_first * f;
  const int end = sum_end * f;
  row_sums_.resize(end - begin);
  float* row_sums = row_sums_.data() - begin;  // Indexed by stream position.
  for (int j = begin; j < end;) {
    if (j - row_before + 1 >= 0 && j + 3 + row_after < n && j + 4 <= end) {
      Double2 low = {}, high = {};
      for (int t = j - row_before + 1; t <= j + row_after; ++t) {
        const Float4 values = Load4(scores + t);
        low += LowToDouble(values);
        high += HighToDouble(values);
      }
      Store4(row_sums + j, ToFloat4(low, high));
      j += 4;
    } else {
      double sum = 0.0;
      for (int t = std::max(0, j - row_before + 1); t <= std::min(n - 1, j + row_after); ++t) {
        sum += scores[t];
      }
      row_sums[j] = static_cast<float>(sum);
      ++j;
    }
  }
  float* smoothed = smoothed_.mutable_data();
  const Float4 threshold = {score_threshold_, score_threshold_, score_threshold_, score_threshold_};
  const Float4 zero = {};
  for (int row = first_row; row < end_row; ++row) {
    const int from = std::max(sum_first, row - column_before + 1);
    const int to = std::min(sum_end - 1, row + column_after);
    float* out = smoothed + static_cast<int64_t>(row) * f;
    int c = 0;
    for (; c + 4 <= f; c += 4) {
      Double2 low = {}, high = {};
      for (int r = from; r <= to; ++r) {
        const Float4 values = Load4(row_sums + static_cast<int64_t>(r) * f + c);
        low += LowToDouble(values);
        high += HighToDouble(values);
      }
      const Float4 value = ToFloat4(low, high);
      Store4(out + c, value < threshold ? zero : value);
    }
    for (; c < f; ++c) {
      double sum = 0.0;
      for (int r = from; r <= to; ++r) sum += row_sums[static_cast<int64_t>(r) * f + c];
      const float value = static_cast<float>(sum);
      out[c] = value < score_threshold_ ? 0.0f : value;
    }
  }
}

void VesknetDecoder::GroupCandidateStarts() {
  groups_.clear();
  const float* smoothed = smoothed_.data();
  const int n = smoothed_.size();
  for (int i = 0; i < n;) {
    // Smoothed scores are 0 or above the threshold, so a zero bit pattern is
    // a zero score: skip them eight at a time (in 32-bit words, which the
    // 32-bit build keeps in its registers).
    if (i + 8 <= n) {
      uint32_t bits[8];
      std::memcpy(bits, smoothed + i, sizeof(bits));
      uint32_t any = 0;
      for (const uint32_t word : bits) any |= word;
      if (any == 0) {
        i += 8;
        continue;
      }
    }
    if (!(smoothed[i] > 0.0f)) {
      ++i;
      continue;
    }
    int best = i;
    for (; i < n && smoothed[i] > 0.0f; ++i) {
      if (smoothed[i] > smoothed[best]) best = i;
    }
    bool joined = false;
    for (DecodingGroup& group : groups_) {
      if (group.Add(best, smoothed[best])) {
        joined = true;
        break;
      }
    }
    if (!joined) {
      groups_.emplace_back(best, smoothed[best], frame_size_, params_.group_offset_tolerance,
                           params_.group_max_gap);
    }
  }
}

void VesknetDecoder::ScoreGroupFrames(const DecodingGroup& group, VesknetDecodeResults* results) {
  const int64_t dropped = baseband_real_.dropped();
  const int length = baseband_real_.size();
  real_frame_.resize(extended_size_);
  imag_frame_.resize(extended_size_);
  for (const int position : group.times()) {
    results->frame_times.push_back(static_cast<float>((dropped + position) / baseband_rate_));
    results->frame_scores.push_back(smoothed_[position]);
    const int start = position - left_extension_;
    if (start < 0 || start + extended_size_ > length) continue;
    const int64_t absolute = dropped + position;
    auto cached = frame_cache_.find(absolute);
    if (cached == frame_cache_.end()) {
      std::copy(baseband_real_.data() + start, baseband_real_.data() + start + extended_size_,
                real_frame_.begin());
      std::copy(baseband_imag_.data() + start, baseband_imag_.data() + start + extended_size_,
                imag_frame_.begin());
      std::vector<float> symbol_scores;
      ScoreSymbols(real_frame_, imag_frame_, &symbol_scores);
      cached = frame_cache_.emplace(absolute, std::move(symbol_scores)).first;
    }
    std::vector<float>& entry = results->frame_symbol_scores[group.FrameNumber(position)];
    if (entry.empty()) {
      entry = cached->second;
    } else {
      for (size_t s = 0; s < entry.size(); ++s) entry[s] += cached->second[s];
    }
  }
}

void VesknetDecoder::SelectTokens(const DecodingGroup& group, VesknetDecodeResults* results) {
  token_selector_.SelectTokens(results->frame_symbol_scores, &results->scores_table,
                               &results->token_candidates);
  for (TokenCandidate& candidate : results->token_candidates) {
    converter_->SymbolsToBytes(candidate.symbols, &candidate.bytes);
    candidate.start_index = group.IndexOfFrame(candidate.start_index);
  }
}

}  // namespace audio_vesknet
