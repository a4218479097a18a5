// Cost of the streaming DSSS decoder on one core: seconds of audio decoded
// per second of CPU ("realtime"), for mono microphone input fed in
// 4096-sample blocks with tokens requested every 0.25 s, for both coder
// configurations in use. BM_DecoderRealtime hears noise; BM_DecoderRealtime
// Tokens hears a transmitter repeating a token at 10 dB SNR, so that every
// request also scores the new frames of the token's group and selects
// tokens, and asks DetectBroadcaster as a host would.

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>
#include <vector>

#include "audio/vesknet/vesknet_decoder.h"
#include "audio/vesknet/vesknet_encoder.h"
#include "benchmark/benchmark.h"

namespace audio_vesknet {
namespace {

SymbolWaveCoderParams Coder(int coder_rate) {
  SymbolWaveCoderParams params;
  if (coder_rate == 48000) {
    params.sample_rate = 48000;
    params.upsampling_factor = 16;
    params.baseband_decimation_factor = 4;
  }
  return params;
}

std::vector<float> Noise(int n, uint32_t seed) {
  std::vector<float> samples(n);
  for (float& s : samples) {
    // Sum of uniforms: cheap, roughly Gaussian, deterministic.
    float sum = 0;
    for (int k = 0; k < 4; ++k) {
      seed = seed * 1664525u + 1013904223u;
      sum += static_cast<float>(seed >> 8) / 16777216.0f - 0.5f;
    }
    s = 2000.0f * sum;
  }
  return samples;
}

void BM_DecoderRealtime(benchmark::State& state) {
  const int coder_rate = static_cast<int>(state.range(0));
  const float mic_rate = static_cast<float>(state.range(1));
  const SymbolWaveCoder coder(Coder(coder_rate));
  VesknetDecoderParams params;
  params.max_buffer_duration = 4 * 16 * coder.frame_size() / coder.params().sample_rate;
  VesknetDecoder decoder(&coder, params);
  decoder.Initialize(mic_rate, 1);
  const int block = 4096;
  const std::vector<float> audio = Noise(static_cast<int>(mic_rate) * 8, 1);
  const int64_t blocks_per_request = static_cast<int64_t>(0.25 * mic_rate / block + 0.5);
  std::vector<float> chunk(block);
  VesknetDecodeResults results;
  int64_t blocks = 0;
  size_t offset = 0;
  for (auto _ : state) {
    if (offset + block > audio.size()) offset = 0;
    chunk.assign(audio.begin() + offset, audio.begin() + offset + block);
    offset += block;
    decoder.ProcessSamples(chunk);
    if (++blocks % blocks_per_request == 0) decoder.GetToken(&results);
  }
  state.SetItemsProcessed(state.iterations() * block);
  state.counters["realtime"] = benchmark::Counter(static_cast<double>(block) / mic_rate,
                                                  benchmark::Counter::kIsIterationInvariantRate);
}
BENCHMARK(BM_DecoderRealtime)
    ->ArgNames({"coder", "mic"})
    ->Args({44100, 44100})
    ->Args({48000, 44100})
    ->Args({48000, 48000})
    ->Unit(benchmark::kMicrosecond);

// The token (8 bytes, 16 symbols) at the microphone rate, repeated without a
// gap, with white noise 10 dB below its power.
std::vector<float> Broadcast(const SymbolWaveCoderParams& coder_params, float mic_rate, int n) {
  VesknetEncoderParams params;
  params.broadcast_sample_rate = mic_rate;
  const VesknetEncoder encoder(std::make_unique<SymbolWaveCoder>(coder_params), params);
  std::vector<float> token;
  encoder.EncodeToken({0x01, 0x23, 0x45, 0x67, 0x89, 0xab, 0xcd, 0xef}, &token);
  double power = 0.0;
  for (const float s : token) power += static_cast<double>(s) * s;
  const float noise_rms = static_cast<float>(std::sqrt(power / token.size() / 10.0));
  // Noise() has an rms of 2000 / sqrt(3): rescale it.
  const std::vector<float> noise = Noise(n, 7);
  std::vector<float> samples(n);
  for (int i = 0; i < n; ++i) {
    samples[i] =
        32768.0f * (token[i % token.size()] + noise[i] * noise_rms * std::sqrt(3.0f) / 2000.0f);
  }
  return samples;
}

void BM_DecoderRealtimeTokens(benchmark::State& state) {
  const int coder_rate = static_cast<int>(state.range(0));
  const float mic_rate = static_cast<float>(state.range(1));
  const SymbolWaveCoder coder(Coder(coder_rate));
  VesknetDecoderParams params;
  params.max_buffer_duration = 4 * 16 * coder.frame_size() / coder.params().sample_rate;
  VesknetDecoder decoder(&coder, params);
  decoder.Initialize(mic_rate, 1);
  const int block = 4096;
  const std::vector<float> audio =
      Broadcast(Coder(coder_rate), mic_rate, static_cast<int>(mic_rate) * 8);
  const int64_t blocks_per_request = static_cast<int64_t>(0.25 * mic_rate / block + 0.5);
  std::vector<float> chunk(block);
  VesknetDecodeResults results;
  int64_t blocks = 0, found = 0;
  size_t offset = 0;
  for (auto _ : state) {
    if (offset + block > audio.size()) offset = 0;
    chunk.assign(audio.begin() + offset, audio.begin() + offset + block);
    offset += block;
    decoder.ProcessSamples(chunk);
    if (++blocks % blocks_per_request == 0) {
      benchmark::DoNotOptimize(decoder.DetectBroadcaster());
      found += decoder.GetToken(&results) ? 1 : 0;
    }
  }
  state.SetItemsProcessed(state.iterations() * block);
  state.counters["realtime"] = benchmark::Counter(static_cast<double>(block) / mic_rate,
                                                  benchmark::Counter::kIsIterationInvariantRate);
  // Share of requests that returned a token (the audio loops every 8 s).
  state.counters["found"] =
      static_cast<double>(found) / std::max<int64_t>(1, blocks / blocks_per_request);
}
BENCHMARK(BM_DecoderRealtimeTokens)
    ->ArgNames({"coder", "mic"})
    ->Args({44100, 44100})
    ->Args({48000, 44100})
    ->Args({48000, 48000})
    ->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace audio_vesknet
