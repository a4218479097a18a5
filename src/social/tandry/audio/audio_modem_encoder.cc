#include "social/tandry/audio/audio_modem_encoder.h"

#include <utility>

#include "audio/vesknet/crc16_coder.h"
#include "base/logging.h"
#include "social/tandry/audio/config_limits.h"

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
  if (config.token_length_bytes < 1 || config.token_length_bytes > kMaxTokenBytes) {
    return "the token must have 1 to " + std::to_string(kMaxTokenBytes) + " bytes";
  }
  const std::string waveform_error = DsssWaveformConfigError(config.waveform);
  if (!waveform_error.empty()) return waveform_error;
  if (DsssTokenSeconds(config.waveform, config.token_length_bytes, config.append_checksum_symbol) >
      kMaxTokenSeconds) {
    return "a token may last at most " + std::to_string(static_cast<int>(kMaxTokenSeconds)) +
           " s on air";
  }
  if (config.broadcast_sample_rate < 1 || config.broadcast_sample_rate > kMaxSampleRateHz) {
    return "the broadcast sample rate must lie in [1, " + std::to_string(int(kMaxSampleRateHz)) +
           "] Hz";
  }
  if (DsssTokenSeconds(config.waveform, config.token_length_bytes, config.append_checksum_symbol) *
          config.broadcast_sample_rate <
      1.0) {
    return "a token must last at least one sample at the broadcast rate";
  }
  if (!(config.waveform.carrier_frequency < config.broadcast_sample_rate / 2.0f)) {
    return "the carrier (" + std::to_string(int(config.waveform.carrier_frequency)) +
           " Hz) must lie below half the broadcast sample rate";
  }
  if (!(config.transition_duration >= 0 && config.transition_duration <= 1)) {
    return "the transition must last 0 to 1 s";
  }
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

std::string DtmfEncoderConfigError(const DtmfEncoderConfig& config) {
  return DtmfWaveformConfigError(config);
}

std::unique_ptr<AudioModemEncoder> MakeDtmfAudioModemEncoder(const DtmfEncoderConfig& config) {
  audio_vesknet::DtmfEncoderParams params;
  if (!MakeDtmfEncoderParams(config, &params)) return nullptr;
  return std::make_unique<AudioModemEncoder>(std::make_unique<audio_vesknet::DtmfEncoder>(params));
}

}  // namespace audio_modem
