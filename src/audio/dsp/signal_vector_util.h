// Streaming signal-vector helpers.

#ifndef AUDIO_DSP_SIGNAL_VECTOR_UTIL_H_
#define AUDIO_DSP_SIGNAL_VECTOR_UTIL_H_

#include <complex>
#include <cstddef>
#include <utility>
#include <vector>

#include "base/logging.h"

namespace audio_dsp {

// A complex FIR filter that carries its state between calls: the output is
// the convolution of the whole input stream with the taps, sample for sample,
// however the stream is cut into blocks (output n = sum over k of
// h[k] * x[n - k], with x = 0 before the first sample).
//
// Transposed direct form: the state holds L - 1 partial sums for L taps.
// Allocation happens at construction only; ProcessSamples allocates only when
// `result` must grow. Thread-compatible: one filter per stream.
class StreamingFirFilter {
 public:
  // `taps` are h[0] .. h[L - 1]; an empty tap vector is fatal.
  explicit StreamingFirFilter(std::vector<std::complex<float>> taps)
      : impulse_response_(std::move(taps)),
        state_(impulse_response_.empty() ? 0 : impulse_response_.size() - 1) {
    CHECK(!impulse_response_.empty());
  }

  // Filters `input` and writes input.size() outputs to `result` (non-null;
  // resized). `result` may be &input (in-place).
  void ProcessSamples(const std::vector<std::complex<float>>& input,
                      std::vector<std::complex<float>>* result) {
    CHECK(result);
    const std::size_t n = input.size();
    result->resize(n);
    // Complex products are written out by hand: std::complex multiplication
    // tests every product for NaN to fall back to a library call, which
    // halves the speed of the inner loop.
    const float* h = reinterpret_cast<const float*>(impulse_response_.data());
    const float* x = reinterpret_cast<const float*>(input.data());
    float* y = reinterpret_cast<float*>(result->data());
    const std::size_t num_taps = impulse_response_.size();
    if (num_taps == 1) {
      const float hr = h[0], hi = h[1];
      for (std::size_t i = 0; i < n; ++i) {
        const float xr = x[2 * i], xi = x[2 * i + 1];
        y[2 * i] = xr * hr - xi * hi;
        y[2 * i + 1] = xr * hi + xi * hr;
      }
      return;
    }
    float* s = reinterpret_cast<float*>(state_.data());
    const std::size_t last = num_taps - 2;  // Index of the last partial sum.
    for (std::size_t i = 0; i < n; ++i) {
      const float xr = x[2 * i], xi = x[2 * i + 1];
      const float yr = s[0] + (xr * h[0] - xi * h[1]);
      const float yi = s[1] + (xr * h[1] + xi * h[0]);
      for (std::size_t k = 1; k <= last; ++k) {
        s[2 * k - 2] = s[2 * k] + (xr * h[2 * k] - xi * h[2 * k + 1]);
        s[2 * k - 1] = s[2 * k + 1] + (xr * h[2 * k + 1] + xi * h[2 * k]);
      }
      s[2 * last] = xr * h[2 * last + 2] - xi * h[2 * last + 3];
      s[2 * last + 1] = xr * h[2 * last + 3] + xi * h[2 * last + 2];
      y[2 * i] = yr;
      y[2 * i + 1] = yi;
    }
  }

  // Zeroes the state, as after construction.
  void Reset() { state_.assign(state_.size(), std::complex<float>()); }

 private:
  std::vector<std::complex<float>> impulse_response_;
  std::vector<std::complex<float>> state_;  // L - 1 partial sums.
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_SIGNAL_VECTOR_UTIL_H_
