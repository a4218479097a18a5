#include "tools/channel/agc.h"

#include <cmath>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_channel {
namespace {

// The frames at which the target gain changes: where the gain's slope jumps
// (by far more than it bends along an attack or release), at least 0.1 s
// apart.
std::vector<int64_t> Steps(const std::vector<double>& gain, int rate) {
  std::vector<int64_t> steps;
  for (size_t i = 1; i + 1 < gain.size(); ++i) {
    const double before = gain[i] - gain[i - 1], after = gain[i + 1] - gain[i];
    if (std::abs(after - before) > 0.002 &&
        (steps.empty() || static_cast<int64_t>(i) > steps.back() + rate / 10)) {
      steps.push_back(i);
    }
  }
  return steps;
}

TEST(AgcTest, StepsOnceAnIntervalWithAttackAndReleaseTimeConstants) {
  AgcParams params;
  params.step_db = 20;
  params.interval_s = 2.0;
  const int rate = 8000;
  const std::vector<double> gain = AgcGainDb(params, rate, 10 * rate, 5);
  const std::vector<int64_t> steps = Steps(gain, rate);
  ASSERT_EQ(steps.size(), 5u);
  for (size_t k = 0; k < steps.size(); ++k) {
    // One step in each 2 s interval.
    EXPECT_GE(steps[k], static_cast<int64_t>(k) * 2 * rate);
    EXPECT_LT(steps[k], static_cast<int64_t>(k + 1) * 2 * rate);
    const int64_t s = steps[k];
    if (k % 2 == 0) {
      // Down to -20 dB with the 10 ms attack: 1 - 1/e of the way after one
      // time constant (from where the last release had got to).
      const double from = gain[s - 1];
      EXPECT_NEAR(gain[s + rate / 100], from + (-20 - from) * (1 - std::exp(-1.0)), 0.05);
    } else {
      // Back up with the 0.5 s release.
      const double from = gain[s - 1];
      EXPECT_NEAR(gain[s + rate / 2], from * std::exp(-1.0), 0.1);
    }
  }
  EXPECT_NEAR(gain[0], 0.0, 1e-12);
  for (double g : gain) {
    EXPECT_LE(g, 1e-12);
    EXPECT_GE(g, -20 - 1e-12);
  }
}

TEST(AgcTest, AppliesTheSameGainToEveryChannelAndNoneWhenOff) {
  AgcParams params;
  params.step_db = 12;
  params.interval_s = 0.5;
  std::vector<std::vector<float>> channels(2, std::vector<float>(8000, 1000.0f));
  channels[1].assign(8000, -10.0f);
  ApplyAgc(params, 8000, 3, &channels);
  const std::vector<double> gain = AgcGainDb(params, 8000, 8000, 3);
  for (size_t i = 0; i < 8000; i += 97) {
    EXPECT_NEAR(channels[0][i], 1000 * std::pow(10, gain[i] / 20), 1e-3);
    EXPECT_NEAR(channels[1][i], -10 * std::pow(10, gain[i] / 20), 1e-5);
  }
  params.step_db = 0;
  std::vector<std::vector<float>> untouched(1, std::vector<float>(100, 7.0f));
  ApplyAgc(params, 8000, 3, &untouched);
  EXPECT_EQ(untouched[0], std::vector<float>(100, 7.0f));
}

}  // namespace
}  // namespace vesk_channel
