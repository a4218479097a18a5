// One seeded over-the-air trial of the DSSS modem: encode a token, play it
// through the simulated channel, decode the microphone stream as an app
// would (4096-byte chunks, tokens requested every 0.25 s), and judge.

#ifndef TOOLS_BENCH_DSSS_TRIAL_H_
#define TOOLS_BENCH_DSSS_TRIAL_H_

#include <cstdint>
#include <string>
#include <vector>

#include "audio/vesknet/vesknet_decoder.h"
#include "social/tandry/audio/dsss_waveform_config.h"
#include "tools/channel/channel_simulator.h"

namespace vesk_bench {

struct DsssTrial {
  audio_modem::DsssWaveformConfig waveform;    // Product waveform by default.
  audio_vesknet::VesknetDecoderParams tuning;  // Decoder tuning (defaults).
  vesk_channel::ChannelParams channel;         // Set per experiment.
  int repeat = 3;                              // Token repetitions played.
  bool crc = true;                             // 6 + 2 bytes, or 8 bytes unchecked.
  bool checksum_symbol = false;
  bool zintar = false;                // Listen through the zintar mode.
  int chunk_bytes = 4096;             // PCM bytes per decoder call.
  float buffer_length_tokens = 4.0f;  // Decoder history, in token durations.
};

struct TrialResult {
  bool correct = false;       // The sent token was reported.
  int wrong = 0;              // Other tokens reported.
  double found_delay_s = -1;  // From the signal's start to the first correct report.
  double heard_delay_s = -1;  // From the signal's start to DetectBroadcaster's first true.
};

// Channel defaults for trials: 0.5 s fixed plus up to 1 s random lead-in,
// 1 s tail, 44.1 kHz mono, no noise.
vesk_channel::ChannelParams DefaultTrialChannel();

TrialResult RunDsssTrial(const DsssTrial& trial, uint64_t seed);

// Tokens reported from `seconds` of noise only (or `babble`), with the same
// decoding loop: every one is a false token. When `detections` is not null it
// receives the fraction of DetectBroadcaster answers that were positive.
int CountFalseTokens(const DsssTrial& trial, double seconds, bool babble, uint64_t seed,
                     double* detections = nullptr);

// Applies "name=value" to the tuning; false for an unknown name or bad value.
bool SetTuning(const std::string& assignment, audio_vesknet::VesknetDecoderParams* tuning);

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_DSSS_TRIAL_H_
