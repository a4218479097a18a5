#include "audio/vesknet/dtmf/dtmf_decoder.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <limits>
#include <utility>

#include "audio/dsp/max_filter.h"
#include "audio/dsp/resampling_kernel.h"
#include "audio/vesknet/stream_intake.h"
#include "base/logging.h"

// Some checks compare a vector's size with an int, as their texts read.
#pragma GCC diagnostic ignored "-Wsign-compare"

namespace audio_vesknet {
namespace {

constexpr double kSpeedOfSound = 340.0;  // m/s.
// Bandwidth of one symbol's envelope, in cycles per symbol duration.
constexpr float kSymbolBandwidth = 0.594f;
// Largest denominator of the resampler's rate fraction (filter phases).
constexpr int kResamplerMaxDenominator = 2000;
// Keeps the acquisition ratio finite when the noise estimate is zero.
constexpr float kNoiseFloor = 1e-12f;

// lanes[t] = (rows[0][t], ..., rows[3][t]) for t < count.
void RowsToLanes(const float* const* rows, int count, audio_dsp::Float4* lanes) {
  int t = 0;
  for (; t + 4 <= count; t += 4) {
    audio_dsp::Float4 block[4] = {audio_dsp::Load4(rows[0] + t), audio_dsp::Load4(rows[1] + t),
                                  audio_dsp::Load4(rows[2] + t), audio_dsp::Load4(rows[3] + t)};
    audio_dsp::Transpose4(block);
    for (int j = 0; j < 4; ++j) lanes[t + j] = block[j];
  }
  for (; t < count; ++t)
    lanes[t] = audio_dsp::Float4{rows[0][t], rows[1][t], rows[2][t], rows[3][t]};
}

// rows[l][t] = lane l of lanes[t] for t < count, lane 3 first (rows may
// repeat; a repeated row gets the lowest such lane).
void LanesToRows(const audio_dsp::Float4* lanes, int count, float* const* rows) {
  int t = 0;
  for (; t + 4 <= count; t += 4) {
    audio_dsp::Float4 block[4] = {lanes[t], lanes[t + 1], lanes[t + 2], lanes[t + 3]};
    audio_dsp::Transpose4(block);
    for (int l = 3; l >= 0; --l) audio_dsp::Store4(rows[l] + t, block[l]);
  }
  for (; t < count; ++t) {
    for (int l = 3; l >= 0; --l) rows[l][t] = lanes[t][l];
  }
}

// Vector or single float, loaded alike.
template <typename V>
V LoadLanes(const float* p);
template <>
audio_dsp::Float4 LoadLanes<audio_dsp::Float4>(const float* p) {
  return audio_dsp::Load4(p);
}
template <>
float LoadLanes<float>(const float* p) {
  return *p;
}
inline float Max4(float a, float b) { return std::max(a, b); }
inline float Min4(float a, float b) { return std::min(a, b); }
using audio_dsp::Max4;
using audio_dsp::Min4;

// For the times t .. t + lanes of V: each row's value bubbles through the
// top_count largest so far (largest first); what falls out of the last place
// is one of the values below position k of the ascending order and goes to
// the noise sum, in row order. *peak = the top_count-th largest, *noise_sum =
// that sum. kTop is top_count when known at compile time (the ranks then
// stay in registers), else 0 and `top` holds top_count vectors of scratch.
template <int kTop, typename V>
void RankTimes(const float* const* rows, int num_rows, int top_count, int t, V* top, V* peak,
               V* noise_sum) {
  const int ranks = kTop > 0 ? kTop : top_count;
  for (int j = 0; j < ranks; ++j) top[j] = V{} - std::numeric_limits<float>::infinity();
  V sum = V{};
  for (int i = 0; i < num_rows; ++i) {
    V moving = LoadLanes<V>(rows[i] + t);
    for (int j = 0; j < ranks; ++j) {
      const V larger = Max4(moving, top[j]);
      moving = Min4(moving, top[j]);
      top[j] = larger;
    }
    if (i >= ranks) sum += moving;
  }
  *peak = top[ranks - 1];
  *noise_sum = sum;
}

// The peak (tones_per_symbol-th largest value) and noise (mean of the values
// below it) of every time t < count, four times per vector; the times are
// independent and each lane does the scalar arithmetic.
template <int kTop>
void SelectPeaksOfTimes(const float* const* rows, int num_rows, int top_count, int count,
                        float* peak, float* noise, audio_dsp::Float4* scratch) {
  const int k = num_rows - top_count;
  const float below = static_cast<float>(k);
  audio_dsp::Float4 registers[kTop > 0 ? kTop : 1];
  audio_dsp::Float4* top = kTop > 0 ? registers : scratch;
  int t = 0;
  for (; t + 4 <= count; t += 4) {
    audio_dsp::Float4 p, sum;
    RankTimes<kTop>(rows, num_rows, top_count, t, top, &p, &sum);
    audio_dsp::Store4(peak + t, p);
    audio_dsp::Store4(noise + t, k > 0 ? sum / below : sum);
  }
  for (; t < count; ++t) {
    float tail_top[kTop > 0 ? kTop : 1];
    std::vector<float> tail_scratch(kTop > 0 ? 0 : top_count);
    float sum;
    RankTimes<kTop>(rows, num_rows, top_count, t, kTop > 0 ? tail_top : tail_scratch.data(),
                    &peak[t], &sum);
    noise[t] = k > 0 ? sum / below : sum;
  }
}

// The checks run before any member is built from the record.
const DtmfDecoderParams& Validated(const DtmfDecoderParams& params) {
  ValidateDtmfEncoderParams(params);
  CHECK(params.max_meters_per_second >= 0.0);
  CHECK(params.max_buffer_duration_in_seconds > 0.0);
  CHECK(params.tone_normalization_params.window_size >= 0.0);
  CHECK(params.tone_normalization_params.cross_frequency_weight >= 0.0);
  CHECK(params.tone_normalization_params.division_floor >= 0.0);
  CHECK(params.noise_estimate_filter_order > 0);
  CHECK(params.noise_estimate_filter_stddev > 0.0);
  CHECK(params.acquisition_threshold >= 0.0);
  CHECK(params.max_candidates_rank > 0);
  CHECK(params.max_candidates_per_decode_token_call > 0);
  CHECK(params.token_threshold_factor >= 0);
  return params;
}

TokenSelectorParams MakeTokenSelectorParams(const DtmfDecoderParams& params,
                                            const ByteSymbolConverter& converter) {
  TokenSelectorParams selector;
  selector.alphabet_size = static_cast<int>(params.symbol_table.size());
  selector.spacer = params.spacer_symbol;
  selector.symbols_in_token = converter.symbols_in_token();
  selector.use_checksum_symbol = params.append_checksum_symbol;
  selector.max_candidates_rank = params.max_candidates_rank;
  selector.max_candidates_to_return = params.max_candidates_per_decode_token_call;
  selector.token_threshold_factor = params.token_threshold_factor;
  return selector;
}

float ToneFilterBandwidth(const DtmfDecoderParams& params, float symbol_duration) {
  float max_frequency = 0.0f;
  for (const float frequency : params.tone_frequencies) {
    max_frequency = std::max(max_frequency, frequency);
  }
  return kSymbolBandwidth / symbol_duration +
         static_cast<float>(max_frequency * params.max_meters_per_second / kSpeedOfSound);
}

// round(value) half away from zero, limited to [0, 2^31 - 1]: the buffer
// arithmetic is done in 32-bit frame counts.
int64_t RoundToFrameCount(double value) {
  const double rounded = std::round(value);
  if (!(rounded > 0.0)) return 0;
  return static_cast<int64_t>(std::min<double>(rounded, std::numeric_limits<int32_t>::max()));
}

}  // namespace

DtmfDecoder::DtmfDecoder(const DtmfDecoderParams& params)
    : params_(Validated(params)),
      converter_(static_cast<int>(params_.symbol_table.size()), params_.spacer_symbol,
                 params_.bytes_in_token),
      token_selector_(MakeTokenSelectorParams(params_, converter_)),
      num_frequencies_(static_cast<int>(params_.tone_frequencies.size())),
      frame_size_(GetFrameSize(params_)),
      samples_per_symbol_(frame_size_ / params_.baseband_decimation_factor),
      symbol_duration_(static_cast<float>(frame_size_) / params_.sample_rate),
      baseband_rate_(params_.sample_rate / static_cast<float>(params_.baseband_decimation_factor)),
      tone_bandwidth_(ToneFilterBandwidth(params_, symbol_duration_)),
      tone_strength_buffers_(num_frequencies_),
      noise_filter_(audio_dsp::GammaFilterFromStddev(
          baseband_rate_, params_.noise_estimate_filter_order,
          static_cast<float>(samples_per_symbol_) * params_.noise_estimate_filter_stddev)) {
  tone_filters_.reserve(num_frequencies_);
  for (const float frequency : params_.tone_frequencies) {
    tone_filters_.emplace_back(params_.sample_rate, frequency, tone_bandwidth_,
                               params_.baseband_decimation_factor);
  }
  folded_.resize(samples_per_symbol_);
  filter_outputs_.resize(num_frequencies_);
  normalized_rows_.resize(num_frequencies_);
  // Truncated; at least one sample (a width of 0 would be no maximum at all)
  // and bounded so that the product cannot overflow.
  const double width =
      std::floor(static_cast<double>(samples_per_symbol_) *
                 static_cast<double>(params_.tone_normalization_params.window_size));
  normalization_window_ = static_cast<int>(std::max(1.0, std::min(width, double{1 << 30})));
}

DtmfDecoder::~DtmfDecoder() = default;

void DtmfDecoder::Init(float received_sample_rate, int num_channels) {
  CHECK(received_sample_rate > 0.0);
  CHECK(num_channels >= 1);
  received_sample_rate_ = received_sample_rate;
  num_channels_ = num_channels;
  ratio_ = received_sample_rate / baseband_rate_;
  // The token with its leading spacer and checksum symbol, if any.
  const int symbols = converter_.symbols_in_token() + (params_.append_checksum_symbol ? 1 : 0) + 1;
  token_length_ = RoundToFrameCount(static_cast<double>(symbols) * received_sample_rate *
                                    static_cast<double>(symbol_duration_));
  max_buffer_size_ = RoundToFrameCount(static_cast<double>(params_.max_buffer_duration_in_seconds) *
                                       received_sample_rate);

  if (!(received_sample_rate == params_.sample_rate)) {
    const audio_dsp::DefaultResamplingKernel kernel(received_sample_rate, params_.sample_rate);
    received_resampler_ = std::make_unique<audio_dsp::RationalFactorResampler<float>>(
        kernel, kResamplerMaxDenominator);
    CHECK(received_resampler_->Valid()) << "Failed to initialize RationalFactorResampler.";
  } else {
    received_resampler_.reset();
  }

  tone_strength_buffer_size_ = 0;
  for (ToneStrengthFilter& filter : tone_filters_) filter.Reset();
  for (ToneStrengthQueue& buffer : tone_strength_buffers_) buffer.Clear();
  ClearToneScores();
  initialized_ = true;
}

void DtmfDecoder::ClearToneScores() {
  for (ToneStrengthQueue& row : normalized_rows_) row.Clear();
  peak_.Clear();
  noise_sum_.Clear();
  scores_stale_ = 0;
  scores_stale_head_ = 0;
}

void DtmfDecoder::Reset() {
  for (ToneStrengthQueue& buffer : tone_strength_buffers_) buffer.Clear();
  tone_strength_buffer_size_ = 0;
  ClearToneScores();
  if (initialized_) Init(received_sample_rate_, num_channels_);
}

int64_t DtmfDecoder::buffered_received_samples() const {
  return static_cast<int64_t>(
      std::ceil((static_cast<double>(tone_strength_buffer_size_) + 1.0) * ratio_));
}

std::vector<float> DtmfDecoder::ToneStrengths(int tone) const {
  const ToneStrengthQueue& buffer = tone_strength_buffers_.at(tone);
  return std::vector<float>(buffer.data(), buffer.data() + buffer.Size());
}

void DtmfDecoder::ProcessSamples(const std::vector<float>& received_samples) {
  if (!initialized_) {
    LOG(ERROR) << "ProcessSamples() called before call to Init().";
    return;
  }
  if (received_samples.empty()) return;
  const int64_t count = static_cast<int64_t>(received_samples.size());
  const int64_t first = AdmitBlock(
      count, num_channels_, token_length_, max_buffer_size_,
      [this] { return buffered_received_samples(); },
      [this] { Init(received_sample_rate_, num_channels_); },
      [this](int frames) { DropHistory(frames); });
  if (first == count) return;

  const float* samples = received_samples.data() + first;
  if (num_channels_ == 1) {
    if (first == 0) {
      FeedMono(received_samples);
    } else {
      mono_.assign(samples, received_samples.data() + count);
      FeedMono(mono_);
    }
    return;
  }
  CHECK(received_samples.size() % num_channels_ == 0);
  DownmixChannels(samples, static_cast<int>((count - first) / num_channels_), num_channels_,
                  Downmix::kMean, &mono_);
  FeedMono(mono_);
}

void DtmfDecoder::DropHistory(int64_t received_samples) {
  int64_t drop = static_cast<int64_t>(std::ceil(static_cast<double>(received_samples) / ratio_));
  if (drop <= 0) return;
  // Whole symbols, so that symbol boundaries keep their place in the buffer.
  drop = (drop + samples_per_symbol_ - 1) / samples_per_symbol_ * samples_per_symbol_;
  const int count = static_cast<int>(std::min<int64_t>(drop, tone_strength_buffer_size_));
  for (ToneStrengthQueue& buffer : tone_strength_buffers_) buffer.DropFront(count);
  tone_strength_buffer_size_ -= count;
  // The scores kept move with the strengths; the oldest times lose part of
  // their window and wait for the next request.
  const int kept = std::min(count, peak_.Size());
  for (ToneStrengthQueue& row : normalized_rows_) row.DropFront(kept);
  peak_.DropFront(kept);
  noise_sum_.DropFront(kept);
  scores_stale_ = std::max(0, scores_stale_ - count);
  if (count > 0) {
    const int after = (normalization_window_ - 1) / 2;
    scores_stale_head_ = std::max(scores_stale_head_, normalization_window_ - after - 1);
  }
}

void DtmfDecoder::FeedMono(const std::vector<float>& mono) {
  const std::vector<float>* input = &mono;
  if (received_resampler_) {
    received_resampler_->ProcessSamples(mono, &resampled_);
    input = &resampled_;
  }
  ToneStrengthFilter::ProcessAll(tone_filters_.data(), num_frequencies_, *input,
                                 filter_outputs_.data());
  for (int i = 0; i < num_frequencies_; ++i) {
    tone_strength_buffers_[i].Append(filter_outputs_[i]);
    if (i == 0) tone_strength_buffer_size_ += static_cast<int>(filter_outputs_[i].size());
    CHECK(tone_strength_buffers_[i].Size() == tone_strength_buffer_size_);
  }
}

void DtmfDecoder::NormalizeToneStrengths(audio_dsp::MatrixXf* tone_scores) {
  CHECK(tone_scores);
  UpdateToneScores();
  const int n = tone_strength_buffer_size_;
  // Every element is written below; resize only zero-fills on a new shape.
  if (tone_scores->rows() != num_frequencies_ || tone_scores->cols() != n) {
    tone_scores->resize(num_frequencies_, n);
  }
  for (int i = 0; i < num_frequencies_; ++i) {
    const float* normalized = normalized_rows_[i].data();
    for (int t = 0; t < n; ++t) (*tone_scores)(i, t) = normalized[t];
  }
}

void DtmfDecoder::UpdateToneScores() {
  const int n = tone_strength_buffer_size_;
  const int known = peak_.Size();
  if (known < n) {
    for (ToneStrengthQueue& row : normalized_rows_) row.AppendZeros(n - known);
    peak_.AppendZeros(n - known);
    noise_sum_.AppendZeros(n - known);
  }
  // Times whose window reaches the oldest strengths after the history moved,
  // and every time from the first whose window reaches past the strengths
  // scored before.
  ScoreTimes(0, std::min(scores_stale_head_, n));
  ScoreTimes(std::max(std::min(scores_stale_, known), std::min(scores_stale_head_, n)), n);
  const int after = (normalization_window_ - 1) / 2;
  scores_stale_ = std::max(0, n - after);
  scores_stale_head_ = 0;
}

void DtmfDecoder::ScoreTimes(int first, int end) {
  if (first >= end) return;
  const int n = tone_strength_buffer_size_;
  const DtmfDecoderParams::ToneNormalizationParams& normalization =
      params_.tone_normalization_params;
  // Each tone's running maximum at these times, from the strengths that
  // their windows cover (the maximum is exact, so a part of the history gives
  // the values of the whole).
  const int w = normalization_window_;
  const int after = (w - 1) / 2;
  const int before = w - after;  // Including t.
  const int from = std::max(0, first - before + 1);
  const int to = std::min(n, end + after);
  const int count = end - first;
  const int span = to - from;
  column_max_.resize(count);
  // Four tones at a time, one per lane: the running maxima of the lanes are
  // independent and the maximum is exact, so each lane gets what MaxFilter
  // of its own tone gives. Lanes beyond the last tone repeat it.
  tone_lanes_.resize(span);
  running_max_.resize(span);
  for (int group = 0; group < num_frequencies_; group += 4) {
    const int lanes = std::min(4, num_frequencies_ - group);
    const float* strengths[4];
    float* maxima[4];
    for (int l = 0; l < 4; ++l) {
      const int i = group + std::min(l, lanes - 1);
      strengths[l] = tone_strength_buffers_[i].data() + from;
      maxima[l] = normalized_rows_[i].mutable_data() + first;
    }
    RowsToLanes(strengths, span, tone_lanes_.data());
    audio_dsp::MaxFilter(tone_lanes_.data(), span, w, running_max_.data(), &max_filter_scratch_);
    LanesToRows(running_max_.data() + (first - from), count, maxima);
    for (int l = 0; l < lanes; ++l) {
      const float* x = maxima[l];
      // m: the strongest tone's running maximum at each time.
      if (group + l == 0) {
        std::copy(x, x + count, column_max_.begin());
      } else {
#pragma omp simd
        for (int t = 0; t < count; ++t) column_max_[t] = std::max(column_max_[t], x[t]);
      }
    }
  }
  // In place of the running maxima, tone by tone (vectorisable).
  const float weight = normalization.cross_frequency_weight;
  const float floor = normalization.division_floor;
  const float* m = column_max_.data();
  rows_.resize(num_frequencies_);
  for (int i = 0; i < num_frequencies_; ++i) {
    float* x = normalized_rows_[i].mutable_data() + first;
    const float* s = tone_strength_buffers_[i].data() + first;
#pragma omp simd
    for (int t = 0; t < count; ++t) x[t] = s[t] / ((m[t] - x[t]) * weight + x[t] + floor);
    rows_[i] = normalized_rows_[i].data() + first;
  }
  SelectPeaks(rows_.data(), count, peak_.mutable_data() + first, noise_sum_.mutable_data() + first);
}

void DtmfDecoder::ComputeAcquisitionScores(const audio_dsp::MatrixXf& tone_scores,
                                           std::vector<float>* acquisition_scores) {
  CHECK(tone_scores.rows() == num_frequencies_);
  CHECK(tone_scores.cols() == tone_strength_buffer_size_);
  CHECK(acquisition_scores);
  const int n = tone_strength_buffer_size_;
  // Tone-major copy, in one sequential pass over the columns.
  tone_major_.resize(static_cast<size_t>(num_frequencies_) * n);
  for (int t = 0; t < n; ++t) {
    const float* column = tone_scores.col(t);
    for (int i = 0; i < num_frequencies_; ++i) {
      tone_major_[static_cast<size_t>(i) * n + t] = column[i];
    }
  }
  rows_.resize(num_frequencies_);
  for (int i = 0; i < num_frequencies_; ++i)
    rows_[i] = tone_major_.data() + static_cast<size_t>(i) * n;
  acquisition_scores->resize(n);
  noise_.resize(n);
  SelectPeaks(rows_.data(), n, acquisition_scores->data(), noise_.data());
  FinishAcquisitionScores(acquisition_scores->data(), acquisition_scores);
}

void DtmfDecoder::SelectPeaks(const float* const* rows, int count, float* peak, float* noise) {
  // Position of the tones_per_symbol-th largest value; the k below it are the
  // noise.
  const int k = std::max(0, num_frequencies_ - params_.tones_per_symbol);
  const int top_count = num_frequencies_ - k;
  switch (top_count) {
    case 1:
      return SelectPeaksOfTimes<1>(rows, num_frequencies_, top_count, count, peak, noise, nullptr);
    case 2:
      return SelectPeaksOfTimes<2>(rows, num_frequencies_, top_count, count, peak, noise, nullptr);
    case 3:
      return SelectPeaksOfTimes<3>(rows, num_frequencies_, top_count, count, peak, noise, nullptr);
  }
  top_.resize(top_count);
  SelectPeaksOfTimes<0>(rows, num_frequencies_, top_count, count, peak, noise, top_.data());
}

void DtmfDecoder::FinishAcquisitionScores(const float* peak,
                                          std::vector<float>* acquisition_scores) {
  const int n = tone_strength_buffer_size_;
  // noise_ holds the noise of every time, not yet smoothed.
  SmoothNoiseEstimate(&noise_);
  acquisition_scores->resize(n);
  float* scores = acquisition_scores->data();
  const float* noise = noise_.data();
  // Element by element (peak may be *acquisition_scores itself).
#pragma omp simd
  for (int t = 0; t < n; ++t) scores[t] = peak[t] / (noise[t] + kNoiseFloor);
}

void DtmfDecoder::SmoothNoiseEstimate(std::vector<float>* noise) {
  CHECK(noise);
  std::vector<float>& values = *noise;
  const int n = static_cast<int>(values.size());
  const int delay = noise_filter_.Delay();
  if (n == 0) return;
  if (n <= delay) {
    double sum = 0.0;
    for (const float value : values) sum += value;
    std::fill(values.begin(), values.end(), static_cast<float>(sum / n));
    return;
  }
  // With no delay there is nothing to pad; the first value starts the filter.
  float head_mean = values[0];
  float tail_mean = values[n - 1];
  if (delay > 0) {
    double head = 0.0, tail = 0.0;
    for (int k = 0; k < delay; ++k) {
      head += values[k];
      tail += values[n - delay + k];
    }
    head_mean = static_cast<float>(head / delay);
    tail_mean = static_cast<float>(tail / delay);
  }
  noise_filter_.Reset(head_mean);
  noise_filter_.Process(values.data(), delay, nullptr);
  // In place: value k - delay is written after value k was read.
  noise_filter_.Process(values.data() + delay, n - delay, values.data());
  std::fill(values.begin() + (n - delay), values.end(), tail_mean);
  noise_filter_.Process(values.data() + (n - delay), delay, values.data() + (n - delay));
}

int DtmfDecoder::ComputeStartOffset(const std::vector<float>& acquisition_scores) const {
  const int period = samples_per_symbol_;
  const int n = static_cast<int>(acquisition_scores.size());
  const int num_symbols = n / period;
  std::vector<double>& folded = folded_;
  std::fill(folded.begin(), folded.end(), 0.0);
  double* sums = folded.data();
  for (int j = 0; j < num_symbols; ++j) {
    const float* symbol = acquisition_scores.data() + static_cast<size_t>(j) * period;
#pragma omp simd
    for (int p = 0; p < period; ++p) sums[p] += symbol[p];
  }
  const std::complex<double> step = std::polar(1.0, 2.0 * M_PI / period);
  std::complex<double> power = 1.0;
  std::complex<double> sum = 0.0;
  for (int p = 0; p < period; ++p) {
    sum += folded[p] * power;
    power *= step;
  }
  const double angle = std::atan2(sum.imag(), sum.real());
  const int start = static_cast<int>(std::round(period * angle / (2.0 * M_PI)));
  return ((start % period) + period) % period;
}

void DtmfDecoder::FindCandidates(const audio_dsp::MatrixXf& tone_scores,
                                 const std::vector<float>& acquisition_scores, int start,
                                 std::map<int, std::vector<float>>* candidates) const {
  CHECK(tone_scores.rows() == num_frequencies_);
  CHECK(tone_scores.cols() == tone_strength_buffer_size_);
  CHECK(acquisition_scores.size() == tone_strength_buffer_size_);
  CHECK(candidates);
  FindCandidatesIn(
      [&tone_scores](int tone, int64_t t) { return tone_scores(tone, static_cast<int>(t)); },
      acquisition_scores, start, candidates);
}

template <typename ToneScore>
void DtmfDecoder::FindCandidatesIn(ToneScore tone_score,
                                   const std::vector<float>& acquisition_scores, int start,
                                   std::map<int, std::vector<float>>* candidates) const {
  candidates->clear();
  const int64_t n = tone_strength_buffer_size_;
  const int64_t period = samples_per_symbol_;
  const std::vector<std::vector<int32_t>>& symbol_table = params_.symbol_table;
  for (int64_t t = std::max(start, 0); t < n; t += period) {
    float value = acquisition_scores[t];
    // Inside the buffer a candidate must be supported by both neighbouring
    // symbols; within one symbol of either end it stands alone.
    if (t > period && t + period < n) {
      value = std::min({acquisition_scores[t - period], value, acquisition_scores[t + period]});
    }
    if (!(value >= params_.acquisition_threshold)) continue;
    // Keyed by symbol index, so that the token selector's folding (index mod
    // token period) lines up with whole symbols.
    std::vector<float>& scores = (*candidates)[static_cast<int>(t / period)];
    scores.resize(symbol_table.size());
    for (size_t s = 0; s < symbol_table.size(); ++s) {
      // A symbol is as strong as its weakest tone.
      float weakest = std::numeric_limits<float>::infinity();
      for (const int32_t tone : symbol_table[s]) weakest = std::min(weakest, tone_score(tone, t));
      scores[s] = weakest;
    }
  }
}

std::vector<DtmfDecodedToken> DtmfDecoder::GetToken() {
  std::vector<DtmfDecodedToken> tokens;
  if (!initialized_) {
    LOG(ERROR) << "GetToken() called before call to Init().";
    return tokens;
  }
  // The steps of NormalizeToneStrengths, ComputeAcquisitionScores and
  // FindCandidates, on the normalised strengths kept between requests, tone
  // after tone (the public steps lay them out time after time, which costs
  // two copies).
  UpdateToneScores();
  const int n = tone_strength_buffer_size_;
  noise_.assign(noise_sum_.data(), noise_sum_.data() + n);
  FinishAcquisitionScores(peak_.data(), &acquisition_scores_);
  const int start = ComputeStartOffset(acquisition_scores_);
  rows_.resize(num_frequencies_);
  for (int i = 0; i < num_frequencies_; ++i) rows_[i] = normalized_rows_[i].data();
  const float* const* rows = rows_.data();
  std::map<int, std::vector<float>> candidates;
  FindCandidatesIn([rows](int tone, int64_t t) { return rows[tone][t]; }, acquisition_scores_,
                   start, &candidates);
  // Fewer candidates than one token period cannot cover every position.
  if (static_cast<int>(candidates.size()) < token_selector_.symbol_period()) return tokens;

  std::vector<TokenCandidate> selected;
  token_selector_.SelectTokens(candidates, &scores_table_, &selected);
  for (const TokenCandidate& candidate : selected) {
    std::vector<uint8_t> bytes = converter_.SymbolsToBytes(candidate.symbols);
    // Symbols spelling a number beyond the byte space were never sent: the
    // symbol space is larger, and only the caller can tell by the length.
    if (static_cast<int>(bytes.size()) > params_.bytes_in_token) continue;
    tokens.push_back({std::move(bytes), candidate.score});
  }
  return tokens;
}

}  // namespace audio_vesknet
