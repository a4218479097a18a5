// Cost of one tone strength filter on microphone input: 44100 Hz, one output
// per 16 samples. The DTMF receiver runs one filter per tone (ten with the
// default tone set) over every input sample. Reported as input samples per
// second (items_per_second) for a 10 ms block, a typical audio callback and a
// one-second buffer; divide by 44100 for the multiple of real time.

#include <random>
#include <vector>

#include "audio/vesknet/dtmf/dtmf_encoder_params.h"
#include "audio/vesknet/dtmf/tone_strength_filter.h"
#include "benchmark/benchmark.h"

namespace audio_vesknet {
namespace {

void BM_ToneStrengthFilter(benchmark::State& state) {
  const int block_size = static_cast<int>(state.range(0));
  std::mt19937 random(1);
  std::uniform_real_distribution<float> noise(-32768.0f, 32767.0f);
  std::vector<float> input(block_size);
  for (float& x : input) x = noise(random);
  ToneStrengthFilter filter(44100.0f, 1108.7473f, 12.0f, 16);
  std::vector<float> output;
  output.reserve(block_size / 16 + 1);
  for (auto _ : state) {
    filter.Process(input, &output);
    benchmark::DoNotOptimize(output.data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * block_size);
}
BENCHMARK(BM_ToneStrengthFilter)->Arg(441)->Arg(4096)->Arg(44100);

// The receiver's bank: a filter for each of the ten default tones, run side
// by side over 4096-sample blocks as the decoder feeds them.
// items_per_second / 44100 is the multiple of real time.
void BM_ToneStrengthFilterBank(benchmark::State& state) {
  std::mt19937 random(1);
  std::uniform_real_distribution<float> noise(-32768.0f, 32767.0f);
  std::vector<float> input(4096);
  for (float& x : input) x = noise(random);
  DtmfEncoderParams params;
  SetDefaultToneTable(&params);
  std::vector<ToneStrengthFilter> bank;
  for (const float frequency : params.tone_frequencies)
    bank.emplace_back(44100.0f, frequency, 12.0f, 16);
  std::vector<std::vector<float>> outputs(bank.size());
  for (auto _ : state) {
    ToneStrengthFilter::ProcessAll(bank.data(), static_cast<int>(bank.size()), input,
                                   outputs.data());
    benchmark::DoNotOptimize(outputs[0].data());
    benchmark::ClobberMemory();
  }
  state.SetItemsProcessed(state.iterations() * input.size());
}
BENCHMARK(BM_ToneStrengthFilterBank);

}  // namespace
}  // namespace audio_vesknet
