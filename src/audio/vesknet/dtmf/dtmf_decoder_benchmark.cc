// Cost of the streaming DTMF decoder on one core: seconds of audio decoded
// per second of CPU ("realtime"), for microphone input fed in 4096-sample
// blocks with tokens requested every 0.25 s, over a history of 4 tokens
// (2 s). The input is noise with a token in it now and then; the cost hardly
// depends on what is heard. 44.1 kHz needs no resampling; 48 kHz does.

#include <cstdint>
#include <map>
#include <vector>

#include "audio/vesknet/dtmf/dtmf_decoder.h"
#include "audio/vesknet/dtmf/dtmf_encoder.h"
#include "benchmark/benchmark.h"

namespace audio_vesknet {
namespace {

// Noise plus a quiet token every second, deterministic.
std::vector<float> MakeInput(int seconds, uint32_t seed) {
  DtmfEncoderParams params;
  params.append_checksum_symbol = true;
  const DtmfEncoder encoder(params);
  std::vector<float> token;
  encoder.EncodeToken({1, 2, 3, 4, 5}, &token);
  std::vector<float> samples(44100 * seconds);
  for (float& sample : samples) {
    float sum = 0;
    for (int k = 0; k < 4; ++k) {
      seed = seed * 1664525u + 1013904223u;
      sum += static_cast<float>(seed >> 8) / 16777216.0f - 0.5f;
    }
    sample = 2000.0f * sum;
  }
  for (size_t start = 0; start + token.size() <= samples.size(); start += 44100) {
    for (size_t i = 0; i < token.size(); ++i) samples[start + i] += 3000.0f * token[i];
  }
  return samples;
}

// A decoder holding a full history (2 s), fed as an app feeds it.
void FillHistory(DtmfDecoder* decoder) {
  const std::vector<float> input = MakeInput(2, 2);
  for (size_t i = 0; i + 4096 <= input.size(); i += 4096) {
    decoder->ProcessSamples(std::vector<float>(input.begin() + i, input.begin() + i + 4096));
  }
}

void BM_DtmfDecoderRealtime(benchmark::State& state) {
  const float mic_rate = static_cast<float>(state.range(0));
  DtmfDecoderParams params;
  params.append_checksum_symbol = true;
  DtmfDecoder decoder(params);
  decoder.Init(mic_rate, 1);
  const int block = 4096;
  const std::vector<float> audio = MakeInput(8, 1);
  const int64_t blocks_per_request = static_cast<int64_t>(0.25 * mic_rate / block + 0.5);
  std::vector<float> chunk(block);
  int64_t blocks = 0;
  size_t offset = 0;
  for (auto _ : state) {
    if (offset + block > audio.size()) offset = 0;
    chunk.assign(audio.begin() + offset, audio.begin() + offset + block);
    offset += block;
    decoder.ProcessSamples(chunk);
    if (++blocks % blocks_per_request == 0) benchmark::DoNotOptimize(decoder.GetToken());
  }
  state.SetItemsProcessed(state.iterations() * block);
  state.counters["realtime"] = benchmark::Counter(static_cast<double>(block) / mic_rate,
                                                  benchmark::Counter::kIsIterationInvariantRate);
}
BENCHMARK(BM_DtmfDecoderRealtime)
    ->ArgNames({"mic"})
    ->Arg(44100)
    ->Arg(48000)
    ->Unit(benchmark::kMicrosecond);

// One token request over a full history: normalisation, acquisition,
// timing, candidates and selection.
void BM_DtmfDecoderGetToken(benchmark::State& state) {
  DtmfDecoderParams params;
  params.append_checksum_symbol = true;
  DtmfDecoder decoder(params);
  decoder.Init(44100.0f, 1);
  FillHistory(&decoder);
  for (auto _ : state) benchmark::DoNotOptimize(decoder.GetToken());
}
BENCHMARK(BM_DtmfDecoderGetToken)->Unit(benchmark::kMicrosecond);

// Where a request's time goes, over the same history: 0 normalisation
// (running maxima included), 1 acquisition scores (noise smoothing included,
// plus a copy that GetToken does not make), 2 timing and candidate search.
void BM_DtmfDecoderRequestStep(benchmark::State& state) {
  DtmfDecoderParams params;
  params.append_checksum_symbol = true;
  DtmfDecoder decoder(params);
  decoder.Init(44100.0f, 1);
  FillHistory(&decoder);
  audio_dsp::MatrixXf tone_scores;
  std::vector<float> acquisition_scores;
  std::map<int, std::vector<float>> candidates;
  decoder.NormalizeToneStrengths(&tone_scores);
  decoder.ComputeAcquisitionScores(tone_scores, &acquisition_scores);
  const int step = static_cast<int>(state.range(0));
  for (auto _ : state) {
    if (step == 0) {
      decoder.NormalizeToneStrengths(&tone_scores);
    } else if (step == 1) {
      decoder.ComputeAcquisitionScores(tone_scores, &acquisition_scores);
    } else {
      const int start = decoder.ComputeStartOffset(acquisition_scores);
      decoder.FindCandidates(tone_scores, acquisition_scores, start, &candidates);
    }
    benchmark::ClobberMemory();
  }
}
BENCHMARK(BM_DtmfDecoderRequestStep)
    ->ArgName("step")
    ->DenseRange(0, 2)
    ->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace audio_vesknet
