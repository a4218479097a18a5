// Impulsive sounds of a room: hand claps and door slams.
//
// A clap is a burst of broadband noise, 0.5 ms rise and an exponential decay
// of 3-8 ms, its spectrum tilted up by a 500 Hz high-pass (most energy
// 1-10 kHz, some up to the top of the band). A door slam is a thud: noise
// through a 300 Hz low-pass plus a 60-120 Hz panel ringing, 2 ms rise and a
// 40-120 ms decay. Seven in ten impulses are claps. One impulse starts in
// every interval, at a uniform random moment within it (from the seed), and
// each is scaled to the same peak.
//
// Deterministic for a given seed; stateless and thread-safe.

#ifndef TOOLS_CHANNEL_IMPULSES_H_
#define TOOLS_CHANNEL_IMPULSES_H_

#include <cstdint>
#include <vector>

namespace vesk_channel {

struct ImpulseParams {
  double per_second = 0.0;  // > = 0: impulses per second; 0: none.
  // dB: each impulse's peak amplitude over the signal's RMS.
  double peak_over_signal_db = 20.0;
};

// Adds the impulses to every channel of `channels` (all of the same length,
// at `rate` Hz >= 8000), each with its peak at `peak` (> 0, sample units);
// returns their starting frames.
std::vector<int64_t> AddImpulses(double per_second, double peak, int rate, uint64_t seed,
                                 std::vector<std::vector<float>>* channels);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_IMPULSES_H_
