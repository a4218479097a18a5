#include "tools/channel/noise.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_channel {
namespace {

double Rms(const std::vector<int16_t>& x) {
  double sum = 0;
  for (int16_t v : x) sum += static_cast<double>(v) * v;
  return std::sqrt(sum / x.size());
}

TEST(RoundToPcm16Test, RoundsHalvesAwayAndClips) {
  EXPECT_EQ(RoundToPcm16(2.5f), 3);
  EXPECT_EQ(RoundToPcm16(-2.5f), -3);
  EXPECT_EQ(RoundToPcm16(2.49f), 2);
  EXPECT_EQ(RoundToPcm16(32766.6f), 32767);
  EXPECT_EQ(RoundToPcm16(1e9f), 32767);
  EXPECT_EQ(RoundToPcm16(-32768.4f), -32768);
  EXPECT_EQ(RoundToPcm16(-1e9f), -32768);
  EXPECT_EQ(RoundToPcm16(NAN), -32768);
}

TEST(MakeNoiseTest, LevelChannelsSeedAndClipping) {
  const std::vector<int16_t> noise = MakeNoise(2.0, 8000, 1000, 1, 2);
  ASSERT_EQ(noise.size(), 32000u);
  EXPECT_NEAR(Rms(noise), 1000, 10);
  EXPECT_EQ(noise, MakeNoise(2.0, 8000, 1000, 1, 2));
  EXPECT_NE(noise, MakeNoise(2.0, 8000, 1000, 2, 2));
  const std::vector<int16_t> loud = MakeNoise(0.1, 8000, 1e6, 1);
  EXPECT_EQ(*std::max_element(loud.begin(), loud.end()), 32767);
}

TEST(AddWhiteNoiseTest, AddsTheRequestedLevelAndNothingAtZero) {
  std::vector<float> x(100000, 5.0f);
  AddWhiteNoise(0.0, 1, &x);
  EXPECT_EQ(x, std::vector<float>(100000, 5.0f));
  AddWhiteNoise(30.0, 1, &x);
  double mean = 0, square = 0;
  for (float v : x) mean += v;
  mean /= x.size();
  for (float v : x) square += (v - mean) * (v - mean);
  EXPECT_NEAR(mean, 5.0, 0.3);
  EXPECT_NEAR(std::sqrt(square / x.size()), 30.0, 0.3);
}

}  // namespace
}  // namespace vesk_channel
