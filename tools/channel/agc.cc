#include "tools/channel/agc.h"

#include <cmath>

#include "base/logging.h"
#include "tools/channel/random.h"

namespace vesk_channel {

std::vector<double> AgcGainDb(const AgcParams& params, int rate, int64_t frames, uint64_t seed) {
  CHECK(params.step_db >= 0.0);
  CHECK(params.interval_s > 0.0);
  CHECK(params.attack_s > 0.0);
  CHECK(params.release_s > 0.0);
  CHECK(rate > 0);
  std::vector<double> gain(static_cast<size_t>(frames), 0.0);
  if (params.step_db == 0.0) return gain;
  const double attack = 1.0 - std::exp(-1.0 / (params.attack_s * rate));
  const double release = 1.0 - std::exp(-1.0 / (params.release_s * rate));
  Random random(seed);
  const double interval = params.interval_s * rate;  // frames
  double next_step = random.Uniform() * interval;
  int64_t steps = 0;
  double target = 0.0, applied = 0.0;
  for (int64_t i = 0; i < frames; ++i) {
    if (static_cast<double>(i) >= next_step) {
      ++steps;
      target = steps % 2 == 1 ? -params.step_db : 0.0;
      next_step = (static_cast<double>(steps) + random.Uniform()) * interval;
    }
    applied += (target - applied) * (target < applied ? attack : release);
    gain[i] = applied;
  }
  return gain;
}

void ApplyAgc(const AgcParams& params, int rate, uint64_t seed,
              std::vector<std::vector<float>>* channels) {
  CHECK(channels);
  if (channels->empty() || params.step_db == 0.0) return;
  const int64_t frames = static_cast<int64_t>(channels->front().size());
  const std::vector<double> gain_db = AgcGainDb(params, rate, frames, seed);
  for (std::vector<float>& channel : *channels) {
    CHECK(static_cast<int64_t>(channel.size()) == frames);
    for (int64_t i = 0; i < frames; ++i) {
      channel[i] = static_cast<float>(channel[i] * std::pow(10.0, gain_db[i] / 20.0));
    }
  }
}

}  // namespace vesk_channel
