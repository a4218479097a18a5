#include "tools/channel/random.h"

#include <cmath>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_channel {
namespace {

TEST(RandomTest, KnownSequenceAndGaussianMoments) {
  EXPECT_EQ(Random(0).Next(), 0xe220a8397b1dcdafULL);  // SplitMix64 reference value
  Random random(5);
  double sum = 0, square_sum = 0;
  const int n = 200000;
  for (int i = 0; i < n; ++i) {
    const double v = random.Gaussian();
    sum += v;
    square_sum += v * v;
  }
  EXPECT_NEAR(sum / n, 0.0, 0.01);
  EXPECT_NEAR(square_sum / n, 1.0, 0.01);
}

TEST(RandomTest, UniformRangesAndIntegersCoverTheirRange) {
  Random random(3);
  std::vector<int> counts(7, 0);
  for (int i = 0; i < 70000; ++i) {
    const double u = random.Uniform(-2.0, 3.0);
    ASSERT_GE(u, -2.0);
    ASSERT_LT(u, 3.0);
    ++counts[random.UniformInt(7)];
  }
  for (int count : counts) EXPECT_NEAR(count, 10000, 400);
}

TEST(RandomTest, DerivedStreamsAreDistinctAndReproducible) {
  EXPECT_EQ(DeriveSeed(1, 2), DeriveSeed(1, 2));
  EXPECT_NE(DeriveSeed(1, 2), DeriveSeed(1, 3));
  EXPECT_NE(DeriveSeed(1, 2), DeriveSeed(2, 2));
  // Neighbouring streams of one seed are uncorrelated.
  Random a(DeriveSeed(9, 1)), b(DeriveSeed(9, 2));
  double product = 0;
  for (int i = 0; i < 100000; ++i) product += a.Gaussian() * b.Gaussian();
  EXPECT_NEAR(product / 100000, 0.0, 0.01);
}

}  // namespace
}  // namespace vesk_channel
