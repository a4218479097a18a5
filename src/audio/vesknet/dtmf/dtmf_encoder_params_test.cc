#include "audio/vesknet/dtmf/dtmf_encoder_params.h"

#include <cmath>
#include <string>
#include <utility>
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
  // Halves round away from zero: 0.03125 x 44288 / 16 = 86.5 -> 87 (not the
  // even 86), and 87.5 -> 88.
  params.window_duration = 0.03125f;
  params.sample_rate = 44288;
  EXPECT_EQ(GetFrameSize(params), 87 * 16);
  params.sample_rate = 44800;
  EXPECT_EQ(GetFrameSize(params), 88 * 16);
  params.window_duration = 0.05f;
  params.sample_rate = 48000;
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
  // Times that add up to one float step above 0.05f (0x1.99999cp-5) pass;
  // the tolerance reaches 0.05f x (1 + 4 x 2^-23), 0x1.9999a6p-5 after
  // rounding, and the next float is refused.
  EXPECT_TRUE(SetAdsrWindow(0.001f, 0.007f, 0.017f, 0.025f, 1.0f, &params));
  EXPECT_TRUE(SetAdsrWindow(0x1.9999a6p-5f, 0, 0, 0, 1.0f, &params));
  base::ScopedLogCapture capture;
  EXPECT_FALSE(SetAdsrWindow(0x1.9999a8p-5f, 0, 0, 0, 1.0f, &params));
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

// Every check, in the order they run, on a record spoilt in one place.
TEST(DtmfEncoderParamsDeathTest, Validation) {
  using Params = DtmfEncoderParams;
  const std::vector<std::pair<void (*)(Params*), const char*>> cases = {
      {[](Params* p) { p->sample_rate = 0; }, "params\\.sample_rate > 0\\.0f"},
      {[](Params* p) { p->baseband_decimation_factor = 0; },
       "params\\.baseband_decimation_factor > 0"},
      {[](Params* p) { p->window_duration = 0; }, "params\\.window_duration > 0\\.0f"},
      {[](Params* p) { p->window_duration = 1e-4f; }, "frame_size > 0"},  // 0.28 -> 0 samples.
      {[](Params* p) { p->window_samples.pop_back(); },
       "static_cast<int>\\(params\\.window_samples\\.size\\(\\)\\) == frame_size"},
      {[](Params* p) { p->window_samples[7] = std::nanf(""); }, "std::isfinite\\(sample\\)"},
      {[](Params* p) { p->window_samples[7] = -0.5f; }, "sample >= 0\\.0"},
      {[](Params* p) { p->tone_frequencies[2] = -1; }, "frequency >= 0\\.0"},
      {[](Params* p) { p->tone_frequencies[3] = 22050; }, "frequency < nyquist_frequency"},
      {[](Params* p) {
         p->symbol_table.resize(2);
         p->spacer_symbol = 1;
       },
       "params\\.symbol_table\\.size\\(\\) >= 3"},
      {[](Params* p) {
         MakeToneCombinations({500, 600, 700, 800}, 2, p);  // All 6 pairs of 4 tones...
         p->symbol_table.push_back({0, 1});                 // ...and a seventh row.
       },
       "params\\.tone_frequencies\\.size\\(\\) \\* "
       "\\(params\\.tone_frequencies\\.size\\(\\) - 1\\) / 2 >= "
       "params\\.symbol_table\\.size\\(\\)"},
      {[](Params* p) { p->tones_per_symbol = 0; }, "params\\.tones_per_symbol > 0"},
      {[](Params* p) { p->symbol_table[5].push_back(3); },
       "static_cast<int>\\(symbol_frequencies\\.size\\(\\)\\) == params\\.tones_per_symbol"},
      {[](Params* p) { p->symbol_table[5][0] = -1; }, "index >= 0"},
      {[](Params* p) { p->symbol_table[5][1] = 10; },
       "index < static_cast<int>\\(params\\.tone_frequencies\\.size\\(\\)\\)"},
      {[](Params* p) { p->spacer_symbol = -1; }, "params\\.spacer_symbol >= 0"},
      {[](Params* p) { p->spacer_symbol = 45; },
       "params\\.spacer_symbol < static_cast<int>\\(params\\.symbol_table\\.size\\(\\)\\)"},
      {[](Params* p) { p->bytes_in_token = 0; }, "params\\.bytes_in_token > 0"},
      {[](Params* p) { p->max_amplitude = 0; }, "params\\.max_amplitude > 0\\.0"},
  };
  Params valid;
  SetDefaultWindow(&valid);
  ValidateDtmfEncoderParams(valid);
  for (const auto& [spoil, text] : cases) {
    Params params = valid;
    spoil(&params);
    EXPECT_DEATH(ValidateDtmfEncoderParams(params), std::string("Check failed: ") + text) << text;
  }
}

}  // namespace
}  // namespace audio_vesknet
