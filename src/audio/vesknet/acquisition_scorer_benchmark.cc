// Cost of the acquisition scores alone, per vector kernel: baseband positions
// scored per second of CPU for the 48 kHz coder's geometry (a 508-sample
// frame, 16 chunks, the decoder's Doppler shifts), fed 1024 samples at a time.
// A kernel the processor lacks is skipped.

#include <cstdint>
#include <vector>

#include "audio/vesknet/acquisition_scorer.h"
#include "audio/vesknet/symbol_wave_coder.h"
#include "audio/vesknet/vesknet_decoder.h"
#include "audio/vesknet/vesknet_util.h"
#include "benchmark/benchmark.h"

namespace audio_vesknet {
namespace {

void BM_AcquisitionScores(benchmark::State& state) {
  using Kernel = AcquisitionScorer::Kernel;
  const Kernel kernel = static_cast<Kernel>(state.range(0));
  if (!AcquisitionScorer::KernelAvailable(kernel)) {
    state.SkipWithError("the processor lacks this kernel");
    return;
  }
  SymbolWaveCoderParams coder_params;
  coder_params.sample_rate = 48000;
  coder_params.upsampling_factor = 16;
  coder_params.baseband_decimation_factor = 4;
  const SymbolWaveCoder coder(coder_params);
  const VesknetDecoderParams params;
  std::vector<float> shifts;
  MakeFrequencyOffsets(params.acquisition_doppler_step,
                       coder.carrier_cycles_per_frame() * params.max_speed / 340.0f, &shifts);
  AcquisitionScorer scorer(coder.baseband_code(), shifts, params.acquisition_num_chunks,
                           static_cast<float>(params.noise_smoothing_length), 4096, kernel);
  std::vector<float> real(1024), imag(1024);
  uint32_t seed = 1;
  for (size_t i = 0; i < real.size(); ++i) {
    seed = seed * 1664525u + 1013904223u;
    real[i] = static_cast<float>(seed >> 8) / 16777216.0f - 0.5f;
    seed = seed * 1664525u + 1013904223u;
    imag[i] = static_cast<float>(seed >> 8) / 16777216.0f - 0.5f;
  }
  std::vector<float> scores;
  for (auto _ : state) {
    scorer.ComputeScores(real.data(), imag.data(), static_cast<int>(real.size()), &scores);
    benchmark::DoNotOptimize(scores.data());
  }
  state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(real.size()));
  state.counters["lanes"] = scorer.lanes();
}
BENCHMARK(BM_AcquisitionScores)
    ->ArgName("kernel")
    ->Arg(static_cast<int>(AcquisitionScorer::Kernel::kFourLane))
    ->Arg(static_cast<int>(AcquisitionScorer::Kernel::kEightLane))
    ->Arg(static_cast<int>(AcquisitionScorer::Kernel::kSixteenLane));

}  // namespace
}  // namespace audio_vesknet
