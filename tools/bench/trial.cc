#include "tools/bench/trial.h"

#include <algorithm>
#include <cstdlib>

#include "tools/channel/babble.h"
#include "tools/channel/noise.h"
#include "tools/channel/random.h"

namespace vesk_bench {

vesk_channel::ChannelParams DefaultTrialChannel() {
  vesk_channel::ChannelParams channel;
  channel.lead_in_s = 0.5;
  channel.max_random_lead_in_s = 1.0;
  channel.tail_s = 1.0;
  return channel;
}

std::vector<uint8_t> RandomMessage(size_t bytes, uint64_t seed) {
  vesk_channel::Random random(vesk_channel::DeriveSeed(seed, 1000));
  std::vector<uint8_t> message(bytes);
  for (uint8_t& byte : message) byte = static_cast<uint8_t>(random.Next() & 0xFF);
  return message;
}

int CountFalseTokens(audio_modem::AudioModemDecoder* decoder, int rate, int message_bytes,
                     int crc_bytes, double seconds, bool babble, uint64_t seed,
                     const vesk_tool::StreamDecodingOptions& options, double* detections) {
  vesk_tool::StreamDecoder stream(decoder, rate, 1, message_bytes, crc_bytes, options);
  int found = 0;
  // Generated in pieces to bound memory over long runs.
  const double piece_s = 30.0;
  for (int piece = 0; piece * piece_s < seconds; ++piece) {
    const uint64_t piece_seed = vesk_channel::DeriveSeed(seed, static_cast<uint64_t>(piece));
    std::vector<int16_t> samples;
    if (babble) {
      for (const float s : vesk_channel::MakeBabble(piece_s, rate, 4, piece_seed)) {
        samples.push_back(
            static_cast<int16_t>(std::max(-32768.0f, std::min(32767.0f, 3000.0f * s))));
      }
    } else {
      samples = vesk_channel::MakeNoise(piece_s, rate, 1000.0, piece_seed);
    }
    found +=
        static_cast<int>(stream.Feed(samples.data(), static_cast<int64_t>(samples.size())).size());
  }
  if (detections != nullptr) {
    *detections = static_cast<double>(stream.positive_broadcaster_answers()) /
                  std::max(1, stream.broadcaster_answers());
  }
  return found;
}

bool SetExcisionTuning(const std::string& assignment, ExcisionTuning* tuning) {
  std::string name;
  double value;
  if (!ParseAssignment(assignment, &name, &value)) return false;
  audio_dsp::NarrowbandExcisionParams& p = tuning->params;
  const float real = static_cast<float>(value);
  const int whole = static_cast<int>(value);
  if (name == "excision") {
    tuning->on = value != 0;
  } else if (name == "excision_threshold_db" && value > 0) {
    p.threshold_db = real;
  } else if (name == "excision_interval_s" && value > 0) {
    p.analysis_interval_s = real;
  } else if (name == "excision_confirmations" && whole >= 1) {
    p.confirmations = whole;
  } else if (name == "excision_release" && whole >= 1) {
    p.release = whole;
  } else if (name == "excision_notch_hz" && value > 0) {
    p.notch_bandwidth_hz = real;
  } else if (name == "excision_max_notches" && whole >= 0) {
    p.max_notches = whole;
  } else if (name == "excision_protect_hz" && value >= 0) {
    p.protect_width_hz = real;
  } else {
    return false;
  }
  return true;
}

void AddExcision(const ExcisionTuning& tuning, const audio_dsp::NarrowbandExcisionParams& band,
                 int rate, int channels, audio_modem::AudioModemDecoder* decoder) {
  if (!tuning.on) return;
  audio_dsp::NarrowbandExcisionParams params = tuning.params;
  params.band_low_hz = band.band_low_hz;
  params.band_high_hz = band.band_high_hz;
  params.protected_hz = band.protected_hz;
  decoder->SetNarrowbandExcision(params);
  decoder->Initialize(static_cast<float>(rate), channels);
}

bool ParseAssignment(const std::string& assignment, std::string* name, double* value) {
  const size_t equals = assignment.find('=');
  if (equals == std::string::npos) return false;
  *name = assignment.substr(0, equals);
  const char* text = assignment.c_str() + equals + 1;
  char* end = nullptr;
  *value = std::strtod(text, &end);
  return end != text && *end == '\0';
}

}  // namespace vesk_bench
