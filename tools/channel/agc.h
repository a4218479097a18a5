// A phone's recording automatic gain control, as the receiver meets it: the
// capture gain steps down when something loud arrives and back up when it
// has gone, at moments the receiver does not choose.
//
// The target gain alternates between 0 dB and -step_db at random moments,
// one in every interval (uniform within it, from the seed); the applied gain
// (in dB) approaches the target exponentially, with the attack time
// constant when the gain falls and the release time constant when it rises
// (phone capture paths: milliseconds down, about half a second up). Every
// channel gets the same gain.
//
// Deterministic for a given seed; stateless and thread-safe.

#ifndef TOOLS_CHANNEL_AGC_H_
#define TOOLS_CHANNEL_AGC_H_

#include <cstdint>
#include <vector>

namespace vesk_channel {

struct AgcParams {
  double step_db = 0.0;     // dB, >= 0: size of each gain step; 0: no AGC.
  double interval_s = 1.0;  // s, > 0: one step in every interval.
  double attack_s = 0.01;   // s, > 0: time constant of a falling gain.
  double release_s = 0.5;   // s, > 0: time constant of a rising gain.
};

// The applied gain in dB for each of `frames` frames at `rate` Hz.
std::vector<double> AgcGainDb(const AgcParams& params, int rate, int64_t frames, uint64_t seed);

// Multiplies frame i of every channel by 10^(AgcGainDb[i] / 20); all
// channels have the same length.
void ApplyAgc(const AgcParams& params, int rate, uint64_t seed,
              std::vector<std::vector<float>>* channels);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_AGC_H_
