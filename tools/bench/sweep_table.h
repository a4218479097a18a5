// The result tables of the robustness programs: a row per value of the swept
// variable (SNR, speed, ...), a group of columns per series (a coder, an
// envelope). Rows are printed as markdown as they complete; with a CSV file,
// every cell is also one CSV line, for plots and scripts:
//
//   table,variable,value,series,repeat,trials,successes,wrong,median_delay_s
//   snr,SNR dB,-18,48k/16/4,3,20,18,0,0.52
//
// `wrong` is empty for tables that count no tokens (wake-ups), and
// `median_delay_s` is empty without a success.

#ifndef TOOLS_BENCH_SWEEP_TABLE_H_
#define TOOLS_BENCH_SWEEP_TABLE_H_

#include <cstdio>
#include <functional>
#include <string>
#include <vector>

#include "tools/bench/bench_util.h"

namespace vesk_bench {

// A CSV file of table cells, header first. Not thread-safe.
class CsvFile {
 public:
  // Opens (truncating) `path`; an empty path writes nothing. ok() tells
  // whether the file could be opened.
  explicit CsvFile(const std::string& path);
  ~CsvFile();
  CsvFile(const CsvFile&) = delete;
  CsvFile& operator=(const CsvFile&) = delete;

  bool ok() const { return path_.empty() || file_ != nullptr; }
  void WriteCell(const std::string& table, const std::string& variable, double value,
                 const std::string& series, int repeat, int trials, const Point& point,
                 bool count_wrong);

 private:
  std::string path_;
  FILE* file_ = nullptr;
};

struct SweepDescription {
  std::string table;                // CSV name of the table ("snr", "speed").
  std::string title;                // Markdown heading.
  std::string variable;             // The swept variable with its unit ("SNR dB").
  std::vector<std::string> series;  // Column groups, in order.
  int trials = 20;                  // Per cell (seeds).
  int repeat = 3;                   // Token repetitions played.
  bool count_wrong = true;          // False for tables that decode no tokens.
  std::string success_label = "success";
};

// Runs `cell(value, series index)` for every value and series, printing each
// row as it completes and writing every cell to `csv`.
void RunSweep(const SweepDescription& sweep, const std::vector<double>& values,
              const std::function<Point(double value, size_t series)>& cell, CsvFile* csv);

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_SWEEP_TABLE_H_
