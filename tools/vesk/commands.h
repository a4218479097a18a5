// The commands of the vesk tool. Each takes the arguments after its name,
// writes results to `out` and messages to `err`, and returns the exit
// status: 0 success, 1 nothing found (decode: no token; demo: the token was
// not decoded), 2 any error (usage, input, output).
//
// Each command is three steps, exposed for tests and fuzzers: Parse*Args
// (argument vector -> a validated request, no process state), the work, and
// the report.

#ifndef TOOLS_VESK_COMMANDS_H_
#define TOOLS_VESK_COMMANDS_H_

#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

namespace vesk_tool {

constexpr int kExitSuccess = 0;
constexpr int kExitNothingFound = 1;
constexpr int kExitError = 2;

// Longest message the commands take, bytes (check bytes not counted).
constexpr int kMaxMessageBytes = 32;

// What a Parse*Args step decided.
enum class ParseOutcome {
  kRun,    // The request is complete and valid.
  kHelp,   // -h or --help: the message holds the help text.
  kError,  // The message holds the error, one line, then the usage.
};

// Prints what a Parse*Args step left in `message`: the help on `out` (status
// 0) or the error on `err` (status 2). Returns that status, or -1 for kRun.
int ReportParseOutcome(ParseOutcome outcome, const std::string& message, std::ostream& out,
                       std::ostream& err);

// Sets *message to "vesk COMMAND: ERROR" and the usage; returns kError.
ParseOutcome UsageError(const std::string& command, const std::string& error,
                        const std::string& usage, std::string* message);

// Parses the value of --message: hexadecimal, 1 to kMaxMessageBytes bytes.
// Empty, or what is wrong.
std::string ParseMessageOption(const std::string& hex, std::vector<uint8_t>* message);

int RunDecode(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);
int RunEncode(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);
int RunDemo(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_COMMANDS_H_
