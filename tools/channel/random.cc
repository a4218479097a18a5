#include "tools/channel/random.h"

#include <cmath>

#include "base/logging.h"

namespace vesk_channel {

int Random::UniformInt(int n) {
  CHECK(n > 0);
  return static_cast<int>(((Next() >> 32) * static_cast<uint64_t>(n)) >> 32);
}

double Random::Gaussian() {
  if (has_spare_) {
    has_spare_ = false;
    return spare_;
  }
  // Marsaglia's polar form: a point uniform in the unit disc, no
  // trigonometric functions.
  double u, v, s;
  do {
    u = 2.0 * Uniform() - 1.0;
    v = 2.0 * Uniform() - 1.0;
    s = u * u + v * v;
  } while (s >= 1.0 || s == 0.0);
  const double factor = std::sqrt(-2.0 * std::log(s) / s);
  spare_ = v * factor;
  has_spare_ = true;
  return u * factor;
}

uint64_t DeriveSeed(uint64_t seed, uint64_t stream) {
  Random mixer(seed ^ Random(stream).Next());
  return mixer.Next();
}

}  // namespace vesk_channel
