#include "tools/bench/bench_options.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <sstream>

namespace vesk_bench {
namespace {

bool ParseNumber(const std::string& text, double* value) {
  char* end = nullptr;
  *value = std::strtod(text.c_str(), &end);
  return !text.empty() && *end == '\0' && std::isfinite(*value);
}

// A range holds at most this many values (a mistyped step is an error, not
// a week of trials).
constexpr int kMaxRangeValues = 10000;

}  // namespace

bool ParseValueList(const std::string& text, std::vector<double>* values) {
  values->clear();
  std::stringstream items(text);
  std::string item;
  while (std::getline(items, item, ',')) {
    std::vector<double> parts;
    std::stringstream fields(item);
    std::string field;
    while (std::getline(fields, field, ':')) {
      double value;
      if (!ParseNumber(field, &value)) return false;
      parts.push_back(value);
    }
    if (parts.size() == 1) {
      values->push_back(parts[0]);
    } else if (parts.size() == 3 && parts[2] > 0 && parts[0] <= parts[1]) {
      const double count = std::floor((parts[1] - parts[0]) / parts[2] + 1e-9);
      if (count >= kMaxRangeValues) return false;
      // Each value from its index, so that steps such as 0.1 do not drift.
      for (int i = 0; i <= static_cast<int>(count); ++i) values->push_back(parts[0] + i * parts[2]);
    } else {
      return false;
    }
  }
  return !values->empty();
}

int ParseBenchArguments(int argc, char** argv, const std::string& description,
                        vesk_tool::OptionParser* parser, BenchOptions* options) {
  std::string snrs, speeds, values;
  parser->AddInt("seeds", &options->seeds, "seeds per table cell").Range(1, 100000);
  parser
      ->AddInt("first-seed", &options->first_seed,
               "seed of a cell's first trial (the published tables use 1; develop on others)")
      .Range(1, 1000000000);
  parser->AddInt("threads", &options->threads, "trials run at once").Range(1, 256);
  parser->AddString("csv", &options->csv, "also write every table cell to this CSV file")
      .Placeholder("FILE");
  parser->AddString("snrs", &snrs, "SNR values of the SNR tables, dB (default: each table's)")
      .Placeholder("LIST");
  parser->AddString("speeds", &speeds, "values of the speed tables (default: each table's)")
      .Placeholder("LIST");
  parser
      ->AddString("values", &values,
                  "values of the impairment tables' variable (default: each table's)")
      .Placeholder("LIST");
  vesk_tool::AddOverTheAirOptions(parser, &options->air);
  std::string error;
  const std::vector<std::string> args(argv + 1, argv + argc);
  if (parser->Parse(args, &error) && parser->help_requested()) {
    std::printf("%s\n\n%s", description.c_str(), parser->Help().c_str());
    return 0;
  }
  if (error.empty() && !parser->positional().empty()) {
    error = "unexpected argument '" + parser->positional()[0] + "'";
  }
  if (error.empty() && !snrs.empty() && !ParseValueList(snrs, &options->snrs)) {
    error = "--snrs " + snrs + ": needs numbers or FROM:TO:STEP ranges, comma-separated";
  }
  if (error.empty() && !speeds.empty() && !ParseValueList(speeds, &options->speeds)) {
    error = "--speeds " + speeds + ": needs numbers or FROM:TO:STEP ranges, comma-separated";
  }
  if (error.empty() && !values.empty() && !ParseValueList(values, &options->values)) {
    error = "--values " + values + ": needs numbers or FROM:TO:STEP ranges, comma-separated";
  }
  if (error.empty()) error = vesk_tool::OverTheAirError(options->air);
  for (const double speed : options->speeds) {
    if (error.empty() && !(speed >= 0.5 && speed <= 2.0)) {
      error = "--speeds " + speeds + ": every speed must lie in 0.5 to 2";
    }
  }
  if (!error.empty()) {
    std::fprintf(stderr, "%s: %s (see --help)\n", argv[0], error.c_str());
    return 2;
  }
  return -1;
}

}  // namespace vesk_bench
