#include "tools/bench/dtmf_trial.h"

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <utility>
#include <vector>

#include "audio/vesknet/dtmf/dtmf_encoder.h"
#include "base/logging.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/channel/babble.h"
#include "tools/vesk/stream_decoding.h"

namespace vesk_bench {
namespace {

std::unique_ptr<audio_modem::AudioModemEncoder> MakeEncoder(const DtmfTrial& trial) {
  audio_modem::DtmfWaveformConfig waveform = trial.config;
  if (trial.window == DtmfWindow::kAdsr) {
    waveform.attack_time = 0.01f;
    waveform.decay_time = 0.01f;
    waveform.sustain_time = 0.02f;
    waveform.release_time = 0.01f;
    waveform.sustain_amplitude = 0.5f;
  }
  audio_vesknet::DtmfEncoderParams params;
  CHECK(audio_modem::MakeDtmfEncoderParams(waveform, &params));
  // An empty window makes the encoder use its half-sine.
  if (trial.window == DtmfWindow::kHalfSine) params.window_samples.clear();
  return std::make_unique<audio_modem::AudioModemEncoder>(
      std::make_unique<audio_vesknet::DtmfEncoder>(params));
}

std::unique_ptr<audio_modem::AudioModemDecoder> MakeDecoder(const DtmfTrial& trial, int rate,
                                                            int channels) {
  audio_modem::DtmfDecoderConfig config = trial.config;
  config.input_sample_rate = static_cast<float>(rate);
  config.num_channels = channels;
  return audio_modem::MakeDtmfAudioModemDecoder(config, trial.tuning);
}

int MessageBytes(const DtmfTrial& trial) {
  return trial.config.bytes_in_token - (trial.crc ? 2 : 0);
}

}  // namespace

vesk_channel::ChannelParams DefaultDtmfTrialChannel() {
  vesk_channel::ChannelParams channel;
  channel.lead_in_s = 0.5;
  channel.max_random_lead_in_s = 1.0;
  channel.tail_s = 1.0;
  return channel;
}

DtmfTrialResult RunDtmfTrial(const DtmfTrial& trial, uint64_t seed) {
  vesk_channel::Random random(vesk_channel::DeriveSeed(seed, 1000));
  std::vector<uint8_t> message(MessageBytes(trial));
  for (uint8_t& byte : message) byte = static_cast<uint8_t>(random.Next() & 0xFF);

  const auto encoder = MakeEncoder(trial);
  std::vector<float> token, played;
  encoder->Encode(message, &token, trial.crc ? 2 : 0);
  for (int r = 0; r < trial.repeat; ++r) played.insert(played.end(), token.begin(), token.end());

  vesk_channel::ChannelParams channel = trial.channel;
  channel.seed = seed;
  const vesk_channel::ChannelOutput heard =
      vesk_channel::PlayThroughChannel(played, encoder->GetSampleRate(), channel);

  const auto decoder = MakeDecoder(trial, heard.rate, heard.channels);
  vesk_tool::StreamDecoder stream(decoder.get(), heard.rate, heard.channels, MessageBytes(trial),
                                  trial.crc ? 2 : 0, vesk_tool::StreamDecodingOptions());
  const std::vector<vesk_tool::FoundToken> found =
      stream.Feed(heard.samples.data(), static_cast<int64_t>(heard.samples.size()));
  DtmfTrialResult result;
  const double start_s = heard.signal_start_exact / heard.rate;
  for (const vesk_tool::FoundToken& t : found) {
    if (t.bytes == message) {
      if (!result.correct) result.found_delay_s = t.time_s - start_s;
      result.correct = true;
    } else {
      ++result.wrong;
    }
  }
  return result;
}

int CountDtmfFalseTokens(const DtmfTrial& trial, double seconds, bool babble, uint64_t seed) {
  const int rate = trial.channel.mic_rate;
  const auto decoder = MakeDecoder(trial, rate, 1);
  vesk_tool::StreamDecoder stream(decoder.get(), rate, 1, MessageBytes(trial), trial.crc ? 2 : 0,
                                  vesk_tool::StreamDecodingOptions());
  int found = 0;
  // Generated in pieces to bound memory.
  const double piece_s = 30.0;
  for (int piece = 0; piece * piece_s < seconds; ++piece) {
    const uint64_t piece_seed = vesk_channel::DeriveSeed(seed, static_cast<uint64_t>(piece));
    std::vector<int16_t> samples;
    if (babble) {
      const std::vector<float> speech = vesk_channel::MakeBabble(piece_s, rate, 4, piece_seed);
      for (const float s : speech) {
        samples.push_back(
            static_cast<int16_t>(std::max(-32768.0f, std::min(32767.0f, 3000.0f * s))));
      }
    } else {
      samples = vesk_channel::MakeNoise(piece_s, rate, 1000.0, piece_seed);
    }
    found +=
        static_cast<int>(stream.Feed(samples.data(), static_cast<int64_t>(samples.size())).size());
  }
  return found;
}

bool SetDtmfTuning(const std::string& assignment, DtmfTrial* trial) {
  const size_t equals = assignment.find('=');
  if (equals == std::string::npos) return false;
  const std::string name = assignment.substr(0, equals);
  const char* text = assignment.c_str() + equals + 1;
  char* end = nullptr;
  const double value = std::strtod(text, &end);
  if (end == text || *end != '\0') return false;
  const float real = static_cast<float>(value);
  const int whole = static_cast<int>(value);
  audio_vesknet::DtmfDecoderParams& t = trial->tuning;
  if (name == "max_meters_per_second") {
    t.max_meters_per_second = real;
  } else if (name == "window_size") {
    t.tone_normalization_params.window_size = real;
  } else if (name == "cross_frequency_weight") {
    t.tone_normalization_params.cross_frequency_weight = real;
  } else if (name == "division_floor") {
    t.tone_normalization_params.division_floor = real;
  } else if (name == "noise_estimate_filter_order") {
    t.noise_estimate_filter_order = whole;
  } else if (name == "noise_estimate_filter_stddev") {
    t.noise_estimate_filter_stddev = real;
  } else if (name == "acquisition_threshold") {
    t.acquisition_threshold = real;
  } else if (name == "max_candidates_rank") {
    t.max_candidates_rank = whole;
  } else if (name == "token_threshold_factor") {
    t.token_threshold_factor = real;
  } else if (name == "buffer_length_tokens") {
    trial->config.buffer_length_tokens = real;
  } else if (name == "max_tokens_per_call") {
    trial->config.max_tokens_per_call = whole;
  } else if (name == "checksum") {
    trial->config.append_checksum_symbol = value != 0;
  } else {
    return false;
  }
  return true;
}

}  // namespace vesk_bench
