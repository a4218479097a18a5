#include "audio/dsp/max_filter.h"

#include <algorithm>
#include <random>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using ::testing::ElementsAre;

template <typename T>
std::vector<T> Max(const std::vector<T>& input, int width) {
  std::vector<T> output(input.size(), T(-1));
  MaxFilter(input.data(), static_cast<int>(input.size()), width, output.data());
  return output;
}

TEST(MaxFilterTest, KnownValuesAndBruteForce) {
  const std::vector<float> x = {1, 3, 2, 0};
  EXPECT_THAT(Max(x, 3), ElementsAre(3, 3, 3, 2));
  EXPECT_EQ(Max(x, 1), x);
  EXPECT_THAT(Max(std::vector<int>{5, 0, 0, 0, 7, 0}, 4), ElementsAre(5, 5, 5, 7, 7, 7));
  // Few distinct values (many ties), then a falling and a rising run.
  std::mt19937 rng(11);
  std::vector<int> z(60);
  for (int& v : z) v = static_cast<int>(rng() % 7);
  for (int i = 0; i < 20; ++i) z.push_back(i < 10 ? 10 - i : i);
  const int n = static_cast<int>(z.size());
  for (int w = 1; w <= 25; ++w) {
    std::vector<int> expected(n);
    for (int k = 0, h = (w - 1) / 2; k < n; ++k) {
      expected[k] = *std::max_element(z.begin() + std::max(0, k - (w - h) + 1),
                                      z.begin() + std::min(n, k + h + 1));
    }
    EXPECT_EQ(Max(z, w), expected) << "width " << w;
  }
  // A scratch buffer kept from a longer call gives the same results.
  std::vector<int> scratch(500, 99), out(z.size());
  MaxFilter(z.data(), n, 7, out.data(), &scratch);
  EXPECT_EQ(out, Max(z, 7));
  EXPECT_DEATH(Max(x, 0), "Check failed: window_size >= 1");
}

}  // namespace
}  // namespace audio_dsp
