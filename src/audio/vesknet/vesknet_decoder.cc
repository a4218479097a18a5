#include "audio/vesknet/vesknet_decoder.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "audio/dsp/box_filter.h"
#include "audio/dsp/number_util.h"
#include "audio/dsp/resampling_kernel.h"
#include "audio/vesknet/compute_buffer_truncation.h"
#include "audio/vesknet/decoding_group.h"
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
  const float max_shift =
      static_cast<float>(coder_->carrier_cycles_per_frame() * params_.max_speed / kSpeedOfSound);
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

  MakeFrequencyOffsets(params_.decode_doppler_step, max_shift, &decode_shifts_);
  MakePhasorMatrix(-2.0 * M_PI * chunk_length_ / frame_size_, decode_shifts_,
                   extended_size_ / chunk_length_, &decode_phasors_);
}

VesknetDecoder::VesknetDecoder(std::unique_ptr<const SymbolWaveCoder> symbol_wave_coder,
                               const VesknetDecoderParams& params)
    : VesknetDecoder(symbol_wave_coder.get(), params) {
  owned_coder_ = std::move(symbol_wave_coder);
}

VesknetDecoder::~VesknetDecoder() = default;

int VesknetDecoder::TokenPeriodFrames() const {
  return params_.symbols_in_token + (params_.use_checksum_symbol ? 1 : 0) + 1;
}

void VesknetDecoder::Initialize(float sample_rate, int num_channels) {
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
  int32_t frames_to_skip = 0, frames_to_drop = 0;
  ComputeBufferTruncation(count / num_channels_, buffered_input_frames(), token_size_,
                          max_buffer_size_, &frames_to_skip, &frames_to_drop);
  if (frames_to_skip * num_channels_ >= 1) {
    // The block alone overruns the buffer: start afresh on its tail.
    Initialize(received_rate_, num_channels_);
    ProcessSamples(std::vector<float>(
        received_samples.begin() + static_cast<int64_t>(frames_to_skip) * num_channels_,
        received_samples.end()));
    return;
  }
  if (frames_to_drop > 0) DropHistory(frames_to_drop);

  // Mono: the plain sum of the channels, not their mean.
  const float* mono = received_samples.data();
  int mono_count = count;
  if (num_channels_ > 1) {
    CHECK(received_samples.size() % num_channels_ == 0);
    mono_count = count / num_channels_;
    mono_.resize(mono_count);
    for (int i = 0; i < mono_count; ++i) {
      float sum = 0.0f;
      for (int c = 0; c < num_channels_; ++c) sum += received_samples[i * num_channels_ + c];
      mono_[i] = sum;
    }
    mono = mono_.data();
  }

  if (params_.save_received_samples) {
    received_history_.Append(mono, mono_count);
    const int keep = static_cast<int>(std::round(kSavedSeconds * received_rate_));
    if (received_history_.size() > keep)
      received_history_.DropOldest(received_history_.size() - keep);
  }

  // Down to complex baseband around the carrier.
  mixed_.resize(mono_count);
  std::complex<double> phasor = mixing_phasor_;
  for (int i = 0; i < mono_count; ++i) {
    mixed_[i] = std::complex<float>(static_cast<float>(mono[i] * phasor.real()),
                                    static_cast<float>(mono[i] * phasor.imag()));
    phasor *= mixing_increment_;
  }
  mixing_phasor_ = phasor / std::abs(phasor);
  baseband_resampler_->ProcessSamples(mixed_, &resampled_);
  baseband_filter_->ProcessSamples(resampled_, &filtered_);
  new_real_.resize(filtered_.size());
  new_imag_.resize(filtered_.size());
  for (size_t i = 0; i < filtered_.size(); ++i) {
    new_real_[i] = filtered_[i].real();
    new_imag_[i] = filtered_[i].imag();
  }
  baseband_real_.Append(new_real_);
  baseband_imag_.Append(new_imag_);
  samples_received_ += mono_count;

  // Score what has not been scored yet.
  const int length = baseband_real_.size();
  new_real_.assign(baseband_real_.data() + unscored_, baseband_real_.data() + length);
  new_imag_.assign(baseband_imag_.data() + unscored_, baseband_imag_.data() + length);
  scorer_->ComputeScores(new_real_, new_imag_, &new_scores_);
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

  // Despread and taper.
  std::vector<std::complex<float>> frame(extended_size);
  for (int n = 0; n < extended_size; ++n) {
    const float gain = symbol_reference_[n] * frame_window_[n];
    frame[n] = std::complex<float>(baseband_real_extended_frame[n] * gain,
                                   baseband_imaginary_extended_frame[n] * gain);
  }

  // The Doppler shift that best lines up the chunk sums of the whole
  // extended frame.
  const int num_chunks = extended_size / chunk_length_;
  std::vector<std::complex<float>> chunk_sums(num_chunks);
  for (int c = 0; c < num_chunks; ++c) {
    std::complex<float> sum = 0.0f;
    for (int n = c * chunk_length_; n < (c + 1) * chunk_length_; ++n) sum += frame[n];
    chunk_sums[c] = sum;
  }
  const float shift = decode_shifts_[BestFilterRow(decode_phasors_, chunk_sums).first];

  // Remove that rotation from the central frame, then its constant phase.
  const double step = -2.0 * M_PI * shift / frame_size_;
  std::vector<std::complex<float>> central(frame_size_);
  std::complex<double> correlation = 0.0;
  for (int n = 0; n < frame_size_; ++n) {
    const std::complex<double> rotated =
        std::complex<double>(frame[left_extension_ + n]) * std::polar(1.0, step * n);
    central[n] = std::complex<float>(rotated);
    correlation += rotated;
  }
  double phase = std::atan2(correlation.imag(), correlation.real());
  // With the quadrature carrier the tones ride a quarter cycle from the pedestal.
  if (coder_->params().use_quadrature_carrier) phase += M_PI / 2;
  const std::complex<float> derotate(std::polar(1.0, -phase));
  std::vector<float> aligned(frame_size_);
  for (int n = 0; n < frame_size_; ++n) aligned[n] = (central[n] * derotate).real();

  audio_dsp::MultiplyMatrixVector(coder_->baseband_tones(), aligned.data(), symbol_scores);
}

bool VesknetDecoder::GetToken(VesknetDecodeResults* results) {
  if (!initialized_) {
    LOG(ERROR) << "GetToken() called before call to Initialize().";
    return false;
  }
  CHECK(results);
  *results = VesknetDecodeResults();

  // Integrate the scores along each frame and across successive frames, then
  // keep only what stands clearly above the noise.
  const std::vector<float> scores(scores_.data(), scores_.data() + scores_.size());
  std::vector<float> filtered;
  audio_dsp::BoxFilter2D(scores, frame_size_, params_.score_filter_length,
                         params_.score_filter_count, /*allow_ragged=*/true, &filtered);
  const float threshold =
      params_.score_filter_length * params_.score_filter_count * params_.score_threshold_factor;
  for (float& value : filtered) {
    if (value < threshold) value = 0.0f;
  }

  // One candidate start per run of positive values, at its largest value;
  // candidates join the first group whose grid they fit.
  std::vector<DecodingGroup> groups;
  const int n = static_cast<int>(filtered.size());
  for (int i = 0; i < n;) {
    if (filtered[i] <= 0.0f) {
      ++i;
      continue;
    }
    int best = i;
    for (; i < n && filtered[i] > 0.0f; ++i) {
      if (filtered[i] > filtered[best]) best = i;
    }
    bool joined = false;
    for (DecodingGroup& group : groups) {
      if (group.Add(best, filtered[best])) {
        joined = true;
        break;
      }
    }
    if (!joined) {
      groups.emplace_back(best, filtered[best], frame_size_, params_.group_offset_tolerance,
                          params_.group_max_gap);
    }
  }
  const DecodingGroup* group = SelectGroup(groups, TokenPeriodFrames());
  if (group == nullptr) return false;

  const int64_t dropped = baseband_real_.dropped();
  const int length = baseband_real_.size();
  std::vector<float> real_frame(extended_size_), imag_frame(extended_size_);
  for (const int position : group->times()) {
    results->frame_times.push_back(static_cast<float>((dropped + position) / baseband_rate_));
    results->frame_scores.push_back(filtered[position]);
    const int start = position - left_extension_;
    if (start < 0 || start + extended_size_ > length) continue;
    const int64_t absolute = dropped + position;
    auto cached = frame_cache_.find(absolute);
    if (cached == frame_cache_.end()) {
      std::copy(baseband_real_.data() + start, baseband_real_.data() + start + extended_size_,
                real_frame.begin());
      std::copy(baseband_imag_.data() + start, baseband_imag_.data() + start + extended_size_,
                imag_frame.begin());
      std::vector<float> symbol_scores;
      ScoreSymbols(real_frame, imag_frame, &symbol_scores);
      cached = frame_cache_.emplace(absolute, std::move(symbol_scores)).first;
    }
    std::vector<float>& entry = results->frame_symbol_scores[group->FrameNumber(position)];
    if (entry.empty()) {
      entry = cached->second;
    } else {
      for (size_t s = 0; s < entry.size(); ++s) entry[s] += cached->second[s];
    }
  }

  token_selector_.SelectTokens(results->frame_symbol_scores, &results->scores_table,
                               &results->token_candidates);
  for (TokenCandidate& candidate : results->token_candidates) {
    converter_->SymbolsToBytes(candidate.symbols, &candidate.bytes);
    candidate.start_index = group->IndexOfFrame(candidate.start_index);
  }
  return !results->token_candidates.empty();
}

}  // namespace audio_vesknet
