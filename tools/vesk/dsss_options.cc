#include "tools/vesk/dsss_options.h"

#include "tools/common/audio_input.h"

namespace vesk_tool {

void AddDsssOptions(OptionParser* parser, DsssOptions* options) {
  audio_modem::DsssWaveformConfig& w = options->waveform;
  parser
      ->AddString("preset", &options->preset,
                  "coder: 48k (48000 Hz, upsampling 16, decimation 4; heard by the zintar "
                  "mode) or 44k (44100 Hz, 15, 3)")
      .Choices({"48k", "44k"});
  parser->AddFlag("crc", &options->crc, "two CRC-16 check bytes after the message");
  parser->AddFlag("checksum-symbol", &options->checksum_symbol, "checksum symbol after the data");
  parser->AddInt("taps", &w.number_of_taps, "PN register length").Range(5, 11);
  parser->AddInt("code", &w.code_number, "PN code number (0 to 2 for 5 and 6 taps)").Range(0, 3);
  parser->AddFloat("coder-rate", &w.sample_rate, "coder sample rate, Hz (the preset's by default)")
      .Range(kMinInputRate, kMaxInputRate)
      .Placeholder("HZ");
  parser->AddInt("upsampling", &w.upsampling_factor, "coder samples per chip").Range(1, 32);
  parser
      ->AddInt("decimation", &w.baseband_decimation_factor,
               "baseband decimation factor, divides --upsampling")
      .Range(1, 32);
  parser->AddFloat("carrier", &w.carrier_frequency, "carrier frequency, Hz")
      .Range(1, kMaxInputRate / 2)
      .Placeholder("HZ");
  parser->AddInt("bits", &w.bits_per_symbol, "bits per symbol").Choices({"1", "2", "4", "8"});
  parser->AddInt("cycles", &w.min_cycles_per_frame, "symbol-tone cycles per frame of symbol 0")
      .Range(0, 1000);
  parser->AddFlag("quadrature", &w.use_quadrature_carrier, "symbol tone on the cosine carrier");
}

std::string FinishDsssOptions(const OptionParser& parser, DsssOptions* options) {
  audio_modem::DsssWaveformConfig& w = options->waveform;
  if (options->preset == "44k") {
    const audio_modem::DsssWaveformConfig preset = audio_modem::Waveform44100();
    if (!parser.Given("coder-rate")) w.sample_rate = preset.sample_rate;
    if (!parser.Given("upsampling")) w.upsampling_factor = preset.upsampling_factor;
    if (!parser.Given("decimation")) {
      w.baseband_decimation_factor = preset.baseband_decimation_factor;
    }
  }
  if (w.number_of_taps <= 6 && w.code_number > 2) {
    return "--code " + std::to_string(w.code_number) + " needs --taps 7 or more (" +
           std::to_string(w.number_of_taps) + " taps have codes 0 to 2)";
  }
  if (w.upsampling_factor % w.baseband_decimation_factor != 0) {
    return "--decimation " + std::to_string(w.baseband_decimation_factor) +
           " must divide --upsampling " + std::to_string(w.upsampling_factor);
  }
  if (w.carrier_frequency > w.sample_rate / 2) {
    return "--carrier " + FormatNumber(w.carrier_frequency) +
           " must lie at or below half the coder rate (" + FormatNumber(w.sample_rate / 2) + " Hz)";
  }
  // Symbol tones are sampled once per baseband sample: the highest must stay
  // below half a baseband frame's samples, or symbols alias onto others.
  const int baseband_frame =
      ((1 << w.number_of_taps) - 1) * w.upsampling_factor / w.baseband_decimation_factor;
  const int highest_tone = w.min_cycles_per_frame + (1 << w.bits_per_symbol);
  if (2 * highest_tone >= baseband_frame) {
    return "--cycles " + std::to_string(w.min_cycles_per_frame) + " with --bits " +
           std::to_string(w.bits_per_symbol) + ": the highest symbol tone (" +
           std::to_string(highest_tone) + " cycles per frame) must stay below half the " +
           std::to_string(baseband_frame) + "-sample baseband frame";
  }
  return audio_modem::DsssWaveformConfigError(w);
}

std::string CheckCarrierBelowNyquist(const audio_modem::DsssWaveformConfig& waveform, int rate,
                                     const std::string& what) {
  if (waveform.carrier_frequency < rate / 2.0f) return std::string();
  return what + " is too low: the carrier (" + FormatNumber(waveform.carrier_frequency) +
         " Hz) must lie below half of it (" + FormatNumber(rate / 2.0) + " Hz)";
}

}  // namespace vesk_tool
