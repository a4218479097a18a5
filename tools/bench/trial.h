// What the robustness programs and the loopback tests add to the shared
// over-the-air trial (tools/common/over_the_air.h): their default room,
// random messages, and counting what a decoder reports from noise or babble
// alone.

#ifndef TOOLS_BENCH_TRIAL_H_
#define TOOLS_BENCH_TRIAL_H_

#include <cstdint>
#include <string>
#include <vector>

#include "audio/dsp/narrowband_excision.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "tools/channel/channel_simulator.h"
#include "tools/common/over_the_air.h"
#include "tools/common/stream_decoding.h"

namespace vesk_bench {

using vesk_tool::TrialResult;

// Channel defaults for trials: 0.5 s fixed plus up to 1 s random lead-in,
// 1 s tail, 44.1 kHz mono, no noise.
vesk_channel::ChannelParams DefaultTrialChannel();

// `bytes` random bytes drawn from `seed`.
std::vector<uint8_t> RandomMessage(size_t bytes, uint64_t seed);

// Tokens reported from `seconds` of white noise (1000 rms) or, with
// `babble`, speech babble (3000 rms) alone at `rate` Hz: every one is false.
// When `detections` is not null it receives the share of DetectBroadcaster
// answers that were positive.
int CountFalseTokens(audio_modem::AudioModemDecoder* decoder, int rate, int message_bytes,
                     int crc_bytes, double seconds, bool babble, uint64_t seed,
                     const vesk_tool::StreamDecodingOptions& options, double* detections = nullptr);

// The narrowband excision stage of a trial's decoder: on or off, and its
// tuning (the threshold, analysis interval, confirmations, release, notch
// width and count of `params`; the band, rate and channels are the
// decoder's).
struct ExcisionTuning {
  bool on = true;
  audio_dsp::NarrowbandExcisionParams params;
};

// Applies "excision=0|1" or "excision_<field>=value" (threshold_db,
// interval_s, confirmations, release, notch_hz, max_notches, protect_hz);
// false for any other assignment or a bad value.
bool SetExcisionTuning(const std::string& assignment, ExcisionTuning* tuning);

// Gives `decoder` (built without the stage) the stage of `tuning` over
// `band`, when it is on, and initialises it for `rate` and `channels`.
void AddExcision(const ExcisionTuning& tuning, const audio_dsp::NarrowbandExcisionParams& band,
                 int rate, int channels, audio_modem::AudioModemDecoder* decoder);

// Splits "name=value" with a numeric value; false otherwise.
bool ParseAssignment(const std::string& assignment, std::string* name, double* value);

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_TRIAL_H_
