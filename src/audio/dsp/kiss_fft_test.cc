#include "audio/dsp/kiss_fft.h"

#include <cmath>
#include <complex>
#include <random>
#include <vector>

#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using Complex = std::complex<float>;

std::vector<Complex> RandomComplex(int size, unsigned seed) {
  std::mt19937 rng(seed);
  std::uniform_real_distribution<float> dist(-1.0f, 1.0f);
  std::vector<Complex> values(size);
  for (Complex& v : values) v = {dist(rng), dist(rng)};
  return values;
}

// Unnormalised forward DFT by the O(N²) definition, in double precision.
std::vector<std::complex<double>> DirectDft(const std::vector<Complex>& x) {
  const int n = x.size();
  std::vector<std::complex<double>> result(n);
  for (int k = 0; k < n; ++k) {
    for (int j = 0; j < n; ++j) {
      const int64_t phase = (int64_t{j} * k) % n;  // Exact, so large n stays accurate.
      result[k] += std::complex<double>(x[j]) * std::polar(1.0, -2.0 * M_PI * phase / n);
    }
  }
  return result;
}

// ‖a − b‖ / ‖b‖ over the first a.size() entries.
template <typename A, typename B>
double RelativeError(const std::vector<A>& a, const std::vector<B>& b) {
  double error = 0.0, norm = 0.0;
  for (size_t i = 0; i < a.size(); ++i) {
    error += std::norm(std::complex<double>(a[i]) - std::complex<double>(b[i]));
    norm += std::norm(std::complex<double>(b[i]));
  }
  return std::sqrt(error / norm);
}

TEST(KissFftTest, FastSizeRule) {
  for (int size : {1, 2, 15, 16, 23, 7 * 9 * 4, 13 * 125, 1024, 65536}) {
    EXPECT_TRUE(IsFastFftSize(size)) << size;
  }
  for (int size : {0, -4, 29, 49, 127, 1905, 2159, 32385, 35249}) {
    EXPECT_FALSE(IsFastFftSize(size)) << size;
  }
}

// Fast (kissfft) and slow (Bluestein) sizes, odd and even, against a direct
// DFT; a correct forward transform plus a scaled round trip also pins down
// the inverse.
TEST(KissFftTest, ComplexMatchesDirectDftAndRoundTrips) {
  for (int size : {1, 2, 7, 16, 49, 127, 254, 1905}) {
    const ComplexFFTTransformer fft(size, /*scale_inverse=*/true);
    ASSERT_EQ(fft.GetSize(), size);
    const std::vector<Complex> x = RandomComplex(size, size);
    std::vector<Complex> y;
    fft.Forward(x, &y);
    EXPECT_LT(RelativeError(y, DirectDft(x)), 2e-6) << size;
    fft.Inverse(y.data(), y.data());  // In place.
    EXPECT_LT(RelativeError(y, x), 2e-6) << size;
  }
}

// Real transforms of every implementation: kissfft's real transform (even
// fast), a kissfft complex backend (odd fast) and Bluestein (slow, both
// parities). The inverse rebuilds the full Hermitian spectrum from N / 2 + 1
// bins, which the round trip checks for odd and even N.
TEST(KissFftTest, RealMatchesDirectDftAndRoundTrips) {
  for (int size : {1, 2, 15, 16, 49, 127, 254, 1905}) {
    const RealFFTTransformer real_fft(size, /*scale_inverse=*/true);
    std::vector<Complex> complex_x = RandomComplex(size, 7);
    std::vector<float> x(size);
    for (int i = 0; i < size; ++i) x[i] = complex_x[i].real();
    for (Complex& v : complex_x) v.imag(0.0f);
    std::vector<Complex> spectrum;
    real_fft.Forward(x, &spectrum);
    ASSERT_EQ(spectrum.size(), size / 2 + 1u);
    EXPECT_LT(RelativeError(spectrum, DirectDft(complex_x)), 2e-6) << size;
    std::vector<float> back;
    real_fft.Inverse(spectrum, &back);
    EXPECT_LT(RelativeError(back, x), 2e-6) << size;
  }
}

TEST(KissFftDeathTest, ChecksArguments) {
  EXPECT_DEATH(ComplexFFTTransformer(0, false), "Check failed: size > 0");
  const RealFFTTransformer real_fft(16, true);
  std::vector<float> x(16);
  std::vector<Complex> spectrum(8);
  EXPECT_DEATH(real_fft.Inverse(spectrum, &x),
               "Check failed: input.size\\(\\) == GetTransformedSize\\(\\)");
  EXPECT_DEATH(real_fft.Forward(std::vector<float>(15), &spectrum),
               "Check failed: input.size\\(\\) == GetSize\\(\\)");
  EXPECT_DEATH(real_fft.Forward(x, nullptr), "Check failed: output");
  const ComplexFFTTransformer fft(49, true);
  EXPECT_DEATH(fft.Inverse(spectrum, &spectrum), "Check failed: input.size\\(\\) == GetSize\\(\\)");
  EXPECT_DEATH(fft.Forward(nullptr, spectrum.data()), "Check failed: input");
}

}  // namespace
}  // namespace audio_dsp
