#include "tools/channel/impulses.h"

#include <algorithm>
#include <cmath>

#include "base/logging.h"
#include "tools/channel/channel_constants.h"
#include "tools/channel/random.h"

namespace vesk_channel {
namespace {

constexpr double kClapShare = 0.7;

// One clap of unit peak.
std::vector<double> Clap(int rate, Random* random) {
  const double decay_s = random->Uniform(0.003, 0.008);
  const int length = static_cast<int>(std::ceil(8.0 * decay_s * rate));
  const double rise = 0.0005 * rate;
  // One-pole high-pass at 500 Hz.
  const double pole = std::exp(-2.0 * kPi * 500.0 / rate);
  std::vector<double> x(length);
  double previous_in = 0.0, previous_out = 0.0;
  for (int i = 0; i < length; ++i) {
    const double envelope = std::min(1.0, i / rise) * std::exp(-i / (decay_s * rate));
    const double in = envelope * random->Gaussian();
    previous_out = pole * (previous_out + in - previous_in);
    previous_in = in;
    x[i] = previous_out;
  }
  return x;
}

// One door slam of unit peak.
std::vector<double> Slam(int rate, Random* random) {
  const double decay_s = random->Uniform(0.04, 0.12);
  const double ring_hz = random->Uniform(60.0, 120.0);
  const int length = static_cast<int>(std::ceil(6.0 * decay_s * rate));
  const double rise = 0.002 * rate;
  const double pole = std::exp(-2.0 * kPi * 300.0 / rate);  // Two one-pole stages.
  std::vector<double> x(length);
  double stage1 = 0.0, stage2 = 0.0;
  for (int i = 0; i < length; ++i) {
    const double envelope = std::min(1.0, i / rise) * std::exp(-i / (decay_s * rate));
    stage1 += (1.0 - pole) * (random->Gaussian() - stage1);
    stage2 += (1.0 - pole) * (stage1 - stage2);
    const double ring = std::sin(2.0 * kPi * ring_hz * i / rate);
    x[i] = envelope * (4.0 * stage2 + ring);
  }
  return x;
}

}  // namespace

std::vector<int64_t> AddImpulses(double per_second, double peak, int rate, uint64_t seed,
                                 std::vector<std::vector<float>>* channels) {
  CHECK(per_second >= 0.0);
  CHECK(peak > 0.0);
  CHECK(rate >= 8000);
  CHECK(channels);
  std::vector<int64_t> starts;
  if (per_second == 0.0 || channels->empty()) return starts;
  const int64_t frames = static_cast<int64_t>(channels->front().size());
  const double interval = rate / per_second;
  Random random(seed);
  for (int64_t k = 0; static_cast<double>(k) * interval < static_cast<double>(frames); ++k) {
    const int64_t start =
        static_cast<int64_t>((static_cast<double>(k) + random.Uniform()) * interval);
    std::vector<double> impulse =
        random.Uniform() < kClapShare ? Clap(rate, &random) : Slam(rate, &random);
    if (start >= frames) continue;
    double largest = 0.0;
    for (double v : impulse) largest = std::max(largest, std::abs(v));
    if (largest == 0.0) continue;
    for (std::vector<float>& channel : *channels) {
      const int64_t end = std::min<int64_t>(frames, start + static_cast<int64_t>(impulse.size()));
      for (int64_t i = start; i < end; ++i) {
        channel[i] += static_cast<float>(peak * impulse[i - start] / largest);
      }
    }
    starts.push_back(start);
  }
  return starts;
}

}  // namespace vesk_channel
