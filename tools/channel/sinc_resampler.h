// Band-limited reading of a sampled signal at arbitrary positions: the
// resampling step of the channel simulator, which plays a source faster or
// slower (clock skew, Doppler, a walking listener) and converts it to the
// microphone rate in one pass.
//
// The kernel is a Kaiser-windowed sinc (beta 8) reaching 64 samples of the
// lower rate on each side, cut off (-6 dB) at 0.965 of the lower Nyquist
// frequency, tabulated at 1/512 input sample and interpolated linearly
// between rows (table error near -100 dB). From 48 to 44.1 kHz: flat within
// 0.02 dB up to 20.5 kHz, -6 dB at 21.3 kHz, aliases from above 22.6 kHz at
// -80 dB or less. Arithmetic is single precision in a fixed order, so every
// build computes the same samples.
//
// Read-only after construction: one object may serve several threads.

#ifndef TOOLS_CHANNEL_SINC_RESAMPLER_H_
#define TOOLS_CHANNEL_SINC_RESAMPLER_H_

#include <cstdint>
#include <vector>

namespace vesk_channel {

class SincResampler {
 public:
  // A kernel for reading `step` input samples per output sample (> 0): the
  // cut-off follows the lower of the two rates. Reading at other steps is
  // allowed; steps well above this one alias.
  explicit SincResampler(double step);

  // output[k] = gain x (band-limited input at input position first + k x
  // step) for k < count; the input is zero outside its samples. `output`
  // holds count values.
  void Process(const std::vector<float>& input, double first, float gain, int64_t count,
               float* output) const;

  // output[k] = gains[k] x (band-limited input at positions[k]) for every k
  // of `positions` (input samples, any real values); `gains` has the same
  // length, `output` holds as many values.
  void ProcessAt(const std::vector<float>& input, const std::vector<double>& positions,
                 const std::vector<float>& gains, float* output) const;

  // Input samples on each side of a position that the kernel reaches.
  double radius() const { return radius_; }

 private:
  // The input with taps_ zeros on each side.
  std::vector<float> Pad(const std::vector<float>& input) const;
  // The band-limited value at position p of an input of n samples padded by
  // Pad().
  float Interpolate(const float* padded, int64_t n, double p) const;

  double step_;
  double radius_;  // input samples
  int half_;
  int taps_;
  std::vector<float> table_;
};

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_SINC_RESAMPLER_H_
