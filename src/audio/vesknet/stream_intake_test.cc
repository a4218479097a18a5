#include "audio/vesknet/stream_intake.h"

#include <vector>

#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

// A decoder's view of its history, counted in input frames.
struct History {
  int64_t frames = 0;
  int restarts = 0;
  std::vector<int> drops;

  int64_t Admit(int64_t values, int channels, int64_t margin, int64_t max_size) {
    return AdmitBlock(
        values, channels, margin, max_size, [this] { return frames; },
        [this] {
          frames = 1;  // As the decoders count an empty history.
          ++restarts;
        },
        [this](int count) {
          drops.push_back(count);
          frames -= count;
        });
  }
};

TEST(StreamIntakeTest, ABlockThatFitsTouchesNothing) {
  History history;
  history.frames = 30;
  base::ScopedLogCapture capture;
  EXPECT_EQ(history.Admit(140, 2, 20, 100), 0);  // 70 frames: exactly full.
  EXPECT_EQ(history.restarts, 0);
  EXPECT_TRUE(history.drops.empty());
  EXPECT_TRUE(capture.Messages(base::LogSeverity::kWarning).empty());
}

TEST(StreamIntakeTest, OlderHistoryMakesRoom) {
  History history;
  history.frames = 50;
  EXPECT_EQ(history.Admit(60, 1, 20, 100), 0);
  EXPECT_EQ(history.drops, std::vector<int>{10});
  EXPECT_EQ(history.restarts, 0);
}

// A block beyond the whole buffer: everything is forgotten and the block's
// last 100 frames (200 values of two channels) are taken in, the truncation
// asked again with the history gone (which still counts one frame).
TEST(StreamIntakeTest, AnOverlongBlockRestartsOnItsTail) {
  History history;
  history.frames = 50;
  base::ScopedLogCapture capture;
  EXPECT_EQ(history.Admit(2 * 130, 2, 20, 100), 2 * 30);
  EXPECT_EQ(history.restarts, 1);
  EXPECT_EQ(history.drops, std::vector<int>{1});
  EXPECT_EQ(capture.Messages(base::LogSeverity::kWarning),
            (std::vector<std::string>{
                "Input of size 130 exceeds maximum buffer size 100, 30 samples skipped, signal "
                "may be lost.",
                "Input of size 100 exceeds maximum good block size 80, signal may be lost."}));
}

TEST(StreamIntakeTest, NothingLeftOfABlockAfterARestart) {
  History history;
  EXPECT_EQ(history.Admit(7, 1, 0, 0), 7);
  EXPECT_EQ(history.restarts, 1);
}

// Sums in channel order; the mean divides the sum by the count: 7 / 3 is
// 0x1.2aaaaap+1, where 7 x (1 / 3) would round to 0x1.2aaaacp+1.
TEST(StreamIntakeTest, DownmixSumsOrAveragesTheChannels) {
  const std::vector<float> interleaved = {1, 2, 4, 0.1f, 0.2f, 0.3f};
  std::vector<float> mono;
  DownmixChannels(interleaved.data(), 2, 3, Downmix::kSum, &mono);
  EXPECT_EQ(mono, (std::vector<float>{7, (0.1f + 0.2f) + 0.3f}));
  DownmixChannels(interleaved.data(), 2, 3, Downmix::kMean, &mono);
  EXPECT_EQ(mono, (std::vector<float>{0x1.2aaaaap+1f, ((0.1f + 0.2f) + 0.3f) / 3}));
  DownmixChannels(interleaved.data(), 3, 2, Downmix::kMean, &mono);
  EXPECT_EQ(mono, (std::vector<float>{1.5f, 2.05f, 0.25f}));
  DownmixChannels(interleaved.data(), 6, 1, Downmix::kMean, &mono);
  EXPECT_EQ(mono, interleaved);
}

}  // namespace
}  // namespace audio_vesknet
