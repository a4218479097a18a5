#include "tools/channel/sinc_resampler.h"

#include <cmath>
#include <vector>

#include "gtest/gtest.h"
#include "tools/channel/channel_constants.h"

namespace vesk_channel {
namespace {

std::vector<float> Tone(double frequency, double rate, double seconds, double amplitude) {
  std::vector<float> x(static_cast<size_t>(std::lround(seconds * rate)));
  for (size_t i = 0; i < x.size(); ++i) x[i] = amplitude * std::sin(2 * kPi * frequency * i / rate);
  return x;
}

// Amplitude and phase of `frequency` in y[begin, end) by correlation.
double Amplitude(const std::vector<float>& y, size_t begin, size_t end, double frequency,
                 double rate) {
  double re = 0, im = 0;
  for (size_t i = begin; i < end; ++i) {
    re += y[i] * std::cos(2 * kPi * frequency * i / rate);
    im += y[i] * std::sin(2 * kPi * frequency * i / rate);
  }
  return 2 * std::hypot(re, im) / (end - begin);
}

TEST(SincResamplerTest, KeepsFrequencyAndAmplitudeInBandAndRemovesAliases) {
  struct Case {
    double source_rate, frequency, output_rate;
  };
  // 23 kHz lies above 44.1 kHz's Nyquist frequency: removed, not aliased.
  for (const Case& c : {Case{48000, 5000, 44100}, Case{48000, 20000, 44100},
                        Case{44100, 7000, 48000}, Case{48000, 23000, 44100}}) {
    const double step = c.source_rate / c.output_rate;
    const SincResampler resampler(step);
    const std::vector<float> x = Tone(c.frequency, c.source_rate, 1.0, 1.0);
    const int64_t count = static_cast<int64_t>(x.size() / step);
    std::vector<float> y(count);
    resampler.Process(x, 0.0, 2.0f, count, y.data());
    SCOPED_TRACE(c.frequency);
    const size_t begin = 1000, end = y.size() - 1000;
    if (c.frequency > c.output_rate / 2) {
      double power = 0;
      for (size_t i = begin; i < end; ++i) power += y[i] * y[i];
      EXPECT_LT(std::sqrt(2 * power / (end - begin)), 2.0 * 1e-4);
      continue;
    }
    EXPECT_NEAR(Amplitude(y, begin, end, c.frequency, c.output_rate), 2.0, 0.003 * 2.0);
  }
}

TEST(SincResamplerTest, ReadingAtPositionsMatchesTheFixedStepAndFollowsAChirp) {
  const double step = 48000.0 / 44100.0;
  const SincResampler resampler(step);
  const std::vector<float> x = Tone(3000, 48000, 0.5, 0.5);
  const int64_t count = 20000;
  std::vector<float> fixed(count), at(count);
  resampler.Process(x, -100.5, 3.0f, count, fixed.data());
  std::vector<double> positions(count);
  for (int64_t k = 0; k < count; ++k) positions[k] = -100.5 + static_cast<double>(k) * step;
  resampler.ProcessAt(x, positions, std::vector<float>(count, 3.0f), at.data());
  EXPECT_EQ(fixed, at);
  // Before the input's first sample (beyond the kernel's reach) all zero.
  EXPECT_EQ(fixed[0], 0.0f);

  // Positions advancing 1 % faster read the tone 1 % higher, with per-sample
  // gains applied.
  std::vector<float> gains(count);
  for (int64_t k = 0; k < count; ++k) {
    positions[k] = 1.01 * step * k;
    gains[k] = k < count / 2 ? 1.0f : 0.25f;
  }
  resampler.ProcessAt(x, positions, gains, at.data());
  EXPECT_NEAR(Amplitude(at, 1000, 9000, 3030, 44100), 0.5, 0.005);
  EXPECT_NEAR(Amplitude(at, 11000, 19000, 3030, 44100), 0.125, 0.002);
  EXPECT_LT(Amplitude(at, 1000, 9000, 3000, 44100), 0.05);
}

}  // namespace
}  // namespace vesk_channel
