// A growing history of samples from which the oldest can be dropped, with
// the count of samples dropped so far: the absolute position of element i is
// dropped() + i.
//
// Dropping is amortised O(1): the storage is compacted only once the dropped
// prefix is as large as what remains, so a streaming decoder that appends and
// drops on every block does not move its whole history each time.

#ifndef AUDIO_VESKNET_STREAM_BUFFER_H_
#define AUDIO_VESKNET_STREAM_BUFFER_H_

#include <cstdint>
#include <vector>

#include "base/logging.h"

namespace audio_vesknet {

template <typename T>
class StreamBuffer {
 public:
  int size() const { return static_cast<int>(buffer_.size()); }
  bool empty() const { return buffer_.size() == 0; }
  // Samples dropped from the front since construction or Clear().
  int64_t dropped() const { return dropped_; }

  const T* data() const { return buffer_.storage.data() + buffer_.begin; }
  T* mutable_data() { return buffer_.storage.data() + buffer_.begin; }
  const T& operator[](int index) const { return data()[index]; }

  void Append(const T* samples, int count) {
    buffer_.storage.insert(buffer_.storage.end(), samples, samples + count);
  }
  void Append(const std::vector<T>& samples) {
    Append(samples.data(), static_cast<int>(samples.size()));
  }
  // Appends `count` value-initialised elements.
  void AppendZeros(int count) { buffer_.storage.resize(buffer_.storage.size() + count); }

  // Drops the `num_samples` oldest samples; 0 <= num_samples <= size().
  void DropOldest(int num_samples) {
    CHECK(num_samples >= 0);
    CHECK(num_samples <= static_cast<int>(buffer_.size()));
    buffer_.begin += num_samples;
    dropped_ += num_samples;
    if (buffer_.begin >= buffer_.size()) {
      buffer_.storage.erase(buffer_.storage.begin(), buffer_.storage.begin() + buffer_.begin);
      buffer_.begin = 0;
    }
  }

  // Empties the buffer and restarts the dropped count.
  void Clear() {
    buffer_.storage.clear();
    buffer_.begin = 0;
    dropped_ = 0;
  }

 private:
  // The live samples are storage[begin ...].
  struct Window {
    size_t size() const { return storage.size() - begin; }
    std::vector<T> storage;
    size_t begin = 0;
  };
  Window buffer_;
  int64_t dropped_ = 0;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_STREAM_BUFFER_H_
