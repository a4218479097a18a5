#include "tools/channel/room.h"

#include <cmath>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_channel {
namespace {

TEST(RoomTest, ImpulseResponseHasRequestedDecayAndDirectToReverbRatio) {
  for (double rt60 : {0.3, 0.8}) {
    const std::vector<float> h = MakeRoomImpulseResponse(16000, rt60, 3.0, true, 9);
    ASSERT_EQ(h.size(), static_cast<size_t>(std::ceil(rt60 * 16000)));
    // Schroeder backward integration of the reverberant part; the -5 to
    // -25 dB decay extrapolated to 60 dB.
    std::vector<double> decay(h.size() + 1, 0.0);
    for (size_t i = h.size() - 1; i >= 1; --i) decay[i] = decay[i + 1] + h[i] * h[i];
    EXPECT_NEAR(10 * std::log10(h[0] * h[0] / decay[1]), 3.0, 1e-4);
    const auto time_below = [&](double db) {
      size_t i = 1;
      while (10 * std::log10(decay[i] / decay[1]) > db) ++i;
      return i / 16000.0;
    };
    EXPECT_NEAR(3 * (time_below(-25) - time_below(-5)), rt60, 0.1 * rt60);
  }
}

TEST(RoomTest, SeedChoosesTheRoomAndReflectionsAreOptional) {
  const std::vector<float> a = MakeRoomImpulseResponse(8000, 0.2, 0.0, true, 1);
  EXPECT_EQ(a, MakeRoomImpulseResponse(8000, 0.2, 0.0, true, 1));
  EXPECT_NE(a, MakeRoomImpulseResponse(8000, 0.2, 0.0, true, 2));
  // Without reflections nothing precedes the tail's onset at 1 ms.
  const std::vector<float> plain = MakeRoomImpulseResponse(8000, 0.2, 0.0, false, 1);
  for (int i = 1; i < 8; ++i) EXPECT_EQ(plain[i], 0.0f) << i;
  EXPECT_NE(plain[8], 0.0f);
}

}  // namespace
}  // namespace vesk_channel
