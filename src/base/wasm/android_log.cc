#include <emscripten/console.h>

#include <string>

#include "android/log.h"

namespace {

char PriorityLetter(int prio) {
  switch (prio) {
    case ANDROID_LOG_VERBOSE:
      return 'V';
    case ANDROID_LOG_DEBUG:
      return 'D';
    case ANDROID_LOG_INFO:
      return 'I';
    case ANDROID_LOG_WARN:
      return 'W';
    case ANDROID_LOG_ERROR:
      return 'E';
    case ANDROID_LOG_FATAL:
      return 'F';
  }
  return '?';
}

}  // namespace

extern "C" int __android_log_write(int prio, const char* tag, const char* text) {
  std::string line(1, PriorityLetter(prio));
  line += '/';
  line += tag != nullptr ? tag : "";
  line += ": ";
  line += text != nullptr ? text : "";
  // Straight to the err() hook: no stdio, so the module needs no file system.
  _emscripten_err(line.c_str());
  return 1;
}
