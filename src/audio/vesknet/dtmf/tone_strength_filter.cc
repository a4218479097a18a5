#include "audio/vesknet/dtmf/tone_strength_filter.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <limits>

#include "audio/dsp/simd.h"
#include "base/logging.h"

namespace audio_vesknet {
namespace {

constexpr double kPi = 3.14159265358979323846;

// One period of 4096 entries plus a quarter period, so that the cosine of
// entry j is entry j + 1024 without wrapping.
constexpr int kTableBits = 12;
constexpr int kTablePeriod = 1 << kTableBits;
constexpr int kQuarterPeriod = kTablePeriod / 4;
constexpr int kTableSize = kTablePeriod + kQuarterPeriod;
// The table index is the phase's top 12 bits; starting half an index step in
// makes the truncation pick the nearest entry.
constexpr int kPhaseShift = 32 - kTableBits;
constexpr uint32_t kInitialPhase = 1u << (kPhaseShift - 1);

// Pole placement constant of the two-stage low-pass: 1 / sqrt(2).
constexpr double kLowpassConstant = 0.7071067811865475;

using SineTable = std::array<float, kTableSize>;

// Built once, on first use (thread-safe static initialisation); immutable.
const float* GetSineTable() {
  static const SineTable table = [] {
    SineTable entries;
    for (int i = 0; i < kTableSize; ++i) {
      entries[i] = static_cast<float>(std::sin(i * 2.0 * kPi / kTablePeriod));
    }
    return entries;
  }();
  return table.data();
}

// The table again as (sine, cosine) pairs, entries i and i + 1024: one
// eight-byte load gives both arms of a filter. The same values, shared and
// immutable like the table.
struct SineCosine {
  float sine;
  float cosine;
};
static_assert(sizeof(SineCosine) == 8, "two floats per entry");

const SineCosine* GetSineCosineTable() {
  static const std::array<SineCosine, kTablePeriod> pairs = [] {
    const float* table = GetSineTable();
    std::array<SineCosine, kTablePeriod> entries;
    for (int i = 0; i < kTablePeriod; ++i) entries[i] = {table[i], table[i + kQuarterPeriod]};
    return entries;
  }();
  return pairs.data();
}

// (sine, cosine) of entry a in lanes 0, 1 and of entry b in lanes 2, 3.
inline audio_dsp::Float4 LoadTwoPairs(const SineCosine* pairs, uint32_t a, uint32_t b) {
  double low, high;  // Eight bytes each, moved as they are.
  std::memcpy(&low, pairs + a, sizeof(low));
  std::memcpy(&high, pairs + b, sizeof(high));
  const audio_dsp::Double2 both = {low, high};
  audio_dsp::Float4 lanes;
  std::memcpy(&lanes, &both, sizeof(lanes));
  return lanes;
}

// `values`, with the compiler no longer knowing where it points: a vector
// stored through the original pointer is then read back by one load per
// lane instead of being moved lane by lane into general registers. On
// x86-64 that takes fewer instructions and less time (SSE2 has no
// single-instruction lane extract); the 32-bit build measured slower with it
// (ten filters over 4096 samples: 20.8 us against 19.4 us), so there the
// compiler moves the lanes.
template <typename T>
inline const T* FromMemory(const T* values) {
#if defined(__x86_64__)
  __asm__("" : "+r"(values));
#endif
  return values;
}

// Filters run side by side at most: ten (five vectors of sine and cosine
// sums, three of phases) where there are sixteen or more vector registers,
// six (three of sums, two of phases, the increments read from memory) where
// there are eight (32-bit x86).
#if defined(__x86_64__) || defined(__aarch64__) || defined(__wasm__)
constexpr int kMaxPairs = 5;
#else
constexpr int kMaxPairs = 3;
#endif

// Two samples per pass of the mixing loop where the registers leave room for
// it: on the 32-bit build the wider loop spilled sums and ran about 4%
// slower than one sample per pass.
#if defined(__i386__)
constexpr bool kTwoSamplesPerPass = false;
#else
constexpr bool kTwoSamplesPerPass = true;
#endif

// round(value) half away from zero, saturated to the int32 range.
int32_t RoundToInt32(double value) {
  const double rounded = std::round(value);
  if (!(rounded < std::numeric_limits<int32_t>::max())) return std::numeric_limits<int32_t>::max();
  if (!(rounded > std::numeric_limits<int32_t>::min())) return std::numeric_limits<int32_t>::min();
  return static_cast<int32_t>(rounded);
}

}  // namespace

ToneStrengthFilter::ToneStrengthFilter(float sample_rate, float frequency, float bandwidth,
                                       int decimation_factor)
    : sine_table_(GetSineTable()),
      sample_rate_(sample_rate),
      phase_(kInitialPhase),
      phase_increment_(0),
      frequency_(frequency),
      cosine_sum_(0.0f),
      sine_sum_(0.0f),
      decimation_factor_(decimation_factor),
      countdown_(decimation_factor),
      delay_(0),
      gain_(0.0f),
      i1_(0.0f),
      q1_(0.0f),
      i2_(0.0f),
      q2_(0.0f) {
  const double cycles_per_sample = frequency_ / sample_rate_;
  if (std::isfinite(cycles_per_sample)) {
    const double fraction = cycles_per_sample - std::floor(cycles_per_sample);
    phase_increment_ = static_cast<uint32_t>(fraction * 4294967296.0);
  }

  // Two one-pole stages with pole p at the decimated rate; p is placed so
  // that the cascade passes `bandwidth` Hz.
  const float decimated_rate = sample_rate / static_cast<float>(decimation_factor);
  const double b = (1.0 - std::cos(2.0 * kPi * bandwidth / decimated_rate) * kLowpassConstant) /
                   (1.0 - kLowpassConstant);
  const double pole = b - std::sqrt(b * b - 1.0);
  gain_ = static_cast<float>(1.0 - pole);
  delay_ = RoundToInt32(2.0 * pole / (1.0 - pole));

  CHECK(decimation_factor_ >= 1);
  Reset();
}

void ToneStrengthFilter::Process(const std::vector<float>& input,
                                 std::vector<float>* output_samples) {
  CHECK(output_samples);
  output_samples->clear();
  output_samples->reserve(input.size() / decimation_factor_ + 1);

  // The state lives in locals for the loop so that the compiler keeps it in
  // registers; the inner loop runs over whole stretches up to the next dump.
  const float* const table = sine_table_;
  const uint32_t increment = phase_increment_;
  const float gain = gain_;
  uint32_t phase = phase_;
  float cosine_sum = cosine_sum_;
  float sine_sum = sine_sum_;
  int32_t countdown = countdown_;
  const float* samples = input.data();
  size_t remaining = input.size();
  while (remaining > 0) {
    const int32_t run = static_cast<int32_t>(std::min<size_t>(remaining, countdown));
    for (int32_t j = 0; j < run; ++j) {
      const float x = samples[j];
      const uint32_t index = phase >> kPhaseShift;
      cosine_sum += table[index + kQuarterPeriod] * x;
      sine_sum += x * table[index];
      phase += increment;  // Wraps modulo 2^32: one cycle.
    }
    samples += run;
    remaining -= run;
    countdown -= run;
    if (countdown == 0) {
      const float in_phase = cosine_sum;
      const float quadrature = sine_sum;
      cosine_sum = 0.0f;
      sine_sum = 0.0f;
      countdown = decimation_factor_;
      i1_ += (in_phase - i1_) * gain;
      q1_ += (quadrature - q1_) * gain;
      i2_ += (i1_ - i2_) * gain;
      q2_ += (q1_ - q2_) * gain;
      output_samples->push_back(i2_ * i2_ + q2_ * q2_);
    }
  }
  phase_ = phase;
  cosine_sum_ = cosine_sum;
  sine_sum_ = sine_sum;
  countdown_ = countdown;
}

void ToneStrengthFilter::ProcessAll(ToneStrengthFilter* filters, int count,
                                    const std::vector<float>& input, std::vector<float>* outputs) {
  CHECK(outputs);
  bool lockstep = true;
  for (int i = 1; i < count; ++i) {
    lockstep = lockstep && filters[i].decimation_factor_ == filters[0].decimation_factor_ &&
               filters[i].countdown_ == filters[0].countdown_;
  }
  if (!lockstep) {
    for (int i = 0; i < count; ++i) filters[i].Process(input, &outputs[i]);
    return;
  }
  // Sized for the most strengths the input can complete and cut to what it
  // did: no call inside the loop, so the sums stay in registers.
  const size_t most = input.size() / filters[0].decimation_factor_ + 1;
  for (int i = 0; i < count; ++i) outputs[i].resize(most);
  size_t produced = 0;
  for (int first = 0; first < count; first += 2 * kMaxPairs) {
    const int lanes = std::min(2 * kMaxPairs, count - first);
    ToneStrengthFilter* const f = filters + first;
    std::vector<float>* const out = outputs + first;
    switch ((lanes + 1) / 2) {
      case 1:
        ProcessPairs<1>(f, lanes, input, out, &produced);
        break;
      case 2:
        ProcessPairs<2>(f, lanes, input, out, &produced);
        break;
      case 3:
        ProcessPairs<3>(f, lanes, input, out, &produced);
        break;
#if defined(__x86_64__) || defined(__aarch64__) || defined(__wasm__)
      case 4:
        ProcessPairs<4>(f, lanes, input, out, &produced);
        break;
      case 5:
        ProcessPairs<5>(f, lanes, input, out, &produced);
        break;
#endif
    }
  }
  for (int i = 0; i < count; ++i) outputs[i].resize(produced);
}

template <int kPairs>
void ToneStrengthFilter::ProcessPairs(ToneStrengthFilter* filters, int lanes,
                                      const std::vector<float>& input, std::vector<float>* outputs,
                                      size_t* produced) {
  using audio_dsp::Float4;
  typedef uint32_t UInt4 __attribute__((vector_size(16)));
  // Filter l: phase and low-pass in lane l % 4 of vector l / 4; sine and
  // cosine sums in lanes 2 (l % 2) and 2 (l % 2) + 1 of sums[l / 2]. Each
  // lane does Process's arithmetic in its order (a product is the same
  // whichever factor comes first). Lanes beyond the last filter run on a zero
  // increment and gain and are not written back.
  constexpr int kVectors = (kPairs + 1) / 2;
  UInt4 phase[kVectors] = {}, increment[kVectors] = {};
  Float4 sums[kPairs] = {};
  Float4 gain[kVectors] = {}, i1[kVectors] = {}, q1[kVectors] = {}, i2[kVectors] = {},
         q2[kVectors] = {};
  for (int l = 0; l < lanes; ++l) {
    const ToneStrengthFilter& f = filters[l];
    phase[l / 4][l % 4] = f.phase_;
    increment[l / 4][l % 4] = f.phase_increment_;
    sums[l / 2][2 * (l % 2)] = f.sine_sum_;
    sums[l / 2][2 * (l % 2) + 1] = f.cosine_sum_;
    gain[l / 4][l % 4] = f.gain_;
    i1[l / 4][l % 4] = f.i1_;
    q1[l / 4][l % 4] = f.q1_;
    i2[l / 4][l % 4] = f.i2_;
    q2[l / 4][l % 4] = f.q2_;
  }
  const SineCosine* const pairs = GetSineCosineTable();
  const int32_t decimation = filters[0].decimation_factor_;
  int32_t countdown = filters[0].countdown_;
  float* out[4 * kVectors];
  for (int l = 0; l < 4 * kVectors; ++l) out[l] = outputs[std::min(l, lanes - 1)].data();
  size_t written = 0;
  // The table indices of the current sample, read back one lane at a time.
  alignas(16) uint32_t indices[4 * kVectors];
  const uint32_t* const stored = FromMemory(indices);
  // Mixes one sample into every filter's sums.
  const auto mix = [&](float x) {
    const Float4 x4 = {x, x, x, x};
#pragma GCC unroll 4
    for (int v = 0; v < kVectors; ++v) {
      const UInt4 index = phase[v] >> kPhaseShift;
      std::memcpy(indices + 4 * v, &index, sizeof(index));
      phase[v] += increment[v];  // Wraps modulo 2^32: one cycle.
    }
#pragma GCC unroll 8
    for (int p = 0; p < kPairs; ++p) {
      sums[p] += LoadTwoPairs(pairs, stored[2 * p], stored[2 * p + 1]) * x4;
    }
  };
  // The sums of up to four completed groups: the low-pass then runs over
  // them with its state in registers, and four strengths of a filter are
  // stored at once (a 4 x 4 transpose).
  constexpr int kGroups = 4;
  Float4 dumped[kGroups][kPairs];
  const float* samples = input.data();
  size_t remaining = input.size();
  while (remaining > 0) {
    int completed = 0;
    while (remaining > 0 && completed < kGroups) {
      const int32_t run = static_cast<int32_t>(std::min<size_t>(remaining, countdown));
      int32_t j = 0;
      if (kTwoSamplesPerPass) {
        for (; j + 2 <= run; j += 2) {
          mix(samples[j]);
          mix(samples[j + 1]);
        }
      }
      for (; j < run; ++j) mix(samples[j]);
      samples += run;
      remaining -= run;
      countdown -= run;
      if (countdown == 0) {
        countdown = decimation;
#pragma GCC unroll 8
        for (int p = 0; p < kPairs; ++p) {
          dumped[completed][p] = sums[p];
          sums[p] = Float4{};
        }
        ++completed;
      }
    }
    // Highest vector and lane first: lanes beyond the last filter write into
    // the last filter's output before its own lane does.
#pragma GCC unroll 4
    for (int v = kVectors - 1; v >= 0; --v) {
      Float4 strength[kGroups];
      for (int g = 0; g < completed; ++g) {
        const Float4 low = dumped[g][2 * v];
        const Float4 high = 2 * v + 1 < kPairs ? dumped[g][2 * v + 1] : Float4{};
        const Float4 in_phase = __builtin_shufflevector(low, high, 1, 3, 5, 7);
        const Float4 quadrature = __builtin_shufflevector(low, high, 0, 2, 4, 6);
        i1[v] += (in_phase - i1[v]) * gain[v];
        q1[v] += (quadrature - q1[v]) * gain[v];
        i2[v] += (i1[v] - i2[v]) * gain[v];
        q2[v] += (q1[v] - q2[v]) * gain[v];
        strength[g] = i2[v] * i2[v] + q2[v] * q2[v];
      }
      if (completed == kGroups) {
        audio_dsp::Transpose4(strength);
        for (int l = 3; l >= 0; --l) audio_dsp::Store4(out[4 * v + l] + written, strength[l]);
      } else {
        for (int g = 0; g < completed; ++g) {
          for (int l = 3; l >= 0; --l) out[4 * v + l][written + g] = strength[g][l];
        }
      }
    }
    written += completed;
  }
  *produced = written;
  for (int l = 0; l < lanes; ++l) {
    ToneStrengthFilter& f = filters[l];
    f.phase_ = phase[l / 4][l % 4];
    f.sine_sum_ = sums[l / 2][2 * (l % 2)];
    f.cosine_sum_ = sums[l / 2][2 * (l % 2) + 1];
    f.countdown_ = countdown;
    f.i1_ = i1[l / 4][l % 4];
    f.q1_ = q1[l / 4][l % 4];
    f.i2_ = i2[l / 4][l % 4];
    f.q2_ = q2[l / 4][l % 4];
  }
}

void ToneStrengthFilter::Reset() {
  cosine_sum_ = 0.0f;
  sine_sum_ = 0.0f;
  countdown_ = decimation_factor_;
  i1_ = 0.0f;
  q1_ = 0.0f;
  i2_ = 0.0f;
  q2_ = 0.0f;
}

}  // namespace audio_vesknet
