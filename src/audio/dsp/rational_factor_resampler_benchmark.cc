// Streaming throughput of the rational-factor resampler in the decoders'
// configurations, in input samples per second.

#include <cmath>
#include <complex>
#include <vector>

#include "audio/dsp/rational_factor_resampler.h"
#include "audio/dsp/resampling_kernel.h"
#include "benchmark/benchmark.h"

namespace audio_dsp {
namespace {

constexpr int kBlockSize = 4096;  // input samples per call

template <typename T>
T TestSample(int n);
template <>
float TestSample<float>(int n) {
  return 1000.0f * std::sin(0.01f * n);
}
template <>
std::complex<float> TestSample<std::complex<float>>(int n) {
  return std::polar(1000.0f, 0.01f * n);
}

template <typename T>
void Resample(benchmark::State& state, double input_rate, double output_rate) {
  RationalFactorResampler<T> resampler(DefaultResamplingKernel(input_rate, output_rate), 2000);
  if (!resampler.Valid()) {
    state.SkipWithError("invalid resampler");
    return;
  }
  std::vector<T> input(kBlockSize), output;
  for (int n = 0; n < kBlockSize; ++n) input[n] = TestSample<T>(n);
  for (auto _ : state) {
    resampler.ProcessSamples(input, &output);
    benchmark::DoNotOptimize(output.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * kBlockSize);
  state.counters["taps"] = resampler.num_taps();
}

void BM_ResampleComplex(benchmark::State& state, double input_rate, double output_rate) {
  Resample<std::complex<float>>(state, input_rate, output_rate);
}
void BM_ResampleFloat(benchmark::State& state, double input_rate, double output_rate) {
  Resample<float>(state, input_rate, output_rate);
}

BENCHMARK_CAPTURE(BM_ResampleComplex, 44100_to_14700, 44100, 14700);
BENCHMARK_CAPTURE(BM_ResampleComplex, 48000_to_12000, 48000, 12000);
BENCHMARK_CAPTURE(BM_ResampleFloat, 48000_to_44100, 48000, 44100);
BENCHMARK_CAPTURE(BM_ResampleFloat, 44100_to_48000, 44100, 48000);

}  // namespace
}  // namespace audio_dsp
