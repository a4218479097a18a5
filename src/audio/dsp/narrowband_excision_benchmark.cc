// Cost of the narrowband excision stage on one core, fed 4096-sample blocks
// of 44.1 kHz mono as a receiver's front feeds it: "realtime" is seconds of
// audio per second of CPU. Noise alone (the usual case: analyses only), and
// noise with one and with four steady tones (a notch per tone per sample).

#include <cmath>
#include <cstdint>
#include <vector>

#include "audio/dsp/narrowband_excision.h"
#include "benchmark/benchmark.h"

namespace audio_dsp {
namespace {

std::vector<float> Input(int tones) {
  std::vector<float> x(8 * 44100);
  uint32_t seed = 1;
  for (size_t i = 0; i < x.size(); ++i) {
    seed = seed * 1664525u + 1013904223u;
    x[i] = 1000.0f * (static_cast<float>(seed >> 8) / 16777216.0f - 0.5f);
    for (int t = 0; t < tones; ++t) {
      x[i] += 3000.0f * static_cast<float>(std::sin(2 * 3.14159265358979 * (16000.0 + 1000.0 * t) *
                                                    static_cast<double>(i) / 44100));
    }
  }
  return x;
}

void BM_NarrowbandExcision(benchmark::State& state) {
  NarrowbandExcisionParams params;
  params.band_low_hz = 15500;
  params.band_high_hz = 21500;
  NarrowbandExcision stage(params);
  const std::vector<float> input = Input(static_cast<int>(state.range(0)));
  const int block = 4096;
  std::vector<float> chunk(block);
  size_t offset = 0;
  // Past the confirmations: the notches are in place.
  for (int i = 0; i < 40; ++i) {
    chunk.assign(input.begin() + i * block, input.begin() + (i + 1) * block);
    stage.Analyze(chunk.data(), block);
  }
  for (auto _ : state) {
    if (offset + block > input.size()) offset = 0;
    chunk.assign(input.begin() + offset, input.begin() + offset + block);
    offset += block;
    stage.Analyze(chunk.data(), block);
    stage.Filter(chunk.data(), block);
    benchmark::DoNotOptimize(chunk.data());
  }
  state.counters["realtime"] = benchmark::Counter(static_cast<double>(block) / 44100,
                                                  benchmark::Counter::kIsIterationInvariantRate);
  state.counters["notches"] = static_cast<double>(stage.NotchFrequencies().size());
}
BENCHMARK(BM_NarrowbandExcision)->ArgNames({"tones"})->Arg(0)->Arg(1)->Arg(4);

}  // namespace
}  // namespace audio_dsp
