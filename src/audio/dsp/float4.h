// Four floats in one register where the target has one (SSE on x86, NEON on
// ARM); GCC and Clang lower the vector extension to scalar code elsewhere.
//
// For loops that the auto-vectoriser leaves scalar at -O2 (reductions, whose
// reordering needs -ffast-math, or loops whose lanes are not the innermost
// index): each lane computes exactly what the scalar code would, in the same
// order, so a four-lane loop over four independent outputs is bit-identical
// to four scalar loops. Loads and stores go through memcpy: no alignment is
// assumed.

#ifndef AUDIO_DSP_FLOAT4_H_
#define AUDIO_DSP_FLOAT4_H_

#include <cstring>

namespace audio_dsp {

typedef float Float4 __attribute__((vector_size(16)));

// p[0 .. 3].
inline Float4 Load4(const float* p) {
  Float4 v;
  std::memcpy(&v, p, sizeof(v));
  return v;
}

// p[0 .. 3] = v.
inline void Store4(float* p, Float4 v) { std::memcpy(p, &v, sizeof(v)); }

}  // namespace audio_dsp

#endif  // AUDIO_DSP_FLOAT4_H_
