// Signals and measurements shared by the channel simulator's tests.

#ifndef TOOLS_CHANNEL_CHANNEL_TEST_UTIL_H_
#define TOOLS_CHANNEL_CHANNEL_TEST_UTIL_H_

#include <cmath>
#include <complex>
#include <cstdint>
#include <vector>

#include "tools/channel/channel_constants.h"

namespace vesk_channel {

// round(seconds x rate) samples of amplitude x sin(2 pi frequency t).
inline std::vector<float> Tone(double frequency, double rate, double seconds,
                               double amplitude = 0.5) {
  std::vector<float> x(static_cast<size_t>(std::lround(seconds * rate)));
  for (size_t i = 0; i < x.size(); ++i) x[i] = amplitude * std::sin(2 * kPi * frequency * i / rate);
  return x;
}

// The complex amplitude of `frequency` in x[begin, end): a sinusoid
// a sin(2 pi f t + phi) gives a e^(i phi) (to within the leakage of other
// components).
template <typename Sample>
std::complex<double> Phasor(const std::vector<Sample>& x, size_t begin, size_t end,
                            double frequency, double rate) {
  std::complex<double> sum = 0;
  for (size_t i = begin; i < end; ++i) {
    sum += static_cast<double>(x[i]) * std::polar(1.0, -2 * kPi * frequency * i / rate);
  }
  // sin = (e^(i..) - e^(-i..)) / 2i: the positive-frequency part times 2i.
  return sum * std::complex<double>(0, 2) / static_cast<double>(end - begin);
}

template <typename Sample>
double Amplitude(const std::vector<Sample>& x, size_t begin, size_t end, double frequency,
                 double rate) {
  return std::abs(Phasor(x, begin, end, frequency, rate));
}

template <typename Sample>
double MeanSquare(const std::vector<Sample>& x, size_t begin, size_t end) {
  double sum = 0;
  for (size_t i = begin; i < end; ++i) sum += static_cast<double>(x[i]) * x[i];
  return sum / static_cast<double>(end - begin);
}

inline double ToDb(double ratio) { return 20 * std::log10(ratio); }

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_CHANNEL_TEST_UTIL_H_
