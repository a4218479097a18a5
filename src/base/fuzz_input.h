// Fuzzing support: FuzzInput reads typed values from the front of a fuzzer's
// input, and FuzzSeed writes them in the same layout, so that seed inputs can
// be made from real data (an encoded token, a product configuration) and
// every reader has its writer beside it.
//
// An exhausted input reads as zeros (and empty byte runs), so every input is
// a complete program for a fuzz target.

#ifndef BASE_FUZZ_INPUT_H_
#define BASE_FUZZ_INPUT_H_

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "base/logging.h"

namespace base {

// Drops every log line from now on (FATAL lines still reach the Android
// log, so a fatal check stays visible): fuzz targets log thousands of
// refusals a second.
inline void SilenceLogsForFuzzing() {
  struct NullSink : LogSink {
    void Send(LogSeverity, const char*, int, const std::string&) override {}
  };
  static NullSink sink;
  SetLogSink(&sink);
}

class FuzzInput {
 public:
  FuzzInput(const uint8_t* data, size_t size) : data_(data), size_(size) {}

  size_t remaining() const { return size_ - position_; }

  uint8_t Byte() { return position_ < size_ ? data_[position_++] : 0; }
  // Low byte first; two statements, since the operands of one expression
  // may be evaluated in either order.
  uint16_t U16() {
    const uint16_t low = Byte();
    return static_cast<uint16_t>(low | Byte() << 8);
  }
  uint32_t U32() {
    const uint32_t low = U16();
    return low | static_cast<uint32_t>(U16()) << 16;
  }
  bool Bool() { return (Byte() & 1) != 0; }
  // Any 32-bit pattern: NaN, infinities and denormals included.
  float Float() {
    const uint32_t bits = U32();
    float value;
    std::memcpy(&value, &bits, sizeof(value));
    return value;
  }
  // lo + (a 32-bit value modulo the range's size); lo <= hi.
  int64_t InRange(int64_t lo, int64_t hi) {
    const uint64_t span = static_cast<uint64_t>(hi - lo) + 1;
    return lo + static_cast<int64_t>(U32() % span);
  }
  // Up to `count` samples, little-endian; fewer when the input ends.
  void Samples(size_t count, std::vector<int16_t>* samples) {
    count = std::min(count, remaining() / 2);
    samples->resize(count);
    for (size_t i = 0; i < count; ++i) (*samples)[i] = static_cast<int16_t>(U16());
  }

 private:
  const uint8_t* data_;
  size_t size_;
  size_t position_ = 0;
};

class FuzzSeed {
 public:
  void Byte(uint8_t value) { bytes_.push_back(value); }
  void U16(uint16_t value) {
    Byte(static_cast<uint8_t>(value));
    Byte(static_cast<uint8_t>(value >> 8));
  }
  void U32(uint32_t value) {
    U16(static_cast<uint16_t>(value));
    U16(static_cast<uint16_t>(value >> 16));
  }
  void Bool(bool value) { Byte(value ? 1 : 0); }
  void Float(float value) {
    uint32_t bits;
    std::memcpy(&bits, &value, sizeof(bits));
    U32(bits);
  }
  // Writes what InRange(lo, hi) reads back as `value`.
  void InRange(int64_t lo, int64_t value) { U32(static_cast<uint32_t>(value - lo)); }
  void Samples(const int16_t* samples, size_t count) {
    for (size_t i = 0; i < count; ++i) U16(static_cast<uint16_t>(samples[i]));
  }

  const std::vector<uint8_t>& bytes() const { return bytes_; }

 private:
  std::vector<uint8_t> bytes_;
};

}  // namespace base

#endif  // BASE_FUZZ_INPUT_H_
