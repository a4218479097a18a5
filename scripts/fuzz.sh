#!/usr/bin/env bash
# Builds every fuzz target (clang, libFuzzer, ASan and UBSan) in build/fuzz
# and runs each for SECONDS (default 60), starting from its committed seed
# corpus (new inputs go to build/fuzz/corpus/, never into the sources).
# Exits non-zero on any finding, printing the reproducer's path; prints one
# summary line per target (executions, coverage, corpus).
# FUZZ_SEED fixes libFuzzer's random seed (the test command sets 1, so that a
# CI run explores the same inputs each time); unset, each run draws its own.
# Usage: [FUZZ_SEED=N] scripts/fuzz.sh [SECONDS]
set -euo pipefail
cd "$(dirname "$0")/.."
seconds=${1:-60}
jobs=${JOBS:-$(nproc)}
./scripts/setup.sh build fuzz

mkdir -p build
CC=clang CXX=clang++ cmake -S . -B build/fuzz -DVESK_FUZZ=ON -DVESK_BUILD_TESTS=OFF \
  -DVESK_BUILD_BENCHMARKS=OFF -DVESK_BUILD_JAVA=OFF > build/fuzz.configure.log 2>&1 ||
  { cat build/fuzz.configure.log; exit 1; }
targets=$(awk '{ n = split($1, p, "/"); print p[n] }' build/fuzz/fuzzers.txt)
# shellcheck disable=SC2086
cmake --build build/fuzz -j "$jobs" --target $targets

status=0
while read -r executable seeds; do
  name=$(basename "$executable")
  corpus=build/fuzz/corpus/$name
  findings=build/fuzz/findings/$name
  log=build/fuzz/$name.log
  mkdir -p "$corpus" "$findings"
  if "$executable" ${FUZZ_SEED:+-seed="$FUZZ_SEED"} -max_total_time="$seconds" -timeout=120 -rss_limit_mb=2560 \
      -artifact_prefix="$findings/" -print_final_stats=1 "$corpus" "$seeds" < /dev/null > "$log" 2>&1; then
    runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$log")
    last=$(grep -E '^#[0-9]+[[:space:]].* cov: ' "$log" | tail -1 || true)
    cov=$(sed -E -n 's/.* cov: ([0-9]+) ft: ([0-9]+) corp: ([0-9]+)\/.*/\1 edges, \2 features, \3 inputs/p' <<< "$last")
    echo "fuzz $name: ${runs:-?} executions in ${seconds} s, ${cov:-?}, no finding"
  else
    status=1
    echo "fuzz $name: FINDING" >&2
    grep -E "ERROR|Check failed|runtime error|SUMMARY" "$log" | head -5 >&2 || true
    grep -E "Test unit written to|artifact_prefix" "$log" | sed 's/^/  reproducer: /' >&2 || true
    echo "  full log: $log" >&2
  fi
done < build/fuzz/fuzzers.txt
exit $status
