#include "tools/channel/walking_path.h"

#include <cmath>

#include "base/logging.h"
#include "tools/channel/channel_constants.h"

namespace vesk_channel {

WalkingPath::WalkingPath(double speed_mps, double closest_m, double closest_time_s)
    : speed_(speed_mps), closest_(closest_m), closest_time_(closest_time_s) {
  CHECK(speed_mps >= 0.0);
  CHECK(closest_m > 0.0);
}

double WalkingPath::Distance(double t) const {
  return std::hypot(closest_, speed_ * (t - closest_time_));
}

double WalkingPath::RadialSpeed(double t) const {
  return speed_ * speed_ * (t - closest_time_) / Distance(t);
}

double WalkingPath::ExtraDelay(double t) const { return (Distance(t) - closest_) / kSpeedOfSound; }

double WalkingPath::Gain(double t) const { return closest_ / Distance(t); }

}  // namespace vesk_channel
