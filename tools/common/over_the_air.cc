#include "tools/common/over_the_air.h"

#include <cmath>
#include <string>
#include <utility>
#include <vector>

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
  parser
      ->AddDouble("level", &c.level_db,
                  "level of the signal's full scale at the microphone, dB below 16-bit full scale")
      .Range(-90, 20)
      .Placeholder("DB");

  using vesk_channel::DeviceProfile;
  const std::vector<std::pair<std::string, DeviceProfile>> profiles = {
      {"flat", DeviceProfile::kFlat},
      {"budget", DeviceProfile::kBudgetPhone},
      {"flagship", DeviceProfile::kFlagshipPhone}};
  parser->AddChoice("speaker", &c.speaker, profiles, "frequency response of the loudspeaker");
  parser->AddChoice("microphone", &c.microphone, profiles,
                    "frequency response of the microphone (phones: with a 100 Hz high-pass)");
  parser
      ->AddDouble("overdrive", &c.overdrive_db,
                  "the token is played this much over full scale and clips, dB")
      .Range(0, 40)
      .Placeholder("DB");
  parser->AddDouble("agc", &c.agc.step_db, "recording gain steps of this size, dB; 0: none")
      .Range(0, 40)
      .Placeholder("DB");
  parser->AddDouble("agc-interval", &c.agc.interval_s, "one gain step in every interval of, s")
      .Range(0.05, 60)
      .Placeholder("S");
  parser->AddDouble("dropout", &c.dropouts.length_s, "length of each recording dropout, s")
      .Range(0.001, 1)
      .Placeholder("S");
  parser
      ->AddDouble("dropout-every", &c.dropouts.interval_s,
                  "one dropout in every interval of, s; 0: none")
      .Range(0, 60)
      .Placeholder("S");
  parser->AddDouble("walk", &c.walk_speed_mps, "the listener walks past at this speed, m/s")
      .Range(0, 3)
      .Placeholder("M/S");
  parser->AddDouble("walk-closest", &c.walk_closest_m, "closest distance of the walk, m")
      .Range(0.1, 20)
      .Placeholder("M");
  parser->AddList("tones", &c.tone_frequencies_hz, "steady tones at these frequencies, Hz")
      .Range(1, 96000)
      .Placeholder("HZ,...");
  parser
      ->AddInt("random-tones", &c.random_tones,
               "plus this many steady tones at random frequencies of the tone band")
      .Range(0, 16);
  parser->AddDouble("tone-band-low", &c.random_tone_low_hz, "lowest random tone, Hz")
      .Range(0, 96000)
      .Placeholder("HZ");
  parser->AddDouble("tone-band-high", &c.random_tone_high_hz, "highest random tone, Hz")
      .Range(0, 96000)
      .Placeholder("HZ");
  parser->AddDouble("tone-sir", &c.tone_sir_db, "signal-to-tone ratio of each tone, dB")
      .Range(-60, 60)
      .Placeholder("DB");
  parser
      ->AddDouble("music", &c.music_sir_db,
                  "music (chords of harmonic notes) at this signal-to-music ratio, dB; inf: none")
      .Range(-60, INFINITY)
      .Placeholder("DB");
  parser->AddInt("music-harmonics", &c.music.harmonics, "partials of each note of the music")
      .Range(1, 64);
  parser->AddDouble("impulses", &c.impulses.per_second, "claps and door slams per second")
      .Range(0, 20);
  parser
      ->AddDouble("impulse-peak", &c.impulses.peak_over_signal_db,
                  "each impulse's peak over the signal's RMS, dB")
      .Range(-20, 60)
      .Placeholder("DB");
  parser
      ->AddDouble("second", &c.second_power_db,
                  "a second transmitter with another token at this power over the first's, dB; "
                  "-inf: none")
      .Range(-INFINITY, 20)
      .Placeholder("DB");
  parser
      ->AddDouble("second-offset", &c.second_offset_s,
                  "the second transmitter starts this long after the first, s")
      .Range(-5, 5)
      .Placeholder("S");
}

std::string OverTheAirError(const OverTheAir& air) {
  const vesk_channel::ChannelParams& c = air.channel;
  const double nyquist = c.mic_rate / 2.0;
  for (const double hz : c.tone_frequencies_hz) {
    if (hz >= nyquist) {
      return "--tones " + FormatNumber(hz) + ": a tone must lie below half the microphone rate (" +
             FormatNumber(nyquist) + " Hz)";
    }
  }
  if (c.random_tones > 0) {
    if (!(c.random_tone_low_hz > 0 && c.random_tone_low_hz <= c.random_tone_high_hz)) {
      return "--random-tones: the tone band needs 0 < --tone-band-low <= --tone-band-high";
    }
    if (c.random_tone_high_hz >= nyquist) {
      return "--tone-band-high " + FormatNumber(c.random_tone_high_hz) +
             ": must lie below half the microphone rate (" + FormatNumber(nyquist) + " Hz)";
    }
  }
  if (std::isfinite(c.second_power_db) && c.second_offset_s < -c.lead_in_s) {
    return "--second-offset " + FormatNumber(c.second_offset_s) +
           ": the second transmitter may start at most --lead-in (" + FormatNumber(c.lead_in_s) +
           " s) before the first";
  }
  return std::string();
}

std::string DescribeImpairments(const vesk_channel::ChannelParams& c) {
  std::vector<std::string> parts;
  using vesk_channel::DeviceProfile;
  if (c.level_db != 0) parts.push_back("level " + FormatNumber(c.level_db) + " dB");
  if (c.speaker != DeviceProfile::kFlat) {
    parts.push_back(std::string(vesk_channel::DeviceProfileName(c.speaker)) + " speaker");
  }
  if (c.microphone != DeviceProfile::kFlat) {
    parts.push_back(std::string(vesk_channel::DeviceProfileName(c.microphone)) + " microphone");
  }
  if (c.overdrive_db > 0) parts.push_back("overdrive " + FormatNumber(c.overdrive_db) + " dB");
  if (c.agc.step_db > 0) {
    parts.push_back("AGC steps of " + FormatNumber(c.agc.step_db) + " dB every " +
                    FormatNumber(c.agc.interval_s) + " s");
  }
  if (c.dropouts.interval_s > 0) {
    parts.push_back(FormatNumber(1000 * c.dropouts.length_s) + " ms dropouts every " +
                    FormatNumber(c.dropouts.interval_s) + " s");
  }
  if (c.walk_speed_mps > 0) {
    parts.push_back("walking past at " + FormatNumber(c.walk_speed_mps) + " m/s, closest " +
                    FormatNumber(c.walk_closest_m) + " m");
  }
  const size_t tones = c.tone_frequencies_hz.size() + static_cast<size_t>(c.random_tones);
  if (tones > 0) {
    std::string text = std::to_string(tones) + (tones == 1 ? " tone" : " tones");
    for (const double hz : c.tone_frequencies_hz) text += " " + FormatNumber(hz) + " Hz";
    if (c.random_tones > 0) {
      text += " (" + std::to_string(c.random_tones) + " in " + FormatNumber(c.random_tone_low_hz) +
              "-" + FormatNumber(c.random_tone_high_hz) + " Hz)";
    }
    parts.push_back(text + " at signal-to-tone " + FormatNumber(c.tone_sir_db) + " dB");
  }
  if (std::isfinite(c.music_sir_db)) {
    parts.push_back("music (" + std::to_string(c.music.harmonics) +
                    " partials a note) at signal-to-music " + FormatNumber(c.music_sir_db) + " dB");
  }
  if (c.impulses.per_second > 0) {
    parts.push_back(FormatNumber(c.impulses.per_second) + " impulses/s peaking " +
                    FormatNumber(c.impulses.peak_over_signal_db) + " dB over the signal");
  }
  if (std::isfinite(c.second_power_db)) {
    parts.push_back("second transmitter at " + FormatNumber(c.second_power_db) + " dB, " +
                    FormatNumber(c.second_offset_s) + " s later");
  }
  std::string text;
  for (const std::string& part : parts) text += (text.empty() ? "" : ", ") + part;
  return text.empty() ? "none" : text;
}

std::vector<uint8_t> SecondMessage(const std::vector<uint8_t>& message) {
  std::vector<uint8_t> second = message;
  for (uint8_t& byte : second) byte = static_cast<uint8_t>(~byte);
  return second;
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

namespace {

// The second transmitter's playback when the channel has one, else empty.
std::vector<float> SecondPlayback(const audio_modem::AudioModemEncoder& encoder,
                                  const std::vector<uint8_t>& message, int crc_bytes,
                                  const OverTheAir& air) {
  if (!std::isfinite(air.channel.second_power_db)) return {};
  return MakePlayback(encoder, SecondMessage(message), crc_bytes, air.repeat).samples;
}

}  // namespace

vesk_channel::ChannelOutput PlayOverTheAir(const audio_modem::AudioModemEncoder& encoder,
                                           const std::vector<uint8_t>& message, int crc_bytes,
                                           const OverTheAir& air) {
  return vesk_channel::PlayThroughChannel(
      MakePlayback(encoder, message, crc_bytes, air.repeat).samples, encoder.GetSampleRate(),
      air.channel, SecondPlayback(encoder, message, crc_bytes, air));
}

Reception SendOverTheAir(const audio_modem::AudioModemEncoder& encoder,
                         const std::vector<uint8_t>& message, int crc_bytes, const OverTheAir& air,
                         const DecoderFactory& make_decoder, const StreamDecodingOptions& options,
                         bool finish) {
  Reception reception;
  const Playback playback = MakePlayback(encoder, message, crc_bytes, air.repeat);
  reception.transmit_rate = encoder.GetSampleRate();
  reception.token_samples = playback.token_samples;
  if (std::isfinite(air.channel.second_power_db)) reception.second_message = SecondMessage(message);
  reception.heard =
      vesk_channel::PlayThroughChannel(playback.samples, reception.transmit_rate, air.channel,
                                       SecondPlayback(encoder, message, crc_bytes, air));
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
    } else if (!reception.second_message.empty() && token.bytes == reception.second_message) {
      result.second_correct = true;
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
