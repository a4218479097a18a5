// vesk encode: a token's audio as a 16-bit WAV file, a 32-bit float WAV
// (--float) or headerless 16-bit little-endian PCM (--raw), written to a file
// or to standard output (-).

#ifndef TOOLS_VESK_ENCODE_COMMAND_H_
#define TOOLS_VESK_ENCODE_COMMAND_H_

#include <cstdint>
#include <string>
#include <vector>

#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/common/over_the_air.h"
#include "tools/vesk/commands.h"

namespace vesk_tool {

struct EncodeRequest {
  enum class Format { kWav16, kWavFloat, kRaw16 };

  bool dtmf = false;             // The DTMF modem instead of DSSS.
  std::vector<uint8_t> message;  // 1 to kMaxMessageBytes bytes.
  int crc_bytes = 0;             // 0 or 2, after the message.
  int repeat = 3;                // Token repetitions after the start transition, >= 1.
  Format format = Format::kWav16;
  std::string output;                          // A path, or "-" for standard output.
  audio_modem::DsssEncoderConfig dsss;         // When !dtmf.
  audio_modem::DtmfEncoderConfig dtmf_config;  // When dtmf.
};

// Parses and validates `args` (the arguments after "encode"). On kHelp and
// kError, *message holds the text to print.
ParseOutcome ParseEncodeArgs(const std::vector<std::string>& args, EncodeRequest* request,
                             std::string* message);

// What the request makes: the transmitter's playback and the encoder's facts.
struct EncodedToken {
  Playback playback;
  int sample_rate = 0;   // Hz, of the playback.
  float coder_rate = 0;  // Hz, where the token was synthesised.
  int token_size = 0;    // Bytes on air, check bytes included.
};

// Encodes a request that ParseEncodeArgs accepted. False when the encoder
// refuses it.
bool EncodeToken(const EncodeRequest& request, EncodedToken* token);

// The bytes of the output in the requested format. Samples become 16 bits as
// the library hands them to hosts (audio_dsp::FloatToPcm16).
std::vector<uint8_t> OutputBytes(const EncodeRequest& request, const EncodedToken& token);

// Two lines: what was written, and the token.
void ReportEncode(const EncodeRequest& request, const EncodedToken& token, std::ostream& out);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_ENCODE_COMMAND_H_
