#include "tools/vesk/dsss_options.h"

namespace vesk_tool {

void AddDsssOptions(OptionParser* parser, DsssOptions* options) {
  audio_modem::DsssWaveformConfig& w = options->waveform;
  parser->AddString("preset", &options->preset,
                    "48k: 48000 Hz coder, upsampling 16, decimation 4 (heard by the zintar "
                    "mode); 44k: 44100 Hz, 15, 3");
  parser->AddFlag("crc", &options->crc, "two CRC-16 check bytes after the message");
  parser->AddFlag("checksum-symbol", &options->checksum_symbol, "checksum symbol after the data");
  parser->AddInt("taps", &w.number_of_taps, "PN register length, 5 to 11");
  parser->AddInt("code", &w.code_number, "PN code number, 0 to 2 (5, 6 taps) or 3");
  parser->AddFloat("coder-rate", &w.sample_rate, "coder sample rate, Hz");
  parser->AddInt("upsampling", &w.upsampling_factor, "coder samples per chip");
  parser->AddInt("decimation", &w.baseband_decimation_factor, "baseband decimation factor");
  parser->AddFloat("carrier", &w.carrier_frequency, "carrier frequency, Hz");
  parser->AddInt("bits", &w.bits_per_symbol, "bits per symbol: 1, 2, 4 or 8");
  parser->AddInt("cycles", &w.min_cycles_per_frame, "symbol-tone cycles per frame of symbol 0");
  parser->AddFlag("quadrature", &w.use_quadrature_carrier, "symbol tone on the cosine carrier");
}

std::string FinishDsssOptions(const OptionParser& parser, DsssOptions* options) {
  audio_modem::DsssWaveformConfig& w = options->waveform;
  if (options->preset == "44k") {
    const audio_modem::DsssWaveformConfig preset = audio_modem::Waveform44100();
    if (!parser.Given("coder-rate")) w.sample_rate = preset.sample_rate;
    if (!parser.Given("upsampling")) w.upsampling_factor = preset.upsampling_factor;
    if (!parser.Given("decimation"))
      w.baseband_decimation_factor = preset.baseband_decimation_factor;
  } else if (options->preset != "48k") {
    return "--preset must be 48k or 44k";
  }
  return audio_modem::DsssWaveformConfigError(w);
}

}  // namespace vesk_tool
