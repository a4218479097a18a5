#!/usr/bin/env bash
# Tests scripts/setup.sh against a fake apt and dpkg (shims first on PATH):
# nothing is installed for real. Each case states what a user would see.
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
mkdir -p "$work/bin"

# The fake system: $work/installed lists installed packages, $work/arches the
# foreign architectures; $work/unavailable lists packages no index offers;
# FAKE_UPDATE_FAILS=1 makes every index refresh fail as a syncing mirror does.
cat > "$work/bin/dpkg-query" <<'SHIM'
#!/usr/bin/env bash
pkg=${!#}
grep -qx "$pkg" "$FAKE/installed" && printf 'install ok installed'
exit 0
SHIM
cat > "$work/bin/dpkg" <<'SHIM'
#!/usr/bin/env bash
case $1 in
  --print-foreign-architectures) cat "$FAKE/arches" ;;
  --add-architecture) echo "$2" >> "$FAKE/arches"; echo "dpkg $*" >> "$FAKE/log" ;;
esac
SHIM
cat > "$work/bin/apt-get" <<'SHIM'
#!/usr/bin/env bash
echo "apt-get $*" >> "$FAKE/log"
for arg in "$@"; do
  if [ "$arg" = update ]; then
    [ "${FAKE_UPDATE_FAILS:-0}" = 1 ] && { echo "E: File has unexpected size. Mirror sync in progress?" >&2; exit 100; }
    exit 0
  fi
done
pkgs=()
for arg in "$@"; do case $arg in -*|install) ;; *) pkgs+=("$arg") ;; esac; done
for p in "${pkgs[@]}"; do
  grep -qx "$p" "$FAKE/unavailable" && { echo "E: Unable to locate package $p" >&2; exit 100; }
done
printf '%s\n' "${pkgs[@]}" >> "$FAKE/installed"
SHIM
printf '#!/bin/sh\necho 0\n' > "$work/bin/id"  # Root: no sudo in the way.
chmod +x "$work/bin/"*
export FAKE=$work PATH=$work/bin:$PATH

reset() {
  : > "$work/log"
  : > "$work/arches"
  : > "$work/unavailable"
  printf '%s\n' "$@" > "$work/installed"
}
fail() { echo "FAIL: $*" >&2; exit 1; }
build_group="build-essential cmake pkg-config libkissfft-dev android-liblog-dev libsndfile1-dev"

# Everything present: silent, apt never asked.
reset $build_group
out=$("$here/setup.sh" build 2>&1)
[ -z "$out" ] || fail "a complete system printed: $out"
[ ! -s "$work/log" ] || fail "apt was asked although nothing is missing"

# A failing index refresh is retried once, then setup installs anyway; the
# build group never touches the i386 architecture.
reset build-essential cmake pkg-config libkissfft-dev android-liblog-dev
out=$(FAKE_UPDATE_FAILS=1 "$here/setup.sh" build 2>&1) || fail "setup failed on a flaky mirror: $out"
[ "$(grep -c 'apt-get update' "$work/log")" = 2 ] || fail "update not tried exactly twice"
grep -q "warning: apt-get update failed twice" <<< "$out" || fail "no warning: $out"
grep -q "install -y -qq --no-install-recommends libsndfile1-dev$" "$work/log" ||
  fail "not only the missing package installed: $(cat "$work/log")"
grep -q i386 "$work/log" && fail "the build group asked for i386"
grep -qx libsndfile1-dev "$work/installed" || fail "package not installed"

# The i686 group enables the architecture and installs its packages.
reset $build_group
"$here/setup.sh" build i686 > /dev/null 2>&1 || fail "i686 setup failed"
grep -q "dpkg --add-architecture i386" "$work/log" || fail "i386 not enabled"
grep -qx "libkissfft-dev:i386" "$work/installed" || fail "i386 packages not installed"

# A package no index offers: the others still get installed, and setup fails
# naming it.
reset
echo libsndfile1-dev > "$work/unavailable"
if out=$("$here/setup.sh" build 2>&1); then fail "setup succeeded without libsndfile1-dev"; fi
grep -q "could not install: libsndfile1-dev$" <<< "$out" || fail "failure not named: $out"
grep -qx cmake "$work/installed" || fail "the available packages were not installed"

# Unknown groups are refused.
if "$here/setup.sh" nonsense > /dev/null 2>&1; then fail "unknown group accepted"; fi
echo "setup.sh: all cases pass"
