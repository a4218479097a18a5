#include "tools/bench/sweep_table.h"

namespace vesk_bench {

CsvFile::CsvFile(const std::string& path) : path_(path) {
  if (path_.empty()) return;
  file_ = std::fopen(path_.c_str(), "w");
  if (file_ != nullptr) {
    std::fprintf(file_,
                 "table,variable,value,series,repeat,trials,successes,wrong,median_delay_s\n");
  }
}

CsvFile::~CsvFile() {
  if (file_ != nullptr) std::fclose(file_);
}

void CsvFile::WriteCell(const std::string& table, const std::string& variable, double value,
                        const std::string& series, int repeat, int trials, const Point& point,
                        bool count_wrong) {
  if (file_ == nullptr) return;
  std::fprintf(file_, "%s,%s,%g,%s,%d,%d,%d,", table.c_str(), variable.c_str(), value,
               series.c_str(), repeat, trials, point.successes);
  if (count_wrong) std::fprintf(file_, "%d", point.wrong);
  std::fprintf(file_, ",");
  if (!point.delays.empty()) std::fprintf(file_, "%.3f", Median(point.delays));
  std::fprintf(file_, "\n");
  std::fflush(file_);
}

void RunSweep(const SweepDescription& sweep, const std::vector<double>& values,
              const std::function<Point(double value, size_t series)>& cell, CsvFile* csv) {
  std::printf("\n### %s (%d seeds per point, token played %d %s)\n\n| %s |", sweep.title.c_str(),
              sweep.trials, sweep.repeat, sweep.repeat == 1 ? "time" : "times",
              sweep.variable.c_str());
  for (const std::string& name : sweep.series) {
    std::printf(" %s %s |%s median delay s |", name.c_str(), sweep.success_label.c_str(),
                sweep.count_wrong ? " wrong |" : "");
  }
  std::printf("\n|---|");
  for (size_t i = 0; i < sweep.series.size(); ++i) {
    std::printf(sweep.count_wrong ? "---|---|---|" : "---|---|");
  }
  std::printf("\n");
  for (const double value : values) {
    std::printf("| %g |", value);
    for (size_t s = 0; s < sweep.series.size(); ++s) {
      const Point point = cell(value, s);
      std::printf(" %5.1f%% |", 100.0 * point.successes / sweep.trials);
      if (sweep.count_wrong) std::printf(" %d |", point.wrong);
      std::printf(" %.3f |", Median(point.delays));
      std::fflush(stdout);
      csv->WriteCell(sweep.table, sweep.variable, value, sweep.series[s], sweep.repeat,
                     sweep.trials, point, sweep.count_wrong);
    }
    std::printf("\n");
  }
}

}  // namespace vesk_bench
