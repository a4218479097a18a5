#!/usr/bin/env bash
# Regenerates the fuzz targets' seed corpora (the <target>_corpus/ folders
# beside their sources) from real encoder output. Seeds named regression-*
# (inputs that once found a fault) are kept.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/setup.sh build
cmake -S . -B build/host > /dev/null
cmake --build build/host -j "$(nproc)" --target make_fuzz_corpus
for dir in $(find src tools -type d -name '*_fuzzer_corpus'); do
  find "$dir" -type f ! -name 'regression-*' -delete
done
mkdir -p src/social/tandry/audio/audio_modem_decoder_fuzzer_corpus \
  src/social/tandry/audio/audio_modem_encoder_fuzzer_corpus src/vesk/vesk_fuzzer_corpus \
  src/location/pellam/cpp/audio/jni/jni_fuzzer_corpus tools/common/audio_input_fuzzer_corpus \
  tools/vesk/options_fuzzer_corpus
build/host/tools/make_fuzz_corpus .
