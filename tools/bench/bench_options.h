// The options that every robustness program takes: seeds and threads, the
// CSV file, the values of the swept variables, and the over-the-air settings
// (vesk_tool::AddOverTheAirOptions, shared with vesk demo) that make the room
// of every table; each table then sets the variable it sweeps.

#ifndef TOOLS_BENCH_BENCH_OPTIONS_H_
#define TOOLS_BENCH_BENCH_OPTIONS_H_

#include <string>
#include <vector>

#include "tools/common/option_parser.h"
#include "tools/common/over_the_air.h"

namespace vesk_bench {

struct BenchOptions {
  int seeds = 20;              // Trials per table cell, seeds first_seed ... + seeds - 1.
  int first_seed = 1;          // The published tables use 1; development runs others.
  int threads = 1;             // Trials run at once.
  std::string csv;             // Path of the CSV of every table cell, or empty.
  std::vector<double> snrs;    // SNR values of the SNR tables, dB; empty: each table's own.
  std::vector<double> speeds;  // Values of the speed tables; empty: each table's own.
  std::vector<double> values;  // Of the impairment tables' variable; empty: each table's own.
  vesk_tool::OverTheAir air;   // The room and the repetitions of every trial.
};

// Registers the options above (the lists as --snrs, --speeds and --values:
// numbers or FROM:TO:STEP ranges, comma-separated) with `options`' values as
// defaults, parses `argc`/`argv` (checking the over-the-air options together,
// vesk_tool::OverTheAirError), and prints the help or an error. Returns -1 to
// go on, or the exit status (0 after the help, 2 after an error).
int ParseBenchArguments(int argc, char** argv, const std::string& description,
                        vesk_tool::OptionParser* parser, BenchOptions* options);

// Parses "1,2.5,-20:-10:2" into 1, 2.5, -20, -18, ..., -10. False for
// anything else, or a range that is empty or has a step <= 0.
bool ParseValueList(const std::string& text, std::vector<double>* values);

// `given` when not empty, else `defaults`.
inline const std::vector<double>& ValuesOr(const std::vector<double>& given,
                                           const std::vector<double>& defaults) {
  return given.empty() ? defaults : given;
}

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_BENCH_OPTIONS_H_
