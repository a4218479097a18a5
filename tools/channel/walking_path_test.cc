#include "tools/channel/walking_path.h"

#include <cmath>

#include "gtest/gtest.h"
#include "tools/channel/channel_constants.h"

namespace vesk_channel {
namespace {

TEST(WalkingPathTest, SpeedRunsFromApproachingToLeavingThroughTheClosestPoint) {
  const WalkingPath path(1.2, 0.5, 2.0);
  EXPECT_DOUBLE_EQ(path.Distance(2.0), 0.5);
  EXPECT_DOUBLE_EQ(path.RadialSpeed(2.0), 0.0);
  EXPECT_DOUBLE_EQ(path.Gain(2.0), 1.0);
  EXPECT_DOUBLE_EQ(path.ExtraDelay(2.0), 0.0);
  // Pythagoras: 1.2 m/s for 1 s beside 0.5 m gives 1.3 m.
  EXPECT_DOUBLE_EQ(path.Distance(3.0), 1.3);
  EXPECT_DOUBLE_EQ(path.Gain(1.0), 0.5 / 1.3);
  EXPECT_DOUBLE_EQ(path.ExtraDelay(3.0), 0.8 / kSpeedOfSound);
  // The radial speed is the distance's derivative, within +-speed, and
  // changes by 1.66 m/s within the 0.8 s around the closest point.
  for (double t = -3.0; t <= 7.0; t += 0.05) {
    const double h = 1e-6;
    const double derivative = (path.Distance(t + h) - path.Distance(t - h)) / (2 * h);
    EXPECT_NEAR(path.RadialSpeed(t), derivative, 1e-6) << t;
    EXPECT_LE(std::abs(path.RadialSpeed(t)), 1.2);
  }
  EXPECT_NEAR(path.RadialSpeed(1.6), -0.831, 0.001);
  EXPECT_NEAR(path.RadialSpeed(2.4), 0.831, 0.001);
  EXPECT_NEAR(path.RadialSpeed(-100), -1.2, 1e-4);
}

TEST(WalkingPathTest, StandingStillKeepsDistanceAndLevel) {
  const WalkingPath still(0.0, 2.0, 0.0);
  EXPECT_EQ(still.Distance(5.0), 2.0);
  EXPECT_EQ(still.RadialSpeed(5.0), 0.0);
  EXPECT_EQ(still.Gain(-5.0), 1.0);
}

}  // namespace
}  // namespace vesk_channel
