#include "audio/vesknet/crc16_coder.h"

#include <string>
#include <vector>

#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

Crc16Coder MakeCoder(int num_message_bytes) {
  Crc16CoderParams params;
  params.num_message_bytes = num_message_bytes;
  return Crc16Coder(params);
}

TEST(Crc16CoderTest, KnownCheckBytes) {
  const std::string text = "123456789";
  std::vector<uint8_t> message(text.begin(), text.end());
  const Crc16Coder coder = MakeCoder(9);
  EXPECT_EQ(coder.BytesInToken(), 11);
  EXPECT_EQ(coder.ComputeCrc(message), 0x2189);
  coder.AppendCrc(&message);
  ASSERT_EQ(message.size(), 11u);
  EXPECT_EQ(message[9], 0x21);  // High byte first.
  EXPECT_EQ(message[10], 0x89);
  EXPECT_TRUE(coder.CheckCrc(message));

  std::vector<uint8_t> one = {0x01};
  MakeCoder(1).AppendCrc(&one);
  EXPECT_EQ(one, (std::vector<uint8_t>{0x01, 0x11, 0x89}));
}

TEST(Crc16CoderTest, AllZeroTokenPasses) {
  const Crc16Coder coder = MakeCoder(6);
  std::vector<uint8_t> message(6, 0);
  coder.AppendCrc(&message);
  EXPECT_EQ(message, std::vector<uint8_t>(8, 0));
  EXPECT_TRUE(coder.CheckCrc(message));
}

TEST(Crc16CoderTest, DetectsCorruptionAndByteOrder) {
  const Crc16Coder coder = MakeCoder(6);
  std::vector<uint8_t> token = {0xDE, 0xAD, 0xBE, 0xEF, 0x01, 0x02};
  coder.AppendCrc(&token);
  ASSERT_TRUE(coder.CheckCrc(token));
  // ComputeCrc ignores the surplus check bytes of a whole token.
  EXPECT_EQ(coder.ComputeCrc(token), (token[6] << 8) | token[7]);
  ASSERT_NE(token[6], token[7]);
  std::vector<uint8_t> swapped = token;
  std::swap(swapped[6], swapped[7]);
  EXPECT_FALSE(coder.CheckCrc(swapped));
  // Every single-bit error is caught.
  for (size_t i = 0; i < token.size() * 8; ++i) {
    std::vector<uint8_t> corrupted = token;
    corrupted[i / 8] ^= static_cast<uint8_t>(1 << (i % 8));
    EXPECT_FALSE(coder.CheckCrc(corrupted)) << "bit " << i;
  }
}

TEST(Crc16CoderDeathTest, ChecksSizes) {
  EXPECT_DEATH(MakeCoder(0), "Check failed: params_.num_message_bytes > 0");
  const Crc16Coder coder = MakeCoder(4);
  std::vector<uint8_t> five(5, 0);
  EXPECT_DEATH(coder.AppendCrc(&five),
               "Check failed: static_cast<int>\\(message->size\\(\\)\\) == "
               "params_.num_message_bytes");
  EXPECT_DEATH(coder.CheckCrc(five),
               "Check failed: static_cast<int>\\(token.size\\(\\)\\) == BytesInToken\\(\\)");
  EXPECT_DEATH(coder.ComputeCrc({1, 2}),
               "Check failed: static_cast<int>\\(bytes.size\\(\\)\\) >= "
               "params_.num_message_bytes");
  EXPECT_DEATH(coder.AppendCrc(nullptr), "Check failed: message");
}

}  // namespace
}  // namespace audio_vesknet
