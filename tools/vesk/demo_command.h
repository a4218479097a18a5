// vesk demo: encodes a token with the product configuration (DSSS, or DTMF
// with --dtmf), plays it through a simulated room (noise, clock skew,
// reverberation) into a phone microphone, decodes it as an app would, and
// shows what happened. --save keeps what the microphone heard as a WAV file.

#ifndef TOOLS_VESK_DEMO_COMMAND_H_
#define TOOLS_VESK_DEMO_COMMAND_H_

#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

#include "tools/common/over_the_air.h"
#include "tools/vesk/commands.h"

namespace vesk_tool {

struct DemoRequest {
  bool dtmf = false;             // The DTMF product configuration instead of DSSS.
  std::vector<uint8_t> message;  // 6 bytes (DSSS, + CRC-16) or 5 (DTMF, + checksum symbol).
  OverTheAir air;                // The room; air.channel.seed from --seed.
  bool zintar = false;           // Decode through the listening mode.
  std::string save;              // Path of a WAV of the microphone's PCM, or empty.
};

// Parses and validates `args` (the arguments after "demo"). On kHelp and
// kError, *message holds the text to print.
ParseOutcome ParseDemoArgs(const std::vector<std::string>& args, DemoRequest* request,
                           std::string* message);

// Sends the request's token over the air and decodes it.
Reception RunDemoTrial(const DemoRequest& request);

// What was sent, the room, and what was heard and decoded. Returns whether
// the sent token was decoded.
bool ReportDemo(const DemoRequest& request, const Reception& reception, std::ostream& out);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_DEMO_COMMAND_H_
