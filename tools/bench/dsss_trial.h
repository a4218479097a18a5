// One seeded over-the-air trial of the DSSS modem (see trial.h).

#ifndef TOOLS_BENCH_DSSS_TRIAL_H_
#define TOOLS_BENCH_DSSS_TRIAL_H_

#include <cstdint>
#include <string>

#include "audio/vesknet/vesknet_decoder.h"
#include "social/tandry/audio/dsss_waveform_config.h"
#include "tools/bench/trial.h"

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
  ExcisionTuning excision;            // The stage in front of the decoder.
};

TrialResult RunDsssTrial(const DsssTrial& trial, uint64_t seed);

// Tokens reported from `seconds` of noise (or babble) alone; see trial.h.
int CountFalseTokens(const DsssTrial& trial, double seconds, bool babble, uint64_t seed,
                     double* detections = nullptr);

// Applies "name=value" to the tuning; false for an unknown name or bad value.
bool SetTuning(const std::string& assignment, audio_vesknet::VesknetDecoderParams* tuning);
// The same for the decoder tuning (above) and the excision stage
// (SetExcisionTuning).
bool SetTuning(const std::string& assignment, audio_vesknet::VesknetDecoderParams* tuning,
               ExcisionTuning* excision);

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_DSSS_TRIAL_H_
