#include "tools/vesk/demo_command.h"

#include <cmath>
#include <cstdio>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/common/audio_output.h"
#include "tools/common/hex_bytes.h"
#include "tools/vesk/dtmf_options.h"

namespace vesk_tool {
namespace {

constexpr char kUsage[] = "usage: vesk demo [--dtmf] [options]\n";
constexpr char kDescription[] =
    "Encodes a token with the product configuration, plays it through a simulated room into a\n"
    "phone microphone and decodes it as an app would. Exit status: 0 when the token was decoded,\n"
    "1 when not, 2 on an error.\n\n";

// The product tokens: DSSS 6 message bytes + CRC-16; DTMF 5 bytes with the
// checksum symbol.
constexpr size_t kDsssMessageBytes = 6;
constexpr size_t kDtmfMessageBytes = 5;

int CrcBytes(const DemoRequest& request) { return request.dtmf ? 0 : 2; }

audio_modem::DsssDecoderConfig DsssReceiver(const DemoRequest& request, int rate, int channels) {
  audio_modem::DsssDecoderConfig config;
  config.input_sample_rate = static_cast<float>(rate);
  config.num_channels = channels;
  config.use_zintar = request.zintar;
  return config;
}

audio_modem::DtmfDecoderConfig DtmfReceiver(int rate, int channels) {
  audio_modem::DtmfDecoderConfig config;
  config.input_sample_rate = static_cast<float>(rate);
  config.num_channels = channels;
  return config;
}

}  // namespace

ParseOutcome ParseDemoArgs(const std::vector<std::string>& args, DemoRequest* request,
                           std::string* message) {
  DemoRequest& r = *request;
  r.dtmf = WantsDtmf(args);
  std::string message_hex = r.dtmf ? "0123456789" : "0123456789ab";
  // The demo's room: noise at the signal's level, a slightly fast
  // transmitter, reverberation, a random start.
  vesk_channel::ChannelParams& room = r.air.channel;
  room.snr_db = 0.0;
  room.speed = 1.001;
  room.reverb = true;
  room.lead_in_s = 0.5;
  room.max_random_lead_in_s = 0.5;
  room.tail_s = 1.0;
  int seed = 1;
  OptionParser parser;
  parser.AddFlag("dtmf", &r.dtmf, "the multi-tone modem (5 bytes with a checksum symbol)");
  parser.AddString("message", &message_hex, "message bytes in hex: 6 (DSSS) or 5 (DTMF)")
      .Placeholder("HEX");
  AddOverTheAirOptions(&parser, &r.air);
  parser.AddInt("seed", &seed, "seed of the simulated room").Range(0, INT32_MAX);
  parser.AddFlag("zintar", &r.zintar, "decode through the zintar listening mode (DSSS)");
  parser.AddString("save", &r.save, "write what the microphone heard to this WAV file")
      .Placeholder("FILE");
  std::string error;
  if (!parser.Parse(args, &error)) return UsageError("demo", error, kUsage, message);
  if (parser.help_requested()) {
    *message = std::string(kUsage) + kDescription + parser.Help();
    return ParseOutcome::kHelp;
  }
  if (!parser.positional().empty()) {
    return UsageError("demo", "unexpected argument '" + parser.positional()[0] + "'", kUsage,
                      message);
  }
  room.seed = static_cast<uint64_t>(seed);
  error = ParseMessageOption(message_hex, &r.message);
  const size_t bytes = r.dtmf ? kDtmfMessageBytes : kDsssMessageBytes;
  if (error.empty() && r.message.size() != bytes) {
    error = "--message " + message_hex + ": the " + (r.dtmf ? "DTMF" : "DSSS") +
            " demo sends the product token of " + std::to_string(bytes) + " bytes";
  }
  if (error.empty() && r.dtmf && r.zintar) error = "--zintar listens for DSSS tokens only";
  if (error.empty()) error = OverTheAirError(r.air);
  if (error.empty()) {
    error =
        r.dtmf ? audio_modem::DtmfDecoderConfigError(DtmfReceiver(room.mic_rate, room.channels))
               : audio_modem::DsssDecoderConfigError(DsssReceiver(r, room.mic_rate, room.channels));
    if (!error.empty()) error = "--mic-rate " + std::to_string(room.mic_rate) + ": " + error;
  }
  if (!error.empty()) return UsageError("demo", error, kUsage, message);
  return ParseOutcome::kRun;
}

Reception RunDemoTrial(const DemoRequest& request) {
  const auto encoder =
      request.dtmf ? audio_modem::MakeDtmfAudioModemEncoder(audio_modem::DtmfEncoderConfig())
                   : audio_modem::MakeDsssAudioModemEncoder(audio_modem::DsssEncoderConfig());
  StreamDecodingOptions options;
  options.zintar = request.zintar;
  return SendOverTheAir(
      *encoder, request.message, CrcBytes(request), request.air,
      [&](int rate, int channels) {
        return request.dtmf
                   ? audio_modem::MakeDtmfAudioModemDecoder(DtmfReceiver(rate, channels))
                   : audio_modem::MakeDsssAudioModemDecoder(DsssReceiver(request, rate, channels));
      },
      options, /*finish=*/true);
}

bool ReportDemo(const DemoRequest& request, const Reception& reception, std::ostream& out) {
  const vesk_channel::ChannelParams& room = request.air.channel;
  char line[320];
  out << (request.dtmf ? "Vesk DTMF demo\n" : "Vesk DSSS demo\n");
  std::snprintf(line, sizeof(line), "sent:     %s %s, %d x %.3f s at %.0f Hz (%s)\n",
                ToHex(request.message).c_str(), request.dtmf ? "+ checksum symbol" : "+ CRC-16",
                request.air.repeat, reception.token_samples / reception.transmit_rate,
                reception.transmit_rate,
                request.dtmf ? "pairs of ten tones from 740 to 2489 Hz, 50 ms symbols"
                             : "carrier 18500 Hz, 2032-sample frames");
  out << line;
  char reverb[64] = "no reverberation";
  if (room.reverb) std::snprintf(reverb, sizeof(reverb), "reverberation RT60 %g s", room.rt60_s);
  std::snprintf(line, sizeof(line),
                "room:     SNR %.1f dB full band, speed %.4f, %s, microphone %d Hz%s%s; signal "
                "starts at %.3f s\n",
                room.snr_db, room.speed, reverb, room.mic_rate, room.channels == 2 ? " stereo" : "",
                request.zintar ? " (listening mode)" : "", reception.signal_start_s);
  out << line;
  if (DescribeImpairments(room) != "none") out << "extra:    " << DescribeImpairments(room) << "\n";
  if (!reception.second_message.empty()) {
    out << "other:    a second transmitter sends " << ToHex(reception.second_message) << "\n";
  }
  if (reception.broadcaster_time_s >= 0) {
    std::snprintf(line, sizeof(line), "heard:    a transmitter at %.3f s\n",
                  reception.broadcaster_time_s);
    out << line;
  }
  bool correct = false;
  for (const FoundToken& token : reception.found) {
    const bool match = token.bytes == request.message;
    const bool other = !reception.second_message.empty() && token.bytes == reception.second_message;
    correct = correct || match;
    std::snprintf(line, sizeof(line), "decoded:  %s at %.3f s%s\n", ToHex(token.bytes).c_str(),
                  token.time_s,
                  match   ? "  (correct)"
                  : other ? "  (the second transmitter's)"
                          : "  (WRONG)");
    out << line;
  }
  if (reception.found.empty()) out << "decoded:  nothing\n";
  return correct;
}

int RunDemo(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
  DemoRequest request;
  std::string message;
  const int status = ReportParseOutcome(ParseDemoArgs(args, &request, &message), message, out, err);
  if (status >= 0) return status;
  const Reception reception = RunDemoTrial(request);
  if (!request.save.empty()) {
    const vesk_channel::ChannelOutput& heard = reception.heard;
    std::string error;
    if (!WriteBytes(request.save, WavBytes(heard.samples, heard.rate, heard.channels), &error)) {
      err << "vesk demo: " << error << "\n";
      return kExitError;
    }
  }
  return ReportDemo(request, reception, out) ? kExitSuccess : kExitNothingFound;
}

}  // namespace vesk_tool
