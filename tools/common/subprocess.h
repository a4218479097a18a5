// Runs a program as a shell would, for the tests of the tools' binaries:
// given arguments and standard input, collects standard output, standard
// error and the exit status. Standard error may be a pseudo-terminal, to
// test what a program shows only on a terminal.
//
// Ignores SIGPIPE in the calling process (a program may exit without reading
// all its input); the program itself starts with the default disposition.

#ifndef TOOLS_COMMON_SUBPROCESS_H_
#define TOOLS_COMMON_SUBPROCESS_H_

#include <string>
#include <vector>

namespace vesk_tool {

struct ProcessOptions {
  std::string input;                // Written to standard input, which is then closed.
  bool stderr_on_terminal = false;  // Standard error is a pseudo-terminal.
};

struct ProcessResult {
  int exit_status = -1;  // 0 to 255, or -1 when the program did not exit (a signal).
  std::string out;       // Standard output.
  std::string err;       // Standard error (a terminal's, with "\r\n" line ends).
};

// Runs `program` (a path) with `args`.
ProcessResult RunProcess(const std::string& program, const std::vector<std::string>& args,
                         const ProcessOptions& options = ProcessOptions());

// Runs `command` with /bin/sh -c: pipes between programs, as users write them.
ProcessResult RunShell(const std::string& command,
                       const ProcessOptions& options = ProcessOptions());

}  // namespace vesk_tool

#endif  // TOOLS_COMMON_SUBPROCESS_H_
