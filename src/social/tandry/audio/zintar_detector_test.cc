#include "social/tandry/audio/zintar_detector.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <random>
#include <vector>

#include "gtest/gtest.h"

namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr int kCodeSamples = 2032;  // One code period at 48000 Hz.

ZintarConfig StandardConfig(int32_t rate = 48000) {
  ZintarConfig config;
  SetStandardZintarConfig(rate, &config);
  return config;
}

// Owns a detector and its state.
struct Zintar {
  explicit Zintar(const ZintarConfig& config)
      : detector(CreateZintarDetector(&config)), state(CreateZintarState(&config, detector)) {}
  ~Zintar() {
    FreeZintarState(state);
    FreeZintarDetector(detector);
  }
  float Process(const std::vector<int16_t>& x, size_t begin, size_t end) {
    float score = -1.0f;
    ZintarProcess(detector, state, x.data() + begin, static_cast<int32_t>(end - begin), &score);
    return score;
  }
  // Feeds `x` in calls of `call` samples and returns each call's score.
  std::vector<float> Scores(const std::vector<int16_t>& x, size_t call) {
    std::vector<float> scores;
    for (size_t i = 0; i < x.size(); i += call) {
      scores.push_back(Process(x, i, std::min(x.size(), i + call)));
    }
    return scores;
  }
  ZintarDetector* detector;
  ZintarState* state;
};

// The reference pattern as a real baseband sequence (linearly interpolated,
// 256 values per 2032 input samples) on a carrier of 18496.0625 Hz at 48000 Hz.
std::vector<int16_t> ReferenceSignal(int num_samples, double amplitude) {
  std::vector<int16_t> x(num_samples);
  for (int n = 0; n < num_samples; ++n) {
    const double t = n * 256.0 / kCodeSamples;
    const int k = static_cast<int>(t);
    const double frac = t - k;
    const double p = (1 - frac) * kZintarReferencePattern[k % 256] +
                     frac * kZintarReferencePattern[(k + 1) % 256];
    x[n] = static_cast<int16_t>(
        std::lround(amplitude * p * std::cos(2 * kPi * 18496.0625 * n / 48000)));
  }
  return x;
}

std::vector<int16_t> Noise(int num_samples, double sigma, unsigned seed) {
  std::mt19937 rng(seed);
  std::normal_distribution<double> normal(0.0, sigma);
  std::vector<int16_t> x(num_samples);
  for (auto& s : x)
    s = static_cast<int16_t>(std::lround(std::clamp(normal(rng), -32768.0, 32767.0)));
  return x;
}

TEST(ZintarDetectorTest, RefusesInvalidConfigurations) {
  const std::vector<void (*)(ZintarConfig*)> breaks = {
      [](ZintarConfig* c) { c->sample_rate = 0; },
      [](ZintarConfig* c) { c->center_frequency = 24000.5f; },
      [](ZintarConfig* c) { c->center_frequency = -1.0f; },
      [](ZintarConfig* c) { c->sample_rate = 36991; },  // r / 2 = 18495 < centre.
      [](ZintarConfig* c) { c->block_size = 4096; },
      [](ZintarConfig* c) { c->block_size = 100; },
      [](ZintarConfig* c) { c->block_size = 0; },
      [](ZintarConfig* c) { c->reference_pattern = nullptr; },
      [](ZintarConfig* c) { c->history_blocks = 0; },
      [](ZintarConfig* c) { c->history_blocks = 65; },
      [](ZintarConfig* c) { c->peaks_per_block = 0; },
      [](ZintarConfig* c) { c->peaks_per_block = 65; },
      [](ZintarConfig* c) { c->peak_spread = -1; },
      [](ZintarConfig* c) { c->peak_spread = 128; },
      [](ZintarConfig* c) { c->scaled_baseband_rate = 0; },
      [](ZintarConfig* c) { c->scaled_input_rate = c->scaled_baseband_rate - 1; },
      [](ZintarConfig* c) { SetStandardZintarConfig(2000000, c); },  // r * 2032 overflows.
  };
  const ZintarConfig good = StandardConfig();
  ZintarDetector* detector = CreateZintarDetector(&good);
  ASSERT_NE(detector, nullptr);
  for (size_t i = 0; i < breaks.size(); ++i) {
    ZintarConfig config = good;
    breaks[i](&config);
    EXPECT_EQ(CreateZintarDetector(&config), nullptr) << "case " << i;
    EXPECT_EQ(CreateZintarState(&config, detector), nullptr) << "case " << i;
  }
  EXPECT_EQ(CreateZintarDetector(nullptr), nullptr);
  EXPECT_EQ(CreateZintarState(&good, nullptr), nullptr);
  ZintarConfig other = good;
  other.peaks_per_block = 2;  // Valid, but not what the detector was built for.
  EXPECT_EQ(CreateZintarState(&other, detector), nullptr);

  // Edge values are accepted: centre exactly r / 2, W = N / 2 - 1, D = B.
  ZintarConfig edge = good;
  edge.center_frequency = 24000.0f;
  edge.peak_spread = 127;
  edge.scaled_input_rate = edge.scaled_baseband_rate;
  ZintarDetector* edge_detector = CreateZintarDetector(&edge);
  ZintarState* edge_state = CreateZintarState(&edge, edge_detector);
  EXPECT_NE(edge_state, nullptr);
  FreeZintarState(edge_state);
  FreeZintarDetector(edge_detector);
  FreeZintarDetector(detector);
  FreeZintarState(nullptr);
  FreeZintarDetector(nullptr);
}

TEST(ZintarDetectorTest, FrontEndPlan) {
  struct Case {
    int32_t rate, stages, modulus;
  };
  for (const Case& c :
       {Case{48000, 2, 49152000}, Case{44100, 2, 49152000}, Case{96000, 3, 98304000},
        Case{16000, 1, 24576000}, Case{8000, 0, 12288000}}) {
    ZintarConfig config = StandardConfig(c.rate);
    config.center_frequency = 1000.0f;  // Below every rate's Nyquist frequency.
    Zintar z(config);
    ASSERT_NE(z.state, nullptr);
    ZintarDetectorInfo info;
    GetZintarDetectorInfo(z.detector, &info);
    EXPECT_EQ(info.num_half_band_stages, c.stages) << c.rate;
    EXPECT_EQ(info.stage0_modulus, c.modulus) << c.rate;
    EXPECT_EQ(info.stage0_step, c.rate * 2032 - c.modulus) << c.rate;
  }
  Zintar z(StandardConfig(48000));
  ZintarDetectorInfo info;
  GetZintarDetectorInfo(z.detector, &info);
  EXPECT_NEAR(static_cast<double>(info.stage0_modulus + info.stage0_step) / info.stage0_modulus,
              1.984, 1e-3);
  // -18496.0625 / 48000 turns, as a fraction of 2^32.
  EXPECT_NEAR(info.mixer_phase_increment, (1.0 - 18496.0625 / 48000) * 4294967296.0, 1.0);
}

TEST(ZintarDetectorTest, FftInvertsAndMatchesDirectDft) {
  std::mt19937 rng(7);
  std::uniform_real_distribution<float> uniform(-1.0f, 1.0f);
  for (int n : {1, 2, 4, 8, 16, 32, 64, 128, 256, 2048}) {
    ZintarFftPlan* plan = CreateZintarFftPlan(n);
    ASSERT_NE(plan, nullptr);
    std::vector<float> x(2 * n);
    for (float& v : x) v = uniform(rng);
    std::vector<float> y = x;
    ZintarFftForward(plan, y.data());
    double worst = 0;
    for (int k = 0; k < n; ++k) {
      std::complex<double> sum = 0;
      for (int j = 0; j < n; ++j) {
        sum += std::complex<double>(x[2 * j], x[2 * j + 1]) * std::polar(1.0, -2 * kPi * j * k / n);
      }
      worst = std::max(worst, std::abs(sum - std::complex<double>(y[2 * k], y[2 * k + 1])));
    }
    EXPECT_LT(worst, 1e-5 * n) << n;
    ZintarFftInverse(plan, y.data());
    for (int i = 0; i < 2 * n; ++i) ASSERT_NEAR(y[i], n * x[i], 1e-5 * n) << n;
    FreeZintarFftPlan(plan);
  }
  EXPECT_EQ(CreateZintarFftPlan(0), nullptr);
  EXPECT_EQ(CreateZintarFftPlan(48), nullptr);
}

TEST(ZintarDetectorTest, ReferencePatternHasUnitPower) {
  double sum = 0;
  for (float v : kZintarReferencePattern) sum += static_cast<double>(v) * v;
  EXPECT_NEAR(sum, 256.0, 1e-3);
  EXPECT_EQ(kZintarReferencePattern[0], -1.0f);
  EXPECT_EQ(kZintarReferencePattern[255], 0.4437927f);
}

TEST(ZintarDetectorTest, SilenceAndPartialBlocksScoreZero) {
  Zintar z(StandardConfig());
  // 1000 samples give about 126 baseband samples: no block yet.
  const std::vector<int16_t> loud = ReferenceSignal(1000, 8000);
  EXPECT_EQ(z.Process(loud, 0, loud.size()), 0.0f);
  EXPECT_EQ(z.Process(loud, 0, 0), 0.0f);
  Zintar quiet(StandardConfig());
  const std::vector<int16_t> zeros(20 * kCodeSamples, 0);
  for (float score : quiet.Scores(zeros, 3000)) EXPECT_EQ(score, 0.0f);
}

TEST(ZintarDetectorTest, SplittingCallsKeepsBlockScores) {
  std::vector<int16_t> x = Noise(12 * kCodeSamples, 1000, 3);
  const std::vector<int16_t> signal = ReferenceSignal(4 * kCodeSamples, 6000);
  for (size_t i = 0; i < signal.size(); ++i) x[3 * kCodeSamples + i] += signal[i];

  Zintar whole(StandardConfig());
  const float one_call = whole.Process(x, 0, x.size());
  EXPECT_GT(one_call, 25.0f);
  // Odd call sizes, including ones smaller and larger than a mixer chunk.
  Zintar split(StandardConfig());
  float best = 0.0f;
  size_t i = 0;
  for (size_t step : {1, 63, 65, 1000, 5, 4096, 129, 7}) {
    best = std::max(best, split.Process(x, i, i + step));
    i += step;
  }
  for (float score : split.Scores(std::vector<int16_t>(x.begin() + i, x.end()), 777)) {
    best = std::max(best, score);
  }
  EXPECT_EQ(best, one_call);
}

TEST(ZintarDetectorTest, ReferenceSignalStandsOutOfNoise) {
  for (unsigned seed : {11u, 12u}) {
    Zintar z(StandardConfig());
    const std::vector<int16_t> noise = Noise(60 * kCodeSamples, 2000, seed);
    float noise_max = 0.0f;
    for (float score : z.Scores(noise, 1000)) noise_max = std::max(noise_max, score);
    EXPECT_LT(noise_max, 25.0f);
    EXPECT_GT(noise_max, 0.0f);

    const std::vector<int16_t> signal = ReferenceSignal(8 * kCodeSamples, 8000);
    std::vector<float> scores = z.Scores(signal, 1000);
    const float signal_max = *std::max_element(scores.begin(), scores.end());
    EXPECT_GT(signal_max, 60.0f);
    EXPECT_LE(signal_max, 256.0f);
  }
}

TEST(ZintarDetectorTest, HistoryAveragesAndForgets) {
  ZintarConfig config = StandardConfig();
  config.history_blocks = 4;
  config.peaks_per_block = 3;
  config.peak_spread = 2;
  Zintar z(config);
  ASSERT_NE(z.state, nullptr);
  const std::vector<int16_t> signal = ReferenceSignal(10 * kCodeSamples, 8000);
  const std::vector<float> on = z.Scores(signal, kCodeSamples);
  EXPECT_GT(on.back(), 60.0f);
  EXPECT_LE(on.back(), 256.5f);
  // The first block after the signal still carries three signal blocks.
  const std::vector<int16_t> zeros(8 * kCodeSamples, 0);
  const std::vector<float> off = z.Scores(zeros, kCodeSamples);
  EXPECT_GT(off[1], 25.0f);
  EXPECT_NEAR(off.back(), 0.0f, 1e-3f);
}

}  // namespace
