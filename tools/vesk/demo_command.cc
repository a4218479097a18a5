// vesk demo: encodes a token with the product configuration (DSSS, or DTMF
// with --dtmf), plays it through a simulated room (noise, clock skew,
// reverberation) into a phone microphone, decodes it as an app would, and
// shows what happened.

#include <cmath>
#include <cstdio>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/channel/channel_simulator.h"
#include "tools/vesk/commands.h"
#include "tools/vesk/option_parser.h"
#include "tools/vesk/stream_decoding.h"

namespace vesk_tool {

int RunDemo(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
  bool dtmf = false;
  for (const std::string& arg : args) dtmf = dtmf || arg == "--dtmf";
  std::string message_hex = dtmf ? "0123456789" : "0123456789ab";
  float snr_db = 0.0f;
  float speed = 1.001f;
  bool reverb = true;
  int mic_rate = 44100;
  int repeat = 3;
  int seed = 1;
  bool zintar = false;
  bool help = false;
  OptionParser parser;
  parser.AddFlag("dtmf", &dtmf, "the multi-tone modem (5 bytes with a checksum symbol)");
  parser.AddString("message", &message_hex, "message bytes in hex: 6 (DSSS) or 5 (DTMF)");
  parser.AddFloat("snr", &snr_db, "full-band signal-to-noise ratio at the microphone, dB");
  parser.AddFloat("speed", &speed, "clock skew or Doppler: the token plays this much faster");
  parser.AddFlag("reverb", &reverb, "room reverberation (RT60 0.3 s)");
  parser.AddInt("mic-rate", &mic_rate, "microphone sample rate, Hz");
  parser.AddInt("repeat", &repeat, "token repetitions");
  parser.AddInt("seed", &seed, "seed of the simulated room");
  parser.AddFlag("zintar", &zintar, "decode through the zintar listening mode");
  parser.AddFlag("help", &help, "show this help");
  std::string error;
  std::vector<unsigned char> message;
  const size_t message_bytes = dtmf ? 5 : 6;
  if (!parser.Parse(args, &error) || !ParseHexBytes(message_hex, &message) ||
      message.size() != message_bytes || repeat < 1 || !(speed > 0.5f && speed < 2.0f) ||
      mic_rate < 8000 || (dtmf && zintar)) {
    err << "vesk demo: "
        << (error.empty() ? "needs 6 (DSSS) or 5 (DTMF) message bytes, --repeat >= 1, --speed "
                            "in (0.5, 2), --mic-rate >= 8000, and no --zintar with --dtmf"
                          : error)
        << "\nusage: vesk demo [options]\n"
        << parser.Help();
    return 2;
  }
  if (help) {
    out << "usage: vesk demo [options]\n" << parser.Help();
    return 0;
  }
  audio_modem::DsssDecoderConfig decoder_config;
  decoder_config.input_sample_rate = static_cast<float>(mic_rate);
  decoder_config.use_zintar = zintar;
  audio_modem::DtmfDecoderConfig dtmf_decoder_config;
  dtmf_decoder_config.input_sample_rate = static_cast<float>(mic_rate);
  error = dtmf ? audio_modem::DtmfDecoderConfigError(dtmf_decoder_config)
               : audio_modem::DsssDecoderConfigError(decoder_config);
  if (!error.empty()) {
    err << "vesk demo: " << error << "\n";
    return 2;
  }

  // Transmit: DSSS tokens carry CRC-16 bytes, DTMF tokens a checksum symbol.
  const int crc_bytes = dtmf ? 0 : 2;
  const auto encoder =
      dtmf ? audio_modem::MakeDtmfAudioModemEncoder(audio_modem::DtmfEncoderConfig())
           : audio_modem::MakeDsssAudioModemEncoder(audio_modem::DsssEncoderConfig());
  std::vector<float> token_audio, transition;
  encoder->Encode(std::vector<uint8_t>(message.begin(), message.end()), &token_audio, crc_bytes);
  encoder->MakeStartTransition(token_audio, &transition);
  std::vector<float> played = transition;
  for (int r = 0; r < repeat; ++r)
    played.insert(played.end(), token_audio.begin(), token_audio.end());

  // Through the room.
  vesk_channel::ChannelParams room;
  room.mic_rate = mic_rate;
  room.speed = speed;
  room.snr_db = snr_db;
  room.reverb = reverb;
  room.lead_in_s = 0.5;
  room.max_random_lead_in_s = 0.5;
  room.tail_s = 1.0;
  room.seed = static_cast<uint64_t>(seed);
  const vesk_channel::ChannelOutput heard =
      vesk_channel::PlayThroughChannel(played, encoder->GetSampleRate(), room);

  // Receive, as an app's recording loop would.
  const auto decoder = dtmf ? audio_modem::MakeDtmfAudioModemDecoder(dtmf_decoder_config)
                            : audio_modem::MakeDsssAudioModemDecoder(decoder_config);
  StreamDecodingOptions stream_options;
  stream_options.zintar = zintar;
  StreamDecoder stream(decoder.get(), mic_rate, 1, static_cast<int>(message_bytes), crc_bytes,
                       stream_options);
  const std::vector<FoundToken> found =
      stream.Feed(heard.samples.data(), static_cast<int64_t>(heard.samples.size()));

  char line[256];
  out << (dtmf ? "Vesk DTMF demo\n" : "Vesk DSSS demo\n");
  std::snprintf(line, sizeof(line), "sent:     %s %s, %d x %.3f s at %.0f Hz (%s)\n",
                ToHex(message).c_str(), dtmf ? "+ checksum symbol" : "+ CRC-16", repeat,
                token_audio.size() / encoder->GetSampleRate(), encoder->GetSampleRate(),
                dtmf ? "pairs of ten tones from 740 to 2489 Hz, 50 ms symbols"
                     : "carrier 18500 Hz, 2032-sample frames");
  out << line;
  std::snprintf(line, sizeof(line),
                "room:     SNR %.1f dB full band, speed %.4f, %s, microphone %d Hz%s; signal "
                "starts at %.3f s\n",
                snr_db, speed, reverb ? "reverberation RT60 0.3 s" : "no reverberation", mic_rate,
                zintar ? " (listening mode)" : "", heard.signal_start_exact / mic_rate);
  out << line;
  if (stream.broadcaster_time_s() >= 0) {
    std::snprintf(line, sizeof(line), "heard:    a transmitter at %.3f s\n",
                  stream.broadcaster_time_s());
    out << line;
  }
  bool correct = false;
  for (const FoundToken& token : found) {
    const bool match = token.bytes == std::vector<uint8_t>(message.begin(), message.end());
    correct = correct || match;
    std::snprintf(line, sizeof(line), "decoded:  %s at %.3f s%s\n",
                  ToHex(std::vector<unsigned char>(token.bytes.begin(), token.bytes.end())).c_str(),
                  token.time_s, match ? "  (correct)" : "  (WRONG)");
    out << line;
  }
  if (found.empty()) out << "decoded:  nothing\n";
  return correct ? 0 : 1;
}

}  // namespace vesk_tool
