#!/usr/bin/env bash
# Builds and runs every test of the project:
#   host     x86-64: the C++ suites and the JUnit suites through a real JVM;
#   i686     32-bit x86 (-m32 -march=i686 -mssse3 -mfpmath=sse, tuned generic), the stand-in
#            for the Android x86 ABI: the C++ suites;
#   sanitize x86-64 under AddressSanitizer and UndefinedBehaviorSanitizer:
#            the C++ suites;
#   fuzz     every libFuzzer target (clang, ASan, UBSan) for 30 s from its
#            seed corpus with a fixed random seed (scripts/fuzz.sh);
#   web      the WebAssembly module in Node.js and the page in headless
#            Chromium (scripts/test-web.sh); by default only where the web
#            toolchain can be installed.
# Installs missing packages first, only those the chosen builds need.
# VESK_TEST_BUILDS="host i686" picks builds.
set -euo pipefail
cd "$(dirname "$0")/.."

JOBS=${JOBS:-$(nproc)}
BUILDS=${VESK_TEST_BUILDS:-host i686 sanitize fuzz web}
# The default builds run the web tests only where their toolchain installs.
[ -n "${VESK_TEST_BUILDS:-}" ] || web_optional=--if-installable

groups=(build test)
for b in $BUILDS; do
  case $b in
    host) groups+=(java) ;;
    i686) groups+=(i686) ;;
    fuzz) groups+=(fuzz) ;;
  esac
done
./scripts/setup.sh "${groups[@]}"

configure_and_build() {
  local dir=$1
  shift
  cmake -S . -B "build/$dir" "$@" > "build/$dir.configure.log" 2>&1 ||
    { cat "build/$dir.configure.log"; return 1; }
  cmake --build "build/$dir" -j "$JOBS"
}

mkdir -p build
for b in $BUILDS; do
  echo "=== $b build ==="
  case $b in
    host) configure_and_build host ;;
    i686) configure_and_build i686 -DCMAKE_TOOLCHAIN_FILE=cmake/i686-linux-gnu.cmake \
            -DVESK_BUILD_JAVA=OFF -DVESK_BUILD_BENCHMARKS=OFF ;;
    sanitize) configure_and_build sanitize -DVESK_SANITIZE=ON -DVESK_BUILD_JAVA=OFF \
                -DVESK_BUILD_BENCHMARKS=OFF ;;
    fuzz) JOBS=$JOBS FUZZ_SEED=1 ./scripts/fuzz.sh 30; continue ;;
    web) ./scripts/test-web.sh ${web_optional:-}; continue ;;
    *) echo "unknown build: $b" >&2; exit 2 ;;
  esac
  (cd "build/$b" && ctest --output-on-failure -j "$JOBS")
done
echo "=== all tests passed: $BUILDS ==="
