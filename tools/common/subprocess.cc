#include "tools/common/subprocess.h"

#include <fcntl.h>
#include <poll.h>
#include <pty.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>

namespace vesk_tool {
namespace {

// Reads what `fd` has into *text; false at its end.
bool Drain(int fd, std::string* text) {
  char buffer[65536];
  const ssize_t n = read(fd, buffer, sizeof(buffer));
  if (n < 0 && errno == EINTR) return true;
  if (n <= 0) return false;  // End, or EIO once a terminal's other side is closed.
  text->append(buffer, static_cast<size_t>(n));
  return true;
}

}  // namespace

ProcessResult RunProcess(const std::string& program, const std::vector<std::string>& args,
                         const ProcessOptions& options) {
  signal(SIGPIPE, SIG_IGN);
  int in[2], out[2], err[2];
  if (pipe(in) != 0 || pipe(out) != 0) return ProcessResult();
  if (options.stderr_on_terminal ? openpty(&err[0], &err[1], nullptr, nullptr, nullptr) != 0
                                 : pipe(err) != 0) {
    return ProcessResult();
  }
  std::vector<char*> argv;
  argv.push_back(const_cast<char*>(program.c_str()));
  for (const std::string& arg : args) argv.push_back(const_cast<char*>(arg.c_str()));
  argv.push_back(nullptr);
  const pid_t pid = fork();
  if (pid == 0) {
    signal(SIGPIPE, SIG_DFL);
    dup2(in[0], STDIN_FILENO);
    dup2(out[1], STDOUT_FILENO);
    dup2(err[1], STDERR_FILENO);
    for (int fd : {in[0], in[1], out[0], out[1], err[0], err[1]}) close(fd);
    execv(program.c_str(), argv.data());
    _exit(127);
  }
  close(in[0]);
  close(out[1]);
  close(err[1]);
  ProcessResult result;
  size_t written = 0;
  int to_child = in[1];
  if (options.input.empty()) {
    close(to_child);
    to_child = -1;
  } else {
    fcntl(to_child, F_SETFL, O_NONBLOCK);
  }
  bool out_open = true, err_open = true;
  while (out_open || err_open) {
    pollfd fds[3] = {{out[0], POLLIN, 0}, {err[0], POLLIN, 0}, {to_child, POLLOUT, 0}};
    if (!out_open) fds[0].fd = -1;
    if (!err_open) fds[1].fd = -1;
    if (poll(fds, 3, -1) < 0) {
      if (errno == EINTR) continue;
      break;
    }
    if (fds[0].revents) out_open = Drain(out[0], &result.out);
    if (fds[1].revents) err_open = Drain(err[0], &result.err);
    if (to_child >= 0 && fds[2].revents) {
      const ssize_t n =
          write(to_child, options.input.data() + written, options.input.size() - written);
      if (n > 0) written += static_cast<size_t>(n);
      if ((n < 0 && errno != EAGAIN && errno != EINTR) || written == options.input.size()) {
        close(to_child);
        to_child = -1;
      }
    }
  }
  if (to_child >= 0) close(to_child);
  close(out[0]);
  close(err[0]);
  int status = 0;
  while (waitpid(pid, &status, 0) < 0 && errno == EINTR) {
  }
  result.exit_status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  return result;
}

ProcessResult RunShell(const std::string& command, const ProcessOptions& options) {
  return RunProcess("/bin/sh", {"-c", command}, options);
}

}  // namespace vesk_tool
