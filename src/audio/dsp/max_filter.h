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
// operator<. input and output must not overlap (not in-place).
//
// Cost is about three comparisons per sample whatever the width (van Herk /
// Gil-Werman: maxima from the start and from the end of each block of
// window_size samples; a window meets at most two blocks). The suffix
// maxima live in one scratch array of num_samples values, allocated per
// call (see the overload below to reuse it); the prefix maxima are built in
// `output` itself.
template <typename T>
void MaxFilter(const T* input, int num_samples, int window_size, T* output,
               std::vector<T>* scratch);

template <typename T>
void MaxFilter(const T* input, int num_samples, int window_size, T* output) {
  std::vector<T> scratch;
  MaxFilter(input, num_samples, window_size, output, &scratch);
}

// The same with the suffix maxima in *scratch (resized to num_samples), for
// callers that run the filter often and keep their buffers.
template <typename T>
void MaxFilter(const T* input, int num_samples, int window_size, T* output,
               std::vector<T>* scratch) {
  CHECK(num_samples >= 0);
  CHECK(window_size >= 1);
  if (num_samples == 0) return;
  CHECK(input);
  CHECK(output);
  CHECK(scratch);
  // std::max's form, which compilers turn into a single max instruction.
  auto max = [](T a, T b) { return a < b ? b : a; };
  const int n = num_samples;
  const int w = window_size;

  // prefix (in output): maximum from the block's start to i; suffix: from i
  // to the block's end (or the input's end).
  scratch->resize(n);
  T* const suffix = scratch->data();
  // Block by block, both directions at once: two independent chains of
  // steps, each carried in a register (through memory, each step would wait
  // for the store of the one before).
  for (int64_t start = 0; start < n; start += w) {
    const int64_t length = std::min<int64_t>(w, n - start);
    const int64_t last = start + length - 1;
    T forward = input[start];
    T backward = input[last];
    output[start] = forward;
    suffix[last] = backward;
    for (int64_t i = 1; i < length; ++i) {
      forward = max(input[start + i], forward);
      backward = max(input[last - i], backward);
      output[start + i] = forward;
      suffix[last - i] = backward;
    }
  }

  // Output k covers a = k - (w - h) + 1 .. b = k + h. Each step reads
  // prefix values at b >= k and overwrites output k, whose prefix value no
  // later step needs.
  const int h = (w - 1) / 2;
  const int64_t first_full = static_cast<int64_t>(w) - h - 1;  // First k with a >= 0.
  const int64_t last_full = static_cast<int64_t>(n) - 1 - h;   // Last k with b < n.
  for (int64_t k = 0; k < std::min<int64_t>(first_full, n); ++k) {
    // Clipped at the start: the window lies in the first block.
    output[k] = output[std::min<int64_t>(k + h, n - 1)];
  }
  for (int64_t k = first_full; k <= last_full; ++k) {
    output[k] = max(suffix[k - first_full], output[k + h]);
  }
  const T last_prefix = output[n - 1];
  const int64_t last_block_start = (n - 1) / w * w;
  for (int64_t k = std::max(first_full, last_full + 1); k < n; ++k) {
    // Clipped at the end: from a to the last sample.
    const int64_t a = k - first_full;
    output[k] = a >= last_block_start ? suffix[a] : max(suffix[a], last_prefix);
  }
}

}  // namespace audio_dsp

#endif  // AUDIO_DSP_MAX_FILTER_H_
