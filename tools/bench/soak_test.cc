// The soak program over a few simulated minutes: its output ends with a
// well-formed RESULT line; loud tokens are all decoded, hostile sound
// reports nothing, no token is false and the heap stays flat; a decoder
// run alone hears what it hears among the four.

#include <unistd.h>

#include <fstream>
#include <iterator>
#include <regex>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tools/common/subprocess.h"

namespace {

struct Result {
  bool ok = false;  // The last line is a RESULT line.
  std::string out;  // The whole output.
  std::string hours;
  int decoders = -1;
  int sent = -1, decoded = -1, false_tokens = -1;
  long heap_start_kib = -1, heap_end_kib = -1, rss_peak_kib = -1;
};

Result RunSoak(std::vector<std::string> args) {
  args.insert(args.begin(), {"--hours", "0.05"});
  const vesk_tool::ProcessResult run = vesk_tool::RunProcess(SOAK, args);
  EXPECT_EQ(run.exit_status, 0) << run.err;
  static const std::regex kLine(
      "RESULT hours=([0-9.]+) decoders=([0-9]+) tokens_sent=([0-9]+) tokens_decoded=([0-9]+) "
      "false_tokens=([0-9]+) heap_start_kib=([0-9]+) heap_end_kib=([0-9]+) "
      "rss_peak_kib=([0-9]+)\n$");
  Result result;
  std::smatch m;
  const size_t last_line = run.out.rfind('\n', run.out.size() - 2) + 1;
  const std::string line = run.out.substr(last_line);
  if (!std::regex_match(line, m, kLine)) {
    ADD_FAILURE() << "no RESULT line at the end of:\n" << run.out;
    return result;
  }
  result.ok = true;
  result.out = run.out;
  result.hours = m[1];
  result.decoders = std::stoi(m[2]);
  result.sent = std::stoi(m[3]);
  result.decoded = std::stoi(m[4]);
  result.false_tokens = std::stoi(m[5]);
  result.heap_start_kib = std::stol(m[6]);
  result.heap_end_kib = std::stol(m[7]);
  result.rss_peak_kib = std::stol(m[8]);
  return result;
}

const char* const kDecoders[] = {"DSSS 48k", "DSSS 44.1k", "DTMF", "listening"};

// A decoder's row of the per-decoder table: sent, decoded, reported again,
// false; all -1 when it is missing.
std::vector<int> RowOf(const Result& result, const std::string& decoder) {
  std::smatch m;
  const std::regex row("\\| " + decoder +
                       " \\| ([0-9]+) \\| ([0-9]+) \\| ([0-9]+) \\| ([0-9]+) \\|");
  if (!std::regex_search(result.out, m, row)) return {-1, -1, -1, -1};
  return {std::stoi(m[1]), std::stoi(m[2]), std::stoi(m[3]), std::stoi(m[4])};
}

int SentTo(const Result& result, const std::string& decoder) { return RowOf(result, decoder)[0]; }

// The totals of the RESULT line are the sums of the per-decoder table, and
// the SNR band table adds up to each decoder's sent and decoded counts;
// `decoders` are the rows and columns, in order.
void ExpectTablesAddUp(const Result& result, const std::vector<std::string>& decoders = {
                                                 std::begin(kDecoders), std::end(kDecoders)}) {
  const int n = static_cast<int>(decoders.size());
  EXPECT_EQ(result.decoders, n);
  int sent = 0, decoded = 0, false_tokens = 0;
  for (const std::string& decoder : decoders) {
    const std::vector<int> row = RowOf(result, decoder);
    ASSERT_GE(row[0], 0) << decoder << " has no row in:\n" << result.out;
    sent += row[0];
    decoded += row[1];
    false_tokens += row[3];
  }
  EXPECT_EQ(sent, result.sent);
  EXPECT_EQ(decoded, result.decoded);
  EXPECT_EQ(false_tokens, result.false_tokens);
  // Band rows: "| low to high |" then per decoder "- |" or "d/s (p%) |".
  std::vector<int> band_sent(n), band_decoded(n);
  const std::regex band_row("\\| -?[0-9]+ to -?[0-9]+ \\|(.*)\n");
  const std::regex cell(" (?:-|([0-9]+)/([0-9]+) \\([0-9]+%\\)) \\|");
  for (std::sregex_iterator row(result.out.begin(), result.out.end(), band_row), end; row != end;
       ++row) {
    const std::string cells = (*row)[1];
    int column = 0;
    for (std::sregex_iterator c(cells.begin(), cells.end(), cell); c != end; ++c, ++column) {
      ASSERT_LT(column, n) << (*row)[0];
      if ((*c)[1].matched) {
        band_decoded[column] += std::stoi((*c)[1]);
        band_sent[column] += std::stoi((*c)[2]);
      }
    }
    EXPECT_EQ(column, n) << (*row)[0];
  }
  for (int i = 0; i < n; ++i) {
    EXPECT_EQ(band_sent[i], RowOf(result, decoders[i])[0]) << decoders[i];
    EXPECT_EQ(band_decoded[i], RowOf(result, decoders[i])[1]) << decoders[i];
  }
}

void ExpectFlatMemory(const Result& result) {
  EXPECT_GT(result.heap_start_kib, 0);
  EXPECT_LT(result.heap_end_kib - result.heap_start_kib, 64);
  EXPECT_GT(result.rss_peak_kib, result.heap_end_kib);
}

TEST(SoakTest, LoudTokensAreAllDecodedAndNoneIsFalse) {
  const Result result = RunSoak({"--min-snr", "10", "--max-snr", "20", "--seed", "3"});
  ASSERT_TRUE(result.ok);
  EXPECT_EQ(result.hours, "0.05");
  EXPECT_GE(result.sent, 5);
  EXPECT_EQ(result.decoded, result.sent);
  EXPECT_EQ(result.false_tokens, 0);
  ExpectFlatMemory(result);
  // A token of the 48 kHz coder is sent to its plain decoder and to the
  // listening mode.
  const int dsss48 = SentTo(result, "DSSS 48k"), dsss44 = SentTo(result, "DSSS 44.1k");
  const int dtmf = SentTo(result, "DTMF");
  EXPECT_GT(dsss48, 0);
  EXPECT_GT(dsss44, 0);
  EXPECT_GT(dtmf, 0);
  EXPECT_EQ(SentTo(result, "listening"), dsss48);
  EXPECT_EQ(result.sent, 2 * dsss48 + dsss44 + dtmf);
  ExpectTablesAddUp(result);
}

// Over the whole SNR range some tokens are lost, none is false, and the same
// seed gives the same counts.
TEST(SoakTest, AnySnrNoFalseTokenAndRepeatable) {
  const Result result = RunSoak({"--seed", "4"});
  ASSERT_TRUE(result.ok);
  EXPECT_GT(result.sent, 0);
  EXPECT_LE(result.decoded, result.sent);
  EXPECT_EQ(result.false_tokens, 0);
  ExpectTablesAddUp(result);
  const Result again = RunSoak({"--seed", "4"});
  EXPECT_EQ(again.sent, result.sent);
  EXPECT_EQ(again.decoded, result.decoded);
  // Alone, or with one other, a decoder hears the same stream: the other
  // transmitters still play.
  const Result dtmf = RunSoak({"--seed", "4", "--decoders", "dtmf"});
  ASSERT_TRUE(dtmf.ok);
  ExpectTablesAddUp(dtmf, {"DTMF"});
  EXPECT_EQ(RowOf(dtmf, "DSSS 48k")[0], -1);
  EXPECT_EQ(RowOf(dtmf, "DTMF"), RowOf(result, "DTMF"));
  EXPECT_EQ(dtmf.sent, SentTo(result, "DTMF"));
  const Result two = RunSoak({"--seed", "4", "--decoders", "listening,dsss44"});
  ASSERT_TRUE(two.ok);
  ExpectTablesAddUp(two, {"DSSS 44.1k", "listening"});
  EXPECT_EQ(RowOf(two, "DSSS 44.1k"), RowOf(result, "DSSS 44.1k"));
  EXPECT_EQ(RowOf(two, "listening"), RowOf(result, "listening"));
}

// --dtmf-set reaches the DTMF receiver: a threshold no score reaches
// decodes nothing of what is sent to it.
TEST(SoakTest, DtmfTuningReachesTheReceiver) {
  const Result deaf = RunSoak({"--min-snr", "10", "--max-snr", "20", "--seed", "3", "--decoders",
                               "dtmf", "--dtmf-set", "acquisition_threshold=1e9"});
  ASSERT_TRUE(deaf.ok);
  EXPECT_GT(deaf.sent, 0);
  EXPECT_EQ(deaf.decoded, 0);
}

TEST(SoakTest, HostileSoundReportsNothing) {
  const Result result = RunSoak({"--hostile"});
  ASSERT_TRUE(result.ok);
  EXPECT_EQ(result.sent, 0);
  EXPECT_EQ(result.decoded, 0);
  EXPECT_EQ(result.false_tokens, 0);
  ExpectFlatMemory(result);
}

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// The recording is the stream's 16-bit samples of the span asked for (cut
// at the end of the stream), the same samples whichever span is asked.
TEST(SoakTest, RecordsTheSpanAskedFor) {
  const std::string dir = ::testing::TempDir() + "/soak_test_" + std::to_string(getpid());
  const std::string whole = dir + "_whole.raw", part = dir + "_part.raw";
  // 72 s of stream; 70 s to 80 s asked: its last 2 s.
  const vesk_tool::ProcessResult run1 =
      vesk_tool::RunProcess(SOAK, {"--hours", "0.02", "--seed", "5", "--record", whole,
                                   "--record-from", "70", "--record-seconds", "10"});
  const vesk_tool::ProcessResult run2 =
      vesk_tool::RunProcess(SOAK, {"--hours", "0.02", "--seed", "5", "--record", part,
                                   "--record-from", "71", "--record-seconds", "0.5"});
  ASSERT_EQ(run1.exit_status, 0) << run1.err;
  ASSERT_EQ(run2.exit_status, 0) << run2.err;
  const std::string whole_bytes = ReadFile(whole), part_bytes = ReadFile(part);
  std::remove(whole.c_str());
  std::remove(part.c_str());
  ASSERT_EQ(whole_bytes.size(), 2u * 48000 * 2);
  ASSERT_EQ(part_bytes.size(), 48000u);  // 0.5 s of 2-byte samples.
  EXPECT_TRUE(whole_bytes.substr(96000, 48000) == part_bytes);
  // The same counts whatever is recorded (the file's buffer moves the heap).
  const auto counts = [](const std::string& out) {
    const size_t result = out.rfind("RESULT");
    return out.substr(result, out.find(" heap_", result) - result);
  };
  EXPECT_EQ(counts(run1.out), counts(run2.out));
  const vesk_tool::ProcessResult unwritable =
      vesk_tool::RunProcess(SOAK, {"--hours", "0.02", "--record", dir + "/no/such/dir.raw"});
  EXPECT_EQ(unwritable.exit_status, 1);
  EXPECT_NE(unwritable.err.find("cannot write"), std::string::npos) << unwritable.err;
}

TEST(SoakTest, RefusesBadOptions) {
  const struct {
    std::vector<std::string> args;
    const char* error;
  } kCases[] = {
      {{"--min-snr", "5", "--max-snr", "4"}, "--min-snr must not exceed --max-snr"},
      {{"--decoders", "dtmf,dsss"}, "unknown decoder in --decoders 'dtmf,dsss'"},
      {{"--decoders", "dtmfx"}, "unknown decoder"},
      {{"--decoders", ","}, "--decoders names no decoder"},
      {{"--dtmf-set", "no_such_field=1"}, "unknown tuning or bad value: no_such_field=1"},
  };
  for (const auto& c : kCases) {
    const vesk_tool::ProcessResult run = vesk_tool::RunProcess(SOAK, c.args);
    EXPECT_EQ(run.exit_status, 2) << c.error;
    EXPECT_NE(run.err.find(c.error), std::string::npos) << run.err;
    EXPECT_EQ(run.out.find("RESULT"), std::string::npos);
  }
}

}  // namespace
