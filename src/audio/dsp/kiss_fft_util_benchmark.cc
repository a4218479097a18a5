// Whole-token resampling from 44.1 kHz to 48 kHz: 32385 samples (Bluestein)
// to 35249 samples (Bluestein).

#include <cmath>
#include <vector>

#include "audio/dsp/kiss_fft_util.h"
#include "benchmark/benchmark.h"

namespace audio_dsp {
namespace {

void BM_FftResample(benchmark::State& state) {
  std::vector<float> input(32385);
  for (size_t i = 0; i < input.size(); ++i) input[i] = std::sin(0.1f * i);
  std::vector<float> output;
  for (auto _ : state) {
    FftResample(input, 44100.0f, 48000.0f, &output);
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * input.size());
}
BENCHMARK(BM_FftResample);

}  // namespace
}  // namespace audio_dsp
