#include "audio/dsp/digit_sequence.h"

#include <cstdint>
#include <random>
#include <vector>

#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using Digits = std::vector<int32_t>;

TEST(DigitSequenceTest, KnownValues) {
  EXPECT_EQ(DigitSequence(Digits(), 10).digits(), Digits{0});
  EXPECT_EQ(DigitSequence(Digits{5, 0, 0}, 10).digits(), Digits{5});
  EXPECT_EQ(DigitSequence(300, 256).digits(), (Digits{44, 1}));
  EXPECT_EQ(DigitSequence(2147483647, 2).digits(), Digits(31, 1));
  EXPECT_EQ(DigitSequence(Digits{255, 255}, 256).ConvertBase(10).digits(), (Digits{5, 3, 5, 5, 6}));
  EXPECT_EQ(DigitSequence(Digits{0}, 256).ConvertBase(44).digits(), Digits{0});
  // The largest result base, 2^30 / 10, still converts exactly.
  EXPECT_EQ(DigitSequence(999999999, 10).ConvertBase(107374182).digits(), (Digits{33632361, 9}));
}

// Conversion keeps the value, and converting back restores the digits.
TEST(DigitSequenceTest, ConversionPreservesTheValue) {
  std::mt19937 random(7);
  for (int trial = 0; trial < 200; ++trial) {
    const int value = static_cast<int>(random() % 2147483647u);
    const int from = 2 + static_cast<int>(random() % 300);
    const int to = 2 + static_cast<int>(random() % 300);
    const DigitSequence converted = DigitSequence(value, from).ConvertBase(to);
    int64_t read_back = 0;
    for (auto it = converted.digits().rbegin(); it != converted.digits().rend(); ++it) {
      read_back = read_back * to + *it;
    }
    EXPECT_EQ(read_back, value) << from << " -> " << to;
    EXPECT_EQ(converted.ConvertBase(from).digits(), DigitSequence(value, from).digits());
  }
}

TEST(DigitSequenceDeathTest, Preconditions) {
  EXPECT_DEATH(DigitSequence(Digits{1}, 1), "Check failed: base >= 2");
  EXPECT_DEATH(DigitSequence(Digits{1, -1}, 10), "Check failed: digit >= 0");
  EXPECT_DEATH(DigitSequence(Digits{10}, 10), "Check failed: digit < base_");
  EXPECT_DEATH(DigitSequence(-1, 10), "Check failed: value >= 0");
  const DigitSequence ten(Digits{1}, 10);
  EXPECT_DEATH(ten.ConvertBase(1), "Check failed: result_base >= 2");
  EXPECT_DEATH(ten.ConvertBase(107374183),
               "Check failed: result_base <= \\(std::numeric_limits<int>::max\\(\\) / 2 \\+ 1\\) "
               "/ base_");
}

}  // namespace
}  // namespace audio_dsp
