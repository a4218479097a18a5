// vesk encode: writes a token's audio to a 16-bit WAV file.

#include <cstdio>
#include <memory>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/vesk/commands.h"
#include "tools/vesk/dsss_options.h"
#include "tools/vesk/dtmf_options.h"
#include "tools/vesk/option_parser.h"
#include "tools/vesk/wav_io.h"

namespace vesk_tool {

int RunEncode(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
  const bool dtmf = WantsDtmf(args);
  std::string message_hex = dtmf ? "0123456789" : "0123456789ab";
  int repeat = 3;
  bool help = false;
  DsssOptions dsss;
  DtmfOptions dtmf_options;
  audio_modem::DsssEncoderConfig dsss_config;
  OptionParser parser;
  parser.AddString("message", &message_hex, "message bytes in hex");
  parser.AddInt("repeat", &repeat, "token repetitions after the start transition");
  if (dtmf) {
    AddDtmfOptions(&parser, &dtmf_options);
  } else {
    AddDsssOptions(&parser, &dsss);
    parser.AddFlag("single-sideband", &dsss_config.single_sideband,
                   "transmit only above the carrier");
    parser.AddInt("broadcast-rate", &dsss_config.broadcast_sample_rate, "output sample rate, Hz");
    parser.AddFloat("transition", &dsss_config.transition_duration, "start transition, seconds");
  }
  parser.AddFlag("help", &help, "show this help");
  const std::string usage = "usage: vesk encode [--dtmf] [options] OUTPUT.wav\n";

  std::string error;
  if (!parser.Parse(args, &error)) {
    err << "vesk encode: " << error << "\n" << usage;
    return 2;
  }
  if (help) {
    out << usage << "Writes the start transition (DSSS only), then the token repeated, as "
        << "16-bit mono PCM.\n\n"
        << parser.Help();
    return 0;
  }
  if (parser.positional().size() != 1) {
    err << "vesk encode: give exactly one output file\n" << usage;
    return 2;
  }
  std::vector<unsigned char> message;
  if (!ParseHexBytes(message_hex, &message)) {
    err << "vesk encode: --message must be hexadecimal bytes, not '" << message_hex << "'\n";
    return 2;
  }
  if (repeat < 1) {
    err << "vesk encode: --repeat must be at least 1\n";
    return 2;
  }
  const bool crc = dtmf ? dtmf_options.crc : dsss.crc;
  const int message_bytes = static_cast<int>(message.size());
  std::unique_ptr<audio_modem::AudioModemEncoder> encoder;
  if (dtmf) {
    error = FinishDtmfOptions(message_bytes, &dtmf_options);
    audio_modem::DtmfEncoderConfig config;
    static_cast<audio_modem::DtmfWaveformConfig&>(config) = dtmf_options.waveform;
    if (error.empty()) error = audio_modem::DtmfEncoderConfigError(config);
    if (error.empty()) encoder = audio_modem::MakeDtmfAudioModemEncoder(config);
  } else {
    error = FinishDsssOptions(parser, &dsss);
    dsss_config.waveform = dsss.waveform;
    dsss_config.append_checksum_symbol = dsss.checksum_symbol;
    dsss_config.token_length_bytes = message_bytes + (crc ? 2 : 0);
    if (error.empty()) error = audio_modem::DsssEncoderConfigError(dsss_config);
    if (error.empty()) encoder = audio_modem::MakeDsssAudioModemEncoder(dsss_config);
  }
  if (!error.empty() || encoder == nullptr) {
    err << "vesk encode: " << (error.empty() ? "the envelope was refused" : error) << "\n";
    return 2;
  }

  std::vector<float> token_audio, transition;
  encoder->Encode(std::vector<uint8_t>(message.begin(), message.end()), &token_audio, crc ? 2 : 0);
  if (token_audio.empty()) {
    err << "vesk encode: the encoder refused the token\n";
    return 1;
  }
  encoder->MakeStartTransition(token_audio, &transition);

  PcmAudio wav;
  wav.sample_rate = static_cast<int>(encoder->GetSampleRate());
  for (float s : transition) wav.samples.push_back(audio_dsp::FloatToPcm16(s));
  for (int r = 0; r < repeat; ++r) {
    for (float s : token_audio) wav.samples.push_back(audio_dsp::FloatToPcm16(s));
  }
  const std::string& path = parser.positional()[0];
  if (!WriteWav(path, wav, &error)) {
    err << "vesk encode: " << error << "\n";
    return 1;
  }
  char summary[256];
  std::snprintf(summary, sizeof(summary),
                "wrote %s: %d Hz, %zu-sample transition + %d x %zu-sample token (%.3f s)\n",
                path.c_str(), wav.sample_rate, transition.size(), repeat, token_audio.size(),
                static_cast<double>(wav.samples.size()) / wav.sample_rate);
  out << summary << (dtmf ? "DTMF" : "DSSS") << " token: message " << ToHex(message)
      << (crc ? " + CRC-16" : "") << ", " << encoder->token_size() << " bytes on air\n";
  return 0;
}

}  // namespace vesk_tool
