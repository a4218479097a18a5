#include "audio/vesknet/decoding_group.h"

#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

// Period 100, tolerance 10 samples.
DecodingGroup MakeGroup(const std::vector<int>& times, float score = 1.0f, int max_gap = 1000) {
  DecodingGroup group(times[0], score, 100, 0.1f, max_gap);
  for (size_t i = 1; i < times.size(); ++i) EXPECT_TRUE(group.Add(times[i], score));
  return group;
}

TEST(DecodingGroupTest, AddKeepsToTheGridAndTheMaxGap) {
  DecodingGroup group = MakeGroup({0, 205}, 2.0f, 250);
  EXPECT_FALSE(group.Add(250, 1.0f));
  EXPECT_FALSE(group.Add(389, 1.0f));  // 11 off the grid.
  EXPECT_TRUE(group.Add(295, 1.0f));
  EXPECT_FALSE(group.Add(600, 1.0f));  // On the grid, but 305 after the last member.
  EXPECT_EQ(group.times(), (std::vector<int>{0, 205, 295}));
  EXPECT_FLOAT_EQ(group.score_sum(), 5.0f);
  EXPECT_EQ(group.FrameNumber(150), 2);  // Halves round away from zero.
  EXPECT_EQ(group.FrameNumber(-150), -2);
  EXPECT_DEATH(group.Add(295, 1.0f), "Check failed: time > times_.back\\(\\)");
}

TEST(DecodingGroupTest, CoversAllPositionsAndIndexOfFrame) {
  EXPECT_FALSE(MakeGroup({0, 300, 600}).CoversAllPositions(3));
  EXPECT_TRUE(MakeGroup({0, 400, 795}).CoversAllPositions(3));    // Frames 0, 4 and 8.
  const DecodingGroup group = MakeGroup({0, 95, 205, 500, 610});  // Frames 0, 1, 2, 5, 6.
  EXPECT_TRUE(group.CoversAllPositions(3));
  EXPECT_FALSE(group.CoversAllPositions(4));
  const int expected[] = {0, 1, 2, 3, 3, 3, 4, 4};  // Missing frames: the next member.
  for (int k = 0; k < 8; ++k) EXPECT_EQ(group.IndexOfFrame(k), expected[k]) << k;
  EXPECT_EQ(group.IndexOfFrame(40), 4);
}

TEST(DecodingGroupTest, SelectGroup) {
  std::vector<DecodingGroup> groups = {MakeGroup({0, 300}, 5.0f), MakeGroup({10, 110, 210}),
                                       MakeGroup({20, 120, 220})};
  EXPECT_EQ(SelectGroup(groups, 3), &groups[1]);  // Covering; equal sums: the earlier.
  groups[2].Add(320, 0.5f);
  EXPECT_EQ(SelectGroup(groups, 3), &groups[2]);
  EXPECT_EQ(SelectGroup(groups, 5), &groups[0]);  // None covers: the largest sum.
  groups = {MakeGroup({0, 100, 200}, 0.0f), MakeGroup({5}, -1.0f)};
  EXPECT_EQ(SelectGroup(groups, 3), nullptr);
  EXPECT_EQ(SelectGroup({}, 3), nullptr);
}

}  // namespace
}  // namespace audio_vesknet
