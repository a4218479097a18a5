#include "audio/vesknet/dtmf/tone_strength_filter.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <random>
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
  for (int count : {1, 3, 4, 6, 7, 9, 10, 13}) {
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

// The filter written out plainly, one sample at a time, for comparison bit
// for bit: its own sine table (sin(i 2 pi / 4096) rounded to float, the
// cosine a quarter period on), a 32-bit phase from half a table step whose
// top 12 bits index the table, sums dumped every `decimation` samples into
// two one-pole stages with the filter's gain, and |I|^2 + |Q|^2.
class ReferenceFilter {
 public:
  ReferenceFilter(float sample_rate, float frequency, int decimation, float gain)
      : decimation_(decimation), gain_(gain) {
    for (int i = 0; i < 5120; ++i) table_[i] = static_cast<float>(std::sin(i * 2.0 * M_PI / 4096));
    const double cycles = static_cast<double>(frequency) / static_cast<double>(sample_rate);
    increment_ = static_cast<uint32_t>((cycles - std::floor(cycles)) * 4294967296.0);
  }

  void Process(const std::vector<float>& input, std::vector<float>* output) {
    for (const float x : input) {
      const uint32_t index = phase_ >> 20;
      cosine_sum_ += table_[index + 1024] * x;
      sine_sum_ += x * table_[index];
      phase_ += increment_;
      if (++count_ < decimation_) continue;
      i1_ += (cosine_sum_ - i1_) * gain_;
      q1_ += (sine_sum_ - q1_) * gain_;
      i2_ += (i1_ - i2_) * gain_;
      q2_ += (q1_ - q2_) * gain_;
      output->push_back(i2_ * i2_ + q2_ * q2_);
      cosine_sum_ = sine_sum_ = 0.0f;
      count_ = 0;
    }
  }

 private:
  float table_[5120];
  const int decimation_;
  const float gain_;
  uint32_t increment_ = 0;
  uint32_t phase_ = 1u << 19;
  int count_ = 0;
  float cosine_sum_ = 0.0f, sine_sum_ = 0.0f;
  float i1_ = 0.0f, q1_ = 0.0f, i2_ = 0.0f, q2_ = 0.0f;
};

std::vector<uint32_t> Bits(const std::vector<float>& values) {
  std::vector<uint32_t> bits(values.size());
  if (!values.empty()) std::memcpy(bits.data(), values.data(), values.size() * sizeof(float));
  return bits;
}

// Every bank size from one filter to more than one pass of the widest kernel,
// on random microphone-range input cut into random blocks: each filter's
// strengths through ProcessAll and through Process equal the plain
// reference's bit for bit (sums, low-pass and square in the same order).
TEST(ToneStrengthFilterTest, ProcessAllAndProcessEqualThePlainFilterBitForBit) {
  std::mt19937 random(14);
  std::uniform_real_distribution<float> sample(-32768.0f, 32767.0f);
  std::vector<float> input(20000);
  for (float& x : input) x = sample(random);
  for (int count = 1; count <= 13; ++count) {
    const int decimation = count % 4 == 3 ? 7 : 16;
    std::vector<ToneStrengthFilter> bank, alone;
    std::vector<ReferenceFilter> references;
    for (int i = 0; i < count; ++i) {
      // Tones across the band, the default decoder's bandwidth.
      const float frequency = 740.0f * std::pow(1.1487f, static_cast<float>(i)) + 3.7f * count;
      bank.emplace_back(44100, frequency, 11.863858f, decimation);
      alone.emplace_back(44100, frequency, 11.863858f, decimation);
      references.emplace_back(44100, frequency, decimation, bank.back().gain());
    }
    std::vector<std::vector<float>> outputs(count), collected(count), each(count), expected(count);
    std::uniform_int_distribution<int> length(0, 700);
    for (size_t start = 0; start < input.size();) {
      const size_t end = std::min(input.size(), start + length(random));
      const std::vector<float> block(input.begin() + start, input.begin() + end);
      ToneStrengthFilter::ProcessAll(bank.data(), count, block, outputs.data());
      for (int i = 0; i < count; ++i) {
        collected[i].insert(collected[i].end(), outputs[i].begin(), outputs[i].end());
        std::vector<float> one;
        alone[i].Process(block, &one);
        each[i].insert(each[i].end(), one.begin(), one.end());
        references[i].Process(block, &expected[i]);
      }
      start = end;
    }
    for (int i = 0; i < count; ++i) {
      ASSERT_EQ(expected[i].size(), input.size() / decimation);
      EXPECT_EQ(Bits(collected[i]), Bits(expected[i])) << count << " filters, filter " << i;
      EXPECT_EQ(Bits(each[i]), Bits(expected[i])) << count << " filters, filter " << i;
    }
  }
}

// The low-pass pole for a bandwidth of a quarter of the decimated rate:
// cos(2 pi / 4) = 0, so b = 1 / (1 - 1 / sqrt 2) = 2 + sqrt 2 and the pole is
// b - sqrt(b^2 - 1) = 0.14973; its group delay 2p / (1 - p) rounds to 0.
double QuarterRateGain() {
  const double b = 2.0 + std::sqrt(2.0);
  return 1.0 - (b - std::sqrt(b * b - 1.0));
}

TEST(ToneStrengthFilterTest, LowPassDesign) {
  const ToneStrengthFilter quarter(8000, 0, 2000, 1);
  EXPECT_NEAR(quarter.gain(), QuarterRateGain(), 1e-7);
  EXPECT_NEAR(quarter.gain(), 0.8502702, 1e-7);
  EXPECT_EQ(quarter.delay(), 0);
  // The decoder's: 11.864 Hz at 44100 / 16 Hz gives the pole 0.958853, a
  // gain of 0.041147 and a delay of round(46.61) = 47 decimated samples.
  const ToneStrengthFilter decoder(44100, 740, 11.863858f, 16);
  EXPECT_NEAR(decoder.gain(), 0.0411470, 2e-7);
  EXPECT_EQ(decoder.delay(), 47);
}

// Frequency 0: the cosine arm passes the input, the sine arm gives 0, so with
// decimation 1 each strength is the input after two low-pass stages, squared.
TEST(ToneStrengthFilterTest, DecimationOneAtFrequencyZero) {
  ToneStrengthFilter filter(8000, 0, 2000, 1);
  std::vector<float> strengths;
  filter.Process({2, 2, 2, -1}, &strengths);
  ASSERT_EQ(strengths.size(), 4u);
  const double k = QuarterRateGain();
  double i1 = 0, i2 = 0;
  for (size_t n = 0; n < 4; ++n) {
    i1 += ((n < 3 ? 2.0 : -1.0) - i1) * k;
    i2 += (i1 - i2) * k;
    EXPECT_NEAR(strengths[n], i2 * i2, 1e-5) << n;
  }
  // Reset clears the low-pass: silence then reads zero.
  filter.Reset();
  filter.Process({0, 0}, &strengths);
  EXPECT_EQ(strengths, (std::vector<float>{0, 0}));
}

// Reset also restarts the group: after 3 of 4 samples, a Reset and 4 more
// give one strength of the 4 new samples only, (4 k^2)^2 from rest.
TEST(ToneStrengthFilterTest, ResetRestartsTheGroup) {
  ToneStrengthFilter filter(8000, 0, 500, 4);  // A quarter of the decimated 2000 Hz.
  std::vector<float> strengths;
  filter.Process({5, 5, 5}, &strengths);
  EXPECT_TRUE(strengths.empty());
  filter.Reset();
  filter.Process({1, 1, 1, 1}, &strengths);
  const double k = QuarterRateGain();
  ASSERT_EQ(strengths.size(), 1u);
  EXPECT_NEAR(strengths[0], std::pow(4 * k * k, 2), 1e-4);
}

// The oscillator starts half a table step in, so truncating the phase picks
// the nearest entry. At 1 Hz of 8192 Hz the phase advances half a step per
// sample: indices 0, 1, 1, 2, ... (from a phase of 0 they would be 0, 0, 1,
// 1, ...). The input +1, -1 over the first two samples then leaves I = 1 -
// cos(2 pi / 4096) and Q = -sin(2 pi / 4096): |I + jQ|^2 = 4 sin^2(pi / 4096)
// (0 from a phase of 0), times k^4 through the two low-pass stages.
TEST(ToneStrengthFilterTest, OscillatorStartsHalfAStepIn) {
  ToneStrengthFilter filter(8192, 1, 1024, 2);  // Decimated rate 4096 Hz.
  std::vector<float> strengths;
  filter.Process({1, -1}, &strengths);
  ASSERT_EQ(strengths.size(), 1u);
  const double k = QuarterRateGain();
  const double expected = std::pow(k, 4) * 4 * std::pow(std::sin(M_PI / 4096), 2);
  EXPECT_NEAR(strengths[0], expected, 1e-3 * expected);
}

TEST(ToneStrengthFilterDeathTest, Preconditions) {
  EXPECT_DEATH(ToneStrengthFilter(44100, 1000, 12, 0), "Check failed: decimation_factor_ >= 1");
  ToneStrengthFilter filter(44100, 1000, 12, 16);
  EXPECT_DEATH(filter.Process({1}, nullptr), "Check failed: output_samples");
}

}  // namespace
}  // namespace audio_vesknet
