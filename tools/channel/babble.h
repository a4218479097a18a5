// Synthetic speech babble: an interferer with the spectral and temporal
// structure of people talking nearby, made without recordings.
//
// Each talker is a source-filter voice: a glottal pulse train whose pitch
// wanders within 90 ... 250 Hz (each talker has its own register), shaped to
// a falling spectrum and passed through three formant resonators that glide
// between vowel targets. Syllables of 1/6 ... 1/3 s (3 ... 6 per second)
// rise and fall smoothly; phrases of 4 ... 12 syllables are separated by pauses
// of 0.15 ... 0.6 s. Talkers start at random moments and are summed.
//
// Deterministic for a given seed (the generator of random.h).
// Stateless and thread-safe.

#ifndef TOOLS_CHANNEL_BABBLE_H_
#define TOOLS_CHANNEL_BABBLE_H_

#include <cstdint>
#include <vector>

namespace vesk_channel {

// round(seconds × rate) samples of `talkers` (> 0) overlapping synthetic
// talkers at `rate` Hz (>= 8000), scaled to unit RMS over the whole buffer
// (all zeros only when the buffer is too short to hold any speech).
// `seconds` >= 0.
std::vector<float> MakeBabble(double seconds, int rate, int talkers, uint64_t seed);

// The same for an exact number of samples (>= 0).
std::vector<float> MakeBabbleSamples(int64_t num_samples, int rate, int talkers, uint64_t seed);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_BABBLE_H_
