#!/usr/bin/env bash
# Builds the browser module into web/dist/: vesk.wasm (the C interface
# compiled to WebAssembly by Emscripten), vesk.js (the ES module that loads
# it) and vesk.d.ts; prints the sizes of vesk.wasm and vesk.js.
#
# Installs what is missing first (setup groups build and web). kissfft has no
# Debian package for WebAssembly (libkissfft-dev holds host objects), so its
# Debian source package, the version the host build links, is fetched once
# into build/web-deps/ and compiled by the build itself. Only that download
# touches apt, through private lists under build/web-deps/apt: the system's
# apt configuration and state are left alone.
set -euo pipefail
cd "$(dirname "$0")/.."

JOBS=${JOBS:-$(nproc)}
./scripts/setup.sh build web

# Debian's emscripten finds its JavaScript helpers (acorn and others) in
# /usr/share/nodejs, where Debian's own Node.js looks by default and other
# builds of Node.js do not.
export NODE_PATH=/usr/share/nodejs${NODE_PATH:+:$NODE_PATH}

deps=$PWD/build/web-deps
kissfft=$deps/kissfft

# Runs "$@" and, when it fails, once more.
retry_once() {
  "$@" && return 0
  echo "build-web: '$*' failed; retrying once" >&2
  "$@"
}

fetch_kissfft() {
  local apt_dir=$deps/apt
  rm -rf "$apt_dir" "$kissfft"
  mkdir -p "$apt_dir/parts" "$apt_dir/lists/partial" "$apt_dir/cache/archives/partial"
  : > "$apt_dir/none.list"
  local suite=bookworm
  # shellcheck disable=SC1091
  [ -r /etc/os-release ] && suite=$(. /etc/os-release && echo "${VERSION_CODENAME:-$suite}")
  cat > "$apt_dir/parts/debian-src.sources" <<EOF
Types: deb-src
URIs: http://deb.debian.org/debian
Suites: $suite
Components: main
Signed-By: /usr/share/keyrings/debian-archive-keyring.gpg
EOF
  local apt_opts=(-q -o "Dir::Etc::SourceList=$apt_dir/none.list"
    -o "Dir::Etc::SourceParts=$apt_dir/parts" -o "Dir::State::Lists=$apt_dir/lists"
    -o "Dir::Cache=$apt_dir/cache" -o "APT::Sandbox::User=$(id -un)")
  echo "build-web: fetching kissfft's source package ($suite)"
  retry_once apt-get "${apt_opts[@]}" update > "$apt_dir/update.log" 2>&1 ||
    { cat "$apt_dir/update.log" >&2; return 1; }
  # The host build's version when it is installed, else the suite's.
  local package=kissfft version
  version=$(dpkg-query -W -f='${Version}\n' libkissfft-dev 2>/dev/null | head -n 1 || true)
  [ -n "$version" ] && package="kissfft=$version"
  if ! (cd "$apt_dir" && retry_once apt-get "${apt_opts[@]}" source --download-only "$package") \
    > "$apt_dir/source.log" 2>&1; then
    [ "$package" = kissfft ] && { cat "$apt_dir/source.log" >&2; return 1; }
    echo "build-web: $package is not in $suite's index; taking the suite's kissfft" >&2
    (cd "$apt_dir" && retry_once apt-get "${apt_opts[@]}" source --download-only kissfft) \
      > "$apt_dir/source.log" 2>&1 || { cat "$apt_dir/source.log" >&2; return 1; }
  fi
  # Unpacks the upstream tarball and applies Debian's patches.
  (cd "$apt_dir" && dpkg-source -x kissfft_*.dsc "$kissfft") > "$apt_dir/unpack.log" 2>&1 ||
    { cat "$apt_dir/unpack.log" >&2; return 1; }
  rm -rf "$apt_dir/lists" "$apt_dir/cache"
  echo "build-web: $(cd "$apt_dir" && basename kissfft_*.dsc .dsc) unpacked in ${kissfft#"$PWD"/}"
}

[ -f "$kissfft/kiss_fftr.c" ] || fetch_kissfft

mkdir -p build
emcmake cmake -S . -B build/web -DCMAKE_BUILD_TYPE=Release -DKISSFFT_SOURCE_DIR="$kissfft" \
  > build/web.configure.log 2>&1 || { cat build/web.configure.log; exit 1; }
cmake --build build/web -j "$JOBS" --target vesk_web

for file in web/dist/vesk.wasm web/dist/vesk.js; do
  echo "$file: $(stat -c %s "$file") bytes, $(gzip -9c "$file" | wc -c) gzipped"
done
