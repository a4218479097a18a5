// Leveled logging and fatal checks.
//
//   LOG(INFO) << "text";      LOG(WARNING), LOG(ERROR), LOG(FATAL) likewise.
//   VLOG(1) << "detail";      emitted only when the verbose level is >= 1.
//   CHECK(condition);         on failure logs "Check failed: condition" at
//                             FATAL severity and aborts; more text may follow
//                             with <<.
//   CHECK_NOTNULL(ptr)        yields ptr; when null logs
//                             "Check failed: 'ptr' Must be non-null", aborts.
//   CHECK_ALLOCATED(call)     yields the result of an allocating call; when
//                             null logs "Check failed: call" and aborts.
//
// Every line names its source unit (the file's path below the source root)
// and line, and goes to the installed LogSink, by default the Android log
// (__android_log_write). FATAL lines also always reach the Android log, so the
// reason for an abort is never lost in a test sink.
//
// Thread-safety: logging may be used from any thread; SetLogSink and
// SetVlogLevel take effect for lines started after they return.

#ifndef BASE_LOGGING_H_
#define BASE_LOGGING_H_

#include <sstream>
#include <string>
#include <utility>

namespace base {

enum class LogSeverity : int {
  kVerbose = 0,
  kInfo = 1,
  kWarning = 2,
  kError = 3,
  kFatal = 4,
};

// Receives finished log lines.
class LogSink {
 public:
  virtual ~LogSink() = default;
  // `file` is the source unit's path below the source root; `message` is the
  // text that the caller streamed, without file and line.
  virtual void Send(LogSeverity severity, const char* file, int line,
                    const std::string& message) = 0;
};

// Installs `sink` for all later lines and returns the previous one. nullptr
// restores the default Android log sink. The sink is not owned.
LogSink* SetLogSink(LogSink* sink);

// Verbose lines VLOG(n) are emitted when n <= the level; the level is 0 at
// start-up, so VLOG(1) is silent unless asked for.
void SetVlogLevel(int level);
int GetVlogLevel();

// Formats a line as the default sink writes it: "file:line] message".
std::string FormatLogLine(const char* file, int line, const std::string& message);

namespace internal {

class LogMessage {
 public:
  LogMessage(const char* file, int line, LogSeverity severity);
  LogMessage(const LogMessage&) = delete;
  LogMessage& operator=(const LogMessage&) = delete;
  ~LogMessage();

  std::ostream& stream() { return stream_; }

 protected:
  void Flush();

 private:
  const char* file_;
  int line_;
  LogSeverity severity_;
  std::ostringstream stream_;
};

class LogMessageFatal : public LogMessage {
 public:
  LogMessageFatal(const char* file, int line);
  [[noreturn]] ~LogMessageFatal();
};

// Lets the conditional macros below have type void on both branches.
struct LogMessageVoidify {
  void operator&(std::ostream&) {}
};

[[noreturn]] void CheckFailed(const char* file, int line, const char* text);

template <typename T>
T CheckNotNull(const char* file, int line, const char* text, T&& value) {
  if (value == nullptr) CheckFailed(file, line, text);
  return std::forward<T>(value);
}

}  // namespace internal
}  // namespace base

#define VESK_LOG_STREAM_INFO \
  ::base::internal::LogMessage(__FILE__, __LINE__, ::base::LogSeverity::kInfo).stream()
#define VESK_LOG_STREAM_WARNING \
  ::base::internal::LogMessage(__FILE__, __LINE__, ::base::LogSeverity::kWarning).stream()
#define VESK_LOG_STREAM_ERROR \
  ::base::internal::LogMessage(__FILE__, __LINE__, ::base::LogSeverity::kError).stream()
#define VESK_LOG_STREAM_FATAL ::base::internal::LogMessageFatal(__FILE__, __LINE__).stream()

#define LOG(severity) VESK_LOG_STREAM_##severity

#define VLOG_IS_ON(level) ((level) <= ::base::GetVlogLevel())
#define VLOG(level)                                                                         \
  !VLOG_IS_ON(level)                                                                        \
      ? (void)0                                                                             \
      : ::base::internal::LogMessageVoidify() &                                             \
            ::base::internal::LogMessage(__FILE__, __LINE__, ::base::LogSeverity::kVerbose) \
                .stream()

#define CHECK(condition)                                                           \
  (condition) ? (void)0                                                            \
              : ::base::internal::LogMessageVoidify() &                            \
                    ::base::internal::LogMessageFatal(__FILE__, __LINE__).stream() \
                        << "Check failed: " #condition " "

#define CHECK_NOTNULL(value) \
  ::base::internal::CheckNotNull(__FILE__, __LINE__, "'" #value "' Must be non-null", (value))

#define CHECK_ALLOCATED(call) ::base::internal::CheckNotNull(__FILE__, __LINE__, #call, (call))

#endif  // BASE_LOGGING_H_
