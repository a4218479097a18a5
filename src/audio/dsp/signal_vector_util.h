// Streaming signal-vector helpers.

#ifndef AUDIO_DSP_SIGNAL_VECTOR_UTIL_H_
#define AUDIO_DSP_SIGNAL_VECTOR_UTIL_H_

#include <algorithm>
#include <complex>
#include <cstddef>
#include <cstring>
#include <utility>
#include <vector>

#include "audio/dsp/simd.h"
#include "base/logging.h"

namespace audio_dsp {

// A complex FIR filter that carries its state between calls: the output is
// the convolution of the whole input stream with the taps, sample for sample,
// however the stream is cut into blocks (output n = sum over k of
// h[k] * x[n - k], with x = 0 before the first sample).
//
// Each output adds its products oldest first, (x[n - L + 1] h[L - 1] +
// x[n - L + 2] h[L - 2]) + ... + x[n] h[0], each product formed as the
// complex product (xr hr - xi hi, xr hi + xi hr): what a transposed direct
// form with L - 1 partial sums computes. Two outputs at a time in one
// four-float vector; the last L - 1 inputs are kept for the next block.
// Allocation happens at construction only; ProcessSamples allocates only when
// `result` must grow. Thread-compatible: one filter per stream.
class StreamingFirFilter {
 public:
  // `taps` are h[0] .. h[L - 1]; an empty tap vector is fatal.
  explicit StreamingFirFilter(std::vector<std::complex<float>> taps)
      : impulse_response_(std::move(taps)) {
    CHECK(!impulse_response_.empty());
    const size_t num_taps = impulse_response_.size();
    input_.resize(2 * (num_taps - 1));
    for (size_t k = 0; k < num_taps; ++k) {
      const float hr = impulse_response_[k].real(), hi = impulse_response_[k].imag();
      real_taps_.insert(real_taps_.end(), {hr, hr, hr, hr});
      // Multiplies the swapped (xi, xr) pairs: -xi hi for the real lanes,
      // xr hi for the imaginary ones.
      imag_taps_.insert(imag_taps_.end(), {-hi, hi, -hi, hi});
    }
  }

  // Filters `input` and writes input.size() outputs to `result` (non-null;
  // resized). `result` may be &input (in-place).
  void ProcessSamples(const std::vector<std::complex<float>>& input,
                      std::vector<std::complex<float>>* result) {
    CHECK(result);
    const std::size_t n = input.size();
    if (n == 0) {  // Nothing to filter; an empty vector may have no storage.
      result->clear();
      return;
    }
    const std::size_t num_taps = impulse_response_.size();
    const std::size_t kept = num_taps - 1;
    // The previous inputs, then this block, as interleaved floats.
    input_.resize(2 * (kept + n));
    std::memcpy(input_.data() + 2 * kept, input.data(), n * sizeof(std::complex<float>));
    result->resize(n);
    float* y = reinterpret_cast<float*>(result->data());
    const float* x = input_.data();  // x + 2 * (i + kept) is input i.
    std::size_t i = 0;
    for (; i + 2 <= n; i += 2) {
      // Outputs i and i + 1; the oldest product first.
      const float* oldest = x + 2 * i;
      Float4 sum = Product(Load4(oldest), kept);
      for (std::size_t k = 1; k < num_taps; ++k) sum += Product(Load4(oldest + 2 * k), kept - k);
      Store4(y + 2 * i, sum);
    }
    for (; i < n; ++i) {
      const float* oldest = x + 2 * i;
      float sum_real =
          oldest[0] * impulse_response_[kept].real() - oldest[1] * impulse_response_[kept].imag();
      float sum_imag =
          oldest[0] * impulse_response_[kept].imag() + oldest[1] * impulse_response_[kept].real();
      for (std::size_t k = 1; k < num_taps; ++k) {
        const float xr = oldest[2 * k], xi = oldest[2 * k + 1];
        const std::complex<float> h = impulse_response_[kept - k];
        sum_real += xr * h.real() - xi * h.imag();
        sum_imag += xr * h.imag() + xi * h.real();
      }
      y[2 * i] = sum_real;
      y[2 * i + 1] = sum_imag;
    }
    // Keep the last L - 1 inputs (zeros before the first) for the next block.
    std::memmove(input_.data(), input_.data() + 2 * n, 2 * kept * sizeof(float));
    input_.resize(2 * kept);
  }

  // Forgets the previous inputs, as after construction.
  void Reset() { std::fill(input_.begin(), input_.end(), 0.0f); }

 private:
  // Two complex inputs (xr, xi, xr', xi') times tap k.
  Float4 Product(Float4 x, std::size_t k) const {
    return x * Load4(real_taps_.data() + 4 * k) +
           __builtin_shufflevector(x, x, 1, 0, 3, 2) * Load4(imag_taps_.data() + 4 * k);
  }

  std::vector<std::complex<float>> impulse_response_;
  std::vector<float> real_taps_;  // (hr, hr, hr, hr) per tap.
  std::vector<float> imag_taps_;  // (-hi, hi, -hi, hi) per tap.
  // The last L - 1 inputs, then, during a call, the block: interleaved floats.
  std::vector<float> input_;
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_SIGNAL_VECTOR_UTIL_H_
