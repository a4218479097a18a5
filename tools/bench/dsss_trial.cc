#include "tools/bench/dsss_trial.h"

#include <algorithm>
#include <cstdlib>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/channel/babble.h"
#include "tools/vesk/stream_decoding.h"

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
  return audio_modem::MakeDsssAudioModemDecoder(config, trial.tuning);
}

vesk_tool::StreamDecodingOptions StreamOptions(const DsssTrial& trial) {
  vesk_tool::StreamDecodingOptions options;
  options.zintar = trial.zintar;
  options.chunk_bytes = trial.chunk_bytes;
  return options;
}

}  // namespace

vesk_channel::ChannelParams DefaultTrialChannel() {
  vesk_channel::ChannelParams channel;
  channel.lead_in_s = 0.5;
  channel.max_random_lead_in_s = 1.0;
  channel.tail_s = 1.0;
  return channel;
}

TrialResult RunDsssTrial(const DsssTrial& trial, uint64_t seed) {
  vesk_channel::Random random(vesk_channel::DeriveSeed(seed, 1000));
  std::vector<uint8_t> message(trial.crc ? 6 : 8);
  for (uint8_t& byte : message) byte = static_cast<uint8_t>(random.Next() & 0xFF);

  audio_modem::DsssEncoderConfig encoder_config;
  encoder_config.waveform = trial.waveform;
  encoder_config.append_checksum_symbol = trial.checksum_symbol;
  const auto encoder = audio_modem::MakeDsssAudioModemEncoder(encoder_config);
  std::vector<float> token, played;
  encoder->Encode(message, &token, trial.crc ? 2 : 0);
  encoder->MakeStartTransition(token, &played);
  for (int r = 0; r < trial.repeat; ++r) played.insert(played.end(), token.begin(), token.end());

  vesk_channel::ChannelParams channel = trial.channel;
  channel.seed = seed;
  const vesk_channel::ChannelOutput heard =
      vesk_channel::PlayThroughChannel(played, encoder->GetSampleRate(), channel);

  const auto decoder = MakeDecoder(trial, heard.rate, heard.channels);
  vesk_tool::StreamDecoder stream(decoder.get(), heard.rate, heard.channels,
                                  static_cast<int>(message.size()), trial.crc ? 2 : 0,
                                  StreamOptions(trial));
  const std::vector<vesk_tool::FoundToken> found =
      stream.Feed(heard.samples.data(), static_cast<int64_t>(heard.samples.size()));
  TrialResult result;
  const double start_s = heard.signal_start_exact / heard.rate;
  for (const vesk_tool::FoundToken& t : found) {
    if (t.bytes == message) {
      if (!result.correct) result.found_delay_s = t.time_s - start_s;
      result.correct = true;
    } else {
      ++result.wrong;
    }
  }
  if (stream.broadcaster_time_s() >= 0)
    result.heard_delay_s = stream.broadcaster_time_s() - start_s;
  return result;
}

int CountFalseTokens(const DsssTrial& trial, double seconds, bool babble, uint64_t seed,
                     double* detections) {
  const int rate = trial.channel.mic_rate;
  // Noise at a moderate level, or babble at a conversational one; an hour of
  // audio is generated in pieces to bound memory.
  const auto decoder = MakeDecoder(trial, rate, 1);
  vesk_tool::StreamDecoder stream(decoder.get(), rate, 1, trial.crc ? 6 : 8, trial.crc ? 2 : 0,
                                  StreamOptions(trial));
  int found = 0;
  const double piece_s = 30.0;
  for (int piece = 0; piece * piece_s < seconds; ++piece) {
    const uint64_t piece_seed = vesk_channel::DeriveSeed(seed, static_cast<uint64_t>(piece));
    std::vector<int16_t> samples;
    if (babble) {
      const std::vector<float> speech = vesk_channel::MakeBabble(piece_s, rate, 4, piece_seed);
      for (float s : speech) {
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

bool SetTuning(const std::string& assignment, audio_vesknet::VesknetDecoderParams* t) {
  const size_t equals = assignment.find('=');
  if (equals == std::string::npos) return false;
  const std::string name = assignment.substr(0, equals);
  const char* text = assignment.c_str() + equals + 1;
  char* end = nullptr;
  const double value = std::strtod(text, &end);
  if (end == text || *end != '\0') return false;
  const int whole = static_cast<int>(value);
  if (name == "max_speed")
    t->max_speed = static_cast<float>(value);
  else if (name == "design_baseband_filter")
    t->design_baseband_filter = value != 0;
  else if (name == "baseband_filter_length")
    t->baseband_filter_length = whole;
  else if (name == "baseband_filter_cutoff")
    t->baseband_filter_cutoff = static_cast<float>(value);
  else if (name == "acquisition_num_chunks")
    t->acquisition_num_chunks = whole;
  else if (name == "acquisition_doppler_step")
    t->acquisition_doppler_step = static_cast<float>(value);
  else if (name == "noise_smoothing_length")
    t->noise_smoothing_length = whole;
  else if (name == "score_filter_length")
    t->score_filter_length = whole;
  else if (name == "score_filter_count")
    t->score_filter_count = whole;
  else if (name == "score_threshold_factor")
    t->score_threshold_factor = static_cast<float>(value);
  else if (name == "group_offset_tolerance")
    t->group_offset_tolerance = static_cast<float>(value);
  else if (name == "group_max_gap")
    t->group_max_gap = whole;
  else if (name == "frame_extension")
    t->frame_extension = static_cast<float>(value);
  else if (name == "decode_doppler_step")
    t->decode_doppler_step = static_cast<float>(value);
  else if (name == "max_candidates_rank")
    t->max_candidates_rank = whole;
  else
    return false;
  return true;
}

}  // namespace vesk_bench
