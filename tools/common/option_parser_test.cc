#include "tools/common/option_parser.h"

#include <cmath>
#include <string>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_tool {
namespace {

struct Fixture {
  int repeat = 3;
  float carrier = 18500;
  double snr = 0;
  std::string message = "00";
  std::string preset = "48k";
  bool crc = true;
  OptionParser parser;
  Fixture() {
    parser.AddInt("repeat", &repeat, "repetitions").Range(1, 100);
    parser.AddFloat("carrier", &carrier, "carrier, Hz");
    parser.AddDouble("snr", &snr, "SNR, dB").Range(-60, INFINITY);
    parser.AddString("message", &message, "message");
    parser.AddString("preset", &preset, "coder").Choices({"48k", "44k"});
    parser.AddFlag("crc", &crc, "CRC-16");
  }
  // Parses `args`, expecting an error, and returns it.
  std::string Error(const std::vector<std::string>& args) {
    std::string error;
    EXPECT_FALSE(parser.Parse(args, &error)) << args[0];
    return error;
  }
};

TEST(OptionParserTest, ParsesEveryForm) {
  Fixture f;
  std::string error;
  ASSERT_TRUE(f.parser.Parse({"--repeat", "5", "out.wav", "--carrier=19000.5", "--no-crc",
                              "--message", "abcd", "--snr", "-10", "-", "--preset=44k"},
                             &error))
      << error;
  EXPECT_EQ(f.repeat, 5);
  EXPECT_FLOAT_EQ(f.carrier, 19000.5f);
  EXPECT_FALSE(f.crc);
  EXPECT_EQ(f.message, "abcd");
  EXPECT_EQ(f.snr, -10.0);
  EXPECT_EQ(f.preset, "44k");
  EXPECT_EQ(f.parser.positional(), (std::vector<std::string>{"out.wav", "-"}));
  EXPECT_TRUE(f.parser.Given("crc"));
  EXPECT_FALSE(f.parser.help_requested());
  EXPECT_FALSE(Fixture().parser.Given("crc"));
}

TEST(OptionParserTest, DoubleDashEndsTheOptions) {
  Fixture f;
  std::string error;
  ASSERT_TRUE(f.parser.Parse({"--repeat", "2", "--", "--crc", "-x"}, &error));
  EXPECT_EQ(f.repeat, 2);
  EXPECT_TRUE(f.crc);
  EXPECT_EQ(f.parser.positional(), (std::vector<std::string>{"--crc", "-x"}));
}

TEST(OptionParserTest, HelpStopsParsingAndIsNotAnOption) {
  for (const char* help : {"-h", "--help"}) {
    Fixture f;
    std::string error;
    // What follows the help request is not looked at.
    ASSERT_TRUE(f.parser.Parse({"--repeat", "7", help, "--repeat", "x"}, &error)) << help;
    EXPECT_TRUE(f.parser.help_requested());
    EXPECT_EQ(f.repeat, 7);
  }
  Fixture f;
  EXPECT_EQ(f.parser.Help().find("help"), std::string::npos);
}

TEST(OptionParserTest, ErrorsNameTheOptionTheValueAndTheRange) {
  Fixture f;
  EXPECT_EQ(f.Error({"--repeat", "0"}), "--repeat 0: out of range (1 to 100)");
  EXPECT_EQ(f.Error({"--repeat=101"}), "--repeat 101: out of range (1 to 100)");
  EXPECT_EQ(f.Error({"--repeat", "1.5"}), "--repeat needs a whole number, not '1.5'");
  EXPECT_EQ(f.Error({"--repeat", "99999999999"}),
            "--repeat needs a whole number, not '99999999999'");
  EXPECT_EQ(f.Error({"--repeat"}), "--repeat needs a value");
  EXPECT_EQ(f.Error({"--carrier", "x"}), "--carrier needs a number, not 'x'");
  EXPECT_EQ(f.Error({"--carrier", "1e99"}), "--carrier needs a number, not '1e99'");
  EXPECT_EQ(f.Error({"--carrier", "nan"}), "--carrier needs a number, not 'nan'");
  EXPECT_EQ(f.Error({"--carrier", "inf"}), "--carrier needs a finite number, not 'inf'");
  EXPECT_EQ(f.Error({"--snr", "-70"}), "--snr -70: out of range (-60 to inf)");
  EXPECT_EQ(f.Error({"--snr", "-inf"}), "--snr -inf: out of range (-60 to inf)");
  EXPECT_EQ(f.Error({"--preset", "96k"}), "--preset 96k: must be one of 48k, 44k");
  EXPECT_EQ(f.Error({"--crc=1"}), "--crc takes no value (use --no-crc to turn it off)");
  EXPECT_EQ(f.Error({"--no-crc=1"}), "--no-crc takes no value");
}

TEST(OptionParserTest, InfinityPassesOnlyAnInfiniteBound) {
  Fixture f;
  std::string error;
  ASSERT_TRUE(f.parser.Parse({"--snr", "inf"}, &error)) << error;
  EXPECT_TRUE(std::isinf(f.snr));
}

TEST(OptionParserTest, UnknownOptionsNameTheNearestKnownOne) {
  Fixture f;
  EXPECT_EQ(f.Error({"--repaet", "3"}), "unknown option --repaet (did you mean --repeat?)");
  EXPECT_EQ(f.Error({"--carier=3"}), "unknown option --carier (did you mean --carrier?)");
  EXPECT_EQ(f.Error({"--pre"}), "unknown option --pre (did you mean --preset?)");
  EXPECT_EQ(f.Error({"-repeat"}), "unknown option -repeat (did you mean --repeat?)");
  EXPECT_EQ(f.Error({"--no-carrier"}), "unknown option --no-carrier (see --help)");
  EXPECT_EQ(f.Error({"--zzz"}), "unknown option --zzz (see --help)");
  EXPECT_EQ(f.parser.Nearest("snt"), "snr");
  EXPECT_EQ(f.parser.Nearest("cr"), "crc");
  EXPECT_EQ(f.parser.Nearest("xyz"), "");
}

TEST(OptionParserTest, HelpShowsTheDefaultsAtRegistrationAndTheRanges) {
  Fixture f;
  std::string error;
  ASSERT_TRUE(f.parser.Parse({"--repeat", "9", "--no-crc"}, &error));
  const std::string help = f.parser.Help();
  EXPECT_NE(help.find("  --repeat N"), std::string::npos) << help;
  EXPECT_NE(help.find("repetitions (1 to 100; default 3)"), std::string::npos) << help;
  EXPECT_NE(help.find("--[no-]crc"), std::string::npos) << help;
  EXPECT_NE(help.find("CRC-16 (default on)"), std::string::npos) << help;
  EXPECT_NE(help.find("coder (one of 48k, 44k; default 48k)"), std::string::npos) << help;
  EXPECT_NE(help.find("SNR, dB (-60 to inf; default 0)"), std::string::npos) << help;
  EXPECT_NE(help.find("carrier, Hz (default 18500)"), std::string::npos) << help;
}

enum class Size { kSmall, kLarge };

TEST(OptionParserTest, ListsAndChoices) {
  std::vector<double> tones = {1200};
  Size size = Size::kLarge;
  OptionParser parser;
  parser.AddList("tones", &tones, "tones, Hz").Range(1, 24000);
  parser.AddChoice("size", &size, {{"small", Size::kSmall}, {"large", Size::kLarge}}, "size");
  const std::string help = parser.Help();
  EXPECT_NE(help.find("--tones X,..."), std::string::npos) << help;
  EXPECT_NE(help.find("tones, Hz (1 to 24000; default 1200)"), std::string::npos) << help;
  EXPECT_NE(help.find("--size NAME"), std::string::npos) << help;
  EXPECT_NE(help.find("size (one of small, large; default large)"), std::string::npos) << help;
  std::string error;
  ASSERT_TRUE(parser.Parse({"--tones", "18600,19000.5", "--size", "small"}, &error)) << error;
  EXPECT_EQ(tones, (std::vector<double>{18600, 19000.5}));
  EXPECT_EQ(size, Size::kSmall);
  ASSERT_TRUE(parser.Parse({"--tones="}, &error)) << error;
  EXPECT_TRUE(tones.empty());
  EXPECT_FALSE(parser.Parse({"--tones", "100,30000"}, &error));
  EXPECT_EQ(error, "--tones 30000: out of range (1 to 24000)");
  EXPECT_FALSE(parser.Parse({"--tones", "100,"}, &error));
  EXPECT_EQ(error, "--tones needs a number after every comma, not '100,'");
  EXPECT_FALSE(parser.Parse({"--tones", "1,x"}, &error));
  EXPECT_EQ(error, "--tones needs a number, not 'x'");
  EXPECT_FALSE(parser.Parse({"--size", "medium"}, &error));
  EXPECT_EQ(error, "--size medium: must be one of small, large");
}

TEST(OptionParserTest, LongHelpWrapsUnderItsColumn) {
  int value = 0;
  OptionParser parser;
  parser.AddInt("n", &value, std::string(120, 'a').replace(60, 1, " "));
  const std::string help = parser.Help();
  for (size_t start = 0, end; (end = help.find('\n', start)) != std::string::npos;
       start = end + 1) {
    EXPECT_LE(end - start, 100u) << help;
  }
  EXPECT_NE(help.find("\n" + std::string(32, ' ') + "aaa"), std::string::npos) << help;
}

}  // namespace
}  // namespace vesk_tool
