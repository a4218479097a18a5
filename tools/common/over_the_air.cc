#include "tools/common/over_the_air.h"

#include <cmath>
#include <utility>

namespace vesk_tool {

void AddOverTheAirOptions(OptionParser* parser, OverTheAir* air) {
  vesk_channel::ChannelParams& c = air->channel;
  parser->AddInt("repeat", &air->repeat, "token repetitions after the start transition")
      .Range(1, 100);
  parser
      ->AddDouble("snr", &c.snr_db,
                  "full-band signal-to-noise ratio at the microphone, dB; inf: no noise")
      .Range(-60, INFINITY)
      .Placeholder("DB");
  parser->AddDouble("speed", &c.speed, "clock skew or Doppler: the token plays this much faster")
      .Range(0.5, 2.0);
  parser->AddFlag("reverb", &c.reverb, "room reverberation");
  parser->AddDouble("rt60", &c.rt60_s, "reverberation time (60 dB decay), s")
      .Range(0.05, 5.0)
      .Placeholder("S");
  parser->AddInt("mic-rate", &c.mic_rate, "microphone sample rate, Hz")
      .Range(8000, 192000)
      .Placeholder("HZ");
  parser->AddInt("channels", &c.channels, "microphone channels, each with its own noise")
      .Range(1, 2);
  parser
      ->AddDouble("babble", &c.babble_sir_db,
                  "signal-to-babble ratio of 4 talkers, dB; inf: no babble")
      .Range(-60, INFINITY)
      .Placeholder("DB");
  parser->AddDouble("lead-in", &c.lead_in_s, "silence before the signal, s")
      .Range(0, 60)
      .Placeholder("S");
  parser->AddDouble("random-lead-in", &c.max_random_lead_in_s, "plus a random delay up to this, s")
      .Range(0, 60)
      .Placeholder("S");
  parser->AddDouble("tail", &c.tail_s, "silence after the signal, s").Range(0, 60).Placeholder("S");
}

Playback MakePlayback(const audio_modem::AudioModemEncoder& encoder,
                      const std::vector<uint8_t>& message, int crc_bytes, int repeat) {
  Playback playback;
  std::vector<float> token;
  encoder.Encode(message, &token, crc_bytes);
  encoder.MakeStartTransition(token, &playback.samples);
  playback.transition_samples = playback.samples.size();
  playback.token_samples = token.size();
  playback.samples.reserve(playback.samples.size() + token.size() * static_cast<size_t>(repeat));
  for (int r = 0; r < repeat; ++r) {
    playback.samples.insert(playback.samples.end(), token.begin(), token.end());
  }
  return playback;
}

vesk_channel::ChannelOutput PlayOverTheAir(const audio_modem::AudioModemEncoder& encoder,
                                           const std::vector<uint8_t>& message, int crc_bytes,
                                           const OverTheAir& air) {
  return vesk_channel::PlayThroughChannel(
      MakePlayback(encoder, message, crc_bytes, air.repeat).samples, encoder.GetSampleRate(),
      air.channel);
}

Reception SendOverTheAir(const audio_modem::AudioModemEncoder& encoder,
                         const std::vector<uint8_t>& message, int crc_bytes, const OverTheAir& air,
                         const DecoderFactory& make_decoder, const StreamDecodingOptions& options,
                         bool finish) {
  Reception reception;
  const Playback playback = MakePlayback(encoder, message, crc_bytes, air.repeat);
  reception.transmit_rate = encoder.GetSampleRate();
  reception.token_samples = playback.token_samples;
  reception.heard =
      vesk_channel::PlayThroughChannel(playback.samples, reception.transmit_rate, air.channel);
  const vesk_channel::ChannelOutput& heard = reception.heard;
  reception.signal_start_s = heard.signal_start_exact / heard.rate;
  const auto decoder = make_decoder(heard.rate, heard.channels);
  StreamDecoder stream(decoder.get(), heard.rate, heard.channels, static_cast<int>(message.size()),
                       crc_bytes, options);
  reception.found = stream.Feed(heard.samples.data(), static_cast<int64_t>(heard.samples.size()));
  if (finish) {
    for (FoundToken& token : stream.Finish()) reception.found.push_back(std::move(token));
  }
  reception.broadcaster_time_s = stream.broadcaster_time_s();
  return reception;
}

TrialResult Judge(const Reception& reception, const std::vector<uint8_t>& message) {
  TrialResult result;
  for (const FoundToken& token : reception.found) {
    if (token.bytes == message) {
      if (!result.correct) result.found_delay_s = token.time_s - reception.signal_start_s;
      result.correct = true;
    } else {
      ++result.wrong;
    }
  }
  if (reception.broadcaster_time_s >= 0) {
    result.heard_delay_s = reception.broadcaster_time_s - reception.signal_start_s;
  }
  return result;
}

}  // namespace vesk_tool
