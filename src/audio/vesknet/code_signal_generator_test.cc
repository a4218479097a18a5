#include "audio/vesknet/code_signal_generator.h"

#include <algorithm>
#include <vector>

#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

std::vector<int> FirstBits(int taps, int code, int count) {
  std::vector<float> chips;
  GenerateCodeSignal(taps, code, &chips);
  std::vector<int> bits;
  for (int i = 0; i < count; ++i) bits.push_back(chips[i] > 0 ? 1 : 0);
  return bits;
}

TEST(CodeSignalGeneratorTest, KnownPrefixes) {
  EXPECT_EQ(FirstBits(5, 0, 16),
            (std::vector<int>{0, 0, 0, 1, 1, 0, 1, 1, 1, 0, 1, 0, 1, 0, 0, 0}));
  EXPECT_EQ(FirstBits(7, 0, 16),
            (std::vector<int>{0, 0, 0, 0, 1, 0, 1, 0, 1, 1, 0, 0, 0, 1, 0, 0}));
  EXPECT_EQ(FirstBits(11, 3, 16),
            (std::vector<int>{0, 0, 0, 0, 1, 1, 0, 0, 0, 0, 0, 1, 1, 1, 0, 0}));
}

// Every code of the table is a maximal-length sequence: balanced, and with the
// two-valued periodic autocorrelation (N at lag 0, -1 elsewhere) that makes it
// a good spreading code.
TEST(CodeSignalGeneratorTest, EveryCodeIsMaximalLength) {
  for (int taps = kMinTaps; taps <= kMaxTaps; ++taps) {
    for (int code = 0; code <= (taps <= 6 ? 2 : 3); ++code) {
      std::vector<float> chips = {42.0f};  // Replaced, not appended to.
      GenerateCodeSignal(taps, code, &chips);
      const int n = (1 << taps) - 1;
      ASSERT_EQ(static_cast<int>(chips.size()), n);
      EXPECT_EQ(std::count(chips.begin(), chips.end(), 1.0f), 1 << (taps - 1));
      EXPECT_EQ(std::count(chips.begin(), chips.end(), -1.0f), (1 << (taps - 1)) - 1);
      for (int lag = 1; lag < n; lag += (lag < 40 ? 1 : 97)) {
        float sum = 0;
        for (int i = 0; i < n; ++i) sum += chips[i] * chips[(i + lag) % n];
        ASSERT_EQ(sum, -1.0f) << taps << " taps, code " << code << ", lag " << lag;
      }
    }
  }
}

TEST(CodeSignalGeneratorDeathTest, RejectsUnknownCodes) {
  std::vector<float> chips;
  EXPECT_DEATH(GenerateCodeSignal(6, 3, &chips),
               "Check failed: code_number <= number_of_taps <= 6 \\? 2 : 3");
  EXPECT_DEATH(GenerateCodeSignal(4, 0, &chips), "Check failed: number_of_taps >= kMinTaps");
  EXPECT_DEATH(GenerateCodeSignal(12, 0, &chips), "Check failed: number_of_taps <= 11");
  EXPECT_DEATH(GenerateCodeSignal(7, -1, &chips), "Check failed: code_number >= 0");
  EXPECT_DEATH(GenerateCodeSignal(7, 0, nullptr), "Check failed: code_signal != nullptr");
}

}  // namespace
}  // namespace audio_vesknet
