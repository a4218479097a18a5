#include "tools/channel/sinc_resampler.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "audio/dsp/resampling_kernel.h"
#include "base/logging.h"
#include "tools/channel/channel_constants.h"

namespace vesk_channel {
namespace {

// Reach of 64 samples of the lower rate on each side and Kaiser beta 8 give a
// transition band of about 0.04 x the lower rate and a stopband near -80 dB;
// the cut-off at 0.965 x the lower Nyquist frequency keeps a 44.1 kHz
// microphone's band flat up to about 20.5 kHz.
constexpr double kKernelReach = 64.0;
constexpr double kKaiserBeta = 8.0;
constexpr double kCutoffFraction = 0.965;
// Kernel rows per input sample; linear interpolation between rows keeps the
// table error near -100 dB.
constexpr int kPhases = 512;
// Partial sums of the dot product (taps are padded to a multiple).
constexpr int kLanes = 16;
// Four floats operated on lane by lane (GCC and Clang vector extension).
typedef float Float4 __attribute__((vector_size(16)));

inline Float4 Load(const float* p) {
  Float4 v;
  std::memcpy(&v, p, sizeof(v));
  return v;
}

}  // namespace

SincResampler::SincResampler(double step) : step_(step) {
  CHECK(step > 0.0);
  const double scale = std::min(1.0, 1.0 / step);
  const double cutoff = 0.5 * kCutoffFraction * scale;  // cycles per input sample
  radius_ = kKernelReach / scale;                       // input samples
  half_ = static_cast<int>(std::ceil(radius_));
  taps_ = (2 * half_ + kLanes - 1) / kLanes * kLanes;
  // Every tap lies on the grid of 1 / kPhases input samples: tap t of row r
  // sits at (t - half_ + 1) - r / kPhases. The kernel is even, so one side
  // of the grid serves all rows.
  const double i0_beta = audio_dsp::BesselI0(kKaiserBeta);
  const int grid_size = half_ * kPhases + 1;
  std::vector<double> kernel(grid_size, 0.0);
  for (int m = 0; m < grid_size; ++m) {
    const double x = static_cast<double>(m) / kPhases;
    const double q = x / radius_;
    if (q >= 1.0) continue;
    const double arg = kPi * 2.0 * cutoff * x;
    const double sinc = m == 0 ? 1.0 : std::sin(arg) / arg;
    kernel[m] = sinc * audio_dsp::BesselI0(kKaiserBeta * std::sqrt(1.0 - q * q)) / i0_beta;
  }
  table_.assign(static_cast<size_t>(kPhases + 1) * taps_, 0.0f);
  for (int r = 0; r <= kPhases; ++r) {
    double sum = 0.0;
    for (int t = 0; t < 2 * half_; ++t) sum += kernel[std::abs((t - half_ + 1) * kPhases - r)];
    // Unit gain at DC for every phase.
    for (int t = 0; t < 2 * half_; ++t) {
      table_[static_cast<size_t>(r) * taps_ + t] =
          static_cast<float>(kernel[std::abs((t - half_ + 1) * kPhases - r)] / sum);
    }
  }
}

std::vector<float> SincResampler::Pad(const std::vector<float>& input) const {
  std::vector<float> padded(input.size() + 2 * static_cast<size_t>(taps_), 0.0f);
  std::copy(input.begin(), input.end(), padded.begin() + taps_);
  return padded;
}

float SincResampler::Interpolate(const float* padded, int64_t n, double p) const {
  if (p <= -radius_ || p >= static_cast<double>(n - 1) + radius_) return 0.0f;
  const double base = std::floor(p);
  const double phase = (p - base) * kPhases;
  int r = static_cast<int>(phase);
  float w = static_cast<float>(phase - r);
  if (r >= kPhases) {
    r = kPhases - 1;
    w = 1.0f;
  }
  const float* x = padded + (static_cast<int64_t>(base) - half_ + 1 + taps_);
  const float* ra = table_.data() + static_cast<size_t>(r) * taps_;
  const float* rb = ra + taps_;
  // Four vectors of partial sums per row, added up in a fixed order: enough
  // independent chains to keep the vector units busy, and the same result on
  // every build.
  Float4 a0 = {}, a1 = {}, a2 = {}, a3 = {}, b0 = {}, b1 = {}, b2 = {}, b3 = {};
  for (int t = 0; t < taps_; t += kLanes) {
    const Float4 x0 = Load(x + t), x1 = Load(x + t + 4), x2 = Load(x + t + 8),
                 x3 = Load(x + t + 12);
    a0 += Load(ra + t) * x0;
    a1 += Load(ra + t + 4) * x1;
    a2 += Load(ra + t + 8) * x2;
    a3 += Load(ra + t + 12) * x3;
    b0 += Load(rb + t) * x0;
    b1 += Load(rb + t + 4) * x1;
    b2 += Load(rb + t + 8) * x2;
    b3 += Load(rb + t + 12) * x3;
  }
  const Float4 va = (a0 + a1) + (a2 + a3);
  const Float4 vb = (b0 + b1) + (b2 + b3);
  const float sa = (va[0] + va[1]) + (va[2] + va[3]);
  const float sb = (vb[0] + vb[1]) + (vb[2] + vb[3]);
  return sa + w * (sb - sa);
}

void SincResampler::Process(const std::vector<float>& input, double first, float gain,
                            int64_t count, float* output) const {
  const std::vector<float> padded = Pad(input);
  const int64_t n = static_cast<int64_t>(input.size());
  for (int64_t k = 0; k < count; ++k) {
    output[k] = gain * Interpolate(padded.data(), n, first + static_cast<double>(k) * step_);
  }
}

void SincResampler::ProcessAt(const std::vector<float>& input, const std::vector<double>& positions,
                              const std::vector<float>& gains, float* output) const {
  CHECK(gains.size() == positions.size());
  const std::vector<float> padded = Pad(input);
  const int64_t n = static_cast<int64_t>(input.size());
  for (size_t k = 0; k < positions.size(); ++k) {
    output[k] = gains[k] * Interpolate(padded.data(), n, positions[k]);
  }
}

}  // namespace vesk_channel
