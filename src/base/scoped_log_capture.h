// Test support: captures the log lines written while an instance lives.
//
//   base::ScopedLogCapture capture;
//   DoSomething();
//   EXPECT_TRUE(capture.Contains(base::LogSeverity::kError, "bad input"));
//
// Lines are captured instead of reaching the Android log (FATAL lines reach
// both). Captures nest: the previous sink is restored on destruction.

#ifndef BASE_SCOPED_LOG_CAPTURE_H_
#define BASE_SCOPED_LOG_CAPTURE_H_

#include <mutex>
#include <string>
#include <vector>

#include "base/logging.h"

namespace base {

class ScopedLogCapture : public LogSink {
 public:
  struct Line {
    LogSeverity severity;
    std::string file;
    int line;
    std::string message;
  };

  ScopedLogCapture() : previous_(SetLogSink(this)) {}
  ~ScopedLogCapture() override { SetLogSink(previous_); }
  ScopedLogCapture(const ScopedLogCapture&) = delete;
  ScopedLogCapture& operator=(const ScopedLogCapture&) = delete;

  void Send(LogSeverity severity, const char* file, int line, const std::string& message) override {
    std::lock_guard<std::mutex> lock(mutex_);
    lines_.push_back({severity, file, line, message});
  }

  std::vector<Line> lines() const {
    std::lock_guard<std::mutex> lock(mutex_);
    return lines_;
  }

  // Messages of the given severity, in order.
  std::vector<std::string> Messages(LogSeverity severity) const {
    std::vector<std::string> result;
    for (const Line& line : lines()) {
      if (line.severity == severity) result.push_back(line.message);
    }
    return result;
  }

  // Whether a line of `severity` contains `text`.
  bool Contains(LogSeverity severity, const std::string& text) const {
    for (const Line& line : lines()) {
      if (line.severity == severity && line.message.find(text) != std::string::npos) return true;
    }
    return false;
  }

  void Clear() {
    std::lock_guard<std::mutex> lock(mutex_);
    lines_.clear();
  }

 private:
  LogSink* previous_;
  mutable std::mutex mutex_;
  std::vector<Line> lines_;
};

}  // namespace base

#endif  // BASE_SCOPED_LOG_CAPTURE_H_
