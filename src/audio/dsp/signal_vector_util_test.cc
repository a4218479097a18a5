#include "audio/dsp/signal_vector_util.h"

#include <algorithm>
#include <complex>
#include <random>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

using ::testing::ElementsAre;
using Complex = std::complex<float>;

TEST(StreamingFirFilterTest, CarriesStateAcrossCalls) {
  StreamingFirFilter filter({1, 1});
  std::vector<Complex> y;
  filter.ProcessSamples({1, 2}, &y);
  EXPECT_THAT(y, ElementsAre(Complex(1), Complex(3)));
  filter.ProcessSamples({3}, &y);
  EXPECT_THAT(y, ElementsAre(Complex(5)));
  // An empty block is no block: nothing out, the state kept.
  filter.ProcessSamples({}, &y);
  EXPECT_TRUE(y.empty());
  filter.ProcessSamples({4}, &y);
  EXPECT_THAT(y, ElementsAre(Complex(7)));
  filter.Reset();
  filter.ProcessSamples({3}, &y);
  EXPECT_THAT(y, ElementsAre(Complex(3)));
  EXPECT_DEATH(filter.ProcessSamples({1}, nullptr), "Check failed: result");
  EXPECT_DEATH(StreamingFirFilter({}), "Check failed: !impulse_response_\\.empty\\(\\)");
}

TEST(StreamingFirFilterTest, MatchesConvolutionWhateverTheBlockSplit) {
  std::mt19937 rng(5);
  std::uniform_real_distribution<float> value(-1.0f, 1.0f);
  std::vector<Complex> x(200), taps(17);
  for (Complex& c : x) c = {value(rng), value(rng)};
  for (Complex& c : taps) c = {value(rng), value(rng)};
  for (size_t num_taps : {1, 2, 3, 17}) {
    StreamingFirFilter filter(std::vector<Complex>(taps.begin(), taps.begin() + num_taps));
    for (size_t block : {1, 7, 200}) {
      filter.Reset();
      for (size_t start = 0; start < x.size(); start += block) {
        std::vector<Complex> y(x.begin() + start, x.begin() + std::min(x.size(), start + block));
        filter.ProcessSamples(y, &y);  // In place.
        for (size_t i = 0, n = start; i < y.size(); ++i, ++n) {
          Complex expected = 0;
          for (size_t k = 0; k < num_taps && k <= n; ++k) expected += taps[k] * x[n - k];
          ASSERT_LT(std::abs(y[i] - expected), 1e-5f) << num_taps << " " << block << " " << n;
        }
      }
    }
  }
}

// The filter adds each output's products oldest first, each formed as the
// complex product: the bits of a transposed direct form that keeps L - 1
// partial sums, however the stream is cut.
TEST(StreamingFirFilterTest, EqualsTheTransposedFormBitForBit) {
  std::mt19937 rng(9);
  std::uniform_real_distribution<float> value(-1000.0f, 1000.0f);
  std::uniform_int_distribution<int> block(1, 40);
  for (size_t num_taps : {1, 2, 3, 4, 9}) {
    std::vector<Complex> taps(num_taps);
    for (Complex& c : taps) c = {value(rng), value(rng)};
    StreamingFirFilter filter(taps);
    std::vector<float> state(2 * (num_taps - 1), 0.0f);  // Partial sums, (re, im).
    for (int round = 0; round < 20; ++round) {
      std::vector<Complex> x(block(rng));
      for (Complex& c : x) c = {value(rng), value(rng)};
      std::vector<Complex> y;
      filter.ProcessSamples(x, &y);
      for (size_t i = 0; i < x.size(); ++i) {
        const float xr = x[i].real(), xi = x[i].imag();
        auto product = [&](size_t k) {
          return Complex(xr * taps[k].real() - xi * taps[k].imag(),
                         xr * taps[k].imag() + xi * taps[k].real());
        };
        Complex expected = product(0);
        if (num_taps > 1) {
          expected = Complex(state[0] + expected.real(), state[1] + expected.imag());
          for (size_t k = 1; k + 1 < num_taps; ++k) {
            state[2 * k - 2] = state[2 * k] + product(k).real();
            state[2 * k - 1] = state[2 * k + 1] + product(k).imag();
          }
          state[2 * num_taps - 4] = product(num_taps - 1).real();
          state[2 * num_taps - 3] = product(num_taps - 1).imag();
        }
        ASSERT_EQ(y[i], expected) << num_taps << " " << round << " " << i;
      }
    }
  }
}

}  // namespace
}  // namespace audio_dsp
