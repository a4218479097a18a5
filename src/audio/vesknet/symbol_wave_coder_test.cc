#include "audio/vesknet/symbol_wave_coder.h"

#include <cmath>
#include <vector>

#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

float PeakOf(const SymbolWaveCoder& coder) {
  float peak = 0;
  for (int s = 0; s < coder.alphabet_size(); ++s) {
    for (float v : coder.GetSymbolWave(s)) peak = std::max(peak, std::fabs(v));
  }
  return peak;
}

TEST(SymbolWaveCoderTest, DefaultGeometry) {
  base::SetVlogLevel(1);
  base::ScopedLogCapture capture;
  const SymbolWaveCoder coder((SymbolWaveCoderParams()));
  base::SetVlogLevel(0);
  EXPECT_TRUE(capture.Contains(base::LogSeverity::kVerbose, "CCPF: 799"));
  EXPECT_EQ(coder.frame_size(), 1905);
  EXPECT_EQ(coder.carrier_cycles_per_frame(), 799);
  EXPECT_NEAR(coder.carrier_frequency(), 18496.5f, 0.1f);
  EXPECT_EQ(coder.alphabet_size(), 17);
  for (int s = 0; s < coder.alphabet_size(); ++s) {
    EXPECT_EQ(coder.GetSymbolWave(s).size(), 1905u);
  }
  EXPECT_EQ(&coder.GetSyncSymbolWave(), &coder.GetSymbolWave(16));
  EXPECT_EQ(PeakOf(coder), 1.0f);  // Exactly.
  EXPECT_EQ(coder.baseband_code().size(), 635u);
  EXPECT_EQ(coder.baseband_tones().rows(), 17);
  EXPECT_EQ(coder.baseband_tones().cols(), 635);
  // Row s of the tones holds 4 + s cycles per baseband frame.
  EXPECT_NEAR(coder.baseband_tones()(3, 10), std::sin(2 * M_PI * 7 * 10 / 635.0), 1e-6);
}

TEST(SymbolWaveCoderTest, ProductGeometryAt48k) {
  SymbolWaveCoderParams params;
  params.sample_rate = 48000;
  params.upsampling_factor = 16;
  params.baseband_decimation_factor = 4;
  const SymbolWaveCoder coder(params);
  EXPECT_EQ(coder.frame_size(), 2032);
  EXPECT_EQ(coder.carrier_cycles_per_frame(), 783);
  EXPECT_EQ(coder.baseband_code().size(), 508u);
}

TEST(SymbolWaveCoderTest, FourierUpsampleInterpolatesThroughTheSamples) {
  const std::vector<float> code = DefaultCodeSignal();
  const std::vector<float> same = FourierUpsample(code, 1);
  ASSERT_EQ(same.size(), code.size());
  for (size_t i = 0; i < code.size(); ++i) EXPECT_NEAR(same[i], code[i], 1e-5);
  const std::vector<float> up = FourierUpsample(code, 5);
  ASSERT_EQ(up.size(), code.size() * 5);
  for (size_t i = 0; i < code.size(); ++i) EXPECT_NEAR(up[5 * i], code[i], 1e-4);
  // Even length: the Nyquist bin is split, so a Nyquist-rate square wave
  // interpolates to a cosine through its samples.
  const std::vector<float> even = FourierUpsample({1, -1, 1, -1}, 2);
  ASSERT_EQ(even.size(), 8u);
  for (int n = 0; n < 8; ++n) EXPECT_NEAR(even[n], std::cos(M_PI * n / 2), 1e-6);
}

// Before normalisation, with the sine carrier, W[s] = U x S x (pedestal + T[s]).
TEST(SymbolWaveCoderTest, WavesAreCodeTimesCarrierTimesToneEnvelope) {
  SymbolWaveCoderParams params;
  params.pedestal_amplitude = 1.5f;
  const SymbolWaveCoder coder(params);
  const int f = coder.frame_size();
  const std::vector<float> u = FourierUpsample(params.code_signal, params.upsampling_factor);
  std::vector<std::vector<double>> expected(coder.alphabet_size(), std::vector<double>(f));
  double peak = 0;
  for (int s = 0; s < coder.alphabet_size(); ++s) {
    for (int n = 0; n < f; ++n) {
      const double carrier = std::sin(2 * M_PI * 799 * n / f);
      const double tone = std::sin(2 * M_PI * (4 + s) * n / f);
      expected[s][n] = u[n] * carrier * (1.5 + tone);
      peak = std::max(peak, std::fabs(expected[s][n]));
    }
  }
  for (int s = 0; s < coder.alphabet_size(); s += 4) {
    for (int n = 0; n < f; n += 7) {
      ASSERT_NEAR(coder.GetSymbolWave(s)[n], expected[s][n] / peak, 2e-5) << s << " " << n;
    }
  }
}

TEST(SymbolWaveCoderTest, QuadratureCarrierChangesTheToneArm) {
  SymbolWaveCoderParams params;
  params.use_quadrature_carrier = true;
  const SymbolWaveCoder quadrature(params);
  const SymbolWaveCoder plain((SymbolWaveCoderParams()));
  EXPECT_EQ(PeakOf(quadrature), 1.0f);
  // At n = 0 the sine carrier is 0; only the cosine arm carries the tone (0 at
  // n = 0 too), so compare a sample inside the frame.
  EXPECT_GT(std::fabs(quadrature.GetSymbolWave(5)[100] - plain.GetSymbolWave(5)[100]), 1e-3);
}

TEST(SymbolWaveCoderDeathTest, RejectsBadRecords) {
  SymbolWaveCoderParams params;
  params.baseband_decimation_factor = 4;
  EXPECT_DEATH(SymbolWaveCoder{params},
               "Check failed: params.upsampling_factor % params.baseband_decimation_factor == 0");
  params = SymbolWaveCoderParams();
  params.desired_carrier_frequency = 23000;
  EXPECT_DEATH(SymbolWaveCoder{params},
               "Check failed: params.desired_carrier_frequency <= params.sample_rate / 2");
  params = SymbolWaveCoderParams();
  params.pedestal_amplitude = 0;
  EXPECT_DEATH(SymbolWaveCoder{params}, "Check failed: params.pedestal_amplitude > 0.0f");
  const SymbolWaveCoder coder((SymbolWaveCoderParams()));
  EXPECT_DEATH(coder.GetSymbolWave(-1), "Check failed: symbol >= 0");
  EXPECT_DEATH(coder.GetSymbolWave(17), "Check failed: symbol < alphabet_size_");
}

}  // namespace
}  // namespace audio_vesknet
