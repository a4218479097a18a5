#include "audio/dsp/resampling_kernel.h"

#include <algorithm>
#include <cmath>

namespace audio_dsp {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr double kEpsilon = 2.220446049250313e-16;  // double machine epsilon
constexpr int kMaxBesselTerms = 39;
constexpr double kBesselSeriesLimit = 21.0;

// Radius in input samples: five samples of the lower of the two rates.
double DefaultRadius(double input_sample_rate, double output_sample_rate) {
  return output_sample_rate >= input_sample_rate ? 5.0
                                                 : 5.0 * input_sample_rate / output_sample_rate;
}

}  // namespace

double BesselI0(double x) {
  x = std::fabs(x);
  if (x < kBesselSeriesLimit) {
    // sum_k ((x/2)^(2k) / (k!)^2); all terms are positive.
    const double quarter_x_squared = 0.25 * x * x;
    double sum = 1.0;
    double term = 1.0;
    for (int k = 1; k <= kMaxBesselTerms; ++k) {
      term *= quarter_x_squared / (static_cast<double>(k) * k);
      if (term < sum * kEpsilon) break;
      sum += term;
    }
    return sum;
  }
  // e^x / sqrt(2 pi x) * sum_k t(k), t(k) = t(k-1) (2k-1)^2 / (8 k x).
  double sum = 1.0;
  double term = 1.0;
  for (int k = 1; k <= kMaxBesselTerms; ++k) {
    const double odd = 2.0 * k - 1.0;
    term *= odd * odd / (8.0 * k * x);
    if (std::fabs(term) < sum * kEpsilon) break;
    sum += term;
  }
  return std::exp(x) / std::sqrt(2.0 * kPi * x) * sum;
}

DefaultResamplingKernel::DefaultResamplingKernel(double input_sample_rate,
                                                 double output_sample_rate)
    : DefaultResamplingKernel(
          input_sample_rate, output_sample_rate,
          kDefaultCutoffFraction * std::min(input_sample_rate, output_sample_rate),
          kDefaultKaiserBeta) {}

DefaultResamplingKernel::DefaultResamplingKernel(double input_sample_rate,
                                                 double output_sample_rate, double cutoff,
                                                 double kaiser_beta)
    : ResamplingKernel(input_sample_rate, output_sample_rate,
                       DefaultRadius(input_sample_rate, output_sample_rate)) {
  Init(cutoff, kaiser_beta);
}

void DefaultResamplingKernel::Init(double cutoff, double kaiser_beta) {
  // Written as "> 0" so that NaN parameters also leave the kernel invalid.
  const bool positive = input_sample_rate_ > 0.0 && output_sample_rate_ > 0.0 && cutoff > 0.0 &&
                        radius_ > 0.0 && kaiser_beta > 0.0;
  if (!positive || !(cutoff <= 0.5 * input_sample_rate_)) return;
  normalized_cutoff_ = 2.0 * cutoff / input_sample_rate_;
  normalized_cutoff_times_pi_ = normalized_cutoff_ * kPi;
  kaiser_beta_ = kaiser_beta;
  bessel_i0_beta_ = BesselI0(kaiser_beta);
  valid_ = true;
}

double DefaultResamplingKernel::Eval(double x) const {
  const double t = normalized_cutoff_times_pi_ * x;
  const double sinc = std::fabs(t) <= 1e-12 ? 1.0 : std::sin(t) / t;
  const double r = std::fabs(x) / radius_;
  double window;
  if (r < 1e-12) {
    window = 1.0;
  } else if (r > 1.000000000001) {
    window = 0.0;
  } else {
    window = BesselI0(kaiser_beta_ * std::sqrt(std::max(1.0 - r * r, 0.0))) / bessel_i0_beta_;
  }
  return normalized_cutoff_ * sinc * window;
}

}  // namespace audio_dsp
