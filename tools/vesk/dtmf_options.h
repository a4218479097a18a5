// The DTMF options shared by the vesk commands (selected with --dtmf).

#ifndef TOOLS_VESK_DTMF_OPTIONS_H_
#define TOOLS_VESK_DTMF_OPTIONS_H_

#include <string>
#include <vector>

#include "social/tandry/audio/dtmf_waveform_config.h"
#include "tools/common/option_parser.h"

namespace vesk_tool {

struct DtmfOptions {
  bool dtmf = true;                          // Set by --dtmf, which selects these options.
  audio_modem::DtmfWaveformConfig waveform;  // Product waveform (checksum symbol on).
  bool crc = false;                          // Two CRC-16 bytes after the message.
  std::string tones;                         // Comma-separated Hz; empty: the default ten-tone set.
  std::string envelope;  // "attack,decay,sustain,release,level" seconds and level.
};

// Whether `args` ask for the DTMF modem (--dtmf), which decides the options
// a command registers.
bool WantsDtmf(const std::vector<std::string>& args);

// Registers --dtmf for a DSSS command: it only points to the DTMF options.
void AddDtmfSwitch(OptionParser* parser, bool* dtmf);

// Registers --dtmf, --crc, --checksum-symbol, --coder-rate, --decimation,
// --window, --tones-per-symbol, --tones and --envelope, each with its range.
void AddDtmfOptions(OptionParser* parser, DtmfOptions* options);

// After parsing: reads the lists and checks what single ranges cannot (the
// tones against the coder rate, the envelope against the symbol duration,
// the size of the alphabet). `message_bytes` (without check bytes) sets the
// token length. Returns an empty string, or a message naming the options
// and values.
std::string FinishDtmfOptions(int message_bytes, DtmfOptions* options);

// The highest tone must lie below half of `rate` (the input rate, named
// `what` in the message). Empty or the reason.
std::string CheckTonesBelowNyquist(const audio_modem::DtmfWaveformConfig& waveform, int rate,
                                   const std::string& what);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_DTMF_OPTIONS_H_
