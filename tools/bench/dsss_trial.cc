#include "tools/bench/dsss_trial.h"

#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"

namespace vesk_bench {
namespace {

std::unique_ptr<audio_modem::AudioModemDecoder> MakeDecoder(const DsssTrial& trial, int rate,
                                                            int channels) {
  audio_modem::DsssDecoderConfig config;
  config.waveform = trial.waveform;
  config.token_length_bytes = 8;
  config.use_checksum_symbol = trial.checksum_symbol;
  config.input_sample_rate = static_cast<float>(rate);
  config.num_channels = channels;
  config.use_zintar = trial.zintar;
  config.design_baseband_filter = trial.tuning.design_baseband_filter;
  config.max_tokens_per_call = trial.tuning.max_candidates_to_return;
  config.acquisition_window_seconds = trial.tuning.acquisition_window_duration;
  config.broadcaster_threshold = trial.tuning.broadcaster_threshold;
  config.buffer_length_tokens = trial.buffer_length_tokens;
  config.narrowband_excision = false;
  auto decoder = audio_modem::MakeDsssAudioModemDecoder(config, trial.tuning);
  AddExcision(trial.excision, audio_modem::DsssExcisionParams(trial.waveform), rate, channels,
              decoder.get());
  return decoder;
}

vesk_tool::StreamDecodingOptions StreamOptions(const DsssTrial& trial) {
  vesk_tool::StreamDecodingOptions options;
  options.zintar = trial.zintar;
  options.chunk_bytes = trial.chunk_bytes;
  return options;
}

}  // namespace

TrialResult RunDsssTrial(const DsssTrial& trial, uint64_t seed) {
  const std::vector<uint8_t> message = RandomMessage(trial.crc ? 6 : 8, seed);
  audio_modem::DsssEncoderConfig encoder_config;
  encoder_config.waveform = trial.waveform;
  encoder_config.append_checksum_symbol = trial.checksum_symbol;
  const auto encoder = audio_modem::MakeDsssAudioModemEncoder(encoder_config);
  vesk_tool::OverTheAir air;
  air.repeat = trial.repeat;
  air.channel = trial.channel;
  air.channel.seed = seed;
  return vesk_tool::Judge(
      vesk_tool::SendOverTheAir(
          *encoder, message, trial.crc ? 2 : 0, air,
          [&](int rate, int channels) { return MakeDecoder(trial, rate, channels); },
          StreamOptions(trial)),
      message);
}

int CountFalseTokens(const DsssTrial& trial, double seconds, bool babble, uint64_t seed,
                     double* detections) {
  const int rate = trial.channel.mic_rate;
  const auto decoder = MakeDecoder(trial, rate, 1);
  return CountFalseTokens(decoder.get(), rate, trial.crc ? 6 : 8, trial.crc ? 2 : 0, seconds,
                          babble, seed, StreamOptions(trial), detections);
}

bool SetTuning(const std::string& assignment, audio_vesknet::VesknetDecoderParams* tuning,
               ExcisionTuning* excision) {
  return SetExcisionTuning(assignment, excision) || SetTuning(assignment, tuning);
}

bool SetTuning(const std::string& assignment, audio_vesknet::VesknetDecoderParams* t) {
  std::string name;
  double value;
  if (!ParseAssignment(assignment, &name, &value)) return false;
  const int whole = static_cast<int>(value);
  const float real = static_cast<float>(value);
  if (name == "max_speed") {
    t->max_speed = real;
  } else if (name == "design_baseband_filter") {
    t->design_baseband_filter = value != 0;
  } else if (name == "baseband_filter_length") {
    t->baseband_filter_length = whole;
  } else if (name == "baseband_filter_cutoff") {
    t->baseband_filter_cutoff = real;
  } else if (name == "acquisition_num_chunks") {
    t->acquisition_num_chunks = whole;
  } else if (name == "acquisition_doppler_step") {
    t->acquisition_doppler_step = real;
  } else if (name == "noise_smoothing_length") {
    t->noise_smoothing_length = whole;
  } else if (name == "score_filter_length") {
    t->score_filter_length = whole;
  } else if (name == "score_filter_count") {
    t->score_filter_count = whole;
  } else if (name == "score_threshold_factor") {
    t->score_threshold_factor = real;
  } else if (name == "group_offset_tolerance") {
    t->group_offset_tolerance = real;
  } else if (name == "group_max_gap") {
    t->group_max_gap = whole;
  } else if (name == "frame_extension") {
    t->frame_extension = real;
  } else if (name == "decode_doppler_step") {
    t->decode_doppler_step = real;
  } else if (name == "max_candidates_rank") {
    t->max_candidates_rank = whole;
  } else {
    return false;
  }
  return true;
}

}  // namespace vesk_bench
