// The DSSS options shared by the vesk commands.

#ifndef TOOLS_VESK_DSSS_OPTIONS_H_
#define TOOLS_VESK_DSSS_OPTIONS_H_

#include <string>

#include "social/tandry/audio/dsss_waveform_config.h"
#include "tools/vesk/option_parser.h"

namespace vesk_tool {

// Token layout and waveform, as the user chose them.
struct DsssOptions {
  audio_modem::DsssWaveformConfig waveform;  // Product waveform.
  std::string preset = "48k";  // "48k" (product) or "44k" (the coder record's defaults).
  bool crc = true;             // Two CRC-16 bytes after the message.
  bool checksum_symbol = false;
};

// Registers --preset, --crc, --checksum-symbol, --taps, --code, --coder-rate,
// --upsampling, --decimation, --carrier, --bits, --cycles and --quadrature.
void AddDsssOptions(OptionParser* parser, DsssOptions* options);

// After parsing: applies the preset to the coder fields that the user did
// not set and validates the waveform. Returns an empty string or what is wrong.
std::string FinishDsssOptions(const OptionParser& parser, DsssOptions* options);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_DSSS_OPTIONS_H_
