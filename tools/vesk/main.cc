// vesk: the command-line face of the Vesk audio modem.

#include <sndfile.h>

#include <iostream>
#include <string>
#include <vector>

#include "base/logging.h"
#include "tools/vesk/commands.h"

namespace {

constexpr char kUsage[] =
    "usage: vesk <command> [options]\n"
    "       vesk --version\n"
    "commands:\n"
    "  encode   write a token's audio: a WAV file, or standard output with -\n"
    "  decode   decode an audio file, or standard input with -\n"
    "  demo     encode a token, play it through a simulated room, decode it\n"
    "Run 'vesk <command> --help' for the options of a command, their ranges and defaults;\n"
    "--verbose (any command) shows the library's diagnostics.\n"
    "Exit status: 0 success (decode: a token was found), 1 nothing found (decode: no token;\n"
    "demo: the token was not decoded), 2 an error.\n";

}  // namespace

int main(int argc, char** argv) {
  if (argc < 2) {
    std::cerr << kUsage;
    return vesk_tool::kExitError;
  }
  const std::string command = argv[1];
  std::vector<std::string> args(argv + 2, argv + argc);
  for (auto it = args.begin(); it != args.end();) {
    if (*it == "--verbose") {
      base::SetVlogLevel(1);
      it = args.erase(it);
    } else {
      ++it;
    }
  }
  if (command == "encode") return vesk_tool::RunEncode(args, std::cout, std::cerr);
  if (command == "decode") return vesk_tool::RunDecode(args, std::cout, std::cerr);
  if (command == "demo") return vesk_tool::RunDemo(args, std::cout, std::cerr);
  if (command == "-h" || command == "--help" || command == "help") {
    std::cout << kUsage;
    return vesk_tool::kExitSuccess;
  }
  if (command == "--version") {
    std::cout << "vesk " << VESK_VERSION << " (" << sf_version_string() << ")\n";
    return vesk_tool::kExitSuccess;
  }
  std::cerr << "vesk: unknown command '" << command << "'\n" << kUsage;
  return vesk_tool::kExitError;
}
