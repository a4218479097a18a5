#!/usr/bin/env bash
# The main job: builds the vesk tool and runs its demo (encode a token, play
# it through a simulated room, decode it). Arguments go to `vesk demo`.
# Installs only what building the tool needs (no test, Java or 32-bit packages).
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/setup.sh build
cmake -S . -B build/demo -DVESK_BUILD_TESTS=OFF -DVESK_BUILD_BENCHMARKS=OFF \
  -DVESK_BUILD_JAVA=OFF > /dev/null
cmake --build build/demo -j "$(nproc)" --target vesk
exec build/demo/tools/vesk/vesk demo "$@"
