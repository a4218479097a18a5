#include "tools/vesk/dtmf_options.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <sstream>

#include "audio/vesknet/dtmf/dtmf_encoder_params.h"
#include "tools/common/audio_input.h"

namespace vesk_tool {
namespace {

// Comma-separated finite numbers; false for anything else.
bool ParseNumbers(const std::string& text, std::vector<float>* numbers) {
  numbers->clear();
  std::stringstream stream(text);
  std::string item;
  while (std::getline(stream, item, ',')) {
    char* end = nullptr;
    errno = 0;
    const float value = std::strtof(item.c_str(), &end);
    if (item.empty() || *end != '\0' || errno != 0 || !std::isfinite(value)) return false;
    numbers->push_back(value);
  }
  return !numbers->empty();
}

// The tones in use: the given set, or the default one.
std::vector<float> Tones(const audio_modem::DtmfWaveformConfig& waveform) {
  if (!waveform.tone_frequencies.empty()) return waveform.tone_frequencies;
  audio_vesknet::DtmfEncoderParams params;
  return params.tone_frequencies;
}

}  // namespace

bool WantsDtmf(const std::vector<std::string>& args) {
  return std::find(args.begin(), args.end(), "--dtmf") != args.end();
}

void AddDtmfSwitch(OptionParser* parser, bool* dtmf) {
  parser->AddFlag("dtmf", dtmf,
                  "the multi-tone modem instead of DSSS (--dtmf --help: its options)");
}

void AddDtmfOptions(OptionParser* parser, DtmfOptions* options) {
  audio_modem::DtmfWaveformConfig& w = options->waveform;
  parser->AddFlag("dtmf", &options->dtmf, "the multi-tone modem instead of DSSS");
  parser->AddFlag("crc", &options->crc, "two CRC-16 check bytes after the message");
  parser->AddFlag("checksum-symbol", &w.append_checksum_symbol,
                  "checksum symbol after the data (keeps wrong tokens out)");
  parser->AddFloat("coder-rate", &w.sample_rate, "modulation sample rate, Hz")
      .Range(kMinInputRate, kMaxInputRate)
      .Placeholder("HZ");
  parser->AddInt("decimation", &w.baseband_decimation_factor, "baseband decimation factor")
      .Range(1, 256);
  parser->AddFloat("window", &w.window_duration, "symbol duration, s")
      .Range(0.001, 1)
      .Placeholder("S");
  parser->AddInt("tones-per-symbol", &w.tones_per_symbol, "tones sounding together").Range(1, 8);
  parser
      ->AddString("tones", &options->tones,
                  "tone frequencies, Hz, comma-separated (default: ten tones, 740 to 2489 Hz)")
      .Placeholder("LIST");
  parser
      ->AddString("envelope", &options->envelope,
                  "attack,decay,sustain,release (s),level (default 0.025,0,0,0.025,1)")
      .Placeholder("LIST");
}

std::string FinishDtmfOptions(int message_bytes, DtmfOptions* options) {
  audio_modem::DtmfWaveformConfig& w = options->waveform;
  if (!options->tones.empty() && !ParseNumbers(options->tones, &w.tone_frequencies)) {
    return "--tones " + options->tones + ": needs comma-separated frequencies in Hz";
  }
  for (const float tone : w.tone_frequencies) {
    if (!(tone >= 0 && tone < w.sample_rate / 2)) {
      return "--tones: " + FormatNumber(tone) + " Hz must lie in 0 to below half the coder rate (" +
             FormatNumber(w.sample_rate / 2) + " Hz)";
    }
  }
  if (!options->envelope.empty()) {
    std::vector<float> values;
    if (!ParseNumbers(options->envelope, &values) || values.size() != 5) {
      return "--envelope " + options->envelope +
             ": needs five numbers, attack,decay,sustain,release,level";
    }
    for (int i = 0; i < 4; ++i) {
      if (values[i] < 0) return "--envelope " + options->envelope + ": times must not be negative";
    }
    if (values[4] < 0 || values[4] > 1) {
      return "--envelope " + options->envelope + ": the level must lie in 0 to 1";
    }
    w.attack_time = values[0];
    w.decay_time = values[1];
    w.sustain_time = values[2];
    w.release_time = values[3];
    w.sustain_amplitude = values[4];
  }
  const float envelope_s = w.attack_time + w.decay_time + w.sustain_time + w.release_time;
  if (envelope_s > w.window_duration * 1.000001f) {
    return "--envelope times add up to " + FormatNumber(envelope_s) +
           " s, more than the symbol (--window " + FormatNumber(w.window_duration) + " s)";
  }
  w.bytes_in_token = message_bytes + (options->crc ? 2 : 0);
  const std::string error = audio_modem::DtmfWaveformConfigError(w);
  if (!error.empty()) return "--tones, --tones-per-symbol, --window, --decimation: " + error;
  return std::string();
}

std::string CheckTonesBelowNyquist(const audio_modem::DtmfWaveformConfig& waveform, int rate,
                                   const std::string& what) {
  const std::vector<float> tones = Tones(waveform);
  const float highest = *std::max_element(tones.begin(), tones.end());
  if (highest < rate / 2.0f) return std::string();
  return what + " is too low: the highest tone (" + FormatNumber(highest) +
         " Hz) must lie below half of it (" + FormatNumber(rate / 2.0) + " Hz)";
}

}  // namespace vesk_tool
