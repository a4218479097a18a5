#include "audio/dsp/narrowband_excision.h"

#include <cmath>
#include <complex>
#include <cstdint>
#include <vector>

#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

constexpr double kPi = 3.14159265358979323846;

// Deterministic white noise of standard deviation `sigma`.
std::vector<float> Noise(size_t n, double sigma, uint32_t seed) {
  std::vector<float> x(n);
  for (float& v : x) {
    double sum = 0;
    for (int k = 0; k < 12; ++k) {  // Irwin-Hall: close enough to Gaussian.
      seed = seed * 1664525u + 1013904223u;
      sum += (seed >> 8) / 16777216.0;
    }
    v = static_cast<float>(sigma * (sum - 6.0));
  }
  return x;
}

void AddTone(double hz, double amplitude, double rate, std::vector<float>* x, size_t begin = 0,
             size_t end = SIZE_MAX) {
  for (size_t i = begin; i < std::min(end, x->size()); ++i) {
    (*x)[i] += static_cast<float>(amplitude * std::sin(2 * kPi * hz * i / rate + 0.3));
  }
}

// Amplitude of `hz` in x[begin, end).
double Amplitude(const std::vector<float>& x, size_t begin, size_t end, double hz, double rate) {
  std::complex<double> sum = 0;
  for (size_t i = begin; i < end; ++i)
    sum += static_cast<double>(x[i]) * std::polar(1.0, -2 * kPi * hz * i / rate);
  return 2 * std::abs(sum) / (end - begin);
}

// Runs the stage over `x` in blocks of `block` frames, as a receiver's front
// does (analysis first, then the notches), and returns what it passes on.
std::vector<float> Excise(NarrowbandExcision* stage, std::vector<float> x, int block = 2048) {
  const int channels = stage->params().num_channels;
  for (size_t start = 0; start < x.size(); start += static_cast<size_t>(block) * channels) {
    const int count = static_cast<int>(std::min<size_t>(block * channels, x.size() - start));
    stage->Analyze(x.data() + start, count);
    stage->Filter(x.data() + start, count);
  }
  return x;
}

NarrowbandExcisionParams DsssBand(float rate) {
  NarrowbandExcisionParams params;
  params.sample_rate = rate;
  params.band_low_hz = 15500;
  params.band_high_hz = 21500;
  return params;
}

TEST(NarrowbandExcisionTest, NotchesASteadyToneAndPassesTheRest) {
  const double rate = 44100;
  NarrowbandExcision stage(DsssBand(rate));
  EXPECT_EQ(stage.analysis_size(), 2048);  // 46 ms, 21.5 Hz per bin.
  std::vector<float> x = Noise(6 * 44100, 100.0, 1);
  AddTone(18603.7, 3000.0, rate, &x);
  // Probes, too weak to be lines (5 dB over the noise in a bin): far from
  // the tone, and at the notch's -3 dB point.
  AddTone(17500.0, 10.0, rate, &x);
  AddTone(18603.7 + 15.0, 10.0, rate, &x);
  const std::vector<float> y = Excise(&stage, x);
  ASSERT_EQ(stage.NotchFrequencies().size(), 1u);
  EXPECT_NEAR(stage.NotchFrequencies()[0], 18603.7, 0.3);
  // After the notch has settled (3 analyses of 0.25 s and its ringing). The
  // output and input hold the same noise, so the ratios are the gains.
  const size_t begin = 2 * 44100, end = 6 * 44100;
  EXPECT_LT(Amplitude(y, begin, end, 18603.7, rate) / 3000.0, 1e-2);  // Over 40 dB down.
  EXPECT_NEAR(Amplitude(y, begin, end, 17500.0, rate) / Amplitude(x, begin, end, 17500.0, rate),
              1.0, 0.01);
  EXPECT_NEAR(20 * std::log10(Amplitude(y, begin, end, 18618.7, rate) /
                              Amplitude(x, begin, end, 18618.7, rate)),
              -3.0, 0.5);
}

TEST(NarrowbandExcisionTest, NotchesALoudToneInTheAudibleBand) {
  // A line among a receiver's tones near 1 kHz: the notch's poles lie close
  // to z = 1, where a recursive filter is most sensitive to rounding.
  NarrowbandExcisionParams params;
  params.band_low_hz = 500;
  params.band_high_hz = 3000;
  NarrowbandExcision stage(params);
  const double rate = 44100;
  std::vector<float> x = Noise(6 * 44100, 30.0, 7);
  AddTone(1203.3, 20000.0, rate, &x);
  AddTone(1000.0, 5.0, rate, &x);  // Probes below line strength, as above.
  AddTone(1203.3 - 15.0, 5.0, rate, &x);
  const std::vector<float> y = Excise(&stage, x);
  ASSERT_EQ(stage.NotchFrequencies().size(), 1u);
  EXPECT_NEAR(stage.NotchFrequencies()[0], 1203.3, 0.3);
  // The gains against the input without the tone, whose leakage would
  // swamp the weak probes.
  std::vector<float> rest = x;
  AddTone(1203.3, -20000.0, rate, &rest);
  const size_t begin = 2 * 44100, end = 6 * 44100;
  EXPECT_LT(Amplitude(y, begin, end, 1203.3, rate) / 20000.0, 1e-2);
  EXPECT_NEAR(Amplitude(y, begin, end, 1000.0, rate) / Amplitude(rest, begin, end, 1000.0, rate),
              1.0, 0.02);
  EXPECT_NEAR(20 * std::log10(Amplitude(y, begin, end, 1188.3, rate) /
                              Amplitude(rest, begin, end, 1188.3, rate)),
              -3.0, 0.5);
}

TEST(NarrowbandExcisionTest, NoiseAloneIsNeverTouched) {
  NarrowbandExcision stage(DsssBand(48000));
  const std::vector<float> x = Noise(60 * 48000, 1000.0, 2);
  EXPECT_EQ(Excise(&stage, x), x);
  EXPECT_FALSE(stage.filtering());
}

TEST(NarrowbandExcisionTest, ToneBurstsThatComeAndGoAreNotSteady) {
  // Symbols of 50 ms on one of ten tones, as a multi-tone modem sends them:
  // a tone is in one analysis in ten, never in three in a row 0.25 s apart.
  NarrowbandExcisionParams params;
  params.band_low_hz = 500;
  params.band_high_hz = 3000;
  params.analysis_interval_s = 0.25f;
  params.confirmations = 3;
  NarrowbandExcision stage(params);
  std::vector<float> x = Noise(20 * 44100, 30.0, 3);
  uint32_t seed = 5;
  for (size_t symbol = 0; symbol * 2205 < x.size(); ++symbol) {
    seed = seed * 1664525u + 1013904223u;
    AddTone(740.0 * std::pow(2.0, (seed >> 16) % 10 / 5.0), 3000.0, 44100, &x, symbol * 2205,
            (symbol + 1) * 2205);
  }
  EXPECT_EQ(Excise(&stage, x), x);
}

TEST(NarrowbandExcisionTest, ProtectedFrequenciesAreNeverNotched) {
  NarrowbandExcisionParams params;
  params.band_low_hz = 500;
  params.band_high_hz = 3000;
  params.protected_hz = {1108.73f, 1244.51f};
  NarrowbandExcision stage(params);
  std::vector<float> x = Noise(3 * 44100, 30.0, 4);
  AddTone(1244.51 + 4.0, 1000.0, 44100, &x);  // Within 10 Hz of a protected tone.
  AddTone(1200.0, 3000.0, 44100, &x);         // 44.5 Hz from it, 10 dB stronger.
  Excise(&stage, x);
  ASSERT_EQ(stage.NotchFrequencies().size(), 1u);
  EXPECT_NEAR(stage.NotchFrequencies()[0], 1200.0, 1.0);
}

TEST(NarrowbandExcisionTest, ConfirmationsBeforeANotchAndReleaseAfterTheLineStops) {
  NarrowbandExcisionParams params = DsssBand(44100);
  params.analysis_interval_s = 0.25f;
  params.confirmations = 3;
  params.release = 4;
  NarrowbandExcision stage(params);
  // A tone from 1 s to 3 s. Analyses read 2048 samples (46 ms) from 0,
  // 0.25, 0.5 ... s: the one from 1.0 s sees the tone first, so the notch
  // comes with the analysis from 1.5 s, done at 1.546 s; the first without
  // the tone reads from 3.0 s, so the notch goes with the fourth, done at
  // 3.796 s.
  std::vector<float> x = Noise(5 * 44100, 100.0, 6);
  AddTone(19000.0, 3000.0, 44100, &x, 44100, 3 * 44100);
  std::vector<bool> notched;
  const int block = 2205;  // 50 ms.
  for (size_t start = 0; start < x.size(); start += block) {
    stage.Analyze(x.data() + start, block);
    stage.Filter(x.data() + start, block);
    notched.push_back(stage.filtering());
  }
  // notched[b] is the state after block b, which ends at (b + 1) x 50 ms.
  const auto state_at = [&](double seconds) {
    return notched[static_cast<size_t>(std::lround(seconds / 0.05)) - 1];
  };
  EXPECT_FALSE(state_at(1.5));
  EXPECT_TRUE(state_at(1.55));
  EXPECT_TRUE(state_at(3.75));
  EXPECT_FALSE(state_at(3.8));
}

TEST(NarrowbandExcisionTest, TheStrongestLinesGetTheNotchesAndCloseLinesAreSeenApart) {
  NarrowbandExcisionParams params = DsssBand(48000);
  params.max_notches = 3;
  NarrowbandExcision stage(params);
  std::vector<float> x = Noise(3 * 48000, 100.0, 7);
  // Two lines 100 Hz apart, and three weaker ones elsewhere.
  AddTone(18500.0, 5000.0, 48000, &x);
  AddTone(18600.0, 4000.0, 48000, &x);
  AddTone(16000.0, 500.0, 48000, &x);
  AddTone(20000.0, 3000.0, 48000, &x);
  AddTone(21000.0, 300.0, 48000, &x);
  Excise(&stage, x);
  const std::vector<float> notches = stage.NotchFrequencies();
  ASSERT_EQ(notches.size(), 3u);
  EXPECT_NEAR(notches[0], 18500.0, 0.5);
  EXPECT_NEAR(notches[1], 18600.0, 0.5);
  EXPECT_NEAR(notches[2], 20000.0, 0.5);
}

TEST(NarrowbandExcisionTest, FrequencyEstimateIsExactForALoneTone) {
  // Anywhere between bins, within a hundredth of a bin (0.2 Hz); 80 dB
  // over the noise in a bin, so that its sidelobes stand over the noise too.
  for (double offset = 0.0; offset < 1.0; offset += 0.125) {
    NarrowbandExcision stage(DsssBand(44100));
    const double hz = (870 + offset) * 44100.0 / 2048;
    std::vector<float> x = Noise(44100, 0.1, 10);
    AddTone(hz, 1000.0, 44100, &x);
    Excise(&stage, x);
    ASSERT_EQ(stage.NotchFrequencies().size(), 1u) << offset;
    EXPECT_NEAR(stage.NotchFrequencies()[0], hz, 0.2) << offset;
  }
}

TEST(NarrowbandExcisionTest, EveryChannelIsNotchedAndResetForgets) {
  NarrowbandExcisionParams params = DsssBand(44100);
  params.num_channels = 2;
  NarrowbandExcision stage(params);
  const std::vector<float> left = Noise(3 * 44100, 100.0, 8);
  const std::vector<float> right = Noise(3 * 44100, 100.0, 9);
  std::vector<float> x;
  for (size_t i = 0; i < left.size(); ++i) {
    const float tone = static_cast<float>(3000.0 * std::sin(2 * kPi * 19500.0 * i / 44100));
    x.insert(x.end(), {left[i] + tone, right[i] + 0.5f * tone});
  }
  const std::vector<float> y = Excise(&stage, x);
  ASSERT_TRUE(stage.filtering());
  for (int c = 0; c < 2; ++c) {
    std::vector<float> channel;
    for (size_t i = c; i < y.size(); i += 2) channel.push_back(y[i]);
    EXPECT_LT(Amplitude(channel, 2 * 44100, 3 * 44100, 19500.0, 44100), 30.0) << c;
  }
  stage.Reset();
  EXPECT_FALSE(stage.filtering());
  EXPECT_TRUE(stage.NotchFrequencies().empty());
}

TEST(NarrowbandExcisionDeathTest, ChecksItsParameters) {
  NarrowbandExcisionParams params;
  params.analysis_size = 1000;
  EXPECT_DEATH(NarrowbandExcision{params}, "Check failed: IsPowerOfTwo\\(analysis_size_\\)");
  params = NarrowbandExcisionParams();
  params.band_low_hz = 3000;
  params.band_high_hz = 2000;
  EXPECT_DEATH(NarrowbandExcision{params},
               "Check failed: params.band_low_hz <= params.band_high_hz");
}

}  // namespace
}  // namespace audio_dsp
