#include "audio/vesknet/dtmf/tone_strength_filter.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
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
  using audio_dsp::Float4;
  typedef uint32_t UInt4 __attribute__((vector_size(16)));
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
  // did: no call inside the loop, so the vectors stay in registers.
  const size_t most = input.size() / filters[0].decimation_factor_ + 1;
  for (int i = 0; i < count; ++i) outputs[i].resize(most);
  size_t produced = 0;
  // Four filters per vector, lane l being filter first + l: each lane does
  // Process's arithmetic in its order. Lanes beyond the last filter run on a
  // zero increment and gain and are not written back.
  for (int first = 0; first < count; first += 4) {
    const int lanes = std::min(4, count - first);
    const ToneStrengthFilter* f = filters + first;
    UInt4 phase = {}, increment = {};
    Float4 cosine_sum = {}, sine_sum = {}, gain = {}, i1 = {}, q1 = {}, i2 = {}, q2 = {};
    for (int l = 0; l < lanes; ++l) {
      phase[l] = f[l].phase_;
      increment[l] = f[l].phase_increment_;
      cosine_sum[l] = f[l].cosine_sum_;
      sine_sum[l] = f[l].sine_sum_;
      gain[l] = f[l].gain_;
      i1[l] = f[l].i1_;
      q1[l] = f[l].q1_;
      i2[l] = f[l].i2_;
      q2[l] = f[l].q2_;
    }
    const float* const table = f[0].sine_table_;
    const int32_t decimation = f[0].decimation_factor_;
    int32_t countdown = f[0].countdown_;
    float* out[4];
    for (int l = 0; l < 4; ++l) out[l] = outputs[first + std::min(l, lanes - 1)].data();
    size_t written = 0;
    const float* samples = input.data();
    size_t remaining = input.size();
    while (remaining > 0) {
      const int32_t run = static_cast<int32_t>(std::min<size_t>(remaining, countdown));
      for (int32_t j = 0; j < run; ++j) {
        const float x = samples[j];
        const UInt4 index = phase >> kPhaseShift;
        const Float4 cosine = {table[index[0] + kQuarterPeriod], table[index[1] + kQuarterPeriod],
                               table[index[2] + kQuarterPeriod], table[index[3] + kQuarterPeriod]};
        const Float4 sine = {table[index[0]], table[index[1]], table[index[2]], table[index[3]]};
        cosine_sum += cosine * x;
        sine_sum += x * sine;
        phase += increment;
      }
      samples += run;
      remaining -= run;
      countdown -= run;
      if (countdown == 0) {
        const Float4 in_phase = cosine_sum, quadrature = sine_sum;
        cosine_sum = Float4{};
        sine_sum = Float4{};
        countdown = decimation;
        i1 += (in_phase - i1) * gain;
        q1 += (quadrature - q1) * gain;
        i2 += (i1 - i2) * gain;
        q2 += (q1 - q2) * gain;
        const Float4 strength = i2 * i2 + q2 * q2;
        // Lanes beyond the last filter write into the last filter's output
        // before its own lane does (highest lane first).
        out[3][written] = strength[3];
        out[2][written] = strength[2];
        out[1][written] = strength[1];
        out[0][written] = strength[0];
        ++written;
      }
    }
    produced = written;
    for (int l = 0; l < lanes; ++l) {
      ToneStrengthFilter& filter = filters[first + l];
      filter.phase_ = phase[l];
      filter.cosine_sum_ = cosine_sum[l];
      filter.sine_sum_ = sine_sum[l];
      filter.countdown_ = countdown;
      filter.i1_ = i1[l];
      filter.q1_ = q1[l];
      filter.i2_ = i2[l];
      filter.q2_ = q2[l];
    }
  }
  for (int i = 0; i < count; ++i) outputs[i].resize(produced);
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
