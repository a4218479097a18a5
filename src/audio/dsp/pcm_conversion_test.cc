#include "audio/dsp/pcm_conversion.h"

#include <cmath>
#include <limits>
#include <vector>

#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

TEST(PcmConversionTest, TruncatesAndClamps) {
  EXPECT_EQ(FloatToPcm16(1.0f), 32767);
  EXPECT_EQ(FloatToPcm16(-1.0f), -32768);
  EXPECT_EQ(FloatToPcm16(0.99999f), 32767);
  EXPECT_EQ(FloatToPcm16(-0.00002f), 0);  // Toward zero, not down.
  EXPECT_EQ(FloatToPcm16(0.5f), 16384);
  EXPECT_EQ(FloatToPcm16(-0.5f), -16384);
  EXPECT_EQ(FloatToPcm16(3.0f), 32767);
  EXPECT_EQ(FloatToPcm16(-3.0f), -32768);
  // Products beyond the 32-bit range and NaN give the most negative value.
  EXPECT_EQ(FloatToPcm16(1e6f), -32768);
  EXPECT_EQ(FloatToPcm16(std::numeric_limits<float>::infinity()), -32768);
  EXPECT_EQ(FloatToPcm16(std::nanf("")), -32768);
}

TEST(PcmConversionTest, BytesAreLittleEndian) {
  const std::vector<uint8_t> bytes = FloatsToPcm16Bytes({1.0f, -1.0f, 0.0f, -0.5f});
  EXPECT_EQ(bytes, (std::vector<uint8_t>{0xFF, 0x7F, 0x00, 0x80, 0x00, 0x00, 0x00, 0xC0}));
  EXPECT_TRUE(FloatsToPcm16Bytes({}).empty());
}

TEST(PcmConversionTest, SixteenBitValuesBecomeUnscaledFloats) {
  // Read from an odd address: no alignment is assumed.
  const uint8_t bytes[] = {0x55, 0x00, 0x80, 0xFF, 0x7F, 0x01, 0x00, 0xFF, 0xFF};
  std::vector<float> samples = {9, 9, 9, 9, 9, 9};
  Pcm16ToFloats(reinterpret_cast<const int16_t*>(bytes + 1), 4, &samples);
  EXPECT_EQ(samples, (std::vector<float>{-32768, 32767, 1, -1}));
  // Every value, in a count that leaves a tail after the groups of four.
  std::vector<int16_t> all;
  for (int v = -32768; v <= 32767; ++v) all.push_back(static_cast<int16_t>(v));
  all.push_back(-2);
  all.push_back(3);
  all.push_back(-32768);
  Pcm16ToFloats(all.data(), static_cast<int>(all.size()), &samples);
  ASSERT_EQ(samples.size(), all.size());
  for (size_t i = 0; i < all.size(); ++i) ASSERT_EQ(samples[i], all[i]) << i;
}

}  // namespace
}  // namespace audio_dsp
