// Cost of one simulated trial: 3 s of 48 kHz source played to a 44.1 kHz
// microphone, from plain resampling up to stereo with reverberation and
// babble; and of babble generation.

#include <cmath>
#include <vector>

#include "benchmark/benchmark.h"
#include "tools/channel/babble.h"
#include "tools/channel/channel_simulator.h"

namespace vesk_channel {
namespace {

std::vector<float> Source() {
  Random random(1);
  std::vector<float> x(3 * 48000);
  for (size_t i = 0; i < x.size(); ++i) {
    x[i] = static_cast<float>(0.4 * std::sin(2 * 3.14159265358979 * 18500.0 * i / 48000) +
                              0.02 * random.Gaussian());
  }
  return x;
}

void Trial(benchmark::State& state, int channels, bool reverb, bool babble) {
  const std::vector<float> source = Source();
  ChannelParams params;
  params.channels = channels;
  params.speed = 1.002;
  params.snr_db = 10;
  params.reverb = reverb;
  params.max_random_lead_in_s = 0.5;
  if (babble) params.babble_sir_db = 10;
  for (auto _ : state) {
    ++params.seed;
    const ChannelOutput output = PlayThroughChannel(source, 48000, params);
    benchmark::DoNotOptimize(output.samples.data());
  }
  state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(source.size()));
}

void BM_MonoNoise(benchmark::State& state) { Trial(state, 1, false, false); }
void BM_MonoReverb(benchmark::State& state) { Trial(state, 1, true, false); }
void BM_StereoReverbBabble(benchmark::State& state) { Trial(state, 2, true, true); }
BENCHMARK(BM_MonoNoise)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_MonoReverb)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_StereoReverbBabble)->Unit(benchmark::kMillisecond);

void BM_Babble10s(benchmark::State& state) {
  uint64_t seed = 0;
  for (auto _ : state) {
    const std::vector<float> babble = MakeBabble(10.0, 44100, 4, ++seed);
    benchmark::DoNotOptimize(babble.data());
  }
}
BENCHMARK(BM_Babble10s)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace vesk_channel
