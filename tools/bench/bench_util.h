// Helpers of the table-printing benchmark programs.

#ifndef TOOLS_BENCH_BENCH_UTIL_H_
#define TOOLS_BENCH_BENCH_UTIL_H_

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <cstdio>
#include <functional>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "tools/bench/trial.h"

namespace vesk_bench {

// fn(seed) for seeds first_seed .. first_seed + num_seeds - 1 on `threads`
// threads, results in seed order.
template <typename Fn>
auto ForSeeds(int num_seeds, int threads, int first_seed, Fn fn)
    -> std::vector<decltype(fn(uint64_t{1}))> {
  std::vector<decltype(fn(uint64_t{1}))> results(num_seeds);
  std::atomic<int> next{0};
  std::vector<std::thread> workers;
  for (int t = 0; t < threads; ++t) {
    workers.emplace_back([&] {
      for (int i; (i = next++) < num_seeds;) {
        results[i] = fn(static_cast<uint64_t>(first_seed) + static_cast<uint64_t>(i));
      }
    });
  }
  for (std::thread& worker : workers) worker.join();
  return results;
}

// The trials of one table cell.
struct Point {
  int successes = 0;
  int second_successes = 0;  // The second transmitter's token heard.
  int wrong = 0;
  std::vector<double> delays;  // Of the successes.
};

inline Point Summarize(const std::vector<TrialResult>& results) {
  Point point;
  for (const TrialResult& r : results) {
    point.successes += r.correct;
    point.second_successes += r.second_correct;
    point.wrong += r.wrong;
    if (r.correct) point.delays.push_back(r.found_delay_s);
  }
  return point;
}

// The upper median; -1 for no values.
inline double Median(std::vector<double> values) {
  if (values.empty()) return -1;
  std::sort(values.begin(), values.end());
  return values[values.size() / 2];
}

// Whether the comma-separated `list` holds `item`.
inline bool HasItem(const std::string& list, const char* item) {
  return ("," + list + ",").find(std::string(",") + item + ",") != std::string::npos;
}

// Applies each "name=value" of a comma-separated list with `apply`; false,
// with a message, for the first it refuses.
inline bool ApplyAssignments(const std::string& list,
                             const std::function<bool(const std::string&)>& apply) {
  std::stringstream stream(list);
  std::string assignment;
  while (std::getline(stream, assignment, ',')) {
    if (!assignment.empty() && !apply(assignment)) {
      std::fprintf(stderr, "unknown tuning or bad value: %s\n", assignment.c_str());
      return false;
    }
  }
  return true;
}

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_BENCH_UTIL_H_
