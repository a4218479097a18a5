#!/usr/bin/env bash
# Installs the library from BUILD_DIR into a temporary prefix, then builds
# and runs this example against it twice: through the CMake package (only
# CMAKE_PREFIX_PATH points there) and through pkg-config. Each run must print
# the encoded message as hex on a line of its own.
# Usage: install_test.sh BUILD_DIR
set -euo pipefail
build=$(cd "$1" && pwd)
here=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix
expected=0123456789ab

cmake --install "$build" --prefix "$prefix" > "$work/install.log"
test -f "$prefix/include/vesk/vesk.h"

# The installed header is plain C and stands alone.
echo '#include <vesk/vesk.h>
int main(void) { return vesk_version() == 0; }' > "$work/header.c"
cc -std=c99 -Wall -Wextra -Werror -pedantic -I"$prefix/include" -c "$work/header.c" \
  -o "$work/header.o"

check_output() {
  local how=$1 output=$2
  if ! grep -qx "$expected" <<< "$output"; then
    echo "FAIL ($how): expected a line '$expected', got:" >&2
    echo "$output" >&2
    exit 1
  fi
  echo "ok ($how)"
}

cmake -S "$here" -B "$work/cmake-build" -DCMAKE_PREFIX_PATH="$prefix" > "$work/configure.log"
cmake --build "$work/cmake-build" > "$work/build.log"
check_output find_package "$("$work/cmake-build/vesk_c_example")"

libdir=$(dirname "$(find "$prefix" -name 'vesk.pc' -print -quit)")
export PKG_CONFIG_PATH=$libdir
flags=$(pkg-config --cflags --libs vesk)
cc -std=c99 -Wall -Wextra -Werror "$here/loopback.c" $flags -o "$work/pc-example"
check_output pkg-config "$(LD_LIBRARY_PATH=$(pkg-config --variable=libdir vesk) "$work/pc-example")"
