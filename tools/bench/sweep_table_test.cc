#include "tools/bench/sweep_table.h"

#include <unistd.h>

#include <cstdio>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "gtest/gtest.h"

namespace vesk_bench {
namespace {

std::string ReadFile(const std::string& path) {
  std::ifstream file(path);
  std::stringstream text;
  text << file.rdbuf();
  return text.str();
}

TEST(SweepTableTest, EveryCellIsOneCsvLineInRowOrder) {
  const std::string path =
      ::testing::TempDir() + "/sweep_table_test_" + std::to_string(getpid()) + ".csv";
  {
    CsvFile csv(path);
    ASSERT_TRUE(csv.ok());
    SweepDescription sweep;
    sweep.table = "snr";
    sweep.title = "Success";
    sweep.variable = "SNR dB";
    sweep.series = {"a", "b"};
    sweep.trials = 4;
    sweep.repeat = 1;
    std::vector<std::string> calls;
    ::testing::internal::CaptureStdout();
    RunSweep(
        sweep, {-3, 2.5},
        [&](double value, size_t series) {
          calls.push_back(std::to_string(static_cast<int>(value)) + sweep.series[series]);
          Point point;
          point.successes = static_cast<int>(series) + 2;
          point.wrong = 1;
          if (series == 0) point.delays = {0.5, 0.25, 1.0};
          return point;
        },
        &csv);
    const std::string markdown = ::testing::internal::GetCapturedStdout();
    EXPECT_EQ(calls, (std::vector<std::string>{"-3a", "-3b", "2a", "2b"}));
    EXPECT_NE(markdown.find("| SNR dB | a success | wrong | median delay s |"), std::string::npos)
        << markdown;
    EXPECT_NE(markdown.find("| -3 |  50.0% | 1 | 0.500 |  75.0% | 1 | -1.000 |"), std::string::npos)
        << markdown;
  }
  EXPECT_EQ(ReadFile(path),
            "table,variable,value,series,repeat,trials,successes,wrong,median_delay_s\n"
            "snr,SNR dB,-3,a,1,4,2,1,0.500\n"
            "snr,SNR dB,-3,b,1,4,3,1,\n"
            "snr,SNR dB,2.5,a,1,4,2,1,0.500\n"
            "snr,SNR dB,2.5,b,1,4,3,1,\n");
  std::remove(path.c_str());
}

TEST(SweepTableTest, TablesWithoutTokensLeaveWrongEmpty) {
  const std::string path =
      ::testing::TempDir() + "/sweep_table_wake_" + std::to_string(getpid()) + ".csv";
  {
    CsvFile csv(path);
    Point point;
    point.successes = 5;
    point.delays = {0.1};
    csv.WriteCell("detect", "speed", 1.0005, "48k/16/4", 3, 20, point, false);
  }
  EXPECT_EQ(ReadFile(path),
            "table,variable,value,series,repeat,trials,successes,wrong,median_delay_s\n"
            "detect,speed,1.0005,48k/16/4,3,20,5,,0.100\n");
  std::remove(path.c_str());
  EXPECT_FALSE(CsvFile("/nonexistent-dir/x.csv").ok());
  EXPECT_TRUE(CsvFile("").ok());
}

}  // namespace
}  // namespace vesk_bench
