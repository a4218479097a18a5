#include "tools/channel/dropouts.h"

#include <algorithm>
#include <cmath>

#include "base/logging.h"
#include "tools/channel/random.h"

namespace vesk_channel {

std::vector<Dropout> ChooseDropouts(const DropoutParams& params, int rate, int64_t frames,
                                    uint64_t seed) {
  CHECK(params.length_s > 0.0);
  CHECK(params.interval_s >= 0.0);
  CHECK(rate > 0);
  std::vector<Dropout> dropouts;
  if (params.interval_s == 0.0) return dropouts;
  const int64_t length = std::max<int64_t>(1, std::llround(params.length_s * rate));
  const double interval = params.interval_s * rate;
  Random random(seed);
  int64_t free_from = 0;  // The first frame a new run may start at.
  for (int64_t k = 0; static_cast<double>(k) * interval < static_cast<double>(frames); ++k) {
    const int64_t start =
        static_cast<int64_t>((static_cast<double>(k) + random.Uniform()) * interval);
    if (start < free_from || start + length > frames) continue;
    dropouts.push_back({start, length});
    free_from = start + length;
  }
  return dropouts;
}

double FramesRemovedBefore(const std::vector<Dropout>& dropouts, double frame) {
  double removed = 0.0;
  for (const Dropout& d : dropouts) {
    if (static_cast<double>(d.start) >= frame) break;
    removed += std::min(static_cast<double>(d.length), frame - static_cast<double>(d.start));
  }
  return removed;
}

}  // namespace vesk_channel
