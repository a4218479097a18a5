#include "audio/dsp/number_util.h"

#include <cmath>
#include <limits>
#include <utility>
#include <vector>

#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using Fraction = std::pair<int, int>;
using Vectors = std::vector<std::vector<int>>;

TEST(RationalApproximationTest, KnownValues) {
  EXPECT_EQ(RationalApproximation(3.0, 2000), Fraction(3, 1));
  // The semiconvergent 1/1 is exactly as far from 0.5 as 0/1: ties keep 0/1.
  EXPECT_EQ(RationalApproximation(0.5, 1), Fraction(0, 1));
  EXPECT_EQ(RationalApproximation(44100.0 / 16000.0, 2000), Fraction(441, 160));
  EXPECT_EQ(RationalApproximation(48000.0 / 44100.0, 2000), Fraction(160, 147));
  EXPECT_EQ(RationalApproximation(M_PI, 100), Fraction(311, 99));  // a semiconvergent
  EXPECT_EQ(RationalApproximation(M_PI, 1000), Fraction(355, 113));
  EXPECT_EQ(RationalApproximation(-0.75, 10), Fraction(-3, 4));
}

TEST(RationalApproximationTest, NoCloserFractionWithinTheLimit) {
  for (int max_denominator : {1, 2, 7, 30}) {
    for (double value = -2.0; value < 3.0; value += 0.0137) {
      const Fraction result = RationalApproximation(value, max_denominator);
      ASSERT_TRUE(result.second >= 1 && result.second <= max_denominator);
      double best_error = std::numeric_limits<double>::infinity();  // brute force
      for (int d = 1; d <= max_denominator; ++d) {
        best_error = std::min(best_error, std::fabs(std::round(value * d) / d - value));
      }
      EXPECT_NEAR(std::fabs(double(result.first) / result.second - value), best_error, 1e-12)
          << value << " limit " << max_denominator;
    }
  }
}

TEST(RationalApproximationDeathTest, RejectsNonFiniteValuesAndZeroLimit) {
  EXPECT_DEATH(RationalApproximation(std::nan(""), 10), "Check failed: isfinite\\(value\\)");
  EXPECT_DEATH(RationalApproximation(-INFINITY, 10), "Check failed: isfinite\\(value\\)");
  EXPECT_DEATH(RationalApproximation(1.5, 0), "Check failed: max_denominator > 0");
}

TEST(IntegerHelpersTest, KnownValues) {
  EXPECT_EQ(PositiveModulo(-1, 5), 4);
  EXPECT_EQ(PositiveModulo(-5, 5), 0);
  EXPECT_EQ(PositiveModulo(7, 5), 2);
  EXPECT_EQ(PositiveModulo(std::numeric_limits<int>::min(), 3), 1);
  EXPECT_EQ(RoundUpToMultiple(5, 4), 8);
  EXPECT_EQ(RoundUpToMultiple(8, 4), 8);
  EXPECT_EQ(RoundUpToMultiple(0, 4), 0);
  EXPECT_EQ(RoundUpToMultiple(-5, 4), -4);
  EXPECT_EQ(RoundUpToMultiple(-8, 4), -8);
  const std::vector<std::pair<unsigned, int>> logs = {{0, -1},    {1, 0},     {3, 2},   {1023, 10},
                                                      {1024, 10}, {1025, 11}, {~0u, 32}};
  for (const auto& [n, log] : logs) EXPECT_EQ(CeilLog2(n), log) << n;
  EXPECT_EQ(NextPowerOfTwo(0), 1u);
  EXPECT_EQ(NextPowerOfTwo(1000), 1024u);
  EXPECT_EQ(NextPowerOfTwo(1024), 1024u);
  EXPECT_EQ(NextPowerOfTwo((1u << 31) + 1), 0u);
}

Vectors AllCombinations(int n, int k) {
  Vectors result;
  for (CombinationIterator it(n, k); !it.Done(); it.Next()) result.push_back(it.GetCombination());
  return result;
}

TEST(CombinationIteratorTest, LexicographicOrderAndDegenerateSizes) {
  EXPECT_EQ(AllCombinations(4, 2), Vectors({{0, 1}, {0, 2}, {0, 3}, {1, 2}, {1, 3}, {2, 3}}));
  const Vectors tone_pairs = AllCombinations(10, 2);
  ASSERT_EQ(tone_pairs.size(), 45u);
  EXPECT_EQ(tone_pairs.back(), std::vector<int>({8, 9}));
  EXPECT_TRUE(AllCombinations(2, 3).empty());
  EXPECT_EQ(AllCombinations(3, 0), Vectors({{}}));  // One empty combination.

  CombinationIterator done(2, 3);
  base::ScopedLogCapture capture;
  done.Next();
  EXPECT_TRUE(done.Done());
  EXPECT_EQ(capture.Messages(base::LogSeverity::kError),
            std::vector<std::string>({"Next() called when already done."}));
}

TEST(CombinationIteratorDeathTest, NegativeSizeIsRefused) {
  EXPECT_DEATH(CombinationIterator(3, -1), "Check failed: k >= 0");
}

TEST(MixedRadixCounterTest, VisitsDigitVectorsAndCompares) {
  Vectors visited;
  MixedRadixCounter counter({2, 3});
  const MixedRadixCounter start = counter;
  for (; !counter.Done(); counter.Next()) visited.push_back(counter.GetDigits());
  EXPECT_EQ(visited, Vectors({{0, 0}, {1, 0}, {0, 1}, {1, 1}, {0, 2}, {1, 2}}));
  EXPECT_TRUE(MixedRadixCounter({}).Done());
  EXPECT_TRUE(MixedRadixCounter({3, 0, 2}).Done());

  MixedRadixCounter second({2, 3});
  EXPECT_TRUE(second == start);
  second.Next();
  EXPECT_TRUE(second != start);
  EXPECT_TRUE(MixedRadixCounter({2, 4}) != start);     // Same digits, other radices.
  EXPECT_TRUE(counter == MixedRadixCounter({5, -1}));  // All finished counters are equal.
}

}  // namespace
}  // namespace audio_dsp
