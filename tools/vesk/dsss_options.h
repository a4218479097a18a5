// The DSSS waveform options shared by the vesk commands.

#ifndef TOOLS_VESK_DSSS_OPTIONS_H_
#define TOOLS_VESK_DSSS_OPTIONS_H_

#include <string>

#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/vesk/option_parser.h"

namespace vesk_tool {

// Token and waveform settings as the user chose them. The message length and
// the CRC setting decide the token length.
struct DsssOptions {
  audio_modem::DsssEncoderConfig config;  // Product defaults.
  std::string preset = "48k";             // "48k" (product) or "44k" (coder record defaults).
  bool crc = true;                        // Two CRC-16 bytes after the message.
};

// Registers --preset, --crc, --checksum-symbol, --single-sideband, --taps,
// --code, --coder-rate, --upsampling, --decimation, --carrier, --bits,
// --cycles, --quadrature, --broadcast-rate and --transition.
void AddDsssOptions(OptionParser* parser, DsssOptions* options);

// After parsing: applies the preset to the coder fields the user did not
// set, sets the token length for `message_bytes` and validates. Returns an
// empty string or what is wrong.
std::string FinishDsssOptions(const OptionParser& parser, int message_bytes, DsssOptions* options);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_DSSS_OPTIONS_H_
