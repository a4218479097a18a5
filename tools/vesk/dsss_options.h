// The DSSS options shared by the vesk commands: token layout and waveform.

#ifndef TOOLS_VESK_DSSS_OPTIONS_H_
#define TOOLS_VESK_DSSS_OPTIONS_H_

#include <string>

#include "social/tandry/audio/dsss_waveform_config.h"
#include "tools/common/option_parser.h"

namespace vesk_tool {

// Token layout and waveform, as the user chose them.
struct DsssOptions {
  audio_modem::DsssWaveformConfig waveform;  // Product waveform.
  std::string preset = "48k";  // "48k" (product) or "44k" (the coder record's defaults).
  bool crc = true;             // Two CRC-16 bytes after the message.
  bool checksum_symbol = false;
};

// Registers --preset, --crc, --checksum-symbol, --taps, --code, --coder-rate,
// --upsampling, --decimation, --carrier, --bits, --cycles and --quadrature,
// each with its range.
void AddDsssOptions(OptionParser* parser, DsssOptions* options);

// After parsing: applies the preset to the coder fields that the user did
// not set, then checks what single ranges cannot (the code number for the
// register length, the decimation against the upsampling, the carrier
// against the coder rate, the symbol tones against the baseband frame).
// Returns an empty string, or a message naming the options and values.
std::string FinishDsssOptions(const OptionParser& parser, DsssOptions* options);

// The carrier must lie below half of `rate` (the broadcast or the input
// rate, named `what` in the message "--broadcast-rate 8000"). Empty or the
// reason.
std::string CheckCarrierBelowNyquist(const audio_modem::DsssWaveformConfig& waveform, int rate,
                                     const std::string& what);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_DSSS_OPTIONS_H_
