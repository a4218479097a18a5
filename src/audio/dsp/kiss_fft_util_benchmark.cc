// Whole-token resampling from 44.1 kHz to 48 kHz: 32385 samples (Bluestein)
// to 35249 samples (Bluestein), and the same with the plan made once
// (FftResampler: two chirp-z transforms on one 51840-point kissfft).

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

void BM_FftResamplerPlanned(benchmark::State& state) {
  std::vector<float> input(32385);
  for (size_t i = 0; i < input.size(); ++i) input[i] = std::sin(0.1f * i);
  const FftResampler resampler(static_cast<int>(input.size()), 44100.0f, 48000.0f);
  std::vector<float> output;
  for (auto _ : state) {
    resampler.Resample(input, &output);
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * input.size());
}
BENCHMARK(BM_FftResamplerPlanned);

}  // namespace
}  // namespace audio_dsp
