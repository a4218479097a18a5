#include "audio/dsp/pcm_conversion.h"

#include <cstddef>
#include <cstring>

#include "audio/dsp/simd.h"

namespace audio_dsp {

int16_t FloatToPcm16(float sample) {
  const double product = sample * 32768.0;
  int32_t v;
  if (product >= -2147483648.0 && product < 2147483648.0) {
    v = static_cast<int32_t>(product);  // Truncation toward zero.
  } else {
    v = INT32_MIN;  // Out of range or NaN.
  }
  if (v >= 32768) v = 32767;
  if (v < -32768) v = -32768;
  return static_cast<int16_t>(v);
}

std::vector<uint8_t> FloatsToPcm16Bytes(const std::vector<float>& samples) {
  std::vector<uint8_t> bytes(samples.size() * 2);
  for (std::size_t i = 0; i < samples.size(); ++i) {
    const uint16_t v = static_cast<uint16_t>(FloatToPcm16(samples[i]));
    bytes[2 * i] = static_cast<uint8_t>(v & 0xFF);
    bytes[2 * i + 1] = static_cast<uint8_t>(v >> 8);
  }
  return bytes;
}

void Pcm16ToFloats(const int16_t* pcm, int count, std::vector<float>* samples) {
  samples->resize(count);
  float* out = samples->data();
  const unsigned char* bytes = reinterpret_cast<const unsigned char*>(pcm);
  // Eight at a time in vector registers (the compiler leaves the plain loop
  // scalar): each value goes to the upper half of a 32-bit lane, and the
  // arithmetic shift down extends its sign.
  static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "the lanes interleave little-endian");
  typedef int16_t Int16x8 __attribute__((vector_size(16)));
  typedef int32_t Int32x4 __attribute__((vector_size(16)));
  const Int16x8 zero = {};
  int i = 0;
  for (; i + 8 <= count; i += 8) {
    Int16x8 values;
    std::memcpy(&values, bytes + 2 * static_cast<size_t>(i), sizeof(values));
    const Int32x4 low = reinterpret_cast<Int32x4>(
                            __builtin_shufflevector(zero, values, 0, 8, 1, 9, 2, 10, 3, 11)) >>
                        16;
    const Int32x4 high = reinterpret_cast<Int32x4>(
                             __builtin_shufflevector(zero, values, 4, 12, 5, 13, 6, 14, 7, 15)) >>
                         16;
    Store4(out + i, __builtin_convertvector(low, Float4));
    Store4(out + i + 4, __builtin_convertvector(high, Float4));
  }
  for (; i < count; ++i) {
    int16_t value;
    std::memcpy(&value, bytes + 2 * static_cast<size_t>(i), sizeof(value));
    out[i] = value;
  }
}

}  // namespace audio_dsp
