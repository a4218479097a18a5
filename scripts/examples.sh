#!/usr/bin/env bash
# Makes the golden recordings in examples/ again, each with the vesk command
# that examples/expected.tsv names for it, and checks that each decodes to its
# message. The recordings pin the air format: remake them only for an
# intended change of it, and say so in the commit.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/setup.sh build
cmake -S . -B build/demo -DVESK_BUILD_TESTS=OFF -DVESK_BUILD_BENCHMARKS=OFF \
  -DVESK_BUILD_JAVA=OFF > /dev/null
cmake --build build/demo -j "$(nproc)" --target vesk > /dev/null
vesk=build/demo/tools/vesk/vesk

while IFS= read -r line; do
  [[ -z "$line" || "$line" == \#* ]] && continue
  # Tab-separated, and the options may be empty: cut keeps empty fields.
  file=examples/$(cut -f1 <<< "$line")
  read -r -a options <<< "$(cut -f2 <<< "$line")"
  message=$(cut -f3 <<< "$line")
  read -r -a made <<< "$(cut -f4 <<< "$line")"
  made=("${made[@]/#FILE/$file}")
  "$vesk" "${made[@]}" > /dev/null
  heard=$("$vesk" decode "${options[@]}" "$file" 2> /dev/null | awk '{print $3}' | sort -u)
  if [ "$heard" != "$message" ]; then
    echo "examples: $file decodes to '${heard}', not $message" >&2
    exit 1
  fi
  echo "$file: $(stat -c %s "$file") bytes, $message"
done < examples/expected.tsv
