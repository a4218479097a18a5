// Real-time factor of the zintar detector on 48 kHz 16-bit input while
// nothing is heard: seeded white noise at a moderate level, fed in blocks as a
// microphone would deliver them. The "realtime" counter is audio seconds per
// CPU second.

#include <stdint.h>

#include <random>
#include <vector>

#include "benchmark/benchmark.h"
#include "social/tandry/audio/zintar_detector.h"

namespace {

constexpr int32_t kSampleRate = 48000;

void BM_ZintarProcessNoise(benchmark::State& bench) {
  const int32_t block = static_cast<int32_t>(bench.range(0));
  // Ten seconds of noise, replayed in a loop so the input stays in cache as a
  // live stream's latest block would.
  std::vector<int16_t> noise(10 * kSampleRate);
  std::mt19937 rng(1234);
  std::normal_distribution<float> normal(0.0f, 1000.0f);
  for (int16_t& s : noise) s = static_cast<int16_t>(normal(rng));

  ZintarConfig config;
  SetStandardZintarConfig(kSampleRate, &config);
  ZintarDetector* detector = CreateZintarDetector(&config);
  ZintarState* state = CreateZintarState(&config, detector);
  if (state == nullptr) {
    bench.SkipWithError("detector creation failed");
    return;
  }
  const size_t num_blocks = noise.size() / block;
  size_t next = 0;
  float score = 0.0f;
  for (auto _ : bench) {
    ZintarProcess(detector, state, noise.data() + next * block, block, &score);
    benchmark::DoNotOptimize(score);
    next = next + 1 == num_blocks ? 0 : next + 1;
  }
  const double samples = static_cast<double>(bench.iterations()) * block;
  bench.SetItemsProcessed(static_cast<int64_t>(samples));
  bench.counters["realtime"] =
      benchmark::Counter(samples / kSampleRate, benchmark::Counter::kIsRate);
  FreeZintarState(state);
  FreeZintarDetector(detector);
}
BENCHMARK(BM_ZintarProcessNoise)->Arg(1024)->Arg(4096);

}  // namespace
