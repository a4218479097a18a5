// vesk: the command-line face of the Vesk audio modem.

#include <iostream>
#include <string>
#include <vector>

#include "base/logging.h"
#include "tools/vesk/commands.h"

namespace {

constexpr char kUsage[] =
    "usage: vesk <command> [options]\n"
    "commands:\n"
    "  encode   write a token's audio to a WAV file\n"
    "  decode   decode a WAV file or raw PCM from standard input\n"
    "  demo     encode a token, play it through a simulated room, decode it\n"
    "Run 'vesk <command> --help' for the options of a command.\n";

}  // namespace

int main(int argc, char** argv) {
  if (argc < 2) {
    std::cerr << kUsage;
    return 2;
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
  if (command == "--help" || command == "help") {
    std::cout << kUsage;
    return 0;
  }
  std::cerr << "vesk: unknown command '" << command << "'\n" << kUsage;
  return 2;
}
