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

namespace {

constexpr double kPi = 3.14159265358979323846;

// The chirp e^(sign i pi m^2 / size) for m = 0 .. count - 1, by recurrence in
// double precision (as the Bluestein transform computes its own).
std::vector<std::complex<double>> Chirp(int size, int count, double sign) {
  std::vector<std::complex<double>> chirp(count);
  const std::complex<double> step = std::polar(1.0, sign * 2.0 * kPi / size);
  std::complex<double> ratio = std::polar(1.0, sign * kPi / size);
  std::complex<double> value = 1.0;
  for (int m = 0; m < count; ++m) {
    chirp[m] = value;
    value *= ratio;
    ratio *= step;
  }
  return chirp;
}

// The smallest size >= `size` whose only prime factors are 2, 3 and 5: the
// sizes that kissfft transforms fastest.
int NextFastSize(int size) {
  for (;; ++size) {
    int rest = size;
    for (const int factor : {2, 3, 5}) {
      while (rest % factor == 0) rest /= factor;
    }
    if (rest == 1) return size;
  }
}

// Number of output samples of FftResample.
int ResampledSize(int input_size, float input_sample_rate, float output_sample_rate) {
  const float ratio = output_sample_rate / input_sample_rate;
  return static_cast<int>(std::round(static_cast<float>(input_size) * ratio));
}

}  // namespace

FftResampler::FftResampler(int input_size, float input_sample_rate, float output_sample_rate)
    : input_size_(input_size), input_sample_rate_(input_sample_rate) {
  CHECK(input_size > 0);
  CHECK(input_sample_rate > 0);
  CHECK(output_sample_rate > 0);
  const int n = input_size;
  output_size_ = ResampledSize(n, input_sample_rate, output_sample_rate);
  const int m = output_size_;
  if (m == 0) return;
  num_bins_ = std::min(n, m) / 2 + 1;
  const int bins = num_bins_;
  // Both chirp-z transforms are linear convolutions: forward, n input samples
  // against kernel offsets -(n - 1) .. bins - 1; inverse, `bins` bins against
  // offsets -(bins - 1) .. m - 1. A circular one of this size wraps onto
  // neither.
  const int inner_size = NextFastSize(std::max(n + bins - 1, m + bins - 1));
  inner_ = std::make_unique<ComplexFFTTransformer>(inner_size, /*scale_inverse=*/false);
  const float inverse_scale = 1.0f / static_cast<float>(inner_size);

  // Forward: X[k] = Σ x[j] e^(-2πijk/n) = c̄_k Σ_j (x_j c̄_j) c_(k-j), c_t = e^(iπt²/n).
  const std::vector<std::complex<double>> forward = Chirp(n, std::max(n, bins), 1.0);
  forward_input_chirp_.resize(n);
  for (int j = 0; j < n; ++j) forward_input_chirp_[j] = std::complex<float>(std::conj(forward[j]));
  std::vector<std::complex<float>> kernel(inner_size);
  for (int t = 0; t < bins; ++t) kernel[t] = std::complex<float>(forward[t]);
  for (int t = 1; t < n; ++t) kernel[inner_size - t] = std::complex<float>(forward[t]);
  forward_kernel_spectrum_.resize(inner_size);
  inner_->Forward(kernel.data(), forward_kernel_spectrum_.data());
  forward_bin_chirp_.resize(bins);
  for (int k = 0; k < bins; ++k) {
    forward_bin_chirp_[k] = std::complex<float>(std::conj(forward[k])) * inverse_scale;
  }

  // Inverse: y[j] = Re Σ_k Z_k e^(2πijk/m) = Re d_j Σ_k (Z_k d_k) d̄_(j-k), d_t = e^(iπt²/m),
  // over the one-sided spectrum Z of the m-point Hermitian one.
  const std::vector<std::complex<double>> inverse = Chirp(m, std::max(m, bins), 1.0);
  inverse_bin_chirp_.resize(bins);
  for (int k = 0; k < bins; ++k) inverse_bin_chirp_[k] = std::complex<float>(inverse[k]);
  std::fill(kernel.begin(), kernel.end(), std::complex<float>());
  for (int t = 0; t < m; ++t) kernel[t] = std::complex<float>(std::conj(inverse[t]));
  for (int t = 1; t < bins; ++t)
    kernel[inner_size - t] = std::complex<float>(std::conj(inverse[t]));
  inverse_kernel_spectrum_.resize(inner_size);
  inner_->Forward(kernel.data(), inverse_kernel_spectrum_.data());
  inverse_output_chirp_.resize(m);
  const float output_scale = inverse_scale / static_cast<float>(n);
  for (int j = 0; j < m; ++j) {
    inverse_output_chirp_[j] = std::complex<float>(inverse[j]) * output_scale;
  }
}

FftResampler::~FftResampler() = default;

void FftResampler::Resample(const std::vector<float>& input, std::vector<float>* output) const {
  Run(input, 0, num_bins_, output);
}

void FftResampler::BandPassAndResample(const std::vector<float>& input, float low_band_edge,
                                       float high_band_edge, std::vector<float>* output) const {
  CHECK(!input.empty());
  CHECK(low_band_edge >= 0.0f);
  CHECK(low_band_edge <= high_band_edge);
  CHECK(high_band_edge < input_sample_rate_ * (0.5f + 0.5f / input.size()));
  // The bins BandPassSpectrum keeps, of the input's N / 2 + 1.
  const int spectrum_size = input_size_ / 2 + 1;
  const float bin_width = input_sample_rate_ / input_size_;
  const float low_bin = std::ceil(low_band_edge / bin_width);
  const float high_bin = std::floor(high_band_edge / bin_width) + 1.0f;
  const int low = static_cast<int>(std::min<float>(low_bin, spectrum_size));
  const int high = static_cast<int>(std::min<float>(high_bin, spectrum_size));
  Run(input, std::min(low, num_bins_), std::min(std::max(low, high), num_bins_), output);
}

void FftResampler::Run(const std::vector<float>& input, int first_bin, int end_bin,
                       std::vector<float>* output) const {
  CHECK(input.size() == static_cast<size_t>(input_size_));
  CHECK(output);
  CHECK(output != &input);
  const int n = input_size_;
  const int m = output_size_;
  output->resize(m);
  if (m == 0) return;
  const int inner_size = inner_->GetSize();
  std::vector<std::complex<float>> work(inner_size), spectrum(inner_size);

  // The input's bins [0, num_bins_).
  for (int j = 0; j < n; ++j) work[j] = input[j] * forward_input_chirp_[j];
  inner_->Forward(work.data(), spectrum.data());
  for (int t = 0; t < inner_size; ++t) spectrum[t] *= forward_kernel_spectrum_[t];
  inner_->Inverse(spectrum.data(), work.data());

  // The output's one-sided spectrum: the kept bins, those strictly between
  // 0 and the output's Nyquist frequency doubled (they stand for their
  // conjugates too). An even input's Nyquist bin, carried into a longer
  // output, is halved first (FftResample's split between +N/2 and -N/2).
  std::fill(spectrum.begin(), spectrum.end(), std::complex<float>());
  for (int k = first_bin; k < end_bin; ++k) {
    std::complex<float> bin = work[k] * forward_bin_chirp_[k];
    if (n % 2 == 0 && n < m && k == n / 2) bin *= 0.5f;
    const bool doubled = k > 0 && !(m % 2 == 0 && k == m / 2);
    spectrum[k] = (doubled ? 2.0f * bin : bin) * inverse_bin_chirp_[k];
  }
  inner_->Forward(spectrum.data(), work.data());
  for (int t = 0; t < inner_size; ++t) work[t] *= inverse_kernel_spectrum_[t];
  inner_->Inverse(work.data(), spectrum.data());
  float* out = output->data();
  for (int j = 0; j < m; ++j) {
    const std::complex<float> value = spectrum[j];
    const std::complex<float> chirp = inverse_output_chirp_[j];
    out[j] = value.real() * chirp.real() - value.imag() * chirp.imag();
  }
}

}  // namespace audio_dsp
