#include "tools/channel/playback_clipping.h"

#include <algorithm>
#include <cmath>

#include "base/logging.h"

namespace vesk_channel {

void ClipPlayback(double overdrive_db, std::vector<float>* samples) {
  CHECK(std::isfinite(overdrive_db));
  CHECK(samples);
  const float gain = static_cast<float>(std::pow(10.0, overdrive_db / 20.0));
  for (float& sample : *samples) sample = std::min(1.0f, std::max(-1.0f, sample * gain));
}

}  // namespace vesk_channel
