// Bounded best-N collector: keeps the `limit` highest-scoring items of a
// stream of (item, score) offers in O(1) amortised time per offer.
//
// Offers are collected in batches: up to 2 * limit items are held; when the
// store is full, a partial sort (linear time) keeps the `limit` best and
// their lowest score becomes the threshold. From the time the first `limit`
// items have arrived, an offer must score strictly above the threshold to be
// stored, so in the common case an offer costs one comparison. An offer that
// equals the threshold never enters: among equal scores the earlier item
// wins. Scores must not be NaN.
//
// Storage for 2 * limit items is reserved at construction; Push never
// allocates. Thread-compatible.

#ifndef AUDIO_DSP_BATCH_TOP_N_H_
#define AUDIO_DSP_BATCH_TOP_N_H_

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

#include "base/logging.h"

namespace audio_dsp {

template <typename T>
class BatchTopN {
 public:
  // limit: the most items returned by Extract, >= 1 (fatal otherwise).
  explicit BatchTopN(int limit) : limit_(limit) {
    CHECK(limit >= 1);
    entries_.reserve(2 * static_cast<std::size_t>(limit));
  }

  int limit() const { return limit_; }
  // Items held now, passed and not yet discarded: at most 2 * limit.
  int size() const { return static_cast<int>(entries_.size()); }

  // Offers `item` with `score` (larger is better).
  void Push(T item, float score) {
    if (has_threshold_ && !(score > threshold_)) return;
    entries_.push_back({std::move(item), score, next_sequence_++});
    const std::size_t limit = static_cast<std::size_t>(limit_);
    if (!has_threshold_ && entries_.size() == limit) {
      threshold_ = std::min_element(entries_.begin(), entries_.end(), ByScore)->score;
      has_threshold_ = true;
    } else if (entries_.size() == 2 * limit) {
      std::nth_element(entries_.begin(), entries_.begin() + (limit - 1), entries_.end(), Better);
      threshold_ = entries_[limit - 1].score;
      entries_.erase(entries_.begin() + limit, entries_.end());
    }
  }

  // Returns the best items held, at most `limit`, by decreasing score (equal
  // scores in the order offered), and empties the collector for reuse.
  std::vector<std::pair<T, float>> Extract() {
    std::sort(entries_.begin(), entries_.end(), Better);
    const std::size_t count = std::min(entries_.size(), static_cast<std::size_t>(limit_));
    std::vector<std::pair<T, float>> result;
    result.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
      result.emplace_back(std::move(entries_[i].item), entries_[i].score);
    }
    Reset();
    return result;
  }

  // Drops every item and the threshold.
  void Reset() {
    entries_.clear();
    has_threshold_ = false;
    next_sequence_ = 0;
  }

 private:
  struct Entry {
    T item;
    float score;
    uint64_t sequence;  // Offer order, to break ties between equal scores.
  };

  static bool ByScore(const Entry& a, const Entry& b) { return a.score < b.score; }
  static bool Better(const Entry& a, const Entry& b) {
    return a.score > b.score || (a.score == b.score && a.sequence < b.sequence);
  }

  int limit_;
  std::vector<Entry> entries_;  // At most 2 * limit_.
  bool has_threshold_ = false;
  float threshold_ = 0.0f;
  uint64_t next_sequence_ = 0;
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_BATCH_TOP_N_H_
