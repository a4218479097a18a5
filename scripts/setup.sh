#!/usr/bin/env bash
# Installs every Debian package that building and testing Vesk needs, for the
# host (x86-64) and for the 32-bit x86 build through Debian multiarch.
# Idempotent: packages already present are not touched, and apt is only asked
# (and its index only refreshed) when something is missing.
set -euo pipefail

SUDO=""
if [ "$(id -u)" -ne 0 ]; then
  SUDO="sudo"
fi

HOST_PACKAGES=(
  build-essential cmake pkg-config clang-format
  libkissfft-dev android-liblog-dev
  googletest libgtest-dev libgmock-dev libbenchmark-dev
  libsndfile1-dev
  openjdk-17-jdk-headless junit5
)
# The 32-bit build mirrors the shipping Android ABI (x86) as closely as this
# machine can: the same libraries, compiled for i386.
I386_PACKAGES=(
  g++-multilib
  libkissfft-dev:i386 android-liblog-dev:i386
  libgtest-dev:i386 libgmock-dev:i386 libbenchmark-dev:i386
)

if ! dpkg --print-foreign-architectures | grep -qx i386; then
  echo "setup: enabling the i386 architecture"
  $SUDO dpkg --add-architecture i386
  NEED_UPDATE=1
fi

missing=()
for pkg in "${HOST_PACKAGES[@]}" "${I386_PACKAGES[@]}"; do
  if ! dpkg-query -W -f='${Status}' "$pkg" 2>/dev/null | grep -q "install ok installed"; then
    missing+=("$pkg")
  fi
done

if [ "${#missing[@]}" -eq 0 ] && [ -z "${NEED_UPDATE:-}" ]; then
  echo "setup: all packages present"
  exit 0
fi

echo "setup: installing ${missing[*]}"
export DEBIAN_FRONTEND=noninteractive
$SUDO apt-get update -qq
$SUDO apt-get install -y -qq --no-install-recommends "${missing[@]}"
echo "setup: done"
