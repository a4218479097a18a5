#include "tools/channel/dropouts.h"

#include <cstdint>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_channel {
namespace {

TEST(DropoutsTest, OneRunOfTheGivenLengthInEveryInterval) {
  DropoutParams params;
  params.length_s = 0.02;
  params.interval_s = 0.5;
  const int rate = 48000;
  const int64_t frames = 10 * rate;
  const std::vector<Dropout> runs = ChooseDropouts(params, rate, frames, 11);
  ASSERT_GE(runs.size(), 19u);  // 20 intervals; a run may not fit at the very end.
  int64_t previous_end = 0;
  for (const Dropout& d : runs) {
    EXPECT_EQ(d.length, 960);  // 20 ms at 48 kHz.
    EXPECT_GE(d.start, previous_end);
    EXPECT_LE(d.start + d.length, frames);
    previous_end = d.start + d.length;
  }
  // Runs fall in distinct intervals.
  for (size_t k = 1; k < runs.size(); ++k) {
    EXPECT_NE(runs[k].start / (rate / 2), runs[k - 1].start / (rate / 2));
  }
  EXPECT_TRUE(ChooseDropouts(DropoutParams(), rate, frames, 11).empty());
  EXPECT_NE(runs[0].start, ChooseDropouts(params, rate, frames, 12)[0].start);
}

TEST(DropoutsTest, RemovalKeepsTheOtherSamplesInOrder) {
  // Stereo frames numbered 0, 1, 2, ...: both samples of frame i hold i.
  std::vector<int> samples;
  for (int i = 0; i < 100; ++i) samples.insert(samples.end(), {i, i});
  const std::vector<Dropout> runs = {{10, 5}, {40, 1}, {95, 5}};
  RemoveDropouts(runs, 2, &samples);
  ASSERT_EQ(samples.size(), 2u * (100 - 11));
  std::vector<int> kept;
  for (size_t i = 0; i < samples.size(); i += 2) {
    EXPECT_EQ(samples[i], samples[i + 1]);
    kept.push_back(samples[i]);
  }
  std::vector<int> want;
  for (int i = 0; i < 100; ++i) {
    if ((i < 10 || i >= 15) && i != 40 && i < 95) want.push_back(i);
  }
  EXPECT_EQ(kept, want);
  EXPECT_EQ(FramesRemovedBefore(runs, 9.5), 0.0);
  EXPECT_EQ(FramesRemovedBefore(runs, 12.0), 2.0);
  EXPECT_EQ(FramesRemovedBefore(runs, 50.0), 6.0);
}

}  // namespace
}  // namespace vesk_channel
