#!/usr/bin/env bash
# The main job: builds the host tools and runs the demo (encode a token, play
# it through a simulated room, decode it). Arguments go to `vesk demo`.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/setup.sh
cmake -S . -B build/host > /dev/null
cmake --build build/host -j "$(nproc)" --target vesk
exec build/host/tools/vesk demo "$@"
