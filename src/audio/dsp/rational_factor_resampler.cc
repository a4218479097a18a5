#include "audio/dsp/rational_factor_resampler.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <cstring>
#include <type_traits>
#include <vector>

#include "audio/dsp/number_util.h"
#include "audio/dsp/simd.h"
#include "base/logging.h"

namespace audio_dsp {
namespace {

// Rate ratios beyond this are rejected before the fraction is formed; the
// approximation works in 32-bit ints and the tables would be absurd anyway.
constexpr double kMaxRatio = 65536.0;

// Sum of a[m] * b[m] over m < n in single precision, as eight partial sums
// held in two four-lane accumulators, returned lane by lane (lanes 4 to 7 are
// folded into 0 to 3). The independent accumulators break the dependency
// chain of a single sum so that the additions pipeline. Ends with a single
// four-wide step when at least four products remain; the last n mod 4
// products are left to the caller, which knows how they pair with lanes.
inline Float4 PartialSums(const float* a, const float* b, int n) {
  Float4 acc0 = {0.0f, 0.0f, 0.0f, 0.0f};
  Float4 acc1 = acc0;
  int m = 0;
  for (; m + 8 <= n; m += 8) {
    acc0 += Load4(a + m) * Load4(b + m);
    acc1 += Load4(a + m + 4) * Load4(b + m + 4);
  }
  if (m + 4 <= n) acc1 += Load4(a + m) * Load4(b + m);
  return acc0 + acc1;
}

// The last n mod 4 products of taps[m] * x[m] (up to three, independent of
// each other), summed as the one-output code sums them; 0 when n is a
// multiple of 4. T is float, or Float4 for four outputs side by side.
template <typename T>
inline T TailProducts(const T* taps, const T* x, int n) {
  const int tail = n & ~3;
  switch (n - tail) {
    case 3:
      return taps[tail] * x[tail] + (taps[tail + 1] * x[tail + 1] + taps[tail + 2] * x[tail + 2]);
    case 2:
      return taps[tail] * x[tail] + taps[tail + 1] * x[tail + 1];
    case 1:
      return taps[tail] * x[tail];
    default:
      return T{};
  }
}

// Real samples: one float per tap.
inline float Dot(const float* taps, const float* x, int num_taps) {
  const Float4 acc = PartialSums(taps, x, num_taps);
  return ((acc[0] + acc[2]) + (acc[1] + acc[3])) + TailProducts(taps, x, num_taps);
}

// Complex samples: the taps are stored duplicated (t0, t0, t1, t1, ...) so
// that the interleaved (real, imaginary) floats of x multiply element by
// element; even lanes collect the real part, odd lanes the imaginary part.
inline std::complex<float> Dot(const float* doubled_taps, const std::complex<float>* x,
                               int num_taps) {
  const float* xf = reinterpret_cast<const float*>(x);
  const int n = 2 * num_taps;
  const Float4 acc = PartialSums(doubled_taps, xf, n);
  float re = acc[0] + acc[2];
  float im = acc[1] + acc[3];
  if (n & 2) {
    re += doubled_taps[n - 2] * xf[n - 2];
    im += doubled_taps[n - 1] * xf[n - 1];
  }
  return {re, im};
}

// PartialSums of `kCount` products at once, sums[j] = PartialSums(a[j], b[j],
// n): the same steps, lane for lane, with the loop shared.
template <int kCount>
inline void PartialSumsOfGroup(const float* const* a, const float* const* b, int n, Float4* sums) {
  Float4 acc0[kCount], acc1[kCount];
#pragma GCC unroll 4
  for (int j = 0; j < kCount; ++j) acc0[j] = acc1[j] = Float4{0.0f, 0.0f, 0.0f, 0.0f};
  int m = 0;
  for (; m + 8 <= n; m += 8) {
#pragma GCC unroll 4
    for (int j = 0; j < kCount; ++j) {
      acc0[j] += Load4(a[j] + m) * Load4(b[j] + m);
      acc1[j] += Load4(a[j] + m + 4) * Load4(b[j] + m + 4);
    }
  }
  if (m + 4 <= n) {
#pragma GCC unroll 4
    for (int j = 0; j < kCount; ++j) acc1[j] += Load4(a[j] + m) * Load4(b[j] + m);
  }
#pragma GCC unroll 4
  for (int j = 0; j < kCount; ++j) sums[j] = acc0[j] + acc1[j];
}

#if defined(__x86_64__) || defined(__i386__)
#define VESK_WIDE_RESAMPLER 1
#endif

typedef float Float8 __attribute__((vector_size(32)));

// PartialSumsOfGroup with eight-lane products: lanes 0 to 3 of an
// accumulator are acc0 and lanes 4 to 7 are acc1, so every lane adds the
// same products in the same order. Compiled for AVX only where it is inlined
// into a function built for it (elsewhere GCC splits the vectors in two).
template <int kCount>
inline __attribute__((always_inline)) void PartialSumsOfGroupEight(const float* const* a,
                                                                   const float* const* b, int n,
                                                                   Float4* sums) {
  Float8 acc[kCount];
#pragma GCC unroll 4
  for (int j = 0; j < kCount; ++j) acc[j] = Float8{};
  int m = 0;
  for (; m + 8 <= n; m += 8) {
#pragma GCC unroll 4
    for (int j = 0; j < kCount; ++j) {
      Float8 x, y;
      std::memcpy(&x, a[j] + m, sizeof(x));
      std::memcpy(&y, b[j] + m, sizeof(y));
      acc[j] += x * y;
    }
  }
#pragma GCC unroll 4
  for (int j = 0; j < kCount; ++j) {
    const Float4 acc0 = __builtin_shufflevector(acc[j], acc[j], 0, 1, 2, 3);
    Float4 acc1 = __builtin_shufflevector(acc[j], acc[j], 4, 5, 6, 7);
    if (m + 4 <= n) acc1 += Load4(a[j] + m) * Load4(b[j] + m);
    sums[j] = acc0 + acc1;
  }
}

// Four real outputs at once, out[j] = Dot(taps[j], x[j], num_taps) exactly:
// the partial sums of the four are transposed so that one vector step does
// their four horizontal sums, each in Dot's order. kWide sums the products
// in eight lanes, with the same result.
template <bool kWide>
inline __attribute__((always_inline)) void DotGroup(const float* const* taps, const float* const* x,
                                                    int num_taps, float* out) {
  Float4 lanes[4];
  if constexpr (kWide) {
    PartialSumsOfGroupEight<4>(taps, x, num_taps, lanes);
  } else {
    PartialSumsOfGroup<4>(taps, x, num_taps, lanes);
  }
  Transpose4(lanes);  // lanes[l]: lane l of each output's partial sums.
  const int tail = num_taps & ~3;
  Float4 rest = {0.0f, 0.0f, 0.0f, 0.0f};
  switch (num_taps - tail) {
    case 3:
#pragma GCC unroll 4
      for (int j = 0; j < 4; ++j) {
        const float* t = taps[j] + tail;
        const float* y = x[j] + tail;
        rest[j] = t[0] * y[0] + (t[1] * y[1] + t[2] * y[2]);
      }
      break;
    case 2:
#pragma GCC unroll 4
      for (int j = 0; j < 4; ++j) {
        rest[j] = taps[j][tail] * x[j][tail] + taps[j][tail + 1] * x[j][tail + 1];
      }
      break;
    case 1:
#pragma GCC unroll 4
      for (int j = 0; j < 4; ++j) rest[j] = taps[j][tail] * x[j][tail];
      break;
  }
  Store4(out, ((lanes[0] + lanes[2]) + (lanes[1] + lanes[3])) + rest);
}

// Two complex outputs at once, exactly as Dot computes each; kWide sums the
// products in eight lanes, with the same result.
template <bool kWide>
inline __attribute__((always_inline)) void DotGroup(const float* const* doubled_taps,
                                                    const std::complex<float>* const* x,
                                                    int num_taps, std::complex<float>* out) {
  const int n = 2 * num_taps;
  const float* xf[2] = {reinterpret_cast<const float*>(x[0]), reinterpret_cast<const float*>(x[1])};
  Float4 sums[2];
  if constexpr (kWide) {
    PartialSumsOfGroupEight<2>(doubled_taps, xf, n, sums);
  } else {
    PartialSumsOfGroup<2>(doubled_taps, xf, n, sums);
  }
  // (re, im) of both: lanes 0 + 2 and 1 + 3 of each.
  Float4 both = __builtin_shufflevector(sums[0], sums[1], 0, 1, 4, 5) +
                __builtin_shufflevector(sums[0], sums[1], 2, 3, 6, 7);
  if (n & 2) {
    const float* t0 = doubled_taps[0];
    const float* t1 = doubled_taps[1];
    both += Float4{t0[n - 2] * xf[0][n - 2], t0[n - 1] * xf[0][n - 1], t1[n - 2] * xf[1][n - 2],
                   t1[n - 1] * xf[1][n - 1]};
  }
  Store4(reinterpret_cast<float*>(out), both);
}

// Four outputs side by side, lane j = Dot(taps, x_j, n) bit for bit: lane j
// of taps[m] and x[m] holds the m-th tap and sample of output j, and the
// products are summed in Dot's order. Dot's partial sums start from +0;
// these start from their first product instead, which changes nothing but
// the sign of a zero, and Dot never returns -0 (a zero sum that starts from
// +0 is +0 in round-to-nearest), so a final + 0 restores it.
inline __attribute__((always_inline)) Float4 DotLanes(const Float4* taps, const Float4* x, int n) {
  const Float4 zero = {0.0f, 0.0f, 0.0f, 0.0f};
  Float4 even[4], odd[4];  // Dot's acc0 and acc1, lane l of each in [l]
  int m = 0;
  if (n >= 8) {
#pragma GCC unroll 4
    for (int l = 0; l < 4; ++l) {
      even[l] = taps[l] * x[l];
      odd[l] = taps[4 + l] * x[4 + l];
    }
    for (m = 8; m + 8 <= n; m += 8) {
#pragma GCC unroll 4
      for (int l = 0; l < 4; ++l) {
        even[l] += taps[m + l] * x[m + l];
        odd[l] += taps[m + 4 + l] * x[m + 4 + l];
      }
    }
  }
  Float4 sums[4];
#pragma GCC unroll 4
  for (int l = 0; l < 4; ++l) {
    if (m + 4 <= n) {
      const Float4 last = taps[m + l] * x[m + l];
      sums[l] = m > 0 ? even[l] + (odd[l] + last) : last;
    } else {
      sums[l] = m > 0 ? even[l] + odd[l] : zero;
    }
  }
  const Float4 sum = ((sums[0] + sums[2]) + (sums[1] + sums[3])) + TailProducts(taps, x, n);
  return n % 4 == 0 ? sum : sum + zero;
}

// What a four-lane group needs to know of the resampler.
struct LaneGeometry {
  int num_taps = 0;
  int step = 0;
  int phase_increment = 0;
  int denominator = 0;
  int run = 0;  // outputs per lane
};

// Outputs i, i + run, i + 2 run and i + 3 run for i in [0, run), the first
// window at lanes[0] with phase `phase`. kTaps is num_taps when known at
// compile time, else 0.
template <int kTaps>
void LaneOutputs(const LaneGeometry& g, const Float4* taps, const Float4* lanes, int phase,
                 float* out) {
  const int num_taps = kTaps > 0 ? kTaps : g.num_taps;
  const int run = g.run;
  int s = 0;
  for (int i = 0; i < run; ++i) {
    const Float4 v = DotLanes(taps + phase * num_taps, lanes + s, num_taps);
    out[i] = v[0];
    out[i + run] = v[1];
    out[i + 2 * run] = v[2];
    out[i + 3 * run] = v[3];
    s += g.step;
    phase += g.phase_increment;
    if (phase >= g.denominator) {
      phase -= g.denominator;
      ++s;
    }
  }
}

// Bounds of the four-lane path. A lane runs at least 32 outputs so that
// interleaving the input (once per group) stays a small part of the work; the
// caps keep the tables a few tens of kilobytes and a group within one
// microphone block of a few thousand samples.
constexpr int64_t kMinLaneRun = 32;          // outputs
constexpr int64_t kMaxLaneRun = 1024;        // outputs
constexpr int64_t kMaxLaneInput = 4096;      // interleaved input elements
constexpr int64_t kMaxLaneTaps = 16 * 1024;  // four-lane tap vectors

// Floats stored per tap: complex samples use duplicated taps. Outputs
// computed side by side: as many as fill a vector.
template <typename T>
constexpr int kFloatsPerTap = 1;
template <>
constexpr int kFloatsPerTap<std::complex<float>> = 2;
template <typename T>
constexpr int kGroupSize = 4 / kFloatsPerTap<T>;

// Where the outputs have got to: the next output, its window's start in
// the stream of buffered and new samples, and its phase.
struct Walk {
  int64_t k;
  int64_t s;
  int phase;
};

// The outputs from walk->k on, up to the last whole group before `count`,
// computed by groups of neighbours (as many as fill a vector) from the new
// samples `input` (window starts count from the num_buffered samples held
// before them, which no window here reaches). Advances *walk past them.
template <bool kWide, typename T>
inline __attribute__((always_inline)) void NeighbourGroups(const LaneGeometry& g,
                                                           const float* filters, const T* input,
                                                           int64_t num_buffered, int64_t count,
                                                           Walk* walk, T* out) {
  constexpr int kGroup = kGroupSize<T>;
  const size_t filter_stride = static_cast<size_t>(g.num_taps) * kFloatsPerTap<T>;
  int64_t k = walk->k, s = walk->s;
  int phase = walk->phase;
  const float* group_taps[kGroup];
  const T* group_input[kGroup];
  for (; k + kGroup <= count; k += kGroup) {
#pragma GCC unroll 4
    for (int j = 0; j < kGroup; ++j) {
      group_taps[j] = filters + phase * filter_stride;
      group_input[j] = input + (s - num_buffered);
      s += g.step;
      phase += g.phase_increment;
      if (phase >= g.denominator) {
        phase -= g.denominator;
        ++s;
      }
    }
    DotGroup<kWide>(group_taps, group_input, g.num_taps, out + k);
  }
  *walk = {k, s, phase};
}

// NeighbourGroups in eight-lane vectors, for processors with AVX. (No FMA:
// fused products would round differently.) Elsewhere never called.
template <typename T>
#ifdef VESK_WIDE_RESAMPLER
__attribute__((target("avx")))
#endif
void NeighbourGroupsWide(const LaneGeometry& g, const float* filters, const T* input,
                         int64_t num_buffered, int64_t count, Walk* walk, T* out) {
  NeighbourGroups<true>(g, filters, input, num_buffered, count, walk, out);
}

}  // namespace

template <typename T>
RationalFactorResampler<T>::RationalFactorResampler(const ResamplingKernel& kernel,
                                                    int max_denominator, bool wide_vectors) {
  if (max_denominator < 1 || !kernel.Valid()) return;
  const double ratio = kernel.input_sample_rate() / kernel.output_sample_rate();
  if (!(ratio < kMaxRatio) || !(kernel.radius() < kMaxRatio)) return;
  const std::pair<int, int> fraction = RationalApproximation(ratio, max_denominator);
  numerator_ = fraction.first;
  denominator_ = fraction.second;
  if (numerator_ < 1) return;
  step_ = numerator_ / denominator_;
  phase_increment_ = numerator_ % denominator_;
  radius_ = static_cast<int>(std::ceil(kernel.radius()));
  num_taps_ = 2 * radius_ + 1;
  // A step longer than a window would skip input that no window covers; the
  // buffering below relies on every call ending inside the stream.
  if (step_ > num_taps_ - 1) return;

  constexpr int kCopies = kFloatsPerTap<T>;
  filters_.resize(static_cast<size_t>(denominator_) * num_taps_ * kCopies);
  float* tap = filters_.data();
  for (int j = 0; j < denominator_; ++j) {
    const double phase_offset = static_cast<double>(j) / denominator_;
    for (int m = 0; m < num_taps_; ++m) {
      const float value = static_cast<float>(kernel.Eval((radius_ - m) + phase_offset));
      for (int c = 0; c < kCopies; ++c) *tap++ = value;
    }
  }
  if constexpr (std::is_same_v<T, float>) {
    const int64_t run = denominator_ * ((kMinLaneRun + denominator_ - 1) / denominator_);
    const int64_t stretch = run / denominator_ * numerator_ + num_taps_;
    if (run <= kMaxLaneRun && stretch <= kMaxLaneInput &&
        static_cast<int64_t>(filters_.size()) <= kMaxLaneTaps) {
      lane_run_ = static_cast<int>(run);
      lane_taps_.reserve(filters_.size());
      for (const float t : filters_) lane_taps_.push_back(Float4{t, t, t, t});
      lane_input_.resize(static_cast<size_t>(stretch));
    }
  }
#ifdef VESK_WIDE_RESAMPLER
  wide_ = wide_vectors && __builtin_cpu_supports("avx");
#else
  (void)wide_vectors;
#endif
  buffer_.reserve(2 * num_taps_);
  flush_zeros_.assign(2 * radius_, T(0));
  valid_ = true;
  Reset();
}

template <typename T>
void RationalFactorResampler<T>::Reset() {
  phase_ = 0;
  buffer_.assign(radius_, T(0));
}

template <typename T>
void RationalFactorResampler<T>::ProcessSamples(const std::vector<T>& input,
                                                std::vector<T>* output) {
  CHECK(output);
  if (!valid_) {
    output->clear();
    return;
  }
  // The old samples followed by the new ones form one virtual stream; window
  // starts run over [0, num_windows).
  const int64_t num_input = static_cast<int64_t>(input.size());
  const int64_t num_buffered = static_cast<int64_t>(buffer_.size());
  const int64_t num_windows = num_buffered + num_input + 1 - num_taps_;
  if (num_windows <= 0) {
    output->clear();
    buffer_.insert(buffer_.end(), input.begin(), input.end());
    return;
  }
  // Window k starts at (phase_ + k p) / q; count those below num_windows.
  const int64_t count =
      (static_cast<int64_t>(denominator_) * num_windows - phase_ - 1 + numerator_) / numerator_;
  output->resize(static_cast<size_t>(count));
  T* out = output->data();

  // Bridge: windows that start in the buffer reach at most num_taps_ - 1
  // samples into the input.
  const int64_t num_bridged = std::min<int64_t>(num_input, num_taps_ - 1);
  buffer_.insert(buffer_.end(), input.begin(), input.begin() + num_bridged);

  const float* filters = filters_.data();
  const int num_taps = num_taps_;
  const size_t filter_stride = static_cast<size_t>(num_taps) * kFloatsPerTap<T>;
  int phase = phase_;
  int64_t s = 0;
  int64_t k = 0;
  for (; k < count && s < num_buffered; ++k) {
    out[k] = Dot(filters + phase * filter_stride, buffer_.data() + s, num_taps);
    s += step_;
    phase += phase_increment_;
    if (phase >= denominator_) {
      phase -= denominator_;
      ++s;
    }
  }
  // The windows wholly in the input: lane groups (they end where they began
  // in the phase cycle), then groups of neighbours, then one by one.
  if constexpr (std::is_same_v<T, float>) {
    if (lane_run_ > 0) {
      const int64_t outputs = 4 * static_cast<int64_t>(lane_run_);
      const int64_t advance = outputs / denominator_ * numerator_;  // input samples
      for (; k + outputs <= count; k += outputs, s += advance) {
        ProcessLaneGroup(input.data() + (s - num_buffered), phase, out + k);
      }
    }
  }
  {
    LaneGeometry geometry;
    geometry.num_taps = num_taps;
    geometry.step = step_;
    geometry.phase_increment = phase_increment_;
    geometry.denominator = denominator_;
    Walk walk = {k, s, phase};
    if (wide_) {
      NeighbourGroupsWide(geometry, filters, input.data(), num_buffered, count, &walk, out);
      ClearUpperVectorState();
    } else {
      NeighbourGroups<false>(geometry, filters, input.data(), num_buffered, count, &walk, out);
    }
    k = walk.k;
    s = walk.s;
    phase = walk.phase;
  }
  for (; k < count; ++k) {
    out[k] = Dot(filters + phase * filter_stride, input.data() + (s - num_buffered), num_taps);
    s += step_;
    phase += phase_increment_;
    if (phase >= denominator_) {
      phase -= denominator_;
      ++s;
    }
  }
  phase_ = phase;

  if (s < num_buffered) {
    // The windows ran out inside the old samples; then the whole input was
    // short enough to be bridged, and the buffer already ends with it.
    buffer_.erase(buffer_.begin(), buffer_.begin() + s);
  } else {
    buffer_.assign(input.begin() + (s - num_buffered), input.end());
  }
}

template <typename T>
void RationalFactorResampler<T>::ProcessLaneGroup(const float* x, int phase, float* out) {
  const int run = lane_run_;
  const int lane_offset = run / denominator_ * numerator_;  // D, input samples
  const float* x1 = x + lane_offset;
  const float* x2 = x1 + lane_offset;
  const float* x3 = x2 + lane_offset;
  // The lane's window starts lie in [0, D], so its samples fit lane_input_.
  const int span = (phase + (run - 1) * numerator_) / denominator_ + num_taps_;
  Float4* lanes = lane_input_.data();
  int u = 0;
  for (; u + 4 <= span; u += 4) {
    Float4 r[4] = {Load4(x + u), Load4(x1 + u), Load4(x2 + u), Load4(x3 + u)};
    Transpose4(r);
    for (int i = 0; i < 4; ++i) lanes[u + i] = r[i];
  }
  for (; u < span; ++u) lanes[u] = Float4{x[u], x1[u], x2[u], x3[u]};

  LaneGeometry geometry;
  geometry.num_taps = num_taps_;
  geometry.step = step_;
  geometry.phase_increment = phase_increment_;
  geometry.denominator = denominator_;
  geometry.run = run;
  const Float4* taps = lane_taps_.data();
  // The common tap counts get loops of known length (the accumulators then
  // stay in registers): 11 taps when upsampling, 13 for 48 kHz to 44.1 kHz.
  switch (num_taps_) {
    case 11:
      LaneOutputs<11>(geometry, taps, lanes, phase, out);
      break;
    case 13:
      LaneOutputs<13>(geometry, taps, lanes, phase, out);
      break;
    default:
      LaneOutputs<0>(geometry, taps, lanes, phase, out);
      break;
  }
}

template <typename T>
void RationalFactorResampler<T>::Flush(std::vector<T>* output) {
  CHECK(output);
  output->clear();
  ProcessSamples(flush_zeros_, output);
}

template class RationalFactorResampler<float>;
template class RationalFactorResampler<std::complex<float>>;

}  // namespace audio_dsp
