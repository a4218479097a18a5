#include "tools/channel/playback_clipping.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "gtest/gtest.h"
#include "tools/channel/channel_test_util.h"

namespace vesk_channel {
namespace {

TEST(PlaybackClippingTest, ClipsAtFullScaleTheShareOfASineThatTheOverdriveLifts) {
  // A full-scale sine 6.02 dB over full scale (x 2) clips wherever
  // |sin| > 1/2: two thirds of the time.
  std::vector<float> x = Tone(997, 48000, 1.0, 1.0);
  ClipPlayback(20 * std::log10(2.0), &x);
  EXPECT_EQ(*std::max_element(x.begin(), x.end()), 1.0f);
  EXPECT_EQ(*std::min_element(x.begin(), x.end()), -1.0f);
  const double clipped =
      std::count_if(x.begin(), x.end(), [](float v) { return std::abs(v) == 1; });
  EXPECT_NEAR(clipped / x.size(), 2.0 / 3.0, 0.002);
  // Below the clipping level the samples are scaled by the overdrive.
  const std::vector<float> small = Tone(1000, 48000, 0.01, 0.25);
  std::vector<float> louder = small;
  ClipPlayback(20 * std::log10(2.0), &louder);
  for (size_t i = 0; i < small.size(); ++i) EXPECT_NEAR(louder[i], 2 * small[i], 1e-6);
}

TEST(PlaybackClippingTest, NoOverdriveLeavesASourceWithinFullScaleAlone) {
  const std::vector<float> x = Tone(1000, 48000, 0.1, 1.0);
  std::vector<float> y = x;
  ClipPlayback(0.0, &y);
  EXPECT_EQ(x, y);
}

}  // namespace
}  // namespace vesk_channel
