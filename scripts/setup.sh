#!/usr/bin/env bash
# Installs the Debian packages that a Vesk command needs, by group:
#   build    compile the library and the vesk tool (the demo needs only this)
#   test     GoogleTest, Google Benchmark and clang-format for the C++ suites
#   java     the JDK, JUnit 5 and ProGuard for the Java peers and their tests
#   i686     the 32-bit x86 build: multilib g++ and the :i386 libraries
#   fuzz     clang with the libFuzzer and sanitizer runtimes
#   figures  gnuplot for the robustness plots
#   web      Emscripten, Node.js and Chromium for the WebAssembly build
# Usage: scripts/setup.sh GROUP...
#
# Idempotent and quiet when nothing is missing: apt is only asked (and its
# index only refreshed) when a package is absent. Package mirrors are flaky:
# a failed index refresh is retried once and then only warned about, since
# the indexes that did load usually still carry every package; setup fails
# only when the install itself fails, naming the packages it could not get.
# Works as root or through sudo.
set -euo pipefail

packages_of() {
  case $1 in
    build) echo build-essential cmake pkg-config libkissfft-dev android-liblog-dev libsndfile1-dev ;;
    test) echo googletest libgtest-dev libgmock-dev libbenchmark-dev clang-format ;;
    java) echo openjdk-17-jdk-headless junit5 proguard-cli ;;
    i686) echo g++-multilib libkissfft-dev:i386 android-liblog-dev:i386 libgtest-dev:i386 \
      libgmock-dev:i386 libbenchmark-dev:i386 ;;
    fuzz) echo clang libclang-rt-14-dev ;;
    figures) echo gnuplot-nox ;;
    web) echo emscripten nodejs chromium ;;
    *) return 1 ;;
  esac
}

if [ "$#" -eq 0 ]; then
  echo "usage: $0 GROUP... (build test java i686 fuzz figures web)" >&2
  exit 2
fi

wanted=()
need_i386=""
for group in "$@"; do
  if ! list=$(packages_of "$group"); then
    echo "setup: unknown package group '$group'" >&2
    exit 2
  fi
  [ "$group" = i686 ] && need_i386=1
  read -r -a pkgs <<< "$list"
  wanted+=("${pkgs[@]}")
done

is_installed() {
  dpkg-query -W -f='${Status}' "$1" 2>/dev/null | grep -q "install ok installed"
}

missing=()
for pkg in "${wanted[@]}"; do
  is_installed "$pkg" || missing+=("$pkg")
done
added_arch=""
if [ -n "$need_i386" ] && ! dpkg --print-foreign-architectures | grep -qx i386; then
  added_arch=1
fi
if [ "${#missing[@]}" -eq 0 ] && [ -z "$added_arch" ]; then
  exit 0
fi

SUDO=()
if [ "$(id -u)" -ne 0 ]; then
  if ! command -v sudo > /dev/null; then
    echo "setup: missing packages (${missing[*]}) and neither root nor sudo to install them" >&2
    exit 1
  fi
  SUDO=(sudo)
fi
export DEBIAN_FRONTEND=noninteractive

if [ -n "$added_arch" ]; then
  echo "setup: enabling the i386 architecture"
  "${SUDO[@]}" dpkg --add-architecture i386
fi

# One retry, then a warning: an index that failed to load (a mirror in the
# middle of a sync, say) does not stop packages coming from the others.
refresh_index() {
  local attempt
  for attempt in 1 2; do
    if "${SUDO[@]}" apt-get update -qq; then return 0; fi
    [ "$attempt" = 1 ] && echo "setup: apt-get update failed; retrying once" >&2
  done
  echo "setup: warning: apt-get update failed twice; installing from the indexes that loaded" >&2
}

# apt's progress lines are shown only when the install fails.
install() {
  local log
  log=$(mktemp)
  if "${SUDO[@]}" apt-get install -y -qq --no-install-recommends "$@" > "$log" 2>&1; then
    rm -f "$log"
    return 0
  fi
  cat "$log" >&2
  rm -f "$log"
  return 1
}

echo "setup: installing ${missing[*]}"
refresh_index
if ! install "${missing[@]}"; then
  # A single bad package must not keep the others out: try each on its own,
  # then report what is still missing.
  echo "setup: installing together failed; trying each package" >&2
  for pkg in "${missing[@]}"; do
    is_installed "$pkg" || install "$pkg" || true
  done
fi
failed=()
for pkg in "${missing[@]}"; do
  is_installed "$pkg" || failed+=("$pkg")
done
if [ "${#failed[@]}" -gt 0 ]; then
  echo "setup: could not install: ${failed[*]}" >&2
  exit 1
fi
echo "setup: done"
