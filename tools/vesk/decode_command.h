// vesk decode: decodes an audio file, or standard input (-), in chunks as a
// host app would, and prints each token once with the stream time at which
// it was found (or, with --json, one JSON object per token per line).

#ifndef TOOLS_VESK_DECODE_COMMAND_H_
#define TOOLS_VESK_DECODE_COMMAND_H_

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "tools/common/audio_input.h"
#include "tools/common/stream_decoding.h"
#include "tools/vesk/commands.h"

namespace vesk_tool {

struct DecodeRequest {
  bool dtmf = false;      // The DTMF modem instead of DSSS.
  int message_bytes = 0;  // Message bytes per token, 1 to kMaxMessageBytes.
  int crc_bytes = 0;      // 0 or 2 check bytes after the message.
  bool json = false;      // One JSON object per token instead of the human line.
  std::string input;      // A path, or "-" for standard input.
  AudioInputOptions input_options;
  bool rate_given = false;  // --rate or --channels given (they describe raw input).
  bool channels_given = false;
  audio_modem::DsssDecoderConfig dsss;         // When !dtmf; input rate and channels set later.
  audio_modem::DtmfDecoderConfig dtmf_config;  // When dtmf; likewise.
  StreamDecodingOptions stream;
};

// Parses and validates `args` (the arguments after "decode"). On kHelp and
// kError, *message holds the text to print.
ParseOutcome ParseDecodeArgs(const std::vector<std::string>& args, DecodeRequest* request,
                             std::string* message);

// Opens the request's input: the file, or standard input for "-". Null with
// a message naming the input.
std::unique_ptr<AudioInput> OpenDecodeInput(const DecodeRequest& request, std::string* error);

// Checks the input's rate against the modem (the carrier or the highest tone
// must lie below half of it) and builds the decoder for it. Null with a
// message.
std::unique_ptr<audio_modem::AudioModemDecoder> MakeDecoderForInput(const DecodeRequest& request,
                                                                    const AudioInput& input,
                                                                    std::string* error);

// One token as printed: "    1.024 s  0123456789ab", or with `json`
// {"time": 1.024, "message": "0123456789ab", "modem": "dsss"}.
std::string FormatToken(const FoundToken& token, bool json, bool dtmf);

struct DecodeSummary {
  int tokens = 0;
  double seconds = 0.0;  // Of audio read.
};

// Reads `input` to its end into `decoder` as the request says, calling
// `on_token` with each token when it is first found and `on_progress` with
// the seconds read after each block.
DecodeSummary DecodeStream(const DecodeRequest& request, AudioInput* input,
                           audio_modem::AudioModemDecoder* decoder,
                           const std::function<void(const FoundToken&)>& on_token,
                           const std::function<void(double)>& on_progress);

// The closing lines on standard error: the count, clipped samples and an
// incomplete last frame when there were any.
void ReportDecode(const DecodeSummary& summary, const AudioInput& input, std::ostream& err);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_DECODE_COMMAND_H_
