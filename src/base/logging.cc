#include "base/logging.h"

#include <android/log.h>

#include <atomic>
#include <cstdlib>

namespace base {
namespace {

constexpr char kLogTag[] = "Vesk";

int AndroidPriority(LogSeverity severity) {
  switch (severity) {
    case LogSeverity::kVerbose:
      return ANDROID_LOG_VERBOSE;
    case LogSeverity::kInfo:
      return ANDROID_LOG_INFO;
    case LogSeverity::kWarning:
      return ANDROID_LOG_WARN;
    case LogSeverity::kError:
      return ANDROID_LOG_ERROR;
    case LogSeverity::kFatal:
      return ANDROID_LOG_FATAL;
  }
  return ANDROID_LOG_INFO;
}

void WriteToAndroidLog(LogSeverity severity, const char* file, int line,
                       const std::string& message) {
  __android_log_write(AndroidPriority(severity), kLogTag,
                      FormatLogLine(file, line, message).c_str());
}

class AndroidLogSink : public LogSink {
 public:
  void Send(LogSeverity severity, const char* file, int line, const std::string& message) override {
    WriteToAndroidLog(severity, file, line, message);
  }
};

AndroidLogSink g_android_sink;
// The logging back end's own state: the current sink and verbose level.
std::atomic<LogSink*> g_sink{&g_android_sink};
std::atomic<int> g_vlog_level{0};

}  // namespace

LogSink* SetLogSink(LogSink* sink) {
  LogSink* previous = g_sink.exchange(sink != nullptr ? sink : &g_android_sink);
  return previous == &g_android_sink ? nullptr : previous;
}

void SetVlogLevel(int level) { g_vlog_level.store(level); }

int GetVlogLevel() { return g_vlog_level.load(std::memory_order_relaxed); }

std::string FormatLogLine(const char* file, int line, const std::string& message) {
  std::string text(file);
  text += ':';
  text += std::to_string(line);
  text += "] ";
  text += message;
  return text;
}

namespace internal {

LogMessage::LogMessage(const char* file, int line, LogSeverity severity)
    : file_(file), line_(line), severity_(severity) {}

LogMessage::~LogMessage() { Flush(); }

void LogMessage::Flush() {
  if (file_ == nullptr) return;  // Already flushed.
  std::string message = stream_.str();
  // CHECK leaves a separator after the condition for optional extra text.
  while (!message.empty() && message.back() == ' ') message.pop_back();
  LogSink* sink = g_sink.load();
  sink->Send(severity_, file_, line_, message);
  if (severity_ == LogSeverity::kFatal && sink != &g_android_sink) {
    WriteToAndroidLog(severity_, file_, line_, message);
  }
  file_ = nullptr;
}

LogMessageFatal::LogMessageFatal(const char* file, int line)
    : LogMessage(file, line, LogSeverity::kFatal) {}

LogMessageFatal::~LogMessageFatal() {
  Flush();
  std::abort();
}

void CheckFailed(const char* file, int line, const char* text) {
  LogMessageFatal(file, line).stream() << "Check failed: " << text;
}

}  // namespace internal
}  // namespace base
