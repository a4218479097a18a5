// Short vectors in one register where the target has one (SSE on x86, NEON
// on ARM); GCC and Clang lower the vector extension to scalar code elsewhere.
//
// For loops that the auto-vectoriser leaves scalar at -O2 (reductions, whose
// reordering needs -ffast-math, loops whose lanes are not the innermost
// index, or trip counts known only at run time): each lane computes exactly
// what the scalar code would, in the same order, so a four-lane loop over
// four independent outputs is bit-identical to four scalar loops. Loads and
// stores go through memcpy: no alignment is assumed.

#ifndef AUDIO_DSP_SIMD_H_
#define AUDIO_DSP_SIMD_H_

#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif
#if defined(__i386__)
#include <immintrin.h>
#endif

namespace audio_dsp {

typedef float Float4 __attribute__((vector_size(16)));
typedef double Double2 __attribute__((vector_size(16)));

// p[0 .. 3].
inline Float4 Load4(const float* p) {
  Float4 v;
  std::memcpy(&v, p, sizeof(v));
  return v;
}

// p[0 .. 3] = v.
inline void Store4(float* p, Float4 v) { std::memcpy(p, &v, sizeof(v)); }

// Lanes 0, 1 and lanes 2, 3 of v, widened to double (exactly). (No eight-byte
// vector types here: the 32-bit build handles those badly. With SSE2 the
// conversion instructions directly: GCC builds these from single lanes.)
#if defined(__SSE2__)
inline Double2 LowToDouble(Float4 v) { return reinterpret_cast<Double2>(_mm_cvtps_pd(v)); }
inline Double2 HighToDouble(Float4 v) {
  return reinterpret_cast<Double2>(_mm_cvtps_pd(_mm_movehl_ps(v, v)));
}

// (low[0], low[1], high[0], high[1]), each rounded to float.
inline Float4 ToFloat4(Double2 low, Double2 high) {
  return _mm_movelh_ps(_mm_cvtpd_ps(reinterpret_cast<__m128d>(low)),
                       _mm_cvtpd_ps(reinterpret_cast<__m128d>(high)));
}
#else
inline Double2 LowToDouble(Float4 v) { return Double2{v[0], v[1]}; }
inline Double2 HighToDouble(Float4 v) { return Double2{v[2], v[3]}; }

// (low[0], low[1], high[0], high[1]), each rounded to float.
inline Float4 ToFloat4(Double2 low, Double2 high) {
  return Float4{static_cast<float>(low[0]), static_cast<float>(low[1]), static_cast<float>(high[0]),
                static_cast<float>(high[1])};
}
#endif

// Lane-wise std::max(a, b) and std::min(a, b): the same comparisons, so the
// same results, NaN included.
inline Float4 Max4(Float4 a, Float4 b) { return a < b ? b : a; }
inline Float4 Min4(Float4 a, Float4 b) { return b < a ? b : a; }

// Transposes the 4 x 4 matrix whose rows are r[0 .. 3]: afterwards lane j of
// r[i] holds what lane i of r[j] held.
inline void Transpose4(Float4* r) {
  const Float4 t0 = __builtin_shufflevector(r[0], r[1], 0, 4, 1, 5);
  const Float4 t1 = __builtin_shufflevector(r[0], r[1], 2, 6, 3, 7);
  const Float4 t2 = __builtin_shufflevector(r[2], r[3], 0, 4, 1, 5);
  const Float4 t3 = __builtin_shufflevector(r[2], r[3], 2, 6, 3, 7);
  r[0] = __builtin_shufflevector(t0, t2, 0, 1, 4, 5);
  r[1] = __builtin_shufflevector(t0, t2, 2, 3, 6, 7);
  r[2] = __builtin_shufflevector(t1, t3, 0, 1, 4, 5);
  r[3] = __builtin_shufflevector(t1, t3, 2, 3, 6, 7);
}

// To be called after code built for AVX or AVX-512 returns to SSE code. On
// 32-bit x86 it returns the vector registers' upper parts to their initial
// state: VZEROUPPER, which AVX functions end with, reaches only registers 0
// to 7 in 32-bit code, and some processors (AMD Zen 4 here) then keep the
// upper state marked as in use, so that every SSE instruction that writes a
// register merges with the upper bits; the SSE code after a wide kernel ran
// 2 to 3 times slower. XRSTOR with those components flagged absent from a
// zeroed save area sets them to their initial state; it also reloads MXCSR
// from the area, so the current value goes there. About 400 cycles. Only
// for after AVX code has run (which implies that the system saves AVX state
// and so has XSAVE enabled). Elsewhere VZEROUPPER suffices: nothing to do.
#if defined(__i386__)
__attribute__((target("xsave"))) inline void ClearUpperVectorState() {
  constexpr unsigned kAvxComponents = (1u << 2) | (1u << 5) | (1u << 6) | (1u << 7);
  constexpr int kMxcsrOffset = 24;           // in the legacy region
  alignas(64) unsigned char area[576] = {};  // legacy region, then a zero header
  const unsigned mxcsr = _mm_getcsr();
  std::memcpy(area + kMxcsrOffset, &mxcsr, sizeof(mxcsr));
  _xrstor(area, kAvxComponents);
}
#else
inline void ClearUpperVectorState() {}
#endif

}  // namespace audio_dsp

#endif  // AUDIO_DSP_SIMD_H_
