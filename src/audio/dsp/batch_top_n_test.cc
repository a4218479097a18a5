#include "audio/dsp/batch_top_n.h"

#include <algorithm>
#include <memory>
#include <random>
#include <utility>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using ::testing::ElementsAre;
using ::testing::Pair;

TEST(BatchTopNTest, EqualScoreAtTheThresholdNeverEnters) {
  BatchTopN<int> top(2);
  top.Push(1, 5.0f);
  top.Push(2, 3.0f);  // Threshold is now 3.
  top.Push(3, 3.0f);  // Equal: dropped.
  EXPECT_EQ(top.size(), 2);
  top.Push(4, 5.0f);  // Ties with item 1: the earlier comes first.
  top.Push(5, 4.0f);  // Fills the store: the two best stay, threshold 5.
  top.Push(6, 4.0f);
  EXPECT_THAT(top.Extract(), ElementsAre(Pair(1, 5.0f), Pair(4, 5.0f)));
  EXPECT_TRUE(top.Extract().empty());  // Extract empties the collector.
  EXPECT_DEATH(BatchTopN<int>(0), "Check failed: limit >= 1");
}

TEST(BatchTopNTest, MatchesStableSortOverManyBatches) {
  std::mt19937 rng(9);
  for (int limit : {1, 3, 16}) {
    BatchTopN<std::unique_ptr<int>> top(limit);  // Move-only items work.
    std::vector<std::pair<int, float>> all;
    for (int i = 0; i < 5000; ++i) {
      const float score = static_cast<float>(rng() % 1000);  // Some repeated scores.
      all.push_back({i, score});
      top.Push(std::make_unique<int>(i), score);
    }
    std::stable_sort(all.begin(), all.end(),
                     [](const auto& a, const auto& b) { return a.second > b.second; });
    const auto best = top.Extract();
    ASSERT_EQ(static_cast<int>(best.size()), limit);
    for (int i = 0; i < limit; ++i) {
      EXPECT_EQ(*best[i].first, all[i].first);
      EXPECT_EQ(best[i].second, all[i].second);
    }
  }
}

}  // namespace
}  // namespace audio_dsp
