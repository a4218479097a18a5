#include "audio/dsp/pcm_conversion.h"

#include <cstddef>
#include <cstring>

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
  for (int i = 0; i < count; ++i) {
    int16_t value;
    std::memcpy(&value, bytes + 2 * static_cast<size_t>(i), sizeof(value));
    out[i] = value;
  }
}

}  // namespace audio_dsp
