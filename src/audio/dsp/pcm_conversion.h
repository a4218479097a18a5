// Conversion between 16-bit PCM and float audio: float audio in -1 ... 1 to
// 16-bit PCM, as the library hands audio to its hosts, and 16-bit PCM to
// unscaled floats, as the decoders take it.

#ifndef AUDIO_DSP_PCM_CONVERSION_H_
#define AUDIO_DSP_PCM_CONVERSION_H_

#include <cstdint>
#include <vector>

namespace audio_dsp {

// v = sample x 32768 truncated toward zero, clamped to [-32768, 32767]. A
// product outside the 32-bit range, and NaN, give -32768 (what the x86
// conversion instruction yields; made explicit so that every ABI agrees).
int16_t FloatToPcm16(float sample);

// Each sample as FloatToPcm16, two bytes per sample, low byte first.
std::vector<uint8_t> FloatsToPcm16Bytes(const std::vector<float>& samples);

// Replaces *samples with the `count` 16-bit values at `pcm` (host byte
// order; read byte-wise, so no alignment is assumed) as floats, unscaled:
// -32768 ... 32767. Reuses the vector's capacity.
void Pcm16ToFloats(const int16_t* pcm, int count, std::vector<float>* samples);

}  // namespace audio_dsp

#endif  // AUDIO_DSP_PCM_CONVERSION_H_
