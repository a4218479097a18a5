#include "audio/vesknet/dtmf/dtmf_encoder_params.h"

#include <cmath>
#include <string>
#include <vector>

#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

TEST(DtmfEncoderParamsTest, Defaults) {
  DtmfEncoderParams params;
  EXPECT_EQ(GetFrameSize(params), 2208);
  ASSERT_EQ(params.symbol_table.size(), 45u);
  EXPECT_EQ(params.spacer_symbol, 44);
  EXPECT_EQ(params.symbol_table[8], (std::vector<int32_t>{0, 9}));
  EXPECT_EQ(params.symbol_table[9], (std::vector<int32_t>{1, 2}));
  EXPECT_EQ(params.symbol_table[44], (std::vector<int32_t>{8, 9}));
  EXPECT_FLOAT_EQ(GetTokenDurationSeconds(params), 9 * 2208 / 44100.0f);
  const float expected[] = {740.0f,  830.6219f,  932.3416f,  1108.7473f, 1244.5267f,
                            1480.0f, 1661.2438f, 1864.6832f, 2217.4946f, 2489.0535f};
  ASSERT_EQ(params.tone_frequencies.size(), 10u);
  for (int i = 0; i < 10; ++i) EXPECT_NEAR(params.tone_frequencies[i], expected[i], 2e-4);

  params.sample_rate = 48000;  // 150 decimated samples exactly.
  EXPECT_EQ(GetFrameSize(params), 2400);
  params.append_checksum_symbol = true;
  EXPECT_FLOAT_EQ(GetTokenDurationSeconds(params), 10 * 2400 / 48000.0f);
}

TEST(DtmfEncoderParamsTest, Windows) {
  DtmfEncoderParams params;
  SetDefaultWindow(&params);  // Periodic half-sine.
  ASSERT_EQ(params.window_samples.size(), 2208u);
  EXPECT_EQ(params.window_samples[0], 0.0f);
  EXPECT_EQ(params.window_samples[1104], 1.0f);
  EXPECT_NEAR(params.window_samples[2207], std::sin(M_PI / 2208), 1e-7);

  ASSERT_TRUE(SetAdsrWindow(0.01f, 0.01f, 0.02f, 0.01f, 0.5f, &params));
  const std::vector<float>& w = params.window_samples;
  ASSERT_EQ(w.size(), 2208u);
  EXPECT_EQ(w[0], 0.0f);
  EXPECT_NEAR(w[441], 1.0f, 1e-6);   // t = 0.01: end of the attack.
  EXPECT_NEAR(w[882], 0.5f, 1e-6);   // t = 0.02: end of the decay.
  EXPECT_NEAR(w[1764], 0.5f, 1e-6);  // t = 0.04: end of the sustain.
  EXPECT_NEAR(w[2205], 0.0f, 1e-6);  // t = 0.05: end of the release.
  EXPECT_NEAR(w[220], 3 * std::pow(220 / 441.0, 2) - 2 * std::pow(220 / 441.0, 3), 1e-5);
  for (int i = 1; i <= 441; ++i) ASSERT_GT(w[i], w[i - 1]);

  // A zero-length attack takes the smoothstep midpoint at t = 0.
  ASSERT_TRUE(SetAdsrWindow(0, 0, 0.04f, 0.01f, 0.8f, &params));
  EXPECT_EQ(params.window_samples[0], 0.5f);
  EXPECT_EQ(params.window_samples[1], 0.8f);
  // Both ends of [0, 1], a NaN time and a sum equal to the window pass.
  EXPECT_TRUE(SetAdsrWindow(0.01f, 0.01f, 0.02f, 0.01f, 0.0f, &params));
  EXPECT_TRUE(SetAdsrWindow(0.01f, 0.01f, 0.02f, 0.01f, 1.0f, &params));
  EXPECT_TRUE(SetAdsrWindow(std::nanf(""), 0, 0, 0, 1.0f, &params));
  EXPECT_TRUE(SetAdsrWindow(0.025f, 0, 0, 0.025f, 1.0f, &params));
}

TEST(DtmfEncoderParamsTest, AdsrRefusalsAreLoggedAndChangeNothing) {
  DtmfEncoderParams params;
  SetDefaultWindow(&params);
  const std::vector<float> window = params.window_samples;
  DtmfEncoderParams no_rate = params;
  no_rate.sample_rate = 0;
  base::ScopedLogCapture capture;
  EXPECT_FALSE(SetAdsrWindow(0.01f, 0.01f, 0.02f, 0.01f, 0.5f, nullptr));
  EXPECT_FALSE(SetAdsrWindow(0.01f, 0.01f, 0.02f, 0.01f, 0.5f, &no_rate));
  EXPECT_FALSE(SetAdsrWindow(0.01f, -0.01f, 0.02f, 0.01f, 0.5f, &params));
  EXPECT_FALSE(SetAdsrWindow(0.01f, 0.01f, 0.02f, 0.01f, 1.5f, &params));
  EXPECT_FALSE(SetAdsrWindow(0.02f, 0.01f, 0.02f, 0.01f, 0.5f, &params));
  EXPECT_EQ(params.window_samples, window);
  EXPECT_EQ(
      capture.Messages(base::LogSeverity::kError),
      (std::vector<std::string>{"SetAdsrWindow(): Called with null pointer.",
                                "SetAdsrWindow(): Called with invalid sample rate.",
                                "SetAdsrWindow(): Time parameters must be nonnegative.",
                                "SetAdsrWindow(): Sustain amplitude 1.5 is outside of [0, 1].",
                                "SetAdsrWindow(): Nonzero duration 0.06 exceeds 0.05."}));
}

TEST(DtmfEncoderParamsTest, ToneCombinations) {
  std::vector<std::vector<int32_t>> table = {{7}};
  MakeToneCombinations({1, 2, 3, 4}, 3, &table);
  EXPECT_EQ(table, (std::vector<std::vector<int32_t>>{{0, 1, 2}, {0, 1, 3}, {0, 2, 3}, {1, 2, 3}}));
  DtmfEncoderParams params;
  MakeToneCombinations({500, 600, 700, 800, 900}, 2, &params);
  EXPECT_EQ(params.tone_frequencies, (std::vector<float>{500, 600, 700, 800, 900}));
  EXPECT_EQ(params.symbol_table.size(), 10u);
  EXPECT_EQ(params.spacer_symbol, 9);
  ValidateDtmfEncoderParams(params);
}

TEST(DtmfEncoderParamsDeathTest, Validation) {
  DtmfEncoderParams params;
  SetDefaultWindow(&params);
  DtmfEncoderParams p = params;
  p.window_samples.pop_back();
  EXPECT_DEATH(
      ValidateDtmfEncoderParams(p),
      "Check failed: static_cast<int>\\(params.window_samples.size\\(\\)\\) == frame_size");
  p = params;
  p.tone_frequencies[3] = 22050;
  EXPECT_DEATH(ValidateDtmfEncoderParams(p), "Check failed: frequency < nyquist_frequency");
  p = params;
  p.symbol_table.resize(2);
  p.spacer_symbol = 1;
  EXPECT_DEATH(ValidateDtmfEncoderParams(p), "Check failed: params.symbol_table.size\\(\\) >= 3");
  p = params;
  MakeToneCombinations({500, 600, 700, 800}, 2, &p);  // All 6 pairs of 4 tones...
  p.symbol_table.push_back({0, 1});                   // ...and a seventh row.
  EXPECT_DEATH(
      ValidateDtmfEncoderParams(p),
      "Check failed: params.tone_frequencies.size\\(\\) \\* "
      "\\(params.tone_frequencies.size\\(\\) - 1\\) / 2 >= params.symbol_table.size\\(\\)");
}

}  // namespace
}  // namespace audio_vesknet
