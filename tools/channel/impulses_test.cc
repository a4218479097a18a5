#include "tools/channel/impulses.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "audio/dsp/kiss_fft.h"
#include "gtest/gtest.h"
#include "tools/channel/channel_test_util.h"

namespace vesk_channel {
namespace {

TEST(ImpulsesTest, OnePerIntervalEachAtThePeakLevelInEveryChannel) {
  const int rate = 44100;
  std::vector<std::vector<float>> channels(2, std::vector<float>(10 * rate, 0.0f));
  const std::vector<int64_t> starts = AddImpulses(2.0, 5000.0, rate, 7, &channels);
  ASSERT_EQ(starts.size(), 20u);
  for (size_t k = 0; k < starts.size(); ++k) {
    EXPECT_GE(starts[k], static_cast<int64_t>(k) * rate / 2);
    EXPECT_LT(starts[k], static_cast<int64_t>(k + 1) * rate / 2);
  }
  EXPECT_EQ(channels[0], channels[1]);
  // Each impulse peaks at the requested level, unless its neighbour's tail
  // adds to it (slams last up to 0.7 s).
  int exact = 0;
  for (size_t k = 0; k + 1 < starts.size(); ++k) {
    float peak = 0;
    for (int64_t i = starts[k]; i < starts[k + 1]; ++i)
      peak = std::max(peak, std::abs(channels[0][i]));
    exact += std::abs(peak - 5000.0f) < 1.0f;
    EXPECT_GT(peak, 4000.0f);
  }
  EXPECT_GE(exact, 12);
  // Silence before the first impulse.
  for (int64_t i = 0; i < starts[0]; ++i) ASSERT_EQ(channels[0][i], 0.0f);
}

TEST(ImpulsesTest, ClapsReachHighFrequenciesAndSlamsStayLow) {
  // With ten impulses, some are claps and some slams: the high band of the
  // whole recording holds energy well above the digital floor, and the
  // loudest energy sits below 1 kHz (the slams) as well.
  const int rate = 48000;
  std::vector<std::vector<float>> channels(1, std::vector<float>(10 * rate, 0.0f));
  AddImpulses(1.0, 1000.0, rate, 3, &channels);
  const std::vector<float>& x = channels[0];
  const audio_dsp::RealFFTTransformer fft(static_cast<int>(x.size()), false);
  std::vector<std::complex<float>> spectrum;
  fft.Forward(x, &spectrum);
  const auto band = [&](double low_hz, double high_hz) {
    double energy = 0;
    for (size_t k = 0; k < spectrum.size(); ++k) {
      const double hz = static_cast<double>(k) * rate / x.size();
      if (hz >= low_hz && hz < high_hz) energy += std::norm(spectrum[k]);
    }
    return energy;
  };
  const double low = band(50, 1000), high = band(15000, 16000);
  EXPECT_GT(high, 0.0);
  EXPECT_GT(low, high);
  EXPECT_GT(high, 1e-4 * low);
}

TEST(ImpulsesTest, NoneAtZeroRate) {
  std::vector<std::vector<float>> channels(1, std::vector<float>(8000, 0.0f));
  EXPECT_TRUE(AddImpulses(0.0, 1000.0, 8000, 1, &channels).empty());
  EXPECT_EQ(channels[0], std::vector<float>(8000, 0.0f));
}

}  // namespace
}  // namespace vesk_channel
