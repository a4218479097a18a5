#include "audio/vesknet/dtmf/dtmf_encoder_params.h"

#include <cmath>
#include <limits>

#include "audio/dsp/number_util.h"
#include "audio/vesknet/dtmf/byte_symbol_converter.h"
#include "base/logging.h"

namespace audio_vesknet {
namespace {

constexpr double kPi = 3.14159265358979323846;

// Four float ulps above 1: a total envelope time equal to the window up to
// rounding of the sum is accepted.
constexpr float kDurationTolerance = 1.0f + 4.0f * std::numeric_limits<float>::epsilon();

// Cubic smoothstep on [0, 1]: 0 -> 0, 1 -> 1, flat at both ends.
float Smoothstep(float u) { return (3.0f - 2.0f * u) * u * u; }

}  // namespace

DtmfEncoderParams::DtmfEncoderParams() {
  SetDefaultToneTable(this);
  spacer_symbol = static_cast<int32_t>(symbol_table.size()) - 1;
}

void SetDefaultToneTable(DtmfEncoderParams* params) {
  CHECK(params);
  constexpr int kSemitoneOffsets[] = {0, 2, 4, 7, 9};
  constexpr int kNumOctaves = 2;
  params->tone_frequencies.clear();
  float multiplier = 740.0f;
  for (int octave = 0; octave < kNumOctaves; ++octave) {
    for (const int offset : kSemitoneOffsets) {
      const float ratio = static_cast<float>(std::pow(2.0, offset / 12.0));
      params->tone_frequencies.push_back(ratio * multiplier);
    }
    multiplier *= 2.0f;
  }
  MakeToneCombinations(params->tone_frequencies, 2, &params->symbol_table);
}

int32_t GetFrameSize(const DtmfEncoderParams& params) {
  const float decimated = params.window_duration * params.sample_rate /
                          static_cast<float>(params.baseband_decimation_factor);
  const double frame_size =
      static_cast<double>(std::round(decimated)) * params.baseband_decimation_factor;
  // Out-of-range and NaN records yield 0 instead of an undefined conversion;
  // validation then refuses them as a non-positive frame size.
  if (!(std::fabs(frame_size) <= std::numeric_limits<int32_t>::max())) return 0;
  return static_cast<int32_t>(frame_size);
}

float GetTokenDurationSeconds(const DtmfEncoderParams& params) {
  const ByteSymbolConverter converter(static_cast<int>(params.symbol_table.size()),
                                      params.spacer_symbol, params.bytes_in_token);
  const int num_symbols =
      converter.symbols_in_token() + 1 + (params.append_checksum_symbol ? 1 : 0);
  return static_cast<float>(GetFrameSize(params) * num_symbols) / params.sample_rate;
}

void SetDefaultWindow(DtmfEncoderParams* params) {
  using std::isfinite;
  CHECK(params);
  const int32_t frame_size = GetFrameSize(*params);
  params->window_samples.clear();
  if (frame_size <= 0) return;
  params->window_samples.reserve(frame_size);
  for (int32_t i = 0; i < frame_size; ++i) {
    const float fraction = static_cast<float>(i) / static_cast<float>(frame_size);
    const float sample = static_cast<float>(std::sin(kPi * fraction));
    CHECK(isfinite(sample));
    CHECK(sample >= 0.0);
    params->window_samples.push_back(sample);
  }
}

bool SetAdsrWindow(float attack_time, float decay_time, float sustain_time, float release_time,
                   float sustain_amplitude, DtmfEncoderParams* params) {
  if (params == nullptr) {
    LOG(ERROR) << "SetAdsrWindow(): Called with null pointer.";
    return false;
  }
  if (params->sample_rate <= 0.0f) {
    LOG(ERROR) << "SetAdsrWindow(): Called with invalid sample rate.";
    return false;
  }
  // Only a value below zero is refused: a NaN time passes.
  if (attack_time < 0.0f || decay_time < 0.0f || sustain_time < 0.0f || release_time < 0.0f) {
    LOG(ERROR) << "SetAdsrWindow(): Time parameters must be nonnegative.";
    return false;
  }
  if (sustain_amplitude < 0.0f || sustain_amplitude > 1.0f) {
    LOG(ERROR) << "SetAdsrWindow(): Sustain amplitude " << sustain_amplitude
               << " is outside of [0, 1].";
    return false;
  }
  const float total_time = attack_time + decay_time + sustain_time + release_time;
  if (total_time > params->window_duration * kDurationTolerance) {
    LOG(ERROR) << "SetAdsrWindow(): Nonzero duration " << total_time << " exceeds "
               << params->window_duration << ".";
    return false;
  }

  const float attack_end = attack_time;
  const float decay_end = attack_end + decay_time;
  const float sustain_end = decay_end + sustain_time;
  const float release_end = sustain_end + release_time;
  const float level = sustain_amplitude;
  const int32_t frame_size = GetFrameSize(*params);
  params->window_samples.clear();
  if (frame_size <= 0) return true;
  params->window_samples.reserve(frame_size);
  for (int32_t i = 0; i < frame_size; ++i) {
    const float t = static_cast<float>(i) / params->sample_rate;
    float value = 0.0f;
    // A zero-length segment is met only at its single instant; it takes the
    // smoothstep's midpoint there.
    if (t <= attack_end) {
      value = attack_time > 0.0f ? Smoothstep(t / attack_time) : 0.5f;
    } else if (t <= decay_end) {
      value = level + (1.0f - level) *
                          (decay_time > 0.0f ? Smoothstep((decay_end - t) / decay_time) : 0.5f);
    } else if (t <= sustain_end) {
      value = level;
    } else if (t <= release_end) {
      value = level * (release_time > 0.0f ? Smoothstep((release_end - t) / release_time) : 0.5f);
    }
    params->window_samples.push_back(value);
  }
  return true;
}

void ValidateDtmfEncoderParams(const DtmfEncoderParams& params) {
  CHECK(params.sample_rate > 0.0f);
  CHECK(params.baseband_decimation_factor > 0);
  CHECK(params.window_duration > 0.0f);
  const int32_t frame_size = GetFrameSize(params);
  CHECK(frame_size > 0);
  if (!params.window_samples.empty()) {
    CHECK(static_cast<int>(params.window_samples.size()) == frame_size);
    for (const float sample : params.window_samples) {
      CHECK(std::isfinite(sample));
      CHECK(sample >= 0.0);
    }
  }
  const float nyquist_frequency = params.sample_rate * 0.5f;
  for (const float frequency : params.tone_frequencies) {
    CHECK(frequency >= 0.0);
    CHECK(frequency < nyquist_frequency);
  }
  CHECK(params.symbol_table.size() >= 3);
  // Bounded by the number of tone pairs whatever tones_per_symbol is.
  CHECK(params.tone_frequencies.size() * (params.tone_frequencies.size() - 1) / 2 >=
        params.symbol_table.size());
  CHECK(params.tones_per_symbol > 0);
  for (const std::vector<int32_t>& symbol_frequencies : params.symbol_table) {
    CHECK(static_cast<int>(symbol_frequencies.size()) == params.tones_per_symbol);
    for (const int32_t index : symbol_frequencies) {
      CHECK(index >= 0);
      CHECK(index < static_cast<int>(params.tone_frequencies.size()));
    }
  }
  CHECK(params.spacer_symbol >= 0);
  CHECK(params.spacer_symbol < static_cast<int>(params.symbol_table.size()));
  CHECK(params.bytes_in_token > 0);
  CHECK(params.max_amplitude > 0.0);
}

void MakeToneCombinations(const std::vector<float>& frequencies, int tones_per_symbol,
                          std::vector<std::vector<int32_t>>* symbol_table) {
  CHECK(symbol_table);
  symbol_table->clear();
  for (audio_dsp::CombinationIterator it(static_cast<int>(frequencies.size()), tones_per_symbol);
       !it.Done(); it.Next()) {
    const std::vector<int>& combination = it.GetCombination();
    symbol_table->emplace_back(combination.begin(), combination.end());
  }
}

void MakeToneCombinations(const std::vector<float>& frequencies, int tones_per_symbol,
                          DtmfEncoderParams* params) {
  CHECK(params);
  params->tone_frequencies = frequencies;
  MakeToneCombinations(params->tone_frequencies, tones_per_symbol, &params->symbol_table);
  params->spacer_symbol = static_cast<int32_t>(params->symbol_table.size()) - 1;
}

}  // namespace audio_vesknet
