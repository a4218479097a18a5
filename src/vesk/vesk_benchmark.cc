// Cost of decoding through the C interface on one core: seconds of audio
// decoded per second of CPU ("realtime"), for noise from a mono microphone
// fed in 4096-sample chunks, the decoder asking for tokens every 0.25 s of
// stream time (its default). web/bench/decode.mjs feeds the WebAssembly
// build the same samples in the same chunks, so the two figures compare.

#include <cstdint>
#include <vector>

#include "benchmark/benchmark.h"
#include "vesk/vesk.h"

namespace {

constexpr int kChunk = 4096;

// Eight seconds of roughly Gaussian noise (a sum of four uniforms from a
// linear congruential generator), 16-bit, RMS about 1150.
std::vector<int16_t> Noise(int rate) {
  std::vector<int16_t> samples(static_cast<size_t>(rate) * 8);
  uint32_t seed = 1;
  for (int16_t& s : samples) {
    float sum = 0;
    for (int k = 0; k < 4; ++k) {
      seed = seed * 1664525u + 1013904223u;
      sum += static_cast<float>(seed >> 8) / 16777216.0f - 0.5f;
    }
    s = static_cast<int16_t>(2000.0f * sum);
  }
  return samples;
}

void BM_DecodeRealtime(benchmark::State& state) {
  const auto modem = static_cast<vesk_modem>(state.range(0));
  const int rate = static_cast<int>(state.range(1));
  vesk_config config;
  vesk_config_defaults(&config, modem);
  vesk_decoder_options options;
  vesk_decoder_options_defaults(&options);
  options.microphone_rate_hz = rate;
  vesk_decoder* decoder = nullptr;
  if (vesk_decoder_create(&config, &options, &decoder) != VESK_OK) {
    state.SkipWithError(vesk_last_error());
    return;
  }
  const std::vector<int16_t> audio = Noise(rate);
  const vesk_token* tokens = nullptr;
  size_t count = 0;
  size_t offset = 0;
  for (auto _ : state) {
    if (offset + kChunk > audio.size()) offset = 0;
    vesk_decoder_process(decoder, audio.data() + offset, kChunk);
    vesk_decoder_take_tokens(decoder, &tokens, &count);
    offset += kChunk;
  }
  vesk_decoder_destroy(decoder);
  state.counters["realtime"] = benchmark::Counter(static_cast<double>(kChunk) / rate,
                                                  benchmark::Counter::kIsIterationInvariantRate);
}
BENCHMARK(BM_DecodeRealtime)
    ->ArgNames({"modem", "mic"})
    ->Args({VESK_MODEM_DSSS, 44100})
    ->Args({VESK_MODEM_DSSS, 48000})
    ->Args({VESK_MODEM_DTMF, 44100})
    ->Args({VESK_MODEM_DTMF, 48000})
    ->Unit(benchmark::kMicrosecond);

}  // namespace
