#include "audio/vesknet/vesknet_util.h"

#include <algorithm>
#include <cmath>

#include "audio/dsp/kiss_fft.h"
#include "base/logging.h"

// The size check compares an int column count with a container size; both
// are non-negative.
#pragma GCC diagnostic ignored "-Wsign-compare"

namespace audio_vesknet {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr int kLowpassGridSize = 1024;

}  // namespace

void MakeFrequencyOffsets(float frequency_step, float max_offset, std::vector<float>* frequencies) {
  CHECK(frequency_step > 0.0f);
  CHECK(frequencies);
  const int n = static_cast<int>(std::round(max_offset / frequency_step));
  frequencies->clear();
  for (int k = -n; k <= n; ++k) frequencies->push_back(static_cast<float>(k) * frequency_step);
}

std::vector<std::complex<float>> MakeComplexLowpassFilter(int32_t num_taps, float cutoff,
                                                          float sharpness) {
  if (num_taps < 1) return {};
  const float edge = static_cast<float>(cutoff + 0.5 / sharpness);
  std::vector<std::complex<float>> response(kLowpassGridSize);
  for (int k = -kLowpassGridSize / 2 + 1; k <= kLowpassGridSize / 2; ++k) {
    const float f = static_cast<float>(k) / kLowpassGridSize;
    float value;
    if (f < -cutoff) {
      value = 0.0f;
    } else if (f <= edge) {
      value = 1.0f;
    } else {
      // Only reached when edge < 0.5, so the denominator is positive.
      value = static_cast<float>(std::cos((f - edge) * (kPi / 2) / (0.5 - edge)));
    }
    response[k < 0 ? k + kLowpassGridSize : k] = value;
  }
  std::vector<std::complex<float>> impulse;
  audio_dsp::ComplexFFTTransformer(kLowpassGridSize, /*scale_inverse=*/false)
      .Inverse(response, &impulse);

  std::vector<std::complex<float>> taps(num_taps);
  const int half = (num_taps - 1) / 2;
  for (int j = -half; j <= half; ++j) {
    const float weight = static_cast<float>(std::cos(j * kPi / (2 * half + 2)));
    const int index = ((j % kLowpassGridSize) + kLowpassGridSize) % kLowpassGridSize;
    taps[j + half] = impulse[index] * weight;
  }
  return taps;
}

void MakePhasorMatrix(double phase_step, const std::vector<float>& frequencies, int32_t num_samples,
                      audio_dsp::MatrixXcf* phasor_matrix) {
  CHECK(phasor_matrix);
  const int rows = static_cast<int>(frequencies.size());
  phasor_matrix->resize(rows, num_samples);
  for (int i = 0; i < rows; ++i) {
    const std::complex<double> z = std::polar(1.0, frequencies[i] * phase_step);
    std::complex<double> power = 1.0;
    for (int s = 0; s < num_samples; ++s) {
      (*phasor_matrix)(i, s) = std::complex<float>(power);
      power *= z;
    }
  }
}

std::pair<int32_t, float> BestFilterRow(const audio_dsp::MatrixXcf& filter_matrix,
                                        const std::vector<std::complex<float>>& signal) {
  CHECK(filter_matrix.cols() == signal.size());
  std::vector<std::complex<float>> products;
  audio_dsp::MultiplyMatrixVector(filter_matrix, signal.data(), &products);
  int32_t best_row = 0;
  float best_power = 0.0f;
  for (int32_t row = 0; row < static_cast<int32_t>(products.size()); ++row) {
    const float power = std::norm(products[row]);
    if (row == 0 || power > best_power) {
      best_row = row;
      best_power = power;
    }
  }
  return {best_row, best_power};
}

void CircularPad(const std::vector<float>& signal, int32_t pad_before, int32_t pad_after,
                 std::vector<float>* padded_signal) {
  CHECK(!signal.empty());
  CHECK(padded_signal);
  const int64_t size = static_cast<int64_t>(signal.size());
  const int64_t total = std::max<int64_t>(0, int64_t{pad_before} + size + pad_after);
  std::vector<float> copy;
  const std::vector<float>* source = &signal;
  if (padded_signal == &signal) {
    copy = signal;
    source = &copy;
  }
  padded_signal->resize(total);
  int64_t index = ((-int64_t{pad_before}) % size + size) % size;
  for (int64_t i = 0; i < total; ++i) {
    (*padded_signal)[i] = (*source)[index];
    if (++index == size) index = 0;
  }
}

}  // namespace audio_vesknet
