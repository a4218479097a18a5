#include "tools/channel/convolution.h"

#include <cmath>
#include <vector>

#include "gtest/gtest.h"
#include "tools/channel/random.h"

namespace vesk_channel {
namespace {

std::vector<float> Gaussian(size_t n, uint64_t seed, double scale) {
  Random random(seed);
  std::vector<float> x(n);
  for (float& v : x) v = static_cast<float>(scale * random.Gaussian());
  return x;
}

// The definition, in double precision.
std::vector<double> Direct(const std::vector<float>& x, const std::vector<float>& h, int delay) {
  std::vector<double> y(x.size(), 0.0);
  for (size_t i = 0; i < x.size(); ++i) {
    const int64_t full = static_cast<int64_t>(i) + delay;
    for (size_t j = 0; j < h.size(); ++j) {
      const int64_t k = full - static_cast<int64_t>(j);
      if (k >= 0 && k < static_cast<int64_t>(x.size())) y[i] += static_cast<double>(h[j]) * x[k];
    }
  }
  return y;
}

TEST(ConvolveTest, MatchesTheDefinitionForShortAndLongFiltersAndDelays) {
  struct Case {
    size_t signal, filter;
    int delay;
  };
  // Filters shorter and longer than a block; delays inside the filter and
  // beyond the first block.
  for (const Case& c : {Case{1000, 1, 0}, Case{5000, 7, 3}, Case{3000, 300, 150},
                        Case{9000, 2500, 0}, Case{4000, 33, 2000}}) {
    const std::vector<float> x = Gaussian(c.signal, 1, 3000.0);
    const std::vector<float> h = Gaussian(c.filter, 2, 0.3);
    const std::vector<float> y = Convolve(x, h, c.delay);
    const std::vector<double> want = Direct(x, h, c.delay);
    ASSERT_EQ(y.size(), x.size());
    double worst = 0;
    for (size_t i = 0; i < y.size(); ++i) worst = std::max(worst, std::abs(y[i] - want[i]));
    // Single precision on a 16-bit scale: far below one step.
    EXPECT_LT(worst, 0.05) << c.signal << " " << c.filter << " " << c.delay;
  }
}

TEST(ConvolveTest, UnitImpulseCopiesAndShiftedImpulseDelays) {
  const std::vector<float> x = Gaussian(777, 3, 100.0);
  const std::vector<float> y = Convolve(x, {1.0f});
  for (size_t i = 0; i < x.size(); ++i) ASSERT_NEAR(y[i], x[i], 1e-3) << i;
  // An impulse at 5 with delay 5: zero phase again.
  const std::vector<float> z = Convolve(x, {0, 0, 0, 0, 0, 1.0f}, 5);
  for (size_t i = 0; i < x.size(); ++i) ASSERT_NEAR(z[i], x[i], 1e-3) << i;
  // Without the delay, five samples late.
  const std::vector<float> late = Convolve(x, {0, 0, 0, 0, 0, 1.0f});
  EXPECT_NEAR(late[4], 0.0f, 1e-3);
  EXPECT_NEAR(late[5], x[0], 1e-3);
}

}  // namespace
}  // namespace vesk_channel
