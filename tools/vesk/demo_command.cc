// vesk demo: encodes a token with the product configuration and reports the
// audio it made.

#include <cmath>
#include <cstdio>
#include <vector>

#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/vesk/commands.h"
#include "tools/vesk/option_parser.h"

namespace vesk_tool {

int RunDemo(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
  std::string message_hex = "0123456789ab";
  OptionParser parser;
  parser.AddString("message", &message_hex, "message bytes in hex (6 bytes)");
  std::string error;
  std::vector<unsigned char> message;
  if (!parser.Parse(args, &error) || !ParseHexBytes(message_hex, &message) || message.size() != 6) {
    err << "vesk demo: " << (error.empty() ? "--message needs 6 hex bytes" : error) << "\n"
        << "usage: vesk demo [options]\n"
        << parser.Help();
    return 2;
  }
  const audio_modem::DsssEncoderConfig config;
  const auto encoder = audio_modem::MakeDsssAudioModemEncoder(config);
  std::vector<float> audio, transition;
  encoder->Encode(std::vector<uint8_t>(message.begin(), message.end()), &audio, 2);
  encoder->MakeStartTransition(audio, &transition);
  float peak = 0;
  double energy = 0;
  for (float s : audio) {
    peak = std::max(peak, std::fabs(s));
    energy += static_cast<double>(s) * s;
  }
  char line[256];
  out << "Vesk DSSS demo\n";
  std::snprintf(line, sizeof(line),
                "token: %s + CRC-16 (%d bytes on air), carrier %.0f Hz, %d-sample frames\n",
                ToHex(message).c_str(), encoder->token_size(), config.waveform.carrier_frequency,
                config.waveform.upsampling_factor * 127);
  out << line;
  std::snprintf(line, sizeof(line),
                "audio: %zu samples at %.0f Hz (%.3f s), peak %.3f, RMS %.3f; transition %zu "
                "samples\n",
                audio.size(), encoder->GetSampleRate(), audio.size() / encoder->GetSampleRate(),
                peak, std::sqrt(energy / audio.size()), transition.size());
  out << line;
  return 0;
}

}  // namespace vesk_tool
