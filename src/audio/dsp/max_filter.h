// Running maximum over an array.
//
// Window alignment is that of BoxFilter ("audio/dsp/box_filter.h"): for a
// window of w samples, h = (w - 1) / 2 and output k is the maximum of the
// inputs at k - (w - h) + 1 .. k + h that exist (centred for odd w, one more
// sample before k than after it for even w). No padding near the ends.
//
// Stateless and thread-compatible.

#ifndef AUDIO_DSP_MAX_FILTER_H_
#define AUDIO_DSP_MAX_FILTER_H_

#include <algorithm>
#include <cstdint>
#include <vector>

#include "base/logging.h"

namespace audio_dsp {

// Writes the running maximum of input[0 .. num_samples) over windows of
// `window_size` (>= 1) samples to output[0 .. num_samples). T needs only
// operator>=. input and output must not overlap (not in-place).
//
// Cost is amortised constant per sample (a monotone queue of indices). The
// queue lives in one scratch array of min(window_size, num_samples) ints,
// allocated per call; nothing else is allocated.
template <typename T>
void MaxFilter(const T* input, int num_samples, int window_size, T* output) {
  CHECK(num_samples >= 0);
  CHECK(window_size >= 1);
  if (num_samples == 0) return;
  CHECK(input);
  CHECK(output);

  // The queue holds indices with strictly decreasing values from front to
  // back, all within the last window_size positions, so it never holds more
  // than min(window_size, num_samples) entries. It is kept in a ring.
  const int capacity = std::min(window_size, num_samples);
  std::vector<int> ring(capacity);
  int front = 0;  // Ring position of the front entry.
  int count = 0;
  auto wrap = [capacity](int position) {
    return position >= capacity ? position - capacity : position;
  };

  const int h = (window_size - 1) / 2;
  const int64_t end = static_cast<int64_t>(num_samples) + h;
  for (int64_t i = 0; i < end; ++i) {
    if (count > 0 && ring[front] <= i - window_size) {
      front = wrap(front + 1);
      --count;
    }
    if (i < num_samples) {
      const T& value = input[i];
      // An equal value replaces the queued one, so equal values never pile up.
      while (count > 0 && value >= input[ring[wrap(front + count - 1)]]) --count;
      ring[wrap(front + count)] = static_cast<int>(i);
      ++count;
    }
    if (i >= h) output[i - h] = input[ring[front]];
  }
}

}  // namespace audio_dsp

#endif  // AUDIO_DSP_MAX_FILTER_H_
