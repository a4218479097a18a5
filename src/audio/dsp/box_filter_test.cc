#include "audio/dsp/box_filter.h"

#include <algorithm>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using ::testing::ElementsAre;

// Output k sums the inputs k - (w - h) + 1 .. k + h that exist, h = (w - 1) / 2.
std::vector<float> BruteForceBox(const std::vector<float>& x, int w, int stride = 1) {
  const int n = (static_cast<int>(x.size()) + stride - 1) / stride, h = (w - 1) / 2;
  std::vector<float> y(x.size(), 0.0f);
  for (int k = 0; k < n; ++k) {
    for (int i = std::max(0, k - (w - h) + 1); i <= std::min(n - 1, k + h); ++i) {
      y[k * stride] += x[i * stride];
    }
  }
  return y;
}

std::vector<float> Box(std::vector<float> x, int width) {
  std::vector<float> y(x.size() + 1, -1.0f);
  x.push_back(-1.0f);  // Keeps pointers valid for empty inputs; must not be read.
  BoxFilter(x.data(), static_cast<int>(x.size()) - 1, 1, width, y.data());
  EXPECT_EQ(y.back(), -1.0f);
  return std::vector<float>(y.begin(), y.end() - 1);
}

TEST(BoxFilterTest, KnownValuesAndBruteForce) {
  const std::vector<float> x = {1, 2, 3, 4};
  EXPECT_EQ(Box(x, 1), x);
  EXPECT_THAT(Box(x, 3), ElementsAre(3, 6, 9, 7));
  EXPECT_THAT(Box(x, 4), ElementsAre(3, 6, 10, 9));
  EXPECT_THAT(Box({1, 2}, 5), ElementsAre(3, 3));
  std::mt19937 rng(7);
  for (int n = 0; n <= 12; ++n) {
    std::vector<float> z(n);
    for (float& v : z) v = static_cast<float>(rng() % 100);
    for (int w = 1; w <= 16; ++w) EXPECT_EQ(Box(z, w), BruteForceBox(z, w)) << n << " " << w;
  }
}

TEST(BoxFilter2DTest, RowBoxesRunAcrossRowEndsAndRaggedTailIsZero) {
  std::vector<float> y;
  BoxFilter2D({1, 2, 3, 4, 5, 6, 7, 8, 9}, 3, 3, 1, false, &y);
  EXPECT_THAT(y, ElementsAre(3, 6, 9, 12, 15, 18, 21, 24, 17));  // 9 = 2 + 3 + 4.

  const int columns = 7, rows = 5;
  std::vector<float> x(rows * columns + 3);
  std::mt19937 rng(3);
  for (float& v : x) v = static_cast<float>(rng() % 10);
  std::vector<float> expected = BruteForceBox(x, 4);  // Whole flat vector, tail included.
  expected.resize(rows * columns);
  for (int c = 0; c < columns; ++c) {
    const std::vector<float> column(expected.begin() + c, expected.end());
    const std::vector<float> summed = BruteForceBox(column, 3, columns);
    for (int r = 0; r < rows; ++r) expected[r * columns + c] = summed[r * columns];
  }
  expected.resize(x.size(), 0.0f);
  y.assign(100, 123.0f);  // Stale contents must not survive.
  BoxFilter2D(x, columns, 4, 3, true, &y);
  EXPECT_EQ(y, expected);
  BoxFilter2D(x, columns, 4, 3, true, &x);  // In place.
  EXPECT_EQ(x, expected);
  EXPECT_DEATH(BoxFilter2D(std::vector<float>(7), 2, 1, 1, false, &y),
               "input of size 7 is not divisible by 2");
}

// The pointers, counts and strides address memory: each is checked.
TEST(BoxFilterDeathTest, ArgumentsThatWouldAddressOutsideTheArrays) {
  const std::vector<std::pair<void (*)(), const char*>> cases = {
      {[] { BoxFilter(nullptr, 1, 1, 1, std::vector<float>(1).data()); }, "input"},
      {[] { BoxFilter(std::vector<float>(1).data(), -1, 1, 1, std::vector<float>(1).data()); },
       "num_samples >= 0"},
      {[] { BoxFilter(std::vector<float>(1).data(), 1, 1, 0, std::vector<float>(1).data()); },
       "box_width >= 1"},
      {[] { BoxFilter(std::vector<float>(1).data(), 1, 1, 1, nullptr); }, "output"},
      {[] { BoxFilter(std::vector<float>(4).data(), 2, -1, 1, std::vector<float>(4).data()); },
       "stride >= 1"},
      {[] {
         std::vector<float> y;
         BoxFilter2D(std::vector<float>(4), 0, 1, 1, true, &y);
       },
       "num_columns >= 1"},
      {[] { BoxFilter2D(std::vector<float>(4), 2, 1, 1, false, nullptr); }, "output"},
  };
  for (const auto& [call, text] : cases) {
    EXPECT_DEATH(call(), std::string("Check failed: ") + text) << text;
  }
}

}  // namespace
}  // namespace audio_dsp
