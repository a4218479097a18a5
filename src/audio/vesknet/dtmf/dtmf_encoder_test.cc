#include "audio/vesknet/dtmf/dtmf_encoder.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "audio/vesknet/vesknet_encoder.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

using Symbols = std::vector<int32_t>;

float Peak(const std::vector<float>& samples) {
  float peak = 0;
  for (const float s : samples) peak = std::max(peak, std::fabs(s));
  return peak;
}

// Indices of the two default tones with the largest projections on frame
// `index` (2208 samples at 44100 Hz), in increasing order; asserts that they
// stand 20 times above the rest.
std::vector<int32_t> LoudestTwoTones(const std::vector<float>& audio, int index) {
  const std::vector<float> tones = DtmfEncoderParams().tone_frequencies;
  std::vector<std::pair<double, int32_t>> magnitudes;
  for (int32_t k = 0; k < 10; ++k) {
    double re = 0, im = 0;
    for (int i = 0; i < 2208; ++i) {
      re += audio[index * 2208 + i] * std::cos(2 * M_PI * tones[k] * i / 44100);
      im += audio[index * 2208 + i] * std::sin(2 * M_PI * tones[k] * i / 44100);
    }
    magnitudes.push_back({std::hypot(re, im), k});
  }
  std::sort(magnitudes.rbegin(), magnitudes.rend());
  EXPECT_GT(magnitudes[1].first, 20 * magnitudes[2].first) << "frame " << index;
  return {std::min(magnitudes[0].second, magnitudes[1].second),
          std::max(magnitudes[0].second, magnitudes[1].second)};
}

TEST(DtmfEncoderTest, DefaultTokenIsNineFramesOfTwoTones) {
  const DtmfEncoder encoder{DtmfEncoderParams()};
  ASSERT_EQ(encoder.frame_size(), 2208);
  const std::vector<uint8_t> token = {0x01, 0x23, 0x45, 0x67, 0x89};
  std::vector<float> audio = {3};
  encoder.EncodeToken(token, &audio);
  ASSERT_EQ(audio.size(), 9u * 2208);
  EXPECT_EQ(Peak(audio), 1.0f);
  Symbols on_air = encoder.converter().BytesToSymbols(token);
  on_air.insert(on_air.begin(), 44);  // The leading spacer.
  for (int frame = 0; frame < 9; ++frame) {
    EXPECT_EQ(audio[frame * 2208], 0.0f);  // The half-sine window starts at zero.
    EXPECT_EQ(LoudestTwoTones(audio, frame), encoder.params().symbol_table[on_air[frame]]);
  }
}

// Every frame is the window times the plain sum of its symbol's tones, each
// sin(i x 2 pi f / sample_rate) from phase zero at the frame's first sample,
// the whole token scaled to a peak of max_amplitude.
TEST(DtmfEncoderTest, FramesAreWindowedSumsOfSinesFromPhaseZero) {
  DtmfEncoderParams params;
  params.max_amplitude = 0.8f;
  const DtmfEncoder encoder(params);
  const std::vector<uint8_t> token = {0xA5, 0x00, 0x3C, 0xFF, 0x12};
  std::vector<float> audio;
  encoder.EncodeToken(token, &audio);
  Symbols on_air = encoder.converter().BytesToSymbols(token);
  on_air.insert(on_air.begin(), 44);
  const int n = 2208;
  ASSERT_EQ(audio.size(), on_air.size() * n);
  std::vector<double> expected;
  double peak = 0.0;
  for (const int32_t symbol : on_air) {
    for (int i = 0; i < n; ++i) {
      double sum = 0.0;
      for (const int32_t tone : params.symbol_table[symbol]) {
        sum += std::sin(i * 2 * M_PI * params.tone_frequencies[tone] / 44100);
      }
      expected.push_back(sum * std::sin(M_PI * i / n));  // The half-sine window.
      peak = std::max(peak, std::fabs(expected.back()));
    }
  }
  for (size_t i = 0; i < audio.size(); ++i) {
    ASSERT_NEAR(audio[i], 0.8 * expected[i] / peak, 2e-4)
        << "frame " << i / n << " sample " << i % n;
  }
}

TEST(DtmfEncoderTest, ChecksumFrameAndAmplitude) {
  DtmfEncoderParams params;
  params.append_checksum_symbol = true;
  params.max_amplitude = 0.5f;
  const Symbols message = {43, 43, 10, 4, 0, 0, 0, 0};  // Sums to 100.
  ASSERT_EQ(ChecksumSymbol(45, message), 32);           // (44 - 100 mod 44) mod 44.
  std::vector<float> audio;
  DtmfEncoder(params).EncodeSymbols(message, &audio);
  ASSERT_EQ(audio.size(), 10u * 2208);
  EXPECT_EQ(Peak(audio), 0.5f);
  EXPECT_EQ(LoudestTwoTones(audio, 9), params.symbol_table[32]);
}

TEST(DtmfEncoderTest, ValidSymbolSequences) {
  const DtmfEncoder encoder{DtmfEncoderParams()};
  EXPECT_TRUE(encoder.IsValidSymbolSequence(Symbols(8, 0)));
  EXPECT_TRUE(encoder.IsValidSymbolSequence({11, 35, 43, 1, 4, 23, 19, 3}));   // 256^5 - 1.
  EXPECT_FALSE(encoder.IsValidSymbolSequence({12, 35, 43, 1, 4, 23, 19, 3}));  // 256^5.
  EXPECT_FALSE(encoder.IsValidSymbolSequence(Symbols(8, 43)));
  EXPECT_FALSE(encoder.IsValidSymbolSequence(Symbols(9, 0)));
  EXPECT_FALSE(encoder.IsValidSymbolSequence({0, -1, 0, 0, 0, 0, 0, 0}));
  EXPECT_FALSE(encoder.IsValidSymbolSequence({0, 45, 0, 0, 0, 0, 0, 0}));
  EXPECT_FALSE(encoder.IsValidSymbolSequence({0, 44, 0, 0, 0, 0, 0, 0}));  // The spacer.
}

TEST(DtmfEncoderTest, SilentWindowIsNotScaled) {
  DtmfEncoderParams params;
  params.window_samples.assign(2208, 0.0f);
  std::vector<float> audio;
  DtmfEncoder(params).EncodeToken({9, 8, 7, 6, 5}, &audio);
  ASSERT_EQ(audio.size(), 9u * 2208);
  EXPECT_EQ(Peak(audio), 0.0f);
}

TEST(DtmfEncoderDeathTest, Preconditions) {
  DtmfEncoderParams params;
  params.symbol_table.resize(2);
  params.sample_rate = -1;  // The alphabet is refused before the record is checked.
  EXPECT_DEATH(DtmfEncoder{params}, "Check failed: alphabet_size >= 3");
  params.symbol_table.resize(3);
  EXPECT_DEATH(DtmfEncoder{params}, "Check failed: params.sample_rate > 0.0f");
  const DtmfEncoder encoder{DtmfEncoderParams()};
  std::vector<float> audio;
  EXPECT_DEATH(encoder.EncodeSymbols(Symbols(8, 43), &audio),
               "Check failed: IsValidSymbolSequence\\(token_message_symbols\\)");
  EXPECT_DEATH(encoder.EncodeSymbols(Symbols(8, 0), nullptr), "Check failed: audio_samples");
  // The symbol indexes the symbol table.
  EXPECT_DEATH(encoder.SynthesizeSymbol(-1, &audio), "Check failed: symbol >= 0");
  EXPECT_DEATH(encoder.SynthesizeSymbol(45, &audio), "Check failed: symbol < alphabet_size_");
  EXPECT_DEATH(encoder.SynthesizeSymbol(0, nullptr), "Check failed: result");
}

}  // namespace
}  // namespace audio_vesknet
