#include "social/tandry/audio/dtmf_waveform_config.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>

#include "audio/vesknet/dtmf/byte_symbol_converter.h"
#include "social/tandry/audio/config_limits.h"

namespace audio_modem {

namespace {

// Number of k-element subsets of n things, or limit + 1 when it exceeds
// `limit` (counted without building them).
int64_t CountCombinationsUpTo(int64_t n, int64_t k, int64_t limit) {
  if (k > n) return 0;
  k = std::min(k, n - k);
  int64_t count = 1;
  for (int64_t i = 1; i <= k; ++i) {
    count = count * (n - k + i) / i;  // Exact: a binomial coefficient at every step.
    if (count > limit) return limit + 1;
  }
  return count;
}

// Largest alphabet whose digit base the byte-symbol conversion can handle.
constexpr int64_t kMaxAlphabetSize = (1 << 30) / 256 + 1;

}  // namespace

std::string DtmfWaveformConfigError(const DtmfWaveformConfig& config) {
  if (config.bytes_in_token < 1 || config.bytes_in_token > kMaxTokenBytes) {
    return "the token must have 1 to " + std::to_string(kMaxTokenBytes) + " bytes";
  }
  if (!(config.sample_rate > 0 && config.sample_rate <= kMaxSampleRateHz)) {
    return "the sample rate must lie in (0, " + std::to_string(int(kMaxSampleRateHz)) + "] Hz";
  }
  if (config.baseband_decimation_factor < 1) return "the decimation factor must be positive";
  if (!(config.window_duration > 0)) return "the symbol duration must be positive";
  audio_vesknet::DtmfEncoderParams params;
  params.sample_rate = config.sample_rate;
  params.baseband_decimation_factor = config.baseband_decimation_factor;
  params.window_duration = config.window_duration;
  if (audio_vesknet::GetFrameSize(params) < 1) {
    return "the symbol duration must round to between one decimated sample and 2^31 samples";
  }
  if (config.tones_per_symbol < 1) return "a symbol needs at least one tone";
  const bool default_tones = config.tone_frequencies.empty();
  if (default_tones && config.tones_per_symbol != 2) {
    return "the default tone set makes symbols of 2 tones";
  }
  const std::vector<float>& tones =
      default_tones ? params.tone_frequencies : config.tone_frequencies;
  if (tones.size() > static_cast<size_t>(kMaxDtmfTones)) {
    return "a tone set may have at most " + std::to_string(kMaxDtmfTones) + " tones";
  }
  for (const float frequency : tones) {
    if (!(frequency >= 0 && frequency < config.sample_rate * 0.5f)) {
      return "every tone must lie in [0, sample_rate / 2) Hz";
    }
  }
  const int64_t num_tones = static_cast<int64_t>(tones.size());
  const int64_t num_pairs = num_tones * (num_tones - 1) / 2;
  const int64_t num_symbols = CountCombinationsUpTo(num_tones, config.tones_per_symbol,
                                                    std::min(num_pairs, kMaxAlphabetSize));
  if (num_symbols < 3) return "the tones must make at least 3 symbols";
  if (num_symbols > num_pairs) return "there may be no more symbols than pairs of tones";
  if (num_symbols > kMaxAlphabetSize) return "too many symbols";
  if (!(std::isfinite(config.attack_time) && config.attack_time >= 0 &&
        std::isfinite(config.decay_time) && config.decay_time >= 0 &&
        std::isfinite(config.sustain_time) && config.sustain_time >= 0 &&
        std::isfinite(config.release_time) && config.release_time >= 0)) {
    return "envelope times must be finite and non-negative";
  }
  if (!(config.sustain_amplitude >= 0 && config.sustain_amplitude <= 1)) {
    return "the sustain amplitude must lie in [0, 1]";
  }
  // The tolerance of SetAdsrWindow: four float ulps above the window.
  const float total_time =
      config.attack_time + config.decay_time + config.sustain_time + config.release_time;
  if (total_time > config.window_duration * (1.0f + 4.0f * std::numeric_limits<float>::epsilon())) {
    return "the envelope times add up to more than the symbol duration";
  }
  if (DtmfTokenSeconds(config) > kMaxTokenSeconds) {
    return "a token may last at most " + std::to_string(static_cast<int>(kMaxTokenSeconds)) +
           " s on air";
  }
  return std::string();
}

double DtmfTokenSeconds(const DtmfWaveformConfig& config) {
  audio_vesknet::DtmfEncoderParams params;
  params.sample_rate = config.sample_rate;
  params.baseband_decimation_factor = config.baseband_decimation_factor;
  params.window_duration = config.window_duration;
  const int64_t num_tones = config.tone_frequencies.empty()
                                ? static_cast<int64_t>(params.tone_frequencies.size())
                                : static_cast<int64_t>(config.tone_frequencies.size());
  const int64_t alphabet =
      CountCombinationsUpTo(num_tones, config.tones_per_symbol, kMaxAlphabetSize);
  const audio_vesknet::ByteSymbolConverter converter(
      static_cast<int>(alphabet), static_cast<int>(alphabet - 1), config.bytes_in_token);
  const double symbols =
      converter.symbols_in_token() + 1.0 + (config.append_checksum_symbol ? 1.0 : 0.0);
  return symbols * audio_vesknet::GetFrameSize(params) / config.sample_rate;
}

bool MakeDtmfEncoderParams(const DtmfWaveformConfig& config,
                           audio_vesknet::DtmfEncoderParams* params) {
  *params = audio_vesknet::DtmfEncoderParams();
  params->bytes_in_token = config.bytes_in_token;
  params->append_checksum_symbol = config.append_checksum_symbol;
  params->sample_rate = config.sample_rate;
  params->baseband_decimation_factor = config.baseband_decimation_factor;
  params->window_duration = config.window_duration;
  params->tones_per_symbol = config.tones_per_symbol;
  if (!config.tone_frequencies.empty()) {
    audio_vesknet::MakeToneCombinations(config.tone_frequencies, config.tones_per_symbol, params);
  }
  return audio_vesknet::SetAdsrWindow(config.attack_time, config.decay_time, config.sustain_time,
                                      config.release_time, config.sustain_amplitude, params);
}

}  // namespace audio_modem
