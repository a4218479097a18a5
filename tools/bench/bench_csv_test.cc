// The robustness programs write valid CSV: each runs a sweep of one point per
// table (one seed, a clean channel) and its file is read back field by field.

#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tools/common/subprocess.h"

namespace {

std::vector<std::string> Split(const std::string& line) {
  std::vector<std::string> fields;
  std::stringstream stream(line);
  std::string field;
  while (std::getline(stream, field, ',')) fields.push_back(field);
  if (!line.empty() && line.back() == ',') fields.push_back("");
  return fields;
}

bool IsNumber(const std::string& text) {
  char* end = nullptr;
  std::strtod(text.c_str(), &end);
  return !text.empty() && *end == '\0';
}

// Runs `program` with `args` writing a CSV and checks it: the header, nine
// fields per line, numbers where numbers belong, and the sent token heard in
// every cell of the clean sweep. Returns the "table/series" of each line.
std::vector<std::string> CheckCsv(const std::string& program, std::vector<std::string> args,
                                  const std::string& repeat = "1") {
  const std::string path =
      ::testing::TempDir() + "/bench_csv_test_" + std::to_string(getpid()) + ".csv";
  std::remove(path.c_str());
  args.insert(args.end(), {"--seeds", "1", "--threads", "1", "--repeat", repeat, "--snrs", "10",
                           "--speeds", "1", "--csv", path});
  const vesk_tool::ProcessResult run = vesk_tool::RunProcess(program, args);
  EXPECT_EQ(run.exit_status, 0) << run.err;
  EXPECT_NE(run.out.find("|---|"), std::string::npos) << run.out;
  std::ifstream file(path);
  std::string line;
  EXPECT_TRUE(std::getline(file, line));
  EXPECT_EQ(line, "table,variable,value,series,repeat,trials,successes,wrong,median_delay_s");
  std::vector<std::string> cells;
  while (std::getline(file, line)) {
    const std::vector<std::string> f = Split(line);
    EXPECT_EQ(f.size(), 9u) << line;
    if (f.size() != 9) continue;
    cells.push_back(f[0] + "/" + f[3]);
    EXPECT_TRUE(IsNumber(f[2])) << line;
    EXPECT_EQ(f[4], repeat) << line;
    EXPECT_EQ(f[5], "1") << line;  // Trials.
    EXPECT_EQ(f[6], "1") << line;  // Clean: heard.
    EXPECT_TRUE(f[7].empty() || f[7] == "0") << line;
    EXPECT_TRUE(IsNumber(f[8]) && std::strtod(f[8].c_str(), nullptr) >= 0) << line;
  }
  std::remove(path.c_str());
  return cells;
}

TEST(BenchCsvTest, DsssRobustness) {
  EXPECT_EQ(CheckCsv(DSSS_ROBUSTNESS, {"--coder", "48k", "--tables", "snr,speed"}),
            (std::vector<std::string>{"snr/48k/16/4", "speed/48k/16/4"}));
}

// A DTMF token played once after silence is never heard (its leading spacer
// lacks a preceding symbol): two repetitions.
TEST(BenchCsvTest, DtmfRobustness) {
  EXPECT_EQ(CheckCsv(DTMF_ROBUSTNESS, {"--windows", "product", "--tables", "snr,reverb"}, "2"),
            (std::vector<std::string>{"snr/product", "reverb/product"}));
}

// Impairment tables at a mild point: tones and music 10 dB under the signal.
TEST(BenchCsvTest, ImpairmentTables) {
  EXPECT_EQ(CheckCsv(DSSS_ROBUSTNESS,
                     {"--coder", "48k", "--tables", "tone,tones2,music", "--values", "10"}),
            (std::vector<std::string>{"tone/48k/16/4", "tones2/48k/16/4", "music/48k/16/4"}));
  EXPECT_EQ(
      CheckCsv(DTMF_ROBUSTNESS,
               {"--windows", "product", "--tables", "tone,tones2,music", "--values", "10"}, "2"),
      (std::vector<std::string>{"tone/product", "tones2/product", "music/product"}));
}

TEST(BenchCsvTest, ZintarRobustness) {
  EXPECT_EQ(CheckCsv(ZINTAR_ROBUSTNESS, {"--tables", "detect,speed"}),
            (std::vector<std::string>{"detect/48k/16/4", "detect/44.1k/15/3", "speed/48k/16/4",
                                      "speed/44.1k/15/3"}));
}

}  // namespace
