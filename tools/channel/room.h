// A synthetic room: the impulse response from a loudspeaker to a microphone
// in a reverberant room, made without recordings.
//
// Deterministic for a given seed; stateless and thread-safe.

#ifndef TOOLS_CHANNEL_ROOM_H_
#define TOOLS_CHANNEL_ROOM_H_

#include <cstdint>
#include <vector>

namespace vesk_channel {

// An impulse response at `rate` Hz (> 0) of ceil(rt60_s x rate) samples (at
// least 2): the direct path 1.0 at index 0, then (when `early_reflections`)
// 3 to 6 discrete reflections at 1 ... 15 ms carrying 30 % of the
// reverberant energy, and a Gaussian tail starting at 1 ms (rising over
// 5 ms) whose energy envelope falls by 60 dB in rt60_s seconds (> 0). The
// energy after index 0 is exactly 10^(-direct_to_reverb_db / 10).
std::vector<float> MakeRoomImpulseResponse(int rate, double rt60_s, double direct_to_reverb_db,
                                           bool early_reflections, uint64_t seed);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_ROOM_H_
