#!/usr/bin/env bash
# The robustness figures: runs the sweeps of the robustness programs
# (tools/bench; seeded, so a run reproduces the committed files), writes
# their CSV to docs/figures/ and renders the SVG plots with gnuplot
# (scripts/figures.gp). Takes many minutes on 2 cores; JOBS sets the threads,
# SEEDS the trials per point (20).
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/setup.sh build test figures
JOBS=${JOBS:-$(nproc)}
SEEDS=${SEEDS:-20}
cmake -S . -B build/figures -DVESK_BUILD_TESTS=OFF -DVESK_BUILD_JAVA=OFF > /dev/null
cmake --build build/figures -j "$JOBS" \
  --target dsss_robustness dtmf_robustness zintar_robustness > /dev/null
bench=build/figures/tools/bench
out=docs/figures
mkdir -p "$out"

# Every table at 20 seeds, SNR from -24 to -4 dB; the speed tables at 0 dB.
common=(--seeds "$SEEDS" --threads "$JOBS" --snr 0 --snrs -24:-4:1)
for repeat in 1 3; do
  echo "figures: token played $repeat time(s)"
  "$bench/dsss_robustness" "${common[@]}" --repeat "$repeat" --tables snr,speed,reverb \
    --speeds 0.99:1.01:0.001 --csv "$out/dsss_x$repeat.csv" > /dev/null
  "$bench/dtmf_robustness" "${common[@]}" --repeat "$repeat" --tables snr,speed,reverb \
    --windows product --speeds 0.99:1.01:0.001 --csv "$out/dtmf_x$repeat.csv" > /dev/null
  "$bench/zintar_robustness" "${common[@]}" --repeat "$repeat" --tables detect,speed \
    --speeds 0.997:1.003:0.00025 --csv "$out/zintar_x$repeat.csv" > /dev/null
done
gnuplot -e "dir='$out'; seeds=$SEEDS" scripts/figures.gp
echo "figures: $(ls "$out")"
