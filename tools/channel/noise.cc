#include "tools/channel/noise.h"

#include <cmath>

#include "base/logging.h"
#include "tools/channel/random.h"

namespace vesk_channel {

int16_t RoundToPcm16(float value) {
  const double rounded = std::round(static_cast<double>(value));
  if (rounded >= 32767.0) return 32767;
  if (rounded > -32768.0) return static_cast<int16_t>(rounded);
  return -32768;
}

void AddWhiteNoise(double sigma, uint64_t seed, std::vector<float>* samples) {
  CHECK(sigma >= 0.0);
  CHECK(samples);
  if (sigma == 0.0) return;
  Random random(seed);
  for (float& sample : *samples) sample += static_cast<float>(sigma * random.Gaussian());
}

std::vector<int16_t> MakeNoise(double seconds, int rate, double rms, uint64_t seed, int channels) {
  CHECK(seconds >= 0.0);
  CHECK(rate > 0);
  CHECK(rms >= 0.0);
  CHECK(channels > 0);
  const int64_t count = std::llround(seconds * rate) * channels;
  Random random(seed);
  std::vector<int16_t> samples(static_cast<size_t>(count));
  for (auto& sample : samples) sample = RoundToPcm16(static_cast<float>(rms * random.Gaussian()));
  return samples;
}

}  // namespace vesk_channel
