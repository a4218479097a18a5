#include "tools/vesk/option_parser.h"

#include <string>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_tool {
namespace {

struct Fixture {
  int repeat = 3;
  float carrier = 18500;
  std::string message = "00";
  bool crc = true;
  OptionParser parser;
  Fixture() {
    parser.AddInt("repeat", &repeat, "");
    parser.AddFloat("carrier", &carrier, "");
    parser.AddString("message", &message, "");
    parser.AddFlag("crc", &crc, "");
  }
};

TEST(OptionParserTest, ParsesEveryForm) {
  Fixture f;
  std::string error;
  ASSERT_TRUE(f.parser.Parse(
      {"--repeat", "5", "out.wav", "--carrier=19000.5", "--no-crc", "--message", "abcd"}, &error))
      << error;
  EXPECT_EQ(f.repeat, 5);
  EXPECT_FLOAT_EQ(f.carrier, 19000.5f);
  EXPECT_FALSE(f.crc);
  EXPECT_EQ(f.message, "abcd");
  EXPECT_EQ(f.parser.positional(), std::vector<std::string>{"out.wav"});
  EXPECT_TRUE(f.parser.Given("crc"));
  EXPECT_FALSE(Fixture().parser.Given("crc"));
}

TEST(OptionParserTest, ReportsMistakes) {
  const std::vector<std::vector<std::string>> bad = {
      {"--unknown"},         {"--repeat"}, {"--repeat", "x"},          {"--repeat", "1.5"},
      {"--carrier", "1e99"}, {"--crc=1"},  {"--repeat", "99999999999"}};
  for (const auto& args : bad) {
    Fixture f;
    std::string error;
    EXPECT_FALSE(f.parser.Parse(args, &error)) << args[0];
    EXPECT_FALSE(error.empty());
  }
}

TEST(OptionParserTest, HexBytes) {
  std::vector<unsigned char> bytes;
  ASSERT_TRUE(ParseHexBytes("0x01ab:FF 00", &bytes));
  EXPECT_EQ(bytes, (std::vector<unsigned char>{0x01, 0xab, 0xff, 0x00}));
  EXPECT_EQ(ToHex(bytes), "01abff00");
  EXPECT_FALSE(ParseHexBytes("abc", &bytes));
  EXPECT_FALSE(ParseHexBytes("zz", &bytes));
}

}  // namespace
}  // namespace vesk_tool
