#include "tools/bench/bench_options.h"

#include <string>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_bench {
namespace {

TEST(BenchOptionsTest, ValueListsTakeNumbersAndRanges) {
  std::vector<double> values;
  ASSERT_TRUE(ParseValueList("1,2.5,-20:-10:2", &values));
  EXPECT_EQ(values, (std::vector<double>{1, 2.5, -20, -18, -16, -14, -12, -10}));
  // Each value from its index: a tenth step lands on its end.
  ASSERT_TRUE(ParseValueList("0.997:1.003:0.001", &values));
  ASSERT_EQ(values.size(), 7u);
  EXPECT_DOUBLE_EQ(values.back(), 1.003);
  ASSERT_TRUE(ParseValueList("5:5:1", &values));
  EXPECT_EQ(values, std::vector<double>{5});
  for (const char* bad : {"", "x", "1,,2", "1:2", "3:1:1", "1:2:0", "1:2:-1", "0:1e9:1", "inf"}) {
    EXPECT_FALSE(ParseValueList(bad, &values)) << bad;
  }
}

int Parse(std::vector<std::string> args, BenchOptions* options) {
  args.insert(args.begin(), "bench");
  std::vector<char*> argv;
  for (std::string& arg : args) argv.push_back(&arg[0]);
  vesk_tool::OptionParser parser;
  return ParseBenchArguments(static_cast<int>(argv.size()), argv.data(), "A bench.", &parser,
                             options);
}

TEST(BenchOptionsTest, SharedOptionsSetTheRunAndTheRoom) {
  BenchOptions options;
  ASSERT_EQ(Parse({"--seeds", "3", "--threads", "2", "--csv", "x.csv", "--snrs", "-1,1", "--speeds",
                   "0.999:1.001:0.001", "--repeat", "1", "--reverb", "--mic-rate", "48000"},
                  &options),
            -1);
  EXPECT_EQ(options.seeds, 3);
  EXPECT_EQ(options.threads, 2);
  EXPECT_EQ(options.csv, "x.csv");
  EXPECT_EQ(options.snrs, (std::vector<double>{-1, 1}));
  EXPECT_EQ(options.speeds.size(), 3u);
  EXPECT_EQ(options.air.repeat, 1);
  EXPECT_TRUE(options.air.channel.reverb);
  EXPECT_EQ(options.air.channel.mic_rate, 48000);
  EXPECT_EQ(ValuesOr(options.snrs, {5}), options.snrs);
  EXPECT_EQ(ValuesOr({}, {5}), std::vector<double>{5});
}

TEST(BenchOptionsTest, MistakesExitWithStatusTwoAndHelpWithZero) {
  for (const std::vector<std::string>& bad : std::vector<std::vector<std::string>>{
           {"--seeds", "0"}, {"--snrs", "a"}, {"--speeds", "0.1"}, {"extra"}, {"--sedes", "3"}}) {
    BenchOptions options;
    EXPECT_EQ(Parse(bad, &options), 2) << bad[0];
  }
  BenchOptions options;
  EXPECT_EQ(Parse({"--help"}, &options), 0);
}

}  // namespace
}  // namespace vesk_bench
