#include "social/tandry/audio/dsss_waveform_config.h"

#include "audio/vesknet/code_signal_generator.h"
#include "social/tandry/audio/config_limits.h"

namespace audio_modem {

DsssWaveformConfig Waveform44100() {
  DsssWaveformConfig config;
  config.sample_rate = 44100.0f;
  config.upsampling_factor = 15;
  config.baseband_decimation_factor = 3;
  return config;
}

std::string DsssWaveformConfigError(const DsssWaveformConfig& config) {
  if (config.number_of_taps < 5 || config.number_of_taps > 11) {
    return "the code register needs 5 to 11 taps";
  }
  const int max_code_number = config.number_of_taps <= 6 ? 2 : 3;
  if (config.code_number < 0 || config.code_number > max_code_number) {
    return "code number must be 0 to " + std::to_string(max_code_number) + " for " +
           std::to_string(config.number_of_taps) + " taps";
  }
  if (!(config.sample_rate > 0 && config.sample_rate <= kMaxSampleRateHz)) {
    return "the coder sample rate must lie in (0, " + std::to_string(int(kMaxSampleRateHz)) +
           "] Hz";
  }
  if (config.upsampling_factor < 1) return "the upsampling factor must be positive";
  const int code_length = (1 << config.number_of_taps) - 1;
  if (config.upsampling_factor > kMaxDsssFrameSamples / code_length) {
    return "a frame (code length x upsampling factor) may hold at most " +
           std::to_string(kMaxDsssFrameSamples) + " samples";
  }
  if (config.baseband_decimation_factor < 1) return "the decimation factor must be positive";
  if (config.upsampling_factor % config.baseband_decimation_factor != 0) {
    return "the upsampling factor must be a multiple of the decimation factor";
  }
  if (!(config.carrier_frequency > 0 && config.carrier_frequency <= config.sample_rate / 2)) {
    return "the carrier must lie above 0 Hz and at most at half the coder sample rate";
  }
  if (config.bits_per_symbol != 1 && config.bits_per_symbol != 2 && config.bits_per_symbol != 4 &&
      config.bits_per_symbol != 8) {
    return "bits per symbol must be 1, 2, 4 or 8";
  }
  if (config.min_cycles_per_frame < 0) return "cycles per frame must not be negative";
  return std::string();
}

double DsssTokenSeconds(const DsssWaveformConfig& config, int token_bytes, bool checksum_symbol) {
  const double symbols = 1.0 + (8 / config.bits_per_symbol) * static_cast<double>(token_bytes) +
                         (checksum_symbol ? 1 : 0);
  const double frame =
      static_cast<double>((1 << config.number_of_taps) - 1) * config.upsampling_factor;
  return symbols * frame / config.sample_rate;
}

std::unique_ptr<audio_vesknet::SymbolWaveCoder> MakeSymbolWaveCoder(
    const DsssWaveformConfig& config) {
  audio_vesknet::SymbolWaveCoderParams params;
  audio_vesknet::GenerateCodeSignal(config.number_of_taps, config.code_number, &params.code_signal);
  params.sample_rate = config.sample_rate;
  params.upsampling_factor = config.upsampling_factor;
  params.desired_carrier_frequency = config.carrier_frequency;
  params.bits_per_symbol = config.bits_per_symbol;
  params.min_cycles_per_frame = config.min_cycles_per_frame;
  params.baseband_decimation_factor = config.baseband_decimation_factor;
  params.use_quadrature_carrier = config.use_quadrature_carrier;
  return std::make_unique<audio_vesknet::SymbolWaveCoder>(params);
}

}  // namespace audio_modem
