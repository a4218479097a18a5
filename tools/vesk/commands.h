// The subcommands of the vesk tool. Each takes the arguments after its name,
// writes results to `out` and errors to `err`, and returns the exit status:
// 0 on success, 1 when the work failed, 2 for a usage error.

#ifndef TOOLS_VESK_COMMANDS_H_
#define TOOLS_VESK_COMMANDS_H_

#include <ostream>
#include <string>
#include <vector>

namespace vesk_tool {

int RunDecode(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);
int RunEncode(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);
int RunDemo(const std::vector<std::string>& args, std::ostream& out, std::ostream& err);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_COMMANDS_H_
