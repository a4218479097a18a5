#include "tools/common/hex_bytes.h"

#include <vector>

#include "gtest/gtest.h"

namespace vesk_tool {
namespace {

TEST(HexBytesTest, ParsesWithPrefixAndSeparatorsInEitherCase) {
  std::vector<uint8_t> bytes;
  ASSERT_TRUE(ParseHexBytes("0x01ab:FF 00-9c", &bytes));
  EXPECT_EQ(bytes, (std::vector<uint8_t>{0x01, 0xab, 0xff, 0x00, 0x9c}));
  EXPECT_EQ(ToHex(bytes), "01abff009c");
  ASSERT_TRUE(ParseHexBytes("", &bytes));
  EXPECT_TRUE(bytes.empty());
}

TEST(HexBytesTest, RefusesOddDigitCountsAndNonHex) {
  std::vector<uint8_t> bytes = {7};
  EXPECT_FALSE(ParseHexBytes("abc", &bytes));
  EXPECT_FALSE(ParseHexBytes("zz", &bytes));
  EXPECT_FALSE(ParseHexBytes("0g", &bytes));
  EXPECT_EQ(bytes, std::vector<uint8_t>{7});  // Untouched on failure.
}

TEST(HexBytesTest, EveryByteRoundTrips) {
  std::vector<uint8_t> all(256);
  for (int i = 0; i < 256; ++i) all[i] = static_cast<uint8_t>(i);
  std::vector<uint8_t> back;
  ASSERT_TRUE(ParseHexBytes(ToHex(all), &back));
  EXPECT_EQ(back, all);
}

}  // namespace
}  // namespace vesk_tool
