#include "tools/vesk/dtmf_options.h"

#include <cstdlib>
#include <sstream>

namespace vesk_tool {
namespace {

// Comma-separated numbers; false for anything else.
bool ParseNumbers(const std::string& text, std::vector<float>* numbers) {
  numbers->clear();
  std::stringstream stream(text);
  std::string item;
  while (std::getline(stream, item, ',')) {
    char* end = nullptr;
    const float value = std::strtof(item.c_str(), &end);
    if (item.empty() || *end != '\0') return false;
    numbers->push_back(value);
  }
  return !numbers->empty();
}

}  // namespace

bool WantsDtmf(const std::vector<std::string>& args) {
  for (const std::string& arg : args) {
    if (arg == "--dtmf") return true;
  }
  return false;
}

void AddDtmfOptions(OptionParser* parser, DtmfOptions* options) {
  audio_modem::DtmfWaveformConfig& w = options->waveform;
  parser->AddFlag("dtmf", &options->dtmf, "the multi-tone modem instead of DSSS");
  parser->AddFlag("crc", &options->crc, "two CRC-16 check bytes after the message");
  parser->AddFlag("checksum-symbol", &w.append_checksum_symbol,
                  "checksum symbol after the data (keeps wrong tokens out)");
  parser->AddFloat("coder-rate", &w.sample_rate, "modulation sample rate, Hz");
  parser->AddInt("decimation", &w.baseband_decimation_factor, "baseband decimation factor");
  parser->AddFloat("window", &w.window_duration, "symbol duration, seconds");
  parser->AddInt("tones-per-symbol", &w.tones_per_symbol, "tones sounding together");
  parser->AddString("tones", &options->tones, "tone frequencies, Hz, comma-separated");
  parser->AddString("envelope", &options->envelope,
                    "attack,decay,sustain,release,level (default 0.025,0,0,0.025,1)");
}

std::string FinishDtmfOptions(int message_bytes, DtmfOptions* options) {
  audio_modem::DtmfWaveformConfig& w = options->waveform;
  if (!options->tones.empty() && !ParseNumbers(options->tones, &w.tone_frequencies)) {
    return "--tones must be comma-separated frequencies";
  }
  if (!options->envelope.empty()) {
    std::vector<float> values;
    if (!ParseNumbers(options->envelope, &values) || values.size() != 5) {
      return "--envelope needs five numbers: attack,decay,sustain,release,level";
    }
    w.attack_time = values[0];
    w.decay_time = values[1];
    w.sustain_time = values[2];
    w.release_time = values[3];
    w.sustain_amplitude = values[4];
  }
  if (message_bytes < 1) return "the message needs at least one byte";
  w.bytes_in_token = message_bytes + (options->crc ? 2 : 0);
  return audio_modem::DtmfWaveformConfigError(w);
}

}  // namespace vesk_tool
