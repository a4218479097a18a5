#include "tools/vesk/encode_command.h"

#include <cstdio>
#include <memory>

#include "audio/dsp/pcm_conversion.h"
#include "tools/common/audio_input.h"
#include "tools/common/audio_output.h"
#include "tools/common/hex_bytes.h"
#include "tools/vesk/dsss_options.h"
#include "tools/vesk/dtmf_options.h"

namespace vesk_tool {
namespace {

constexpr char kUsage[] = "usage: vesk encode [--dtmf] [options] OUTPUT.wav|-\n";
constexpr char kDescription[] =
    "Writes the start transition (DSSS only), then the token repeated: a 16-bit mono WAV by\n"
    "default; - writes to standard output (for a pipe, or aplay -f S16_LE -r RATE with --raw).\n\n";

// The DSSS request's encoder fields, from the parsed options.
std::string FinishDsss(const OptionParser& parser, DsssOptions* dsss, EncodeRequest* request) {
  std::string error = FinishDsssOptions(parser, dsss);
  if (!error.empty()) return error;
  request->crc_bytes = dsss->crc ? 2 : 0;
  request->dsss.waveform = dsss->waveform;
  request->dsss.append_checksum_symbol = dsss->checksum_symbol;
  request->dsss.token_length_bytes = static_cast<int>(request->message.size()) + request->crc_bytes;
  error = CheckCarrierBelowNyquist(
      dsss->waveform, request->dsss.broadcast_sample_rate,
      "--broadcast-rate " + std::to_string(request->dsss.broadcast_sample_rate));
  if (!error.empty()) return error;
  return audio_modem::DsssEncoderConfigError(request->dsss);
}

std::string FinishDtmf(DtmfOptions* dtmf, EncodeRequest* request) {
  const std::string error = FinishDtmfOptions(static_cast<int>(request->message.size()), dtmf);
  if (!error.empty()) return error;
  request->crc_bytes = dtmf->crc ? 2 : 0;
  static_cast<audio_modem::DtmfWaveformConfig&>(request->dtmf_config) = dtmf->waveform;
  return audio_modem::DtmfEncoderConfigError(request->dtmf_config);
}

}  // namespace

ParseOutcome ParseEncodeArgs(const std::vector<std::string>& args, EncodeRequest* request,
                             std::string* message) {
  EncodeRequest& r = *request;
  r.dtmf = WantsDtmf(args);
  std::string message_hex = r.dtmf ? "0123456789" : "0123456789ab";
  bool raw = false;
  bool float_samples = false;
  DsssOptions dsss;
  DtmfOptions dtmf;
  OptionParser parser;
  parser.AddString("message", &message_hex, "message bytes in hex").Placeholder("HEX");
  parser.AddInt("repeat", &r.repeat, "token repetitions after the start transition").Range(1, 100);
  parser.AddFlag("raw", &raw, "headerless signed 16-bit little-endian PCM instead of a WAV");
  parser.AddFlag("float", &float_samples, "32-bit float WAV: the encoder's samples unrounded");
  if (r.dtmf) {
    AddDtmfOptions(&parser, &dtmf);
  } else {
    AddDtmfSwitch(&parser, &r.dtmf);
    AddDsssOptions(&parser, &dsss);
    parser.AddFlag("single-sideband", &r.dsss.single_sideband, "transmit only above the carrier");
    parser.AddInt("broadcast-rate", &r.dsss.broadcast_sample_rate, "output sample rate, Hz")
        .Range(kMinInputRate, kMaxInputRate)
        .Placeholder("HZ");
    parser.AddFloat("transition", &r.dsss.transition_duration, "start transition, s")
        .Range(0, 1)
        .Placeholder("S");
  }
  std::string error;
  if (!parser.Parse(args, &error)) return UsageError("encode", error, kUsage, message);
  if (parser.help_requested()) {
    *message = std::string(kUsage) + kDescription + parser.Help();
    return ParseOutcome::kHelp;
  }
  if (parser.positional().size() != 1) {
    return UsageError("encode", "give one output: a file name, or - for standard output", kUsage,
                      message);
  }
  r.output = parser.positional()[0];
  if (raw && float_samples) {
    return UsageError("encode", "--raw and --float exclude each other (raw output is 16-bit)",
                      kUsage, message);
  }
  r.format = raw             ? EncodeRequest::Format::kRaw16
             : float_samples ? EncodeRequest::Format::kWavFloat
                             : EncodeRequest::Format::kWav16;
  error = ParseMessageOption(message_hex, &r.message);
  if (error.empty()) error = r.dtmf ? FinishDtmf(&dtmf, &r) : FinishDsss(parser, &dsss, &r);
  if (!error.empty()) return UsageError("encode", error, kUsage, message);
  return ParseOutcome::kRun;
}

bool EncodeToken(const EncodeRequest& request, EncodedToken* token) {
  const std::unique_ptr<audio_modem::AudioModemEncoder> encoder =
      request.dtmf ? audio_modem::MakeDtmfAudioModemEncoder(request.dtmf_config)
                   : audio_modem::MakeDsssAudioModemEncoder(request.dsss);
  if (encoder == nullptr) return false;
  token->playback = MakePlayback(*encoder, request.message, request.crc_bytes, request.repeat);
  token->sample_rate = static_cast<int>(encoder->GetSampleRate());
  token->coder_rate =
      request.dtmf ? request.dtmf_config.sample_rate : request.dsss.waveform.sample_rate;
  token->token_size = encoder->token_size();
  return !token->playback.samples.empty();
}

std::vector<uint8_t> OutputBytes(const EncodeRequest& request, const EncodedToken& token) {
  const std::vector<float>& samples = token.playback.samples;
  switch (request.format) {
    case EncodeRequest::Format::kWavFloat:
      return WavBytes(samples, token.sample_rate, 1);
    case EncodeRequest::Format::kRaw16:
      return audio_dsp::FloatsToPcm16Bytes(samples);
    case EncodeRequest::Format::kWav16:
      break;
  }
  std::vector<int16_t> pcm(samples.size());
  for (size_t i = 0; i < samples.size(); ++i) pcm[i] = audio_dsp::FloatToPcm16(samples[i]);
  return WavBytes(pcm, token.sample_rate, 1);
}

void ReportEncode(const EncodeRequest& request, const EncodedToken& token, std::ostream& out) {
  const char* format = request.format == EncodeRequest::Format::kRaw16      ? "raw 16-bit PCM"
                       : request.format == EncodeRequest::Format::kWavFloat ? "32-bit float WAV"
                                                                            : "16-bit WAV";
  const Playback& p = token.playback;
  char line[512];
  std::snprintf(line, sizeof(line),
                "wrote %s: %s, %d Hz, %zu-sample transition + %d x %zu-sample token (%.3f s)\n",
                request.output == "-" ? "standard output" : request.output.c_str(), format,
                token.sample_rate, p.transition_samples, request.repeat, p.token_samples,
                static_cast<double>(p.samples.size()) / token.sample_rate);
  out << line << (request.dtmf ? "DTMF" : "DSSS") << " token: message " << ToHex(request.message)
      << (request.crc_bytes ? " + CRC-16" : "") << ", " << token.token_size << " bytes on air";
  if (token.coder_rate != static_cast<float>(token.sample_rate)) {
    out << " (" << FormatNumber(token.coder_rate) << " Hz coder resampled to " << token.sample_rate
        << " Hz)";
  }
  out << "\n";
}

int RunEncode(const std::vector<std::string>& args, std::ostream& out, std::ostream& err) {
  EncodeRequest request;
  std::string message;
  const int status =
      ReportParseOutcome(ParseEncodeArgs(args, &request, &message), message, out, err);
  if (status >= 0) return status;
  EncodedToken token;
  if (!EncodeToken(request, &token)) {
    err << "vesk encode: the encoder refused the token\n";
    return kExitError;
  }
  std::string error;
  if (!WriteBytes(request.output, OutputBytes(request, token), &error)) {
    err << "vesk encode: " << error << "\n";
    return kExitError;
  }
  // Standard output carries the audio: the report goes with the messages.
  ReportEncode(request, token, request.output == "-" ? err : out);
  return kExitSuccess;
}

}  // namespace vesk_tool
