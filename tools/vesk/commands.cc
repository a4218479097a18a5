#include "tools/vesk/commands.h"

#include "tools/common/hex_bytes.h"

namespace vesk_tool {

int ReportParseOutcome(ParseOutcome outcome, const std::string& message, std::ostream& out,
                       std::ostream& err) {
  switch (outcome) {
    case ParseOutcome::kHelp:
      out << message;
      return kExitSuccess;
    case ParseOutcome::kError:
      err << message;
      return kExitError;
    case ParseOutcome::kRun:
      break;
  }
  return -1;
}

ParseOutcome UsageError(const std::string& command, const std::string& error,
                        const std::string& usage, std::string* message) {
  *message = "vesk " + command + ": " + error + "\n" + usage;
  return ParseOutcome::kError;
}

std::string ParseMessageOption(const std::string& hex, std::vector<uint8_t>* message) {
  if (!ParseHexBytes(hex, message)) {
    return "--message " + hex + ": needs hexadecimal bytes, such as 0123456789ab";
  }
  if (message->empty() || message->size() > static_cast<size_t>(kMaxMessageBytes)) {
    return "--message " + hex + ": " + std::to_string(message->size()) + " bytes (1 to " +
           std::to_string(kMaxMessageBytes) + ")";
  }
  return std::string();
}

}  // namespace vesk_tool
