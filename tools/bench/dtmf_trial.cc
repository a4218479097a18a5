#include "tools/bench/dtmf_trial.h"

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <utility>
#include <vector>

#include "audio/vesknet/dtmf/dtmf_encoder.h"
#include "base/logging.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/common/stream_decoding.h"

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

int MessageBytes(const DtmfTrial& trial) {
  return trial.config.bytes_in_token - (trial.crc ? 2 : 0);
}

}  // namespace

std::unique_ptr<audio_modem::AudioModemDecoder> MakeDtmfTrialDecoder(const DtmfTrial& trial,
                                                                     int rate, int channels) {
  audio_modem::DtmfDecoderConfig config = trial.config;
  config.input_sample_rate = static_cast<float>(rate);
  config.num_channels = channels;
  config.narrowband_excision = false;
  auto decoder = audio_modem::MakeDtmfAudioModemDecoder(config, trial.tuning);
  if (decoder == nullptr) return decoder;
  audio_vesknet::DtmfEncoderParams waveform;
  CHECK(audio_modem::MakeDtmfEncoderParams(config, &waveform));
  AddExcision(trial.excision, audio_modem::DtmfExcisionParams(waveform.tone_frequencies), rate,
              channels, decoder.get());
  return decoder;
}

TrialResult RunDtmfTrial(const DtmfTrial& trial, uint64_t seed) {
  const std::vector<uint8_t> message = RandomMessage(MessageBytes(trial), seed);
  const auto encoder = MakeEncoder(trial);
  vesk_tool::OverTheAir air;
  air.repeat = trial.repeat;
  air.channel = trial.channel;
  air.channel.seed = seed;
  return vesk_tool::Judge(
      vesk_tool::SendOverTheAir(
          *encoder, message, trial.crc ? 2 : 0, air,
          [&](int rate, int channels) { return MakeDtmfTrialDecoder(trial, rate, channels); },
          vesk_tool::StreamDecodingOptions()),
      message);
}

int CountDtmfFalseTokens(const DtmfTrial& trial, double seconds, bool babble, uint64_t seed) {
  const int rate = trial.channel.mic_rate;
  const auto decoder = MakeDtmfTrialDecoder(trial, rate, 1);
  return CountFalseTokens(decoder.get(), rate, MessageBytes(trial), trial.crc ? 2 : 0, seconds,
                          babble, seed, vesk_tool::StreamDecodingOptions());
}

bool SetDtmfTuning(const std::string& assignment, DtmfTrial* trial) {
  if (SetExcisionTuning(assignment, &trial->excision)) return true;
  std::string name;
  double value;
  if (!ParseAssignment(assignment, &name, &value)) return false;
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
