// The part of Android's log interface that base/logging uses, for builds
// that have no liblog: the WebAssembly build. Same names and values as the
// NDK's <android/log.h>, so that base/logging.cc compiles unchanged.

#ifndef BASE_WASM_ANDROID_LOG_H_
#define BASE_WASM_ANDROID_LOG_H_

#ifdef __cplusplus
extern "C" {
#endif

typedef enum android_LogPriority {
  ANDROID_LOG_UNKNOWN = 0,
  ANDROID_LOG_DEFAULT,
  ANDROID_LOG_VERBOSE,
  ANDROID_LOG_DEBUG,
  ANDROID_LOG_INFO,
  ANDROID_LOG_WARN,
  ANDROID_LOG_ERROR,
  ANDROID_LOG_FATAL,
  ANDROID_LOG_SILENT,
} android_LogPriority;

// Writes "P/tag: text" (P the priority's letter, as logcat shows it) as one
// line to the module's error output: Emscripten's err() hook, which is the
// console unless the module was given a printErr function. Returns 1.
int __android_log_write(int prio, const char* tag, const char* text);

#ifdef __cplusplus
}  // extern "C"
#endif

#endif  // BASE_WASM_ANDROID_LOG_H_
