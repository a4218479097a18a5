#include "audio/dsp/simd.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

TEST(SimdTest, Transpose4) {
  Float4 rows[4];
  for (int i = 0; i < 4; ++i) {
    for (int j = 0; j < 4; ++j) rows[i][j] = static_cast<float>(10 * i + j);
  }
  Transpose4(rows);
  for (int i = 0; i < 4; ++i) {
    for (int j = 0; j < 4; ++j) EXPECT_EQ(rows[i][j], 10 * j + i) << i << " " << j;
  }
}

// Lane by lane what std::max and std::min give, also for a NaN on either
// side and for zeros of both signs.
// Widening is exact and lane-preserving; narrowing rounds each lane as a
// static_cast does (to nearest, ties to even).
TEST(SimdTest, DoubleConversionsKeepTheLanes) {
  const Float4 v = {1.5f, -2.25f, 3.0e38f, -1.0e-40f};  // The last is subnormal.
  const Double2 low = LowToDouble(v), high = HighToDouble(v);
  EXPECT_EQ(low[0], 1.5);
  EXPECT_EQ(low[1], -2.25);
  EXPECT_EQ(high[0], static_cast<double>(3.0e38f));
  EXPECT_EQ(high[1], static_cast<double>(-1.0e-40f));
  const Double2 a = {1.0 + 0x1p-24, 1.0 + 0x1p-23 + 0x1p-24};  // Ties: down, up.
  const Double2 b = {1.0 / 3.0, -1e300};
  const Float4 narrowed = ToFloat4(a, b);
  EXPECT_EQ(narrowed[0], 1.0f);
  EXPECT_EQ(narrowed[1], 1.0f + 0x1p-22f);
  EXPECT_EQ(narrowed[2], static_cast<float>(1.0 / 3.0));
  EXPECT_EQ(narrowed[3], -std::numeric_limits<float>::infinity());
}

TEST(SimdTest, MaxAndMinAreStdMaxAndMin) {
  const float nan = std::numeric_limits<float>::quiet_NaN();
  const Float4 a = {1.0f, nan, 2.0f, -0.0f};
  const Float4 b = {3.0f, 5.0f, nan, 0.0f};
  const Float4 max = Max4(a, b), min = Min4(a, b);
  for (int l = 0; l < 4; ++l) {
    const float expected_max = std::max(a[l], b[l]), expected_min = std::min(a[l], b[l]);
    EXPECT_EQ(std::isnan(max[l]), std::isnan(expected_max)) << l;
    EXPECT_EQ(std::isnan(min[l]), std::isnan(expected_min)) << l;
    if (!std::isnan(expected_max)) {
      EXPECT_EQ(max[l], expected_max) << l;
    }
    if (!std::isnan(expected_min)) {
      EXPECT_EQ(min[l], expected_min) << l;
    }
    EXPECT_EQ(std::signbit(max[l]), std::signbit(expected_max)) << l;
    EXPECT_EQ(std::signbit(min[l]), std::signbit(expected_min)) << l;
  }
}

}  // namespace
}  // namespace audio_dsp
