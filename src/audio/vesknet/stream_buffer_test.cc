#include "audio/vesknet/stream_buffer.h"

#include <algorithm>
#include <vector>

#include "audio/vesknet/circular_array.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

TEST(StreamBufferTest, KeepsAbsolutePositionsAcrossDrops) {
  StreamBuffer<int> buffer;
  std::vector<int> expected;
  int next = 0;
  // Many small appends and drops, as a streaming decoder makes them.
  for (int round = 0; round < 200; ++round) {
    std::vector<int> block(7);
    for (int& v : block) v = next++;
    buffer.Append(block);
    buffer.DropOldest(std::min(buffer.size(), round % 3 == 0 ? 9 : 3));
    ASSERT_EQ(buffer.dropped() + buffer.size(), next);
    for (int i = 0; i < buffer.size(); ++i) {
      ASSERT_EQ(buffer[i], buffer.dropped() + i);  // Element i is absolute sample dropped + i.
    }
  }
  buffer.DropOldest(buffer.size());
  EXPECT_TRUE(buffer.empty());
  buffer.Clear();
  EXPECT_EQ(buffer.dropped(), 0);
}

TEST(StreamBufferDeathTest, DropsOnlyWhatItHolds) {
  StreamBuffer<float> buffer;
  const std::vector<float> three = {1, 2, 3};
  buffer.Append(three);
  EXPECT_DEATH(buffer.DropOldest(-1), "Check failed: num_samples >= 0");
  EXPECT_DEATH(buffer.DropOldest(4),
               "Check failed: num_samples <= static_cast<int>\\(buffer_.size\\(\\)\\)");
}

TEST(CircularArrayTest, RoundsUpToAPowerOfTwoAndWraps) {
  CircularArray<int> ring(1000);
  EXPECT_EQ(ring.capacity(), 1024);
  ring[5] = 42;
  EXPECT_EQ(ring[5 + 1024], 42);
  EXPECT_EQ(CircularArray<int>(1024).capacity(), 1024);
  EXPECT_EQ(CircularArray<int>(1).capacity(), 1);
  EXPECT_DEATH(CircularArray<int>(0), "Check failed: min_size > 0");
}

}  // namespace
}  // namespace audio_vesknet
