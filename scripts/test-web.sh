#!/usr/bin/env bash
# Builds the browser module (scripts/build-web.sh) and runs its tests with
# Node.js's test runner:
#   web/test/module.test.mjs  the ES module over WebAssembly, in Node.js;
#   web/test/page.test.mjs    the page in headless Chromium with a fake
#                             microphone playing tokens.
# The fake microphone's WAVs and the screenshots go to build/web-test/.
#
# --if-installable: when the web toolchain (setup group web) cannot be
# installed, say so and succeed; the default test command runs this way.
set -euo pipefail
cd "$(dirname "$0")/.."

if [ "${1:-}" = --if-installable ] && ! ./scripts/setup.sh web; then
  echo "web: emscripten, nodejs and chromium cannot be installed here; web tests skipped" >&2
  exit 0
fi
./scripts/build-web.sh
export VESK_WEB_TEST_OUTPUT=$PWD/build/web-test
node --test web/test/module.test.mjs web/test/page.test.mjs
echo "web: screenshots in ${VESK_WEB_TEST_OUTPUT#"$PWD"/}/"
