// The simulator's random numbers: a generator whose sequence is fixed by its
// seed on every build, and independent streams derived from one seed, so
// that changing one setting of a trial (say the SNR) leaves the other draws
// unchanged. Never the standard library's distributions, whose output
// differs between implementations.

#ifndef TOOLS_CHANNEL_RANDOM_H_
#define TOOLS_CHANNEL_RANDOM_H_

#include <cstdint>

namespace vesk_channel {

// SplitMix64: a 64-bit generator whose output sequence is fully specified by
// its seed (any value, 0 included). Not for cryptography. One thread at a
// time per object.
class Random {
 public:
  explicit Random(uint64_t seed) : state_(seed) {}

  uint64_t Next() {
    uint64_t z = (state_ += 0x9e3779b97f4a7c15ULL);
    z = (z ^ (z >> 30)) * 0xbf58476d1ce4e5b9ULL;
    z = (z ^ (z >> 27)) * 0x94d049bb133111ebULL;
    return z ^ (z >> 31);
  }
  // Uniform in [0, 1), 53 random bits.
  double Uniform() { return static_cast<double>(Next() >> 11) * 0x1.0p-53; }
  // Uniform in [low, high).
  double Uniform(double low, double high) { return low + (high - low) * Uniform(); }
  // Uniform integer in [0, n), n > 0 (multiply-shift of 32 random bits; bias
  // below n / 2^32).
  int UniformInt(int n);
  // Standard normal (mean 0, variance 1) by Marsaglia's polar method; values
  // come in pairs, the second of a pair is returned by the next call.
  double Gaussian();

 private:
  uint64_t state_;
  bool has_spare_ = false;
  double spare_ = 0.0;
};

// A well-mixed seed for the independent stream number `stream` of `seed`.
uint64_t DeriveSeed(uint64_t seed, uint64_t stream);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_RANDOM_H_
