// What listening costs: the zintar listening mode on 48 kHz mono noise (the
// detector runs, the DSSS decoder sleeps) next to the full DSSS decoder on
// the same audio, tokens requested every 0.25 s. "realtime" is seconds of
// audio per second of CPU; the ratio of the two is what listening saves.

#include <cstdint>
#include <memory>
#include <vector>

#include "benchmark/benchmark.h"
#include "social/tandry/audio/audio_modem_decoder.h"

namespace audio_modem {
namespace {

constexpr int kRate = 48000;
constexpr int kBlock = 4096;

std::vector<int16_t> Noise(int n) {
  std::vector<int16_t> samples(n);
  uint32_t seed = 7;
  for (int16_t& s : samples) {
    seed = seed * 1664525u + 1013904223u;
    s = static_cast<int16_t>(static_cast<int32_t>(seed >> 16) % 6000 - 3000);
  }
  return samples;
}

void Run(benchmark::State& state, bool zintar) {
  DsssDecoderConfig config;
  config.input_sample_rate = kRate;
  config.use_zintar = zintar;
  const auto decoder = MakeDsssAudioModemDecoder(config);
  const std::vector<int16_t> audio = Noise(kRate * 8);
  std::vector<int16_t> raw(kBlock);
  std::vector<float> floats(kBlock);
  DecodeResults results;
  const int64_t blocks_per_request = kRate / 4 / kBlock + 1;
  int64_t blocks = 0;
  size_t offset = 0;
  for (auto _ : state) {
    if (offset + kBlock > audio.size()) offset = 0;
    if (zintar) {
      raw.assign(audio.begin() + offset, audio.begin() + offset + kBlock);
      decoder->ProcessSamplesWithZintar(raw.data(), kBlock);
    } else {
      floats.assign(audio.begin() + offset, audio.begin() + offset + kBlock);
      decoder->ProcessSamples(floats);
    }
    offset += kBlock;
    if (++blocks % blocks_per_request == 0) decoder->GetTokens(&results, 6, 2);
  }
  state.SetItemsProcessed(state.iterations() * kBlock);
  state.counters["realtime"] = benchmark::Counter(static_cast<double>(kBlock) / kRate,
                                                  benchmark::Counter::kIsIterationInvariantRate);
}

void BM_ListeningMode(benchmark::State& state) { Run(state, true); }
BENCHMARK(BM_ListeningMode)->Unit(benchmark::kMicrosecond);

void BM_FullDsssDecoder(benchmark::State& state) { Run(state, false); }
BENCHMARK(BM_FullDsssDecoder)->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace audio_modem
