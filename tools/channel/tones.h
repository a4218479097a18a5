// Steady tones: other devices' ultrasonic pilots and beacons, the whine of
// TV sets and chargers. Each tone is a pure sinusoid of constant level and
// frequency with a random starting phase.
//
// Deterministic for a given seed; stateless and thread-safe.

#ifndef TOOLS_CHANNEL_TONES_H_
#define TOOLS_CHANNEL_TONES_H_

#include <cstdint>
#include <vector>

namespace vesk_channel {

// Adds to `samples` (at `rate` Hz) one sinusoid per frequency (Hz, in
// (0, rate / 2)), each of RMS `rms` (amplitude rms x sqrt 2), sample 0 at
// a phase drawn from the seed.
void AddTones(const std::vector<double>& frequencies_hz, double rms, int rate, uint64_t seed,
              std::vector<float>* samples);

// `count` frequencies drawn uniformly from [low_hz, high_hz).
std::vector<double> RandomToneFrequencies(int count, double low_hz, double high_hz, uint64_t seed);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_TONES_H_
