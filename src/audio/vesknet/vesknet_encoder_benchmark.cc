// Cost of encoding one 8-byte token (6 message + 2 CRC bytes' worth).
//
//   Product:   48000 Hz coder, upsampling 16, decimation 4, broadcast at
//              48000 Hz: copying 17 frames of 2032 samples and scaling, no
//              resampling.
//   Record44k: the coder record's defaults (44100 Hz, upsampling 15) broadcast
//              at 48000 Hz: includes the FFT resampling of 32385 samples to
//              35249.
//   Product44k: the product coder broadcast at 44100 Hz (34544 samples to
//              31737), with and without the single-sideband filter.

#include <memory>
#include <vector>

#include "audio/vesknet/vesknet_encoder.h"
#include "benchmark/benchmark.h"

namespace audio_vesknet {
namespace {

void EncodeToken(benchmark::State& state, const SymbolWaveCoderParams& coder_params,
                 float broadcast_rate = 48000, bool single_sideband = false) {
  VesknetEncoderParams params;
  params.broadcast_sample_rate = broadcast_rate;
  params.single_sideband = single_sideband;
  const VesknetEncoder encoder(std::make_unique<SymbolWaveCoder>(coder_params), params);
  const std::vector<uint8_t> token = {0x01, 0x23, 0x45, 0x67, 0x89, 0xab, 0xcd, 0xef};
  std::vector<float> audio;
  for (auto _ : state) {
    encoder.EncodeToken(token, &audio);
    benchmark::DoNotOptimize(audio.data());
  }
  state.counters["samples"] = static_cast<double>(audio.size());
}

void BM_EncodeTokenProduct(benchmark::State& state) {
  SymbolWaveCoderParams coder_params;
  coder_params.sample_rate = 48000;
  coder_params.upsampling_factor = 16;
  coder_params.baseband_decimation_factor = 4;
  EncodeToken(state, coder_params);
}
BENCHMARK(BM_EncodeTokenProduct)->Unit(benchmark::kMicrosecond);

void BM_EncodeTokenRecord44kTo48k(benchmark::State& state) {
  EncodeToken(state, SymbolWaveCoderParams());
}
BENCHMARK(BM_EncodeTokenRecord44kTo48k)->Unit(benchmark::kMicrosecond);

void BM_EncodeTokenProductTo44k(benchmark::State& state) {
  SymbolWaveCoderParams coder_params;
  coder_params.sample_rate = 48000;
  coder_params.upsampling_factor = 16;
  coder_params.baseband_decimation_factor = 4;
  EncodeToken(state, coder_params, 44100, state.range(0) != 0);
}
BENCHMARK(BM_EncodeTokenProductTo44k)
    ->ArgName("single_sideband")
    ->Arg(0)
    ->Arg(1)
    ->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace audio_vesknet
