// The core of an over-the-air trial, shared by both modems: play encoder
// output through the simulated channel, decode the microphone stream as an
// app would (4096-byte chunks, tokens requested every 0.25 s) and judge what
// was reported; and count what a decoder reports from noise or babble alone.

#ifndef TOOLS_BENCH_TRIAL_H_
#define TOOLS_BENCH_TRIAL_H_

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "tools/channel/channel_simulator.h"
#include "tools/vesk/stream_decoding.h"

namespace vesk_bench {

struct TrialResult {
  bool correct = false;       // The sent token was reported.
  int wrong = 0;              // Other tokens reported.
  double found_delay_s = -1;  // From the signal's start to the first correct report.
  double heard_delay_s = -1;  // From the signal's start to DetectBroadcaster's first true.
};

// Channel defaults for trials: 0.5 s fixed plus up to 1 s random lead-in,
// 1 s tail, 44.1 kHz mono, no noise.
vesk_channel::ChannelParams DefaultTrialChannel();

// `bytes` random bytes drawn from `seed`.
std::vector<uint8_t> RandomMessage(size_t bytes, uint64_t seed);

// Builds a decoder for a microphone rate and channel count.
using DecoderFactory =
    std::function<std::unique_ptr<audio_modem::AudioModemDecoder>(int rate, int channels)>;

// Plays `played` (mono, -1 ... 1, at `rate` Hz) through `channel` seeded with
// `seed`, decodes it with a decoder from `make_decoder` and judges the tokens
// against `message` (`crc_bytes` check bytes follow it on air).
TrialResult DecodeOverTheAir(const std::vector<float>& played, float rate,
                             const std::vector<uint8_t>& message, int crc_bytes,
                             vesk_channel::ChannelParams channel, uint64_t seed,
                             const DecoderFactory& make_decoder,
                             const vesk_tool::StreamDecodingOptions& options);

// Tokens reported from `seconds` of white noise (1000 rms) or, with
// `babble`, speech babble (3000 rms) alone at `rate` Hz: every one is false.
// When `detections` is not null it receives the share of DetectBroadcaster
// answers that were positive.
int CountFalseTokens(audio_modem::AudioModemDecoder* decoder, int rate, int message_bytes,
                     int crc_bytes, double seconds, bool babble, uint64_t seed,
                     const vesk_tool::StreamDecodingOptions& options, double* detections = nullptr);

// Splits "name=value" with a numeric value; false otherwise.
bool ParseAssignment(const std::string& assignment, std::string* name, double* value);

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_TRIAL_H_
