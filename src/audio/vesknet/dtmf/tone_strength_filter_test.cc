#include "audio/vesknet/dtmf/tone_strength_filter.h"

#include <cmath>
#include <vector>

#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

std::vector<float> Tone(double frequency, int size, double amplitude) {
  std::vector<float> tone(size);
  for (int i = 0; i < size; ++i) {
    tone[i] = static_cast<float>(amplitude * std::sin(2 * M_PI * frequency * i / 44100 + 0.3));
  }
  return tone;
}

TEST(ToneStrengthFilterTest, ToneAtTheFilterFrequencySettlesFarToneVanishes) {
  ToneStrengthFilter filter(44100, 1000, 12, 16);
  std::vector<float> strengths;
  filter.Process(Tone(1000, 44100, 100), &strengths);
  ASSERT_EQ(strengths.size(), 2756u);
  EXPECT_LT(strengths[0], 0.01f * 800 * 800);  // Starts from rest...
  // ...and settles near (amplitude x 16 / 2)^2.
  for (size_t i = 1500; i < strengths.size(); ++i) ASSERT_NEAR(strengths[i], 640000, 6400) << i;

  ToneStrengthFilter far_filter(44100, 1000, 12, 16);
  far_filter.Process(Tone(1500, 44100, 100), &strengths);
  for (size_t i = 1500; i < strengths.size(); ++i) ASSERT_LT(strengths[i], 64) << i;
}

// Partial groups carry over: the output does not depend on how input is cut.
TEST(ToneStrengthFilterTest, BlockSplitsDoNotMatter) {
  const std::vector<float> input = Tone(1661.2438, 5000, 3000);
  ToneStrengthFilter whole(44100, 1661.2438f, 20, 16);
  std::vector<float> expected, collected, output = {1, 2, 3};
  whole.Process(input, &expected);
  ASSERT_EQ(expected.size(), 5000u / 16);
  ToneStrengthFilter pieces(44100, 1661.2438f, 20, 16);
  size_t start = 0;
  for (const size_t length : {10, 6, 0, 1, 100, 37, 1000, 3846}) {
    pieces.Process(std::vector<float>(input.begin() + start, input.begin() + start + length),
                   &output);
    if (length == 10) {
      EXPECT_TRUE(output.empty());  // Fewer samples than the countdown.
    }
    collected.insert(collected.end(), output.begin(), output.end());
    start += length;
  }
  EXPECT_EQ(collected, expected);
}

// Filters run side by side give each filter's own strengths, bit for bit:
// groups of four and a last partial group, blocks cut anywhere; filters that
// are not in step (another decimation factor) run one by one.
TEST(ToneStrengthFilterTest, ProcessAllEqualsEachFiltersProcess) {
  const std::vector<float> input = Tone(1244.53, 3000, 2000);
  for (int count : {1, 3, 4, 6, 10}) {
    std::vector<ToneStrengthFilter> bank, alone;
    for (int i = 0; i < count; ++i) {
      const float frequency = 740.0f * (1.0f + 0.13f * i);
      const int decimation = count == 3 && i == 1 ? 8 : 16;
      bank.emplace_back(44100, frequency, 20.0f + i, decimation);
      alone.emplace_back(44100, frequency, 20.0f + i, decimation);
    }
    std::vector<std::vector<float>> outputs(count), expected(count), collected(count);
    size_t start = 0;
    for (const size_t length : {5, 11, 0, 100, 1000, 1884}) {
      const std::vector<float> block(input.begin() + start, input.begin() + start + length);
      ToneStrengthFilter::ProcessAll(bank.data(), count, block, outputs.data());
      for (int i = 0; i < count; ++i) {
        std::vector<float> one;
        alone[i].Process(block, &one);
        expected[i].insert(expected[i].end(), one.begin(), one.end());
        collected[i].insert(collected[i].end(), outputs[i].begin(), outputs[i].end());
      }
      start += length;
    }
    for (int i = 0; i < count; ++i) {
      EXPECT_EQ(collected[i], expected[i]) << count << " filters, filter " << i;
      EXPECT_GE(expected[i].size(), input.size() / 16);
    }
  }
}

// Frequency 0: the cosine arm passes the input, the sine arm gives 0, so with
// decimation 1 each strength is the input after two low-pass stages, squared.
TEST(ToneStrengthFilterTest, DecimationOneAtFrequencyZero) {
  ToneStrengthFilter filter(8000, 0, 100, 1);
  std::vector<float> strengths;
  filter.Process({2, 2, 2, -1}, &strengths);
  ASSERT_EQ(strengths.size(), 4u);
  const float k = filter.gain();
  float i1 = 0, i2 = 0;
  for (size_t n = 0; n < 4; ++n) {
    i1 += ((n < 3 ? 2.0f : -1.0f) - i1) * k;
    i2 += (i1 - i2) * k;
    EXPECT_FLOAT_EQ(strengths[n], i2 * i2) << n;
  }
  // Reset clears the low-pass: silence then reads zero.
  filter.Reset();
  filter.Process({0, 0}, &strengths);
  EXPECT_EQ(strengths, (std::vector<float>{0, 0}));
}

TEST(ToneStrengthFilterDeathTest, Preconditions) {
  EXPECT_DEATH(ToneStrengthFilter(44100, 1000, 12, 0), "Check failed: decimation_factor_ >= 1");
  ToneStrengthFilter filter(44100, 1000, 12, 16);
  EXPECT_DEATH(filter.Process({1}, nullptr), "Check failed: output_samples");
}

}  // namespace
}  // namespace audio_vesknet
