#include "social/tandry/audio/audio_modem_encoder.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <utility>

#include "audio/vesknet/crc16_coder.h"
#include "audio/vesknet/dtmf/dtmf_encoder_params.h"
#include "base/logging.h"

namespace audio_modem {

AudioModemEncoder::AudioModemEncoder(std::unique_ptr<audio_vesknet::VesknetEncoder> dsss_encoder)
    : dsss_encoder_(std::move(CHECK_NOTNULL(dsss_encoder))), kind_(kDsss) {
  token_size_ = dsss_encoder_->symbol_wave_coder().params().bits_per_symbol *
                dsss_encoder_->params().symbols_per_token / 8;
}

AudioModemEncoder::AudioModemEncoder(std::unique_ptr<audio_vesknet::DtmfEncoder> dtmf_encoder)
    : dtmf_encoder_(std::move(CHECK_NOTNULL(dtmf_encoder))), kind_(kDtmf) {
  token_size_ = dtmf_encoder_->params().bytes_in_token;
}

AudioModemEncoder::~AudioModemEncoder() {
  dtmf_encoder_.reset();
  dsss_encoder_.reset();
}

void AudioModemEncoder::Encode(const std::vector<uint8_t>& token_bytes, std::vector<float>* output,
                               int num_crc_check_bytes) const {
  // The size test comes first: a caller sees the size complaint even when the
  // count is also negative.
  if (static_cast<int>(token_bytes.size()) + num_crc_check_bytes != token_size_) {
    LOG(ERROR) << "token_bytes.size() and num_crc_check_bytes do not add to correct value";
    return;
  }
  if (num_crc_check_bytes < 0) {
    LOG(ERROR) << "num_crc_check_bytes must be non-negative";
    return;
  }
  std::vector<uint8_t> token = token_bytes;
  if (num_crc_check_bytes != 0) {
    if (num_crc_check_bytes != 2) {
      LOG(ERROR) << "Unsupported value for num_crc_check_bytes";
      return;
    }
    audio_vesknet::Crc16CoderParams crc_params;
    crc_params.num_message_bytes = static_cast<int32_t>(token_bytes.size());
    audio_vesknet::Crc16Coder(crc_params).AppendCrc(&token);
  }
  if (kind_ == kDtmf) {
    dtmf_encoder_->EncodeToken(token, output);
  } else if (kind_ == kDsss) {
    dsss_encoder_->EncodeToken(token, output);
  }
}

void AudioModemEncoder::MakeStartTransition(const std::vector<float>& audio,
                                            std::vector<float>* transition) const {
  CHECK(transition);
  transition->clear();
  if (kind_ == kDsss) dsss_encoder_->MakeStartTransition(audio, transition);
}

float AudioModemEncoder::GetSampleRate() const {
  if (kind_ == kDsss) return dsss_encoder_->params().broadcast_sample_rate;
  if (kind_ == kDtmf) return dtmf_encoder_->params().sample_rate;
  return 0.0f;
}

std::string DsssEncoderConfigError(const DsssEncoderConfig& config) {
  if (config.token_length_bytes < 1) return "the token needs at least one byte";
  const std::string waveform_error = DsssWaveformConfigError(config.waveform);
  if (!waveform_error.empty()) return waveform_error;
  if (config.broadcast_sample_rate < 1) return "the broadcast sample rate must be positive";
  if (!(config.transition_duration >= 0)) return "the transition must not be negative";
  return std::string();
}

std::unique_ptr<AudioModemEncoder> MakeDsssAudioModemEncoder(const DsssEncoderConfig& config) {
  std::unique_ptr<audio_vesknet::SymbolWaveCoder> coder = MakeSymbolWaveCoder(config.waveform);
  audio_vesknet::VesknetEncoderParams encoder_params;
  // Integer division first, as hosts have always been told: with 3 bits per
  // symbol a 6-byte token would give 12 symbols (the symbol converter then
  // rejects 3 bits). The coder above has already rejected bits_per_symbol 0.
  encoder_params.symbols_per_token =
      (8 / config.waveform.bits_per_symbol) * config.token_length_bytes;
  encoder_params.append_checksum_symbol = config.append_checksum_symbol;
  encoder_params.single_sideband = config.single_sideband;
  encoder_params.transition_duration = config.transition_duration;
  encoder_params.broadcast_sample_rate = static_cast<float>(config.broadcast_sample_rate);
  return std::make_unique<AudioModemEncoder>(
      std::make_unique<audio_vesknet::VesknetEncoder>(std::move(coder), encoder_params));
}

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

std::string DtmfEncoderConfigError(const DtmfEncoderConfig& config) {
  if (config.bytes_in_token < 1) return "the token needs at least one byte";
  if (!(config.sample_rate > 0)) return "the sample rate must be positive";
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
  return std::string();
}

std::unique_ptr<AudioModemEncoder> MakeDtmfAudioModemEncoder(const DtmfEncoderConfig& config) {
  audio_vesknet::DtmfEncoderParams params;
  params.bytes_in_token = config.bytes_in_token;
  params.append_checksum_symbol = config.append_checksum_symbol;
  params.sample_rate = config.sample_rate;
  params.baseband_decimation_factor = config.baseband_decimation_factor;
  params.window_duration = config.window_duration;
  params.tones_per_symbol = config.tones_per_symbol;
  if (!config.tone_frequencies.empty()) {
    audio_vesknet::MakeToneCombinations(config.tone_frequencies, config.tones_per_symbol, &params);
  }
  if (!audio_vesknet::SetAdsrWindow(config.attack_time, config.decay_time, config.sustain_time,
                                    config.release_time, config.sustain_amplitude, &params)) {
    return nullptr;
  }
  return std::make_unique<AudioModemEncoder>(std::make_unique<audio_vesknet::DtmfEncoder>(params));
}

}  // namespace audio_modem
