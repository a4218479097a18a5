#include "audio/vesknet/vesknet_util.h"

#include <cmath>
#include <complex>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

using ::testing::ElementsAre;
using ::testing::Pair;

TEST(VesknetUtilTest, FrequencyOffsetsRoundHalfAwayFromZero) {
  std::vector<float> frequencies;
  MakeFrequencyOffsets(10.0f, 25.0f, &frequencies);  // n = round(2.5) = 3.
  EXPECT_THAT(frequencies, ElementsAre(-30, -20, -10, 0, 10, 20, 30));
  MakeFrequencyOffsets(10.0f, 24.0f, &frequencies);
  EXPECT_THAT(frequencies, ElementsAre(-20, -10, 0, 10, 20));
}

TEST(VesknetUtilTest, CircularPadRepeatsOnBothSides) {
  std::vector<float> padded;
  CircularPad({1, 2, 3}, 2, 4, &padded);
  EXPECT_THAT(padded, ElementsAre(2, 3, 1, 2, 3, 1, 2, 3, 1));
  padded = {1, 2};
  CircularPad(padded, 5, 0, &padded);  // In place, a pad longer than the signal.
  EXPECT_THAT(padded, ElementsAre(2, 1, 2, 1, 2, 1, 2));
}

TEST(VesknetUtilTest, BestFilterRowTakesFirstLargestPower) {
  audio_dsp::MatrixXcf matrix(3, 2);
  const std::vector<std::complex<float>> signal = {{1, 0}, {0, 1}};
  EXPECT_THAT(BestFilterRow(matrix, signal), Pair(0, 0.0f));
  matrix(1, 0) = {3, 0};
  matrix(1, 1) = {4, 0};  // Row 1 · signal = 3 + 4i, power 25.
  matrix(2, 0) = {0, 5};  // Row 2 · signal = 5i, power 25: the earlier row wins.
  EXPECT_THAT(BestFilterRow(matrix, signal), Pair(1, 25.0f));
}

TEST(VesknetUtilTest, PhasorRowsArePowers) {
  const std::vector<float> frequencies = {0.0f, 1.0f, -2.5f};
  audio_dsp::MatrixXcf phasors;
  MakePhasorMatrix(M_PI / 8, frequencies, 40, &phasors);
  ASSERT_TRUE(phasors.rows() == 3 && phasors.cols() == 40);
  for (int i = 0; i < 3; ++i) {
    for (int s = 0; s < 40; ++s) {
      const double phase = frequencies[i] * M_PI / 8 * s;
      EXPECT_LT(std::abs(std::complex<double>(phasors(i, s)) - std::polar(1.0, phase)), 1e-6);
    }
  }
}

// The design response is 1 on [−cutoff, e] and tapers to 0 above e, and the
// single centre tap is the response's sum (its inverse DFT at lag 0).
TEST(VesknetUtilTest, ComplexLowpassResponse) {
  const float cutoff = 0.1f, sharpness = 2.5f;  // e = 0.3.
  double sum = 307 + 102 + 1;                   // Ones for k = −102 .. 307.
  for (int k = 308; k <= 512; ++k) sum += std::cos((k / 1024.0 - 0.3) * M_PI / 2 / 0.2);
  const std::vector<std::complex<float>> one = MakeComplexLowpassFilter(1, cutoff, sharpness);
  ASSERT_EQ(one.size(), 1u);
  EXPECT_LT(std::abs(one[0] - std::complex<float>(sum)), 1e-3);

  const std::vector<std::complex<float>> taps = MakeComplexLowpassFilter(61, cutoff, sharpness);
  const std::vector<std::complex<float>> even = MakeComplexLowpassFilter(62, cutoff, sharpness);
  EXPECT_EQ(std::vector<std::complex<float>>(even.begin(), even.end() - 1), taps);
  EXPECT_EQ(even.back(), std::complex<float>());
  // Gain over the 1024-point grid: about 1024 (the grid's scale) in the
  // passband and small well below −cutoff.
  auto gain = [&](double f) {
    std::complex<double> h;
    for (int j = 0; j < 61; ++j)
      h += std::complex<double>(taps[j]) * std::polar(1.0, -2 * M_PI * f * (j - 30));
    return std::abs(h) / 1024;
  };
  EXPECT_NEAR(gain(0.1), 1.0, 0.05);
  EXPECT_LT(gain(-0.3), 0.02);
}

// Three taps: the response's inverse transform at -1, 0 and 1, the outer two
// weighted by the window cos(j pi / (2 half + 2)) = cos(pi / 4).
TEST(VesknetUtilTest, ComplexLowpassTapsAreWindowedImpulse) {
  const double cutoff = 0.1, edge = 0.3;  // Sharpness 2.5.
  auto impulse = [&](int j) {
    std::complex<double> sum;
    for (int k = -511; k <= 512; ++k) {
      const double f = k / 1024.0;
      const double r = f < -cutoff ? 0.0
                       : f <= edge ? 1.0
                                   : std::cos((f - edge) * M_PI / 2 / (0.5 - edge));
      sum += r * std::polar(1.0, 2 * M_PI * j * k / 1024);
    }
    return sum;
  };
  const std::vector<std::complex<float>> taps = MakeComplexLowpassFilter(3, 0.1f, 2.5f);
  ASSERT_EQ(taps.size(), 3u);
  const double w = std::cos(M_PI / 4);
  const std::complex<double> expected[3] = {impulse(-1) * w, impulse(0), impulse(1) * w};
  for (int j = 0; j < 3; ++j) {
    EXPECT_LT(std::abs(std::complex<double>(taps[j]) - expected[j]), 1e-3 * std::abs(expected[j]))
        << j;
  }
}

TEST(VesknetUtilDeathTest, ChecksArguments) {
  std::vector<float> values;
  EXPECT_DEATH(MakeFrequencyOffsets(0.0f, 10.0f, &values), "Check failed: frequency_step > 0.0f");
  EXPECT_DEATH(MakeFrequencyOffsets(1.0f, 10.0f, nullptr), "Check failed: frequencies");
  EXPECT_DEATH(CircularPad({}, 1, 1, &values), "Check failed: !signal.empty\\(\\)");
  EXPECT_DEATH(CircularPad({1}, 1, 1, nullptr), "Check failed: padded_signal");
  EXPECT_DEATH(MakePhasorMatrix(1.0, {1.0f}, 4, nullptr), "Check failed: phasor_matrix");
  EXPECT_DEATH(BestFilterRow(audio_dsp::MatrixXcf(2, 3), {{1, 0}}),
               "Check failed: filter_matrix.cols\\(\\) == signal.size\\(\\)");
}

}  // namespace
}  // namespace audio_vesknet
