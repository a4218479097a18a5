#!/usr/bin/env bash
# The robustness figures: runs the sweeps of the robustness programs
# (tools/bench; seeded, so a run reproduces the committed files), writes
# their CSV to docs/figures/ and renders the SVG plots with gnuplot
# (scripts/figures.gp). JOBS sets the threads, SEEDS the trials per point
# (20).
#
#   scripts/figures.sh              every table: white noise, speed, reverberation,
#                                   the listening mode, then every impairment
#                                   (about 10 minutes on 2 cores)
#   scripts/figures.sh IMPAIRMENT...  only these impairment tables (names as in
#                                   tools/bench/impairment_tables.h: phone, clip, tone...)
#   VALUES=-10,0 scripts/figures.sh tone   one table at chosen points only
#
# Each impairment table runs for both DSSS coders and DTMF, the token played
# once and three times: docs/figures/impairments/<table>_{dsss,dtmf}_x{1,3}.csv,
# the README's markdown table <table>.md and the plot <table>.svg.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/setup.sh build test figures
JOBS=${JOBS:-$(nproc)}
SEEDS=${SEEDS:-20}
impairments=(phone flagship clip agc level dropout dropout_length walk tone tone_fixed tones2 music
  impulses second second_offset)
tables=("$@")
for table in "${tables[@]}"; do
  if [[ " ${impairments[*]} " != *" $table "* ]]; then
    echo "figures: unknown impairment table '$table' (known: ${impairments[*]})" >&2
    exit 2
  fi
done
# FIGURES_BUILD=build/host uses the programs of an existing build instead.
build=${FIGURES_BUILD:-build/figures}
if [ -z "${FIGURES_BUILD:-}" ]; then
  cmake -S . -B "$build" -DVESK_BUILD_TESTS=OFF -DVESK_BUILD_JAVA=OFF > /dev/null
fi
cmake --build "$build" -j "$JOBS" \
  --target dsss_robustness dtmf_robustness zintar_robustness > /dev/null
bench=$build/tools/bench
out=docs/figures
mkdir -p "$out/impairments"

if [ ${#tables[@]} -eq 0 ]; then
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
  tables=("${impairments[@]}")
fi

# Each impairment table in the programs' default room (a random 0.5-1.5 s
# lead-in, 44.1 kHz microphone); the table sets the SNR it is measured at.
for table in "${tables[@]}"; do
  echo "figures: impairment $table"
  for repeat in 1 3; do
    common=(--tables "$table" --seeds "$SEEDS" --threads "$JOBS" --repeat "$repeat")
    [ -z "${VALUES:-}" ] || common+=(--values "$VALUES")
    "$bench/dsss_robustness" "${common[@]}" \
      --csv "$out/impairments/${table}_dsss_x$repeat.csv" > /dev/null
    "$bench/dtmf_robustness" "${common[@]}" --windows product \
      --csv "$out/impairments/${table}_dtmf_x$repeat.csv" > /dev/null
  done
  awk -F, -f scripts/impairment_table.awk "$out/impairments/${table}"_{dsss,dtmf}_x*.csv \
    > "$out/impairments/$table.md"
done
gnuplot -e "dir='$out'; seeds=$SEEDS" scripts/figures.gp
echo "figures: $(ls "$out" "$out/impairments" | tr '\n' ' ')"
