#include "audio/vesknet/decoding_group.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "base/logging.h"

namespace audio_vesknet {

DecodingGroup::DecodingGroup(int position, float score, int period, float tolerance_fraction,
                             int max_gap)
    : first_position_(position),
      score_sum_(score),
      period_(period),
      tolerance_(static_cast<int>(std::round(period * tolerance_fraction))),
      max_gap_(max_gap),
      times_(1, position) {
  CHECK(period > 0);
}

bool DecodingGroup::Add(int time, float score) {
  CHECK(time > times_.back());
  if (time - times_.back() > max_gap_) return false;
  const int d = std::abs(time - first_position_) % period_;
  if (std::min(d, period_ - d) > tolerance_) return false;
  score_sum_ += score;
  times_.push_back(time);
  return true;
}

bool DecodingGroup::CoversAllPositions(int n) const {
  CHECK(n > 0);
  std::vector<bool> seen(n, false);
  for (const int time : times_) {
    const int remainder = FrameNumber(time) % n;
    seen[remainder < 0 ? remainder + n : remainder] = true;
  }
  return std::find(seen.begin(), seen.end(), false) == seen.end();
}

int DecodingGroup::IndexOfFrame(int k) const {
  CHECK(!times_.empty());
  // Half a period before the ideal grid point of frame k.
  const int target = first_position_ + period_ * k - (period_ + 1) / 2;
  const int count = static_cast<int>(times_.size());
  for (int i = static_cast<int>(std::lower_bound(times_.begin(), times_.end(), target) -
                                times_.begin());
       i < count; ++i) {
    if (FrameNumber(times_[i]) >= k) return i;
  }
  return count - 1;
}

int DecodingGroup::FrameNumber(int position) const {
  return static_cast<int>(
      std::round(static_cast<float>(position - first_position_) / static_cast<float>(period_)));
}

const DecodingGroup* SelectGroup(const std::vector<DecodingGroup>& groups, int n) {
  const DecodingGroup* chosen = nullptr;
  float best_sum = 0.0f;
  for (const DecodingGroup& group : groups) {
    if (group.score_sum() > best_sum && group.CoversAllPositions(n)) {
      chosen = &group;
      best_sum = group.score_sum();
    }
  }
  if (chosen != nullptr) return chosen;
  for (const DecodingGroup& group : groups) {
    if (group.score_sum() > best_sum) {
      chosen = &group;
      best_sum = group.score_sum();
    }
  }
  return chosen;
}

}  // namespace audio_vesknet
