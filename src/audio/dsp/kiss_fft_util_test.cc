#include "audio/dsp/kiss_fft_util.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <initializer_list>
#include <random>
#include <utility>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::FloatNear;
using ::testing::Pointwise;

// Σ amplitude × cos(2π × cycles × i / size) over the given (cycles, amplitude)
// pairs, for i < size.
std::vector<float> Tones(int size, std::initializer_list<std::pair<double, float>> tones) {
  std::vector<float> signal(size);
  for (int i = 0; i < size; ++i) {
    for (const auto& [cycles, amplitude] : tones) {
      signal[i] += amplitude * std::cos(2.0 * M_PI * cycles * i / size);
    }
  }
  return signal;
}

TEST(BandPassSpectrumTest, KeepsBinsWhoseFrequencyIsInTheBand) {
  const std::vector<std::complex<float>> spectrum(6, {1.0f, -1.0f});
  std::vector<std::complex<float>> out;
  // Bins at 0, 100, ..., 500 Hz; the band [150, 400] holds 200, 300 and 400.
  BandPassSpectrum(spectrum, 150.0f, 400.0f, 100.0f, &out);
  const std::complex<float> z, one(1.0f, -1.0f);
  EXPECT_THAT(out, ElementsAre(z, z, one, one, one, z));
  // Edges exactly on bins keep those bins; in place.
  out = spectrum;
  BandPassSpectrum(out, 100.0f, 100.0f, 100.0f, &out);
  EXPECT_THAT(out, ElementsAre(z, one, z, z, z, z));
}

TEST(BandPassFilterTest, CutsExactlyAtBinFrequencies) {
  // 480 samples at 48 kHz: bins are 100 Hz apart; tones at 900, 1000, 1100 Hz.
  std::vector<float> signal = Tones(480, {{9, 2.0f}, {10, 1.0f}, {11, 0.5f}});
  std::vector<float> out;
  BandPassFilter(signal, 1050.0f, 1050.0f, 48000.0f, &out);  // No bin in the band.
  EXPECT_THAT(out, Each(FloatNear(0.0f, 1e-6f)));
  HighPassFilter(signal, 1000.0f, 48000.0f, &signal);  // In place; keeps 1000 Hz.
  EXPECT_THAT(signal, Pointwise(FloatNear(1e-5f), Tones(480, {{10, 1.0f}, {11, 0.5f}})));
}

TEST(BandPassFilterTest, NyquistEdgeAcceptedForAnyLength) {
  for (int size : {15, 16, 127}) {
    const std::vector<float> signal = Tones(size, {{3, 1.0f}, {size / 2, 0.5f}});
    std::vector<float> out;
    BandPassFilter(signal, 0.0f, 4000.0f, 8000.0f, &out);
    EXPECT_THAT(out, Pointwise(FloatNear(1e-5f), signal)) << size;
  }
}

TEST(FftResampleTest, ToneKeepsFrequencyAndAmplitude) {
  // 700 cycles in 32385 samples at 44.1 kHz (953.2 Hz) become 700 cycles in
  // 35249 samples at 48 kHz, the same frequency within 0.01 Hz.
  std::vector<float> out;
  FftResample(Tones(32385, {{700, 0.5f}}), 44100.0f, 48000.0f, &out);
  ASSERT_EQ(out.size(), 35249u);
  EXPECT_THAT(out, Pointwise(FloatNear(2e-4f), Tones(35249, {{700, 0.5f}})));
}

TEST(FftResampleTest, LengthChanges) {
  // An even length's Nyquist tone is split between ±N/2 when growing.
  std::vector<float> signal = {1.0f, -1.0f, 1.0f, -1.0f};
  FftResample(signal, 4.0f, 8.0f, &signal);
  EXPECT_THAT(signal, Pointwise(FloatNear(1e-6f), {1, 0, -1, 0, 1, 0, -1, 0}));
  // Halving the rate keeps the tone below the new Nyquist and drops the other.
  std::vector<float> out;
  FftResample(Tones(64, {{3, 1.0f}, {20, 1.0f}}), 16000.0f, 8000.0f, &out);
  EXPECT_THAT(out, Pointwise(FloatNear(1e-5f), Tones(32, {{3, 1.0f}})));
  // Equal rates copy; an empty buffer stays empty.
  FftResample(signal, 8000.0f, 8000.0f, &out);
  EXPECT_EQ(out, signal);
  FftResample({}, 8000.0f, 16000.0f, &out);
  EXPECT_TRUE(out.empty());
}

// Largest |a - b| over two equally long buffers, relative to b's peak (or
// to 1, the input's scale, when b is about silent).
float LargestError(const std::vector<float>& a, const std::vector<float>& b) {
  EXPECT_EQ(a.size(), b.size());
  float peak = 0.0f, error = 0.0f;
  for (size_t i = 0; i < std::min(a.size(), b.size()); ++i) {
    peak = std::max(peak, std::fabs(b[i]));
    error = std::max(error, std::fabs(a[i] - b[i]));
  }
  return error / std::max(peak, 1.0f);
}

// The planned resampler gives FftResample's output, and BandPassFilter's
// followed by it, within float rounding: growing and shrinking, odd and even
// lengths on either side, fast and Bluestein sizes, the same rate with a
// band, a band edge on the Nyquist bin.
TEST(FftResamplerTest, EqualsFftResampleAndBandPassFilter) {
  struct Case {
    int size;
    float from, to;
  };
  std::mt19937 rng(2);
  std::uniform_real_distribution<float> value(-1.0f, 1.0f);
  for (const Case& c : {Case{32385, 44100, 48000}, Case{34544, 48000, 44100},
                        Case{1024, 8000, 8000}, Case{1000, 16000, 8000}, Case{127, 8000, 16000},
                        Case{128, 8000, 16000}, Case{4, 4, 8}, Case{2032, 48000, 48000}}) {
    std::vector<float> input(c.size);
    for (float& x : input) x = value(rng);
    const FftResampler resampler(c.size, c.from, c.to);
    std::vector<float> got, want;
    if (c.from != c.to) {
      resampler.Resample(input, &got);
      FftResample(input, c.from, c.to, &want);
      EXPECT_LT(LargestError(got, want), 2e-6f) << c.size;
      EXPECT_EQ(resampler.output_size(), static_cast<int>(want.size()));
    }
    for (const std::pair<float, float>& band :
         {std::make_pair(0.3f * c.from, 0.5f * c.from),
          std::make_pair(0.1f * c.from, 0.2f * c.from), std::make_pair(0.0f, 0.5f * c.from)}) {
      std::vector<float> filtered;
      BandPassFilter(input, band.first, band.second, c.from, &filtered);
      FftResample(filtered, c.from, c.to, &want);
      resampler.BandPassAndResample(input, band.first, band.second, &got);
      EXPECT_LT(LargestError(got, want), 2e-6f) << c.size << " " << band.first;
    }
  }
}

TEST(KissFftUtilDeathTest, ChecksArguments) {
  const std::vector<float> signal(16);
  std::vector<float> out;
  EXPECT_DEATH(
      BandPassFilter(signal, 0.0f, 8500.0f, 16000.0f, &out),
      "Check failed: high_band_edge < sample_rate \\* \\(0.5f \\+ 0.5f / input.size\\(\\)\\)");
  const std::vector<std::complex<float>> spectrum(4);
  std::vector<std::complex<float>> masked;
  EXPECT_DEATH(BandPassSpectrum(spectrum, 0.0f, 401.0f, 100.0f, &masked),
               "Check failed: high_band_edge <= bin_width \\* spectrum_size");
  EXPECT_DEATH(FftResample(signal, 0.0f, 8000.0f, &out), "Check failed: input_sample_rate > 0");
  EXPECT_DEATH(FftResample(signal, 8000.0f, 8000.0f, nullptr), "Check failed: output");
}

}  // namespace
}  // namespace audio_dsp
