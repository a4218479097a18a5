#include "tools/channel/tones.h"

#include <cmath>
#include <vector>

#include "gtest/gtest.h"
#include "tools/channel/channel_test_util.h"

namespace vesk_channel {
namespace {

TEST(TonesTest, EachToneHasItsFrequencyAndTheRequestedLevel) {
  std::vector<float> x(48000, 0.0f);
  AddTones({18600.0, 19000.0, 1200.0}, 100.0, 48000, 3, &x);
  for (double hz : {18600.0, 19000.0, 1200.0}) {
    EXPECT_NEAR(Amplitude(x, 0, x.size(), hz, 48000), 100 * std::sqrt(2.0), 0.05) << hz;
  }
  // Three uncorrelated tones of RMS 100: total power 3 x 100^2.
  EXPECT_NEAR(MeanSquare(x, 0, x.size()), 30000, 30);
  EXPECT_LT(Amplitude(x, 0, x.size(), 18800.0, 48000), 0.1);
  // The seed sets the phases.
  std::vector<float> y(48000, 0.0f);
  AddTones({18600.0}, 100.0, 48000, 4, &y);
  std::vector<float> z(48000, 0.0f);
  AddTones({18600.0}, 100.0, 48000, 4, &z);
  EXPECT_EQ(y, z);
  std::vector<float> w(48000, 0.0f);
  AddTones({18600.0}, 100.0, 48000, 5, &w);
  EXPECT_NE(y, w);
}

TEST(TonesTest, RandomFrequenciesLieInTheirBand) {
  const std::vector<double> f = RandomToneFrequencies(200, 15500, 21500, 1);
  ASSERT_EQ(f.size(), 200u);
  double low = 1e9, high = 0;
  for (double v : f) {
    low = std::min(low, v);
    high = std::max(high, v);
  }
  EXPECT_GE(low, 15500);
  EXPECT_LT(high, 21500);
  EXPECT_LT(low, 15700);  // They spread over the band.
  EXPECT_GT(high, 21300);
  EXPECT_EQ(f, RandomToneFrequencies(200, 15500, 21500, 1));
}

}  // namespace
}  // namespace vesk_channel
