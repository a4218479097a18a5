#include "audio/vesknet/compute_buffer_truncation.h"

#include <string>
#include <vector>

#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

TEST(ComputeBufferTruncationTest, SkipsDropsAndWarns) {
  struct Case {
    int32_t input, buffered, skip, drop;
    std::vector<std::string> warnings;
  };
  const Case cases[] = {
      {70, 30, 0, 0, {}},  // Exactly full.
      {60, 50, 0, 10, {}},
      {90, 50, 0, 40, {"Input of size 90 exceeds maximum good block size 80, signal may be lost."}},
      {130,
       50,
       30,
       50,
       {"Input of size 130 exceeds maximum buffer size 100, 30 samples skipped, signal may be "
        "lost."}},
  };
  for (const Case& c : cases) {
    base::ScopedLogCapture capture;
    int32_t skip = -1, drop = -1;
    ComputeBufferTruncation(c.input, c.buffered, /*good_block_margin=*/20,
                            /*max_buffer_size=*/100, &skip, &drop);
    EXPECT_EQ(skip, c.skip) << c.input;
    EXPECT_EQ(drop, c.drop) << c.input;
    EXPECT_EQ(capture.Messages(base::LogSeverity::kWarning), c.warnings);
  }
}

}  // namespace
}  // namespace audio_vesknet
