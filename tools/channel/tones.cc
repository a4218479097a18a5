#include "tools/channel/tones.h"

#include <cmath>

#include "base/logging.h"
#include "tools/channel/channel_constants.h"
#include "tools/channel/random.h"

namespace vesk_channel {

void AddTones(const std::vector<double>& frequencies_hz, double rms, int rate, uint64_t seed,
              std::vector<float>* samples) {
  CHECK(rms >= 0.0);
  CHECK(rate > 0);
  CHECK(samples);
  Random random(seed);
  const double amplitude = rms * std::sqrt(2.0);
  for (const double frequency : frequencies_hz) {
    CHECK(frequency > 0.0 && frequency < rate / 2.0);
    const double phase = 2.0 * kPi * random.Uniform();
    const double step = 2.0 * kPi * frequency / rate;
    for (size_t i = 0; i < samples->size(); ++i) {
      (*samples)[i] +=
          static_cast<float>(amplitude * std::sin(phase + step * static_cast<double>(i)));
    }
  }
}

std::vector<double> RandomToneFrequencies(int count, double low_hz, double high_hz, uint64_t seed) {
  CHECK(count >= 0);
  CHECK(low_hz <= high_hz);
  Random random(seed);
  std::vector<double> frequencies;
  for (int k = 0; k < count; ++k) frequencies.push_back(random.Uniform(low_hz, high_hz));
  return frequencies;
}

}  // namespace vesk_channel
