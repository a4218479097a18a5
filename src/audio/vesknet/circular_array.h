// A fixed-capacity ring indexed by absolute position: element i lives at
// i AND (capacity - 1), the capacity being the requested size rounded up to
// a power of two. Positions older than the capacity are overwritten.

#ifndef AUDIO_VESKNET_CIRCULAR_ARRAY_H_
#define AUDIO_VESKNET_CIRCULAR_ARRAY_H_

#include <cstdint>
#include <vector>

#include "audio/dsp/number_util.h"
#include "base/logging.h"

namespace audio_vesknet {

template <typename T>
class CircularArray {
 public:
  // At least `min_size` elements, 0 < min_size <= 2^30, all value-initialised.
  explicit CircularArray(int min_size) {
    CHECK(min_size > 0);
    CHECK(min_size <= 1 << 30);
    data_.resize(audio_dsp::NextPowerOfTwo(static_cast<unsigned>(min_size)));
    mask_ = static_cast<int64_t>(data_.size()) - 1;
  }

  T& operator[](int64_t position) { return data_[position & mask_]; }
  const T& operator[](int64_t position) const { return data_[position & mask_]; }

  int capacity() const { return static_cast<int>(data_.size()); }

  // Sets every element to `value`.
  void Fill(const T& value) {
    for (T& element : data_) element = value;
  }

 private:
  std::vector<T> data_;
  int64_t mask_;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_CIRCULAR_ARRAY_H_
