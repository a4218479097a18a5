#include "tools/channel/room.h"

#include <algorithm>
#include <cmath>

#include "base/logging.h"
#include "tools/channel/random.h"

namespace vesk_channel {

std::vector<float> MakeRoomImpulseResponse(int rate, double rt60_s, double direct_to_reverb_db,
                                           bool early_reflections, uint64_t seed) {
  CHECK(rate > 0);
  CHECK(rt60_s > 0.0);
  const int length = std::max(2, static_cast<int>(std::ceil(rt60_s * rate)));
  // Amplitude decay per sample: the energy falls by 60 dB (amplitude by
  // 10^-3) in rt60_s.
  const double decay = 3.0 * std::log(10.0) / (rt60_s * rate);
  const int onset = std::max(1, static_cast<int>(std::lround(0.001 * rate)));
  const double ramp = std::max(1.0, 0.005 * rate);
  Random random(seed);

  std::vector<double> tail(length, 0.0), reflections(length, 0.0);
  for (int i = onset; i < length; ++i) {
    const double rise = std::min(1.0, (i - onset + 1) / ramp);
    tail[i] = rise * std::exp(-decay * i) * random.Gaussian();
  }
  if (early_reflections) {
    const int count = 3 + random.UniformInt(4);
    for (int k = 0; k < count; ++k) {
      const int delay = std::min(
          length - 1,
          std::max(1, static_cast<int>(std::lround((0.001 + 0.014 * random.Uniform()) * rate))));
      const double amplitude = 0.5 + 0.5 * random.Uniform();
      const double sign = random.Uniform() < 0.5 ? -1.0 : 1.0;
      reflections[delay] += sign * amplitude * std::exp(-decay * delay);
    }
  }
  double tail_energy = 0.0, reflection_energy = 0.0;
  for (int i = 1; i < length; ++i) {
    tail_energy += tail[i] * tail[i];
    reflection_energy += reflections[i] * reflections[i];
  }
  const double reverb_energy = std::pow(10.0, -direct_to_reverb_db / 10.0);
  const double reflection_share = reflection_energy > 0.0 ? 0.3 : 0.0;
  const double tail_scale =
      tail_energy > 0.0 ? std::sqrt((1.0 - reflection_share) / tail_energy) : 0.0;
  const double reflection_scale =
      reflection_energy > 0.0 ? std::sqrt(reflection_share / reflection_energy) : 0.0;
  std::vector<double> reverb(length, 0.0);
  double energy = 0.0;
  for (int i = 1; i < length; ++i) {
    reverb[i] = tail_scale * tail[i] + reflection_scale * reflections[i];
    energy += reverb[i] * reverb[i];
  }
  // Exact energy after the direct path, whatever the overlap of tail and
  // reflections.
  const double scale = energy > 0.0 ? std::sqrt(reverb_energy / energy) : 0.0;
  std::vector<float> response(length, 0.0f);
  response[0] = 1.0f;
  for (int i = 1; i < length; ++i) response[i] = static_cast<float>(scale * reverb[i]);
  return response;
}

}  // namespace vesk_channel
