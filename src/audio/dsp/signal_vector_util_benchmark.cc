#include <complex>
#include <vector>

#include "audio/dsp/signal_vector_util.h"
#include "benchmark/benchmark.h"

namespace audio_dsp {
namespace {

// Filters blocks of 4096 complex baseband samples; the argument is the
// number of taps.
void BM_StreamingFirFilter(benchmark::State& state) {
  const int num_taps = static_cast<int>(state.range(0));
  std::vector<std::complex<float>> taps(num_taps);
  for (int k = 0; k < num_taps; ++k) taps[k] = {1.0f / (k + 1), 0.5f / (k + 2)};
  StreamingFirFilter filter(taps);
  std::vector<std::complex<float>> input(4096), output;
  for (int i = 0; i < 4096; ++i) input[i] = {static_cast<float>(i % 7) - 3, 1.0f};
  for (auto _ : state) {
    filter.ProcessSamples(input, &output);
    benchmark::DoNotOptimize(output.data());
  }
  state.SetItemsProcessed(state.iterations() * input.size());
}
BENCHMARK(BM_StreamingFirFilter)->Arg(1)->Arg(3)->Arg(15)->Arg(31)->Arg(63);

}  // namespace
}  // namespace audio_dsp
