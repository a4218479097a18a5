#include "audio/dsp/gamma_filter.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

TEST(GammaFilterTest, FromStddevKnownValues) {
  const GammaFilter filter = GammaFilterFromStddev(8000.0, 1, 2.0);
  EXPECT_NEAR(filter.decay(), 0.6096118, 1e-6);    // (1 - sqrt 17) / 8 + 1.
  EXPECT_EQ(filter.Delay(), 2);                    // round(1.5616)
  EXPECT_EQ(GammaFilter(1.0, 2, 0.2).Delay(), 1);  // 0.5 rounds away from zero.
  EXPECT_DEATH(GammaFilter(0.0, 1, 0.5), "Check failed: sample_rate > 0\\.0");
  EXPECT_DEATH(GammaFilter(1.0, 0, 0.5), "Check failed: order >= 1");
}

TEST(GammaFilterTest, ImpulseResponseHasUnitGainAndRequestedWidth) {
  GammaFilter filter = GammaFilterFromStddev(16000.0, 3, 5.0);
  double sum = 0, mean = 0, second = 0;
  for (int n = 0; n < 2000; ++n) {
    const double y = filter.Step(n == 0 ? 1.0f : 0.0f);
    sum += y;
    mean += n * y;
    second += n * n * y;
  }
  EXPECT_NEAR(sum, 1.0, 1e-4);  // Unit DC gain.
  EXPECT_NEAR(second - mean * mean, 25.0, 1e-2);
  EXPECT_EQ(filter.Delay(), std::lround(mean));
  filter.Reset();
  EXPECT_NEAR(filter.Step(1.0f), std::pow(1.0 - filter.decay(), 3), 1e-6);
  // Reset to a value: that value passes unchanged, as after a steady input.
  filter.Reset(2.5f);
  EXPECT_FLOAT_EQ(filter.Step(2.5f), 2.5f);
  EXPECT_LT(filter.Step(0.0f), 2.5f);
}

// Each stage is stored as float and the next stage reads the stored value.
// Two stages of decay 0.3 (gain 0.7) given an impulse: the exact response is
// 0.49 (n + 1) 0.3^n; the expected values are that recursion with every stage
// rounded to float, worked out apart from this code. A state kept in double
// gives other last bits (0x1.f5c29p-2 first).
TEST(GammaFilterTest, StagesAreRoundedToFloat) {
  GammaFilter filter(1.0, 2, 0.3);
  const float expected[] = {0x1.f5c28ep-2f, 0x1.2d0e56p-2f, 0x1.0ef34ep-3f, 0x1.b1854ap-5f,
                            0x1.4523f8p-6f};
  for (int n = 0; n < 5; ++n) {
    const float y = filter.Step(n == 0 ? 1.0f : 0.0f);
    EXPECT_EQ(y, expected[n]) << n;
    EXPECT_NEAR(y, 0.49 * (n + 1) * std::pow(0.3, n), 1e-7) << n;
  }
}

// Process is Step over an array, whatever the order, also in place and
// writing behind its input, as the DTMF noise smoother does.
TEST(GammaFilterTest, ProcessEqualsStep) {
  std::vector<float> input(300);
  uint32_t seed = 3;
  for (float& x : input) {
    seed = seed * 1664525u + 1013904223u;
    x = static_cast<float>(seed >> 8) / 16777216.0f;
  }
  for (int order = 1; order <= 6; ++order) {
    GammaFilter stepped(1.0, order, 0.9), processed(1.0, order, 0.9);
    stepped.Reset(0.25f);
    processed.Reset(0.25f);
    std::vector<float> expected;
    for (const float x : input) expected.push_back(stepped.Step(x));
    std::vector<float> output(input.size());
    processed.Process(input.data(), 100, output.data());
    processed.Process(input.data() + 100, 50, nullptr);  // Outputs dropped.
    // The rest 7 places further on, the outputs written 7 places behind.
    std::vector<float> shifted(input.size() + 7);
    std::copy(input.begin() + 150, input.end(), shifted.begin() + 157);
    processed.Process(shifted.data() + 157, 150, shifted.data() + 150);
    for (int i = 0; i < 100; ++i) ASSERT_EQ(output[i], expected[i]) << order << " " << i;
    for (int i = 150; i < 300; ++i) ASSERT_EQ(shifted[i], expected[i]) << order << " " << i;
    EXPECT_EQ(stepped.Step(1.0f), processed.Step(1.0f)) << order;  // The same state after.
  }
}

}  // namespace
}  // namespace audio_dsp
