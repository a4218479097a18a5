// Forward transforms at fast and Bluestein sizes, and raw kissfft calls at the
// fast sizes to measure the wrappers' overhead.

#include <kiss_fft.h>
#include <kiss_fftr.h>

#include <complex>
#include <cstdlib>
#include <vector>

#include "audio/dsp/kiss_fft.h"
#include "benchmark/benchmark.h"

namespace audio_dsp {
namespace {

void Sizes(benchmark::internal::Benchmark* benchmark) {
  for (int size : {1024, 1905, 32385, 35249, 65536}) benchmark->Arg(size);
}

std::vector<float> Signal(int size) {
  std::vector<float> signal(size);
  for (int i = 0; i < size; ++i) signal[i] = static_cast<float>((i * 7919) % 1000) / 1000.0f;
  return signal;
}

void BM_ComplexForward(benchmark::State& state) {
  const int size = state.range(0);
  const ComplexFFTTransformer fft(size, /*scale_inverse=*/false);
  const std::vector<float> real = Signal(size);
  std::vector<std::complex<float>> input(real.begin(), real.end()), output(size);
  for (auto _ : state) {
    fft.Forward(input.data(), output.data());
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * size);
}
BENCHMARK(BM_ComplexForward)->Apply(Sizes);

void BM_ComplexForwardInverse(benchmark::State& state) {
  const int size = state.range(0);
  const ComplexFFTTransformer fft(size, /*scale_inverse=*/true);
  const std::vector<float> real = Signal(size);
  std::vector<std::complex<float>> input(real.begin(), real.end()), spectrum(size), output(size);
  for (auto _ : state) {
    fft.Forward(input.data(), spectrum.data());
    fft.Inverse(spectrum.data(), output.data());
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * size);
}
BENCHMARK(BM_ComplexForwardInverse)->Apply(Sizes);

void BM_RealForward(benchmark::State& state) {
  const int size = state.range(0);
  const RealFFTTransformer fft(size, /*scale_inverse=*/false);
  const std::vector<float> input = Signal(size);
  std::vector<std::complex<float>> output(fft.GetTransformedSize());
  for (auto _ : state) {
    fft.Forward(input.data(), output.data());
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * size);
}
BENCHMARK(BM_RealForward)->Apply(Sizes);

void BM_RealForwardInverse(benchmark::State& state) {
  const int size = state.range(0);
  const RealFFTTransformer fft(size, /*scale_inverse=*/true);
  const std::vector<float> input = Signal(size);
  std::vector<std::complex<float>> spectrum(fft.GetTransformedSize());
  std::vector<float> output(size);
  for (auto _ : state) {
    fft.Forward(input.data(), spectrum.data());
    fft.Inverse(spectrum.data(), output.data());
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * size);
}
BENCHMARK(BM_RealForwardInverse)->Apply(Sizes);

void BM_RawKissComplexForward(benchmark::State& state) {
  const int size = state.range(0);
  kiss_fft_cfg config = kiss_fft_alloc(size, 0, nullptr, nullptr);
  const std::vector<float> real = Signal(size);
  std::vector<std::complex<float>> input(real.begin(), real.end()), output(size);
  for (auto _ : state) {
    kiss_fft(config, reinterpret_cast<const kiss_fft_cpx*>(input.data()),
             reinterpret_cast<kiss_fft_cpx*>(output.data()));
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * size);
  free(config);
}
BENCHMARK(BM_RawKissComplexForward)->Arg(1024)->Arg(65536);

void BM_RawKissRealForward(benchmark::State& state) {
  const int size = state.range(0);
  kiss_fftr_cfg config = kiss_fftr_alloc(size, 0, nullptr, nullptr);
  const std::vector<float> input = Signal(size);
  std::vector<std::complex<float>> output(size / 2 + 1);
  for (auto _ : state) {
    kiss_fftr(config, input.data(), reinterpret_cast<kiss_fft_cpx*>(output.data()));
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * size);
  free(config);
}
BENCHMARK(BM_RawKissRealForward)->Arg(1024)->Arg(65536);

}  // namespace
}  // namespace audio_dsp
