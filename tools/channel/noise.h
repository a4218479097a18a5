// White Gaussian noise and the microphone's 16-bit conversion.
//
// Deterministic for a given seed; stateless and thread-safe.

#ifndef TOOLS_CHANNEL_NOISE_H_
#define TOOLS_CHANNEL_NOISE_H_

#include <cstdint>
#include <vector>

namespace vesk_channel {

// The nearest 16-bit value (halves away from zero), clipped to
// -32768 ... 32767; NaN gives -32768.
int16_t RoundToPcm16(float value);

// Adds white Gaussian noise of standard deviation `sigma` (>= 0) to every
// sample of *samples.
void AddWhiteNoise(double sigma, uint64_t seed, std::vector<float>* samples);

// White Gaussian noise of `rms` (16-bit units, >= 0), round(seconds x rate)
// frames of `channels` independent interleaved channels, rounded and clipped
// to 16 bits, for noise-only (false alarm) runs.
std::vector<int16_t> MakeNoise(double seconds, int rate, double rms, uint64_t seed,
                               int channels = 1);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_NOISE_H_
