#include "audio/dsp/rational_factor_resampler.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <random>
#include <vector>

#include "audio/dsp/resampling_kernel.h"
#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using ComplexF = std::complex<float>;

TEST(ResamplingKernelTest, BesselI0AndDefaultKernel) {
  // Reference values from a 30-digit evaluation; 21 is the first argument
  // that takes the asymptotic expansion.
  EXPECT_DOUBLE_EQ(BesselI0(0.0), 1.0);
  EXPECT_NEAR(BesselI0(1.0), 1.26606587775200833560, 1e-15);
  EXPECT_NEAR(BesselI0(-6.0) / 67.2344069764779753262, 1.0, 1e-14);
  EXPECT_NEAR(BesselI0(20.9) / 104774245.970863305814, 1.0, 1e-13);
  EXPECT_NEAR(BesselI0(21.0) / 115513961.922158064121, 1.0, 1e-13);

  const DefaultResamplingKernel kernel(48000, 16000);
  ASSERT_TRUE(kernel.Valid());
  EXPECT_DOUBLE_EQ(kernel.radius(), 15.0);          // five output samples
  EXPECT_DOUBLE_EQ(kernel.Eval(0.0), 0.3);          // 2 * 7200 / 48000
  EXPECT_NEAR(kernel.Eval(1.0 / 0.3), 0.0, 1e-15);  // first zero of the sinc
  EXPECT_DOUBLE_EQ(kernel.Eval(-2.7), kernel.Eval(2.7));
  EXPECT_EQ(kernel.Eval(15.01), 0.0);
  EXPECT_DOUBLE_EQ(DefaultResamplingKernel(16000, 48000).radius(), 5.0);
}

TEST(RationalFactorResamplerTest, Geometry) {
  const RationalFactorResampler<float> down(DefaultResamplingKernel(48000, 16000), 2000);
  ASSERT_TRUE(down.Valid());
  EXPECT_EQ(down.numerator(), 3);
  EXPECT_EQ(down.denominator(), 1);
  EXPECT_EQ(down.radius(), 15);
  EXPECT_EQ(down.num_taps(), 31);
  const RationalFactorResampler<ComplexF> up(DefaultResamplingKernel(16000, 48000), 2000);
  ASSERT_TRUE(up.Valid());
  EXPECT_EQ(up.numerator(), 1);
  EXPECT_EQ(up.denominator(), 3);
  EXPECT_EQ(up.radius(), 5);
  EXPECT_EQ(up.num_taps(), 11);
}

TEST(RationalFactorResamplerTest, InvalidKernelOrLimit) {
  EXPECT_TRUE(DefaultResamplingKernel(48000, 16000, 24000, 6.0).Valid());  // cutoff at the limit
  const DefaultResamplingKernel too_wide(48000, 16000, 24001, 6.0);
  EXPECT_FALSE(too_wide.Valid());
  EXPECT_FALSE(RationalFactorResampler<ComplexF>(too_wide, 2000).Valid());
  EXPECT_FALSE(DefaultResamplingKernel(std::nan(""), 16000).Valid());
  EXPECT_FALSE(RationalFactorResampler<float>(DefaultResamplingKernel(48000, 16000), 0).Valid());
  RationalFactorResampler<float> invalid(DefaultResamplingKernel(-1, 16000), 2000);
  EXPECT_FALSE(invalid.Valid());
  std::vector<float> output = {1.0f};
  invalid.ProcessSamples(std::vector<float>(100, 1.0f), &output);
  EXPECT_TRUE(output.empty());
}

// An asymmetric kernel without a support limit: an impulse response shows at
// which offset each tap was tabulated.
class RampKernel : public ResamplingKernel {
 public:
  RampKernel(double input_rate, double output_rate, double radius)
      : ResamplingKernel(input_rate, output_rate, radius) {
    valid_ = true;
  }
  double Eval(double x) const override { return 10.0 + x; }
};

TEST(RationalFactorResamplerTest, TapsSampleTheKernelAtOutputTimeMinusInputTime) {
  RationalFactorResampler<ComplexF> resampler(RampKernel(2, 3, 2.5), 100);
  ASSERT_TRUE(resampler.Valid());
  ASSERT_EQ(resampler.radius(), 3);
  std::vector<ComplexF> impulse(40), output;
  const int n0 = 11;
  impulse[n0] = {1.0f, -2.0f};
  resampler.ProcessSamples(impulse, &output);
  ASSERT_EQ(output.size(), 56u);  // ceil(3 * (40 - 3) / 2)
  for (int k = 0; k < 56; ++k) {
    // Output k is at input time 2k / 3 and sees the times within 3 of floor(2k / 3).
    const float expected = std::abs(k * 2 / 3 - n0) <= 3 ? 10.0 + k * 2.0 / 3.0 - n0 : 0.0;
    EXPECT_NEAR(output[k].real(), expected, 1e-5) << k;
    EXPECT_NEAR(output[k].imag(), -2.0f * expected, 1e-5) << k;
  }
  // A window of 3 taps cannot decimate by 5 without skipping input; by 2 it can.
  EXPECT_FALSE(RationalFactorResampler<float>(RampKernel(5, 1, 1.0), 100).Valid());
  EXPECT_TRUE(RationalFactorResampler<float>(RampKernel(2, 1, 1.0), 100).Valid());
}

TEST(RationalFactorResamplerTest, ShortFirstBlockProducesNothing) {
  RationalFactorResampler<float> resampler(DefaultResamplingKernel(48000, 16000), 2000);
  std::vector<float> output = {1.0f};
  resampler.ProcessSamples(std::vector<float>(15, 1.0f), &output);  // < taps - radius
  EXPECT_TRUE(output.empty());
  resampler.ProcessSamples(std::vector<float>(85, 1.0f), &output);
  EXPECT_EQ(output.size(), 29u);  // ceil((100 - radius) / 3)
}

template <typename T>
void ExpectBlockingDoesNotMatter(double input_rate, double output_rate) {
  SCOPED_TRACE(testing::Message() << input_rate << " -> " << output_rate);
  std::mt19937 random(5);
  std::normal_distribution<float> noise;
  std::vector<T> input(3000), one_block, pieces, block_output;
  for (T& x : input) x = T(noise(random));
  RationalFactorResampler<T> resampler(DefaultResamplingKernel(input_rate, output_rate), 2000);
  resampler.ProcessSamples(input, &one_block);
  const int p = resampler.numerator(), q = resampler.denominator();
  EXPECT_EQ(static_cast<int>(one_block.size()), (q * (3000 - resampler.radius()) + p - 1) / p);
  resampler.Reset();
  // Blocks of every size class: empty, shorter than a window, long.
  const int sizes[] = {1, 0, 7, 130, 2, 31, 500, 13, 0, 64};
  for (size_t start = 0, b = 0; start < input.size(); ++b) {
    const size_t end = std::min(input.size(), start + sizes[b % 10]);
    resampler.ProcessSamples(std::vector<T>(input.begin() + start, input.begin() + end),
                             &block_output);
    pieces.insert(pieces.end(), block_output.begin(), block_output.end());
    start = end;
  }
  EXPECT_EQ(pieces, one_block);  // Bit for bit.
}

TEST(RationalFactorResamplerTest, OutputDoesNotDependOnBlocking) {
  ExpectBlockingDoesNotMatter<float>(48000, 44100);
  ExpectBlockingDoesNotMatter<float>(16000, 48000);
  ExpectBlockingDoesNotMatter<ComplexF>(44100, 14700);
  ExpectBlockingDoesNotMatter<ComplexF>(48000, 12000);
}

// The eight partial sums of products (index mod 8) that the resampler keeps,
// the first four and the second four paired lane by lane; the products past
// the last whole four are left out.
void PartialSums(const std::vector<float>& products, float sums[4]) {
  const int n = static_cast<int>(products.size());
  float first[4] = {0, 0, 0, 0}, second[4] = {0, 0, 0, 0};
  int m = 0;
  for (; m + 8 <= n; m += 8) {
    for (int l = 0; l < 4; ++l) {
      first[l] += products[m + l];
      second[l] += products[m + 4 + l];
    }
  }
  if (m + 4 <= n) {
    for (int l = 0; l < 4; ++l) second[l] += products[m + l];
  }
  for (int l = 0; l < 4; ++l) sums[l] = first[l] + second[l];
}

// Output k computed from its definition: the window of num_taps samples of
// the stream (radius zeros, then the input) that starts at floor(k p / q),
// the taps kernel((radius - m) + (k p mod q) / q) rounded to float, and the
// products summed in single precision in the order the resampler promises
// for every output: eight partial sums (m mod 8), the first four and the
// second four paired lane by lane, then the last num_taps mod 4 products.
// *exact: the same sum in double; *magnitude: the sum of the products'
// magnitudes.
float DirectOutput(const ResamplingKernel& kernel, int p, int q, int radius,
                   const std::vector<float>& input, int64_t k, double* exact, double* magnitude) {
  const int n = 2 * radius + 1;
  const int64_t start = k * p / q;
  const int phase = static_cast<int>(k * p % q);
  std::vector<float> products(n);
  *exact = *magnitude = 0.0;
  for (int m = 0; m < n; ++m) {
    const int64_t i = start + m - radius;
    const float x = i < 0 ? 0.0f : input[i];
    const float tap = static_cast<float>(kernel.Eval((radius - m) + double(phase) / q));
    products[m] = tap * x;
    *exact += double(tap) * x;
    *magnitude += std::fabs(double(tap) * x);
  }
  float sums[4];
  PartialSums(products, sums);
  const float* last = products.data() + (n & ~3);
  const float rest = n % 4 == 3   ? last[0] + (last[1] + last[2])
                     : n % 4 == 2 ? last[0] + last[1]
                     : n % 4 == 1 ? last[0]
                                  : 0.0f;
  return ((sums[0] + sums[2]) + (sums[1] + sums[3])) + rest;
}

TEST(RationalFactorResamplerTest, RealOutputsEqualTheDirectSumBitForBit) {
  // Tap counts 13, 11, 31, 23 and 15, so every tail length; long blocks take
  // the four-lane path for most outputs, the rest go one or four at a time.
  const double rates[][2] = {
      {48000, 44100}, {16000, 48000}, {48000, 16000}, {96000, 44100}, {44100, 32000}};
  std::mt19937 random(9);
  std::normal_distribution<float> noise(0.0f, 3000.0f);
  std::vector<float> input(6000), output;
  for (float& x : input) x = noise(random);
  // Stretches of signed zeros: a zero result must keep the sign that the
  // one-output sum gives it.
  std::fill(input.begin() + 1000, input.begin() + 1100, -0.0f);
  std::fill(input.begin() + 3000, input.begin() + 3100, 0.0f);
  // For 48 kHz to 16 kHz (one phase, 31 taps, radius 15) output 1000 then
  // sees only -0 products: its window holds zeros of the opposite sign to
  // each tap.
  const DefaultResamplingKernel third(48000, 16000);
  for (int m = 0; m < 31; ++m) {
    const bool positive = static_cast<float>(third.Eval(15 - m)) > 0.0f;
    input[3000 + m - 15] = positive ? -0.0f : 0.0f;
  }
  for (const auto& rate : rates) {
    SCOPED_TRACE(testing::Message() << rate[0] << " -> " << rate[1]);
    const DefaultResamplingKernel kernel(rate[0], rate[1]);
    RationalFactorResampler<float> resampler(kernel, 2000);
    ASSERT_TRUE(resampler.Valid());
    const int p = resampler.numerator(), q = resampler.denominator();
    resampler.ProcessSamples(input, &output);
    ASSERT_EQ(static_cast<int>(output.size()), (q * (6000 - resampler.radius()) + p - 1) / p);
    int zeros = 0;
    for (size_t k = 0; k < output.size(); ++k) {
      double exact, magnitude;
      const float direct =
          DirectOutput(kernel, p, q, resampler.radius(), input, k, &exact, &magnitude);
      ASSERT_EQ(std::signbit(output[k]), std::signbit(direct)) << k;
      ASSERT_EQ(output[k], direct) << k;
      // At most 31 roundings of a few parts in 1e8 each.
      ASSERT_NEAR(output[k], exact, 2e-6 * magnitude) << k;
      zeros += output[k] == 0.0f;
    }
    EXPECT_GT(zeros, 20);
  }
}

// Complex output k from its definition: the products tap * x of the window
// as interleaved (real, imaginary) floats, summed as eight partial sums
// (float index mod 8), the first four and the second four paired lane by
// lane; the real part is lanes 0 + 2, the imaginary part lanes 1 + 3, then
// the last tap's product when the float count leaves two over.
ComplexF DirectComplexOutput(const ResamplingKernel& kernel, int p, int q, int radius,
                             const std::vector<ComplexF>& input, int64_t k) {
  const int taps = 2 * radius + 1;
  const int n = 2 * taps;
  const int64_t start = k * p / q;
  const int phase = static_cast<int>(k * p % q);
  std::vector<float> products(n);
  for (int m = 0; m < taps; ++m) {
    const int64_t i = start + m - radius;
    const ComplexF x = i < 0 ? ComplexF() : input[i];
    const float tap = static_cast<float>(kernel.Eval((radius - m) + double(phase) / q));
    products[2 * m] = tap * x.real();
    products[2 * m + 1] = tap * x.imag();
  }
  float sums[4];
  PartialSums(products, sums);
  float re = sums[0] + sums[2], im = sums[1] + sums[3];
  if (n & 2) {
    re += products[n - 2];
    im += products[n - 1];
  }
  return {re, im};
}

// With eight-lane vectors (where the processor has AVX) and without.
TEST(RationalFactorResamplerTest, ComplexOutputsEqualTheDirectSumBitForBit) {
  // 31, 41 and 29 taps; one phase and 160 phases.
  const double rates[][2] = {{44100, 14700}, {48000, 12000}, {44100, 16000}};
  std::mt19937 random(5);
  std::normal_distribution<float> noise(0.0f, 3000.0f);
  std::vector<ComplexF> input(5000), output;
  for (ComplexF& x : input) x = {noise(random), noise(random)};
  for (const auto& rate : rates) {
    for (const bool wide : {true, false}) {
      SCOPED_TRACE(testing::Message() << rate[0] << " -> " << rate[1] << " wide " << wide);
      const DefaultResamplingKernel kernel(rate[0], rate[1]);
      RationalFactorResampler<ComplexF> resampler(kernel, 2000, wide);
      ASSERT_TRUE(resampler.Valid());
#if defined(__x86_64__) || defined(__i386__)
      EXPECT_EQ(resampler.wide(), wide && __builtin_cpu_supports("avx"));
#endif
      const int p = resampler.numerator(), q = resampler.denominator();
      // Two blocks, so that outputs straddle the held-back samples too.
      std::vector<ComplexF> all;
      resampler.ProcessSamples(std::vector<ComplexF>(input.begin(), input.begin() + 1234), &output);
      all = output;
      resampler.ProcessSamples(std::vector<ComplexF>(input.begin() + 1234, input.end()), &output);
      all.insert(all.end(), output.begin(), output.end());
      ASSERT_EQ(static_cast<int>(all.size()), (q * (5000 - resampler.radius()) + p - 1) / p);
      for (size_t k = 0; k < all.size(); ++k) {
        const ComplexF direct = DirectComplexOutput(kernel, p, q, resampler.radius(), input, k);
        ASSERT_EQ(all[k], direct) << k;
      }
    }
  }
}

TEST(RationalFactorResamplerTest, PassbandToneKeepsFrequencyAndAmplitude) {
  struct Case {
    double input_rate, output_rate, frequency;
  };
  for (const Case& c :
       {Case{48000, 44100, 1000}, Case{48000, 44100, 8000}, Case{16000, 48000, 3000},
        Case{48000, 48000, 8000}, Case{44100, 14700, -2500}, Case{48000, 12000, 2000}}) {
    SCOPED_TRACE(testing::Message()
                 << c.input_rate << " -> " << c.output_rate << ", " << c.frequency << " Hz");
    // Real tones through the float path, complex ones through the complex path.
    RationalFactorResampler<float> real(DefaultResamplingKernel(c.input_rate, c.output_rate), 2000);
    RationalFactorResampler<ComplexF> cplx(DefaultResamplingKernel(c.input_rate, c.output_rate),
                                           2000);
    const double w = 2.0 * M_PI * c.frequency / c.input_rate;  // radians per input sample
    std::vector<float> input(4000), output;
    std::vector<ComplexF> complex_input(4000), complex_output;
    for (int n = 0; n < 4000; ++n) {
      input[n] = std::sin(w * n);
      complex_input[n] = std::polar(1000.0f, float(w * n));
    }
    real.ProcessSamples(input, &output);
    cplx.ProcessSamples(complex_input, &complex_output);
    ASSERT_EQ(output.size(), complex_output.size());
    const double p_over_q = double(real.numerator()) / real.denominator();
    for (size_t k = 0; k < output.size(); ++k) {
      const double time = k * p_over_q;    // in input samples
      if (time < real.radius()) continue;  // ramp-in
      ASSERT_NEAR(output[k], std::sin(w * time), 5e-3) << k;
      ASSERT_LT(std::abs(complex_output[k] - std::polar(1000.0f, float(w * time))), 5.0f) << k;
    }
  }
}

TEST(RationalFactorResamplerTest, AttenuatesToneAboveOutputNyquist) {
  RationalFactorResampler<float> resampler(DefaultResamplingKernel(48000, 16000), 2000);
  std::vector<float> input(4800), output;
  for (size_t n = 0; n < input.size(); ++n) input[n] = std::sin(2.0 * M_PI * 11000.0 * n / 48000);
  resampler.ProcessSamples(input, &output);
  double energy = 0.0;
  for (size_t k = 10; k < output.size(); ++k) energy += output[k] * output[k];
  EXPECT_LT(std::sqrt(energy / (output.size() - 10)), 1e-3);  // input RMS 0.707
}

TEST(RationalFactorResamplerTest, FlushReleasesTheHeldBackTail) {
  RationalFactorResampler<float> resampler(DefaultResamplingKernel(48000, 44100), 2000);
  const int p = resampler.numerator(), q = resampler.denominator(), radius = resampler.radius();
  std::vector<float> input(1000, 1.0f), output, flushed = {7.0f};
  resampler.ProcessSamples(input, &output);
  resampler.Flush(&flushed);
  // Together they reach radius samples past the last input.
  EXPECT_EQ(static_cast<int>(output.size() + flushed.size()), (q * (1000 + radius) + p - 1) / p);
  ASSERT_GE(flushed.size(), 2u);
  EXPECT_NEAR(flushed.front(), 1.0f, 2e-3);    // Still a full window of ones.
  EXPECT_LT(std::fabs(flushed.back()), 0.1f);  // Almost past the data.
  // The same as feeding the zeros as ordinary input.
  RationalFactorResampler<float> twin(DefaultResamplingKernel(48000, 44100), 2000);
  std::vector<float> twin_output;
  input.resize(1000 + 2 * radius, 0.0f);
  twin.ProcessSamples(input, &twin_output);
  output.insert(output.end(), flushed.begin(), flushed.end());
  EXPECT_EQ(output, twin_output);
}

}  // namespace
}  // namespace audio_dsp
