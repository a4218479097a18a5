#include "audio/dsp/kiss_fft_util.h"

#include <algorithm>
#include <cmath>

#include "audio/dsp/kiss_fft.h"
#include "base/logging.h"

namespace audio_dsp {

void BandPassFilter(const std::vector<float>& input, float low_band_edge, float high_band_edge,
                    float sample_rate, std::vector<float>* output) {
  CHECK(!input.empty());
  CHECK(low_band_edge >= 0.0f);
  CHECK(low_band_edge <= high_band_edge);
  CHECK(high_band_edge < sample_rate * (0.5f + 0.5f / input.size()));
  CHECK(output != nullptr);
  const int size = static_cast<int>(input.size());
  const RealFFTTransformer transformer(size, /*scale_inverse=*/true);
  std::vector<std::complex<float>> spectrum;
  transformer.Forward(input, &spectrum);
  BandPassSpectrum(spectrum, low_band_edge, high_band_edge, sample_rate / size, &spectrum);
  transformer.Inverse(spectrum, output);
}

void HighPassFilter(const std::vector<float>& input, float low_band_edge, float sample_rate,
                    std::vector<float>* output) {
  BandPassFilter(input, low_band_edge, 0.5f * sample_rate, sample_rate, output);
}

void BandPassSpectrum(const std::vector<std::complex<float>>& input_spectrum, float low_band_edge,
                      float high_band_edge, float bin_width,
                      std::vector<std::complex<float>>* output_spectrum) {
  const int spectrum_size = static_cast<int>(input_spectrum.size());
  CHECK(!input_spectrum.empty());
  CHECK(output_spectrum != nullptr);
  CHECK(low_band_edge >= 0.0f);
  CHECK(low_band_edge <= high_band_edge);
  CHECK(high_band_edge <= bin_width * spectrum_size);
  // First kept bin and one past the last kept one. Clamping to [0, size]
  // keeps the indices in range even for a degenerate bin_width (<= 0, where
  // the quotients are infinite or NaN).
  const float low_bin = std::ceil(low_band_edge / bin_width);
  const float high_bin = std::floor(high_band_edge / bin_width) + 1.0f;
  const int low = low_bin >= 0.0f ? static_cast<int>(std::min<float>(low_bin, spectrum_size)) : 0;
  const int high =
      high_bin >= 0.0f ? static_cast<int>(std::min<float>(high_bin, spectrum_size)) : 0;

  std::vector<std::complex<float>>& output = *output_spectrum;
  if (output_spectrum != &input_spectrum) {
    output.resize(spectrum_size);
    std::copy(input_spectrum.begin() + low, input_spectrum.begin() + std::max(low, high),
              output.begin() + low);
  }
  std::fill(output.begin(), output.begin() + low, std::complex<float>());
  std::fill(output.begin() + std::max(low, high), output.end(), std::complex<float>());
}

void FftResample(const std::vector<float>& input, float input_sample_rate, float output_sample_rate,
                 std::vector<float>* output) {
  CHECK(input_sample_rate > 0);
  CHECK(output_sample_rate > 0);
  CHECK(output);
  const int input_size = static_cast<int>(input.size());
  const float ratio = output_sample_rate / input_sample_rate;
  const int output_size = static_cast<int>(std::round(static_cast<float>(input_size) * ratio));
  if (output_size == input_size) {
    if (output != &input) *output = input;
    return;
  }
  if (output_size == 0) {
    output->clear();
    return;
  }

  std::vector<std::complex<float>> spectrum;
  RealFFTTransformer(input_size, /*scale_inverse=*/false).Forward(input, &spectrum);
  // Zero-padding an even-length spectrum: the Nyquist bin stands for both
  // +N/2 and −N/2, which become distinct bins at the new length; each gets
  // half of it (the −N/2 half being implied by Hermitian symmetry).
  if (input_size % 2 == 0 && input_size < output_size) spectrum.back() *= 0.5f;
  spectrum.resize(output_size / 2 + 1);
  RealFFTTransformer(output_size, /*scale_inverse=*/false).Inverse(spectrum, output);
  const float size = static_cast<float>(input_size);
  for (float& sample : *output) sample /= size;
}

}  // namespace audio_dsp
