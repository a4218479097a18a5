// What the narrowband excision stage costs in front of each decoder: the
// decoder fed 16-bit blocks of 4096 samples of 44.1 kHz mono noise through
// ProcessPcm16 (the JNI path), tokens requested every 0.25 s, with the stage
// off and on. "realtime" is seconds of audio per second of CPU; with no line
// in the noise the stage only analyses, and the two differ by its cost.

#include <cmath>
#include <cstdint>
#include <memory>
#include <vector>

#include "benchmark/benchmark.h"
#include "social/tandry/audio/audio_modem_decoder.h"

namespace audio_modem {
namespace {

constexpr int kRate = 44100;
constexpr int kBlock = 4096;

// Uniform noise of RMS about 1730, plus a tone of amplitude `tone_amplitude`
// at `tone_hz`.
std::vector<int16_t> Noise(int n, double tone_hz, double tone_amplitude) {
  std::vector<int16_t> samples(n);
  uint32_t seed = 7;
  for (int i = 0; i < n; ++i) {
    seed = seed * 1664525u + 1013904223u;
    const double tone = tone_amplitude * std::sin(2.0 * 3.14159265358979 * tone_hz * i / kRate);
    samples[i] =
        static_cast<int16_t>(static_cast<int32_t>(seed >> 16) % 6000 - 3000 + std::lround(tone));
  }
  return samples;
}

std::unique_ptr<AudioModemDecoder> MakeDecoder(int modem, bool excision) {
  if (modem == 2) {
    DtmfDecoderConfig config;
    config.input_sample_rate = kRate;
    config.narrowband_excision = excision;
    return MakeDtmfAudioModemDecoder(config);
  }
  DsssDecoderConfig config;
  if (modem == 1) config.waveform = Waveform44100();
  config.input_sample_rate = kRate;
  config.narrowband_excision = excision;
  return MakeDsssAudioModemDecoder(config);
}

// Arguments: the modem (0: DSSS 48 kHz coder, 1: DSSS 44.1 kHz coder, 2:
// DTMF) and the stage (0: off, 1: on, 2: on with a tone to notch).
void BM_DecoderWithExcision(benchmark::State& state) {
  const int modem = static_cast<int>(state.range(0));
  const int stage = static_cast<int>(state.range(1));
  const auto decoder = MakeDecoder(modem, stage != 0);
  const int message_bytes = modem == 2 ? 5 : 6;
  const int crc_bytes = modem == 2 ? 0 : 2;
  const std::vector<int16_t> audio =
      Noise(kRate * 8, modem == 2 ? 1200.0 : 18600.0, stage == 2 ? 7740.0 : 0.0);
  DecodeResults results;
  const int64_t blocks_per_request = kRate / 4 / kBlock + 1;
  int64_t blocks = 0;
  size_t offset = 0;
  // Warm-up: two seconds, time for the stage to confirm the tone.
  for (; offset + kBlock <= static_cast<size_t>(2 * kRate); offset += kBlock) {
    decoder->ProcessPcm16(audio.data() + offset, kBlock);
  }
  if (stage == 2 && !decoder->narrowband_excision()->filtering()) {
    state.SkipWithError("the stage notches no tone");
  }
  for (auto _ : state) {
    if (offset + kBlock > audio.size()) offset = 0;
    decoder->ProcessPcm16(audio.data() + offset, kBlock);
    offset += kBlock;
    if (++blocks % blocks_per_request == 0) decoder->GetTokens(&results, message_bytes, crc_bytes);
  }
  state.counters["realtime"] = benchmark::Counter(static_cast<double>(kBlock) / kRate,
                                                  benchmark::Counter::kIsIterationInvariantRate);
}
BENCHMARK(BM_DecoderWithExcision)
    ->ArgNames({"modem", "excision"})
    ->ArgsProduct({{0, 1, 2}, {0, 1, 2}})
    ->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace audio_modem
