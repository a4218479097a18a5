// Interpolation kernels for the resamplers: the continuous-time low-pass
// impulse response evaluated at offsets measured in input samples.

#ifndef AUDIO_DSP_RESAMPLING_KERNEL_H_
#define AUDIO_DSP_RESAMPLING_KERNEL_H_

namespace audio_dsp {

// A resampling kernel k(x) for a given rate pair, zero for |x| > radius().
// Immutable after construction; safe to share between threads.
class ResamplingKernel {
 public:
  virtual ~ResamplingKernel() = default;

  double input_sample_rate() const { return input_sample_rate_; }    // Hz
  double output_sample_rate() const { return output_sample_rate_; }  // Hz
  // Half-width of the support, in input samples.
  double radius() const { return radius_; }

  // The kernel value at an offset of `x` input samples from the output
  // instant.
  virtual double Eval(double x) const = 0;

  // Whether the parameters describe a usable kernel.
  virtual bool Valid() const { return valid_; }

 protected:
  ResamplingKernel(double input_sample_rate, double output_sample_rate, double radius)
      : input_sample_rate_(input_sample_rate),
        output_sample_rate_(output_sample_rate),
        radius_(radius) {}

  double input_sample_rate_;
  double output_sample_rate_;
  double radius_;
  bool valid_ = false;
};

// Kaiser-windowed sinc low-pass:
//
//   k(x) = nu * sinc(nu * x) * I0(beta * sqrt(1 - (x / radius)^2)) / I0(beta)
//
// with nu = 2 * cutoff / input_sample_rate (the factor nu gives unit gain at
// zero frequency) and sinc(t) = sin(pi t) / (pi t). The radius is 5 input
// samples when upsampling (or for equal rates) and 5 output samples,
// 5 * input_sample_rate / output_sample_rate input samples, when
// downsampling.
class DefaultResamplingKernel : public ResamplingKernel {
 public:
  static constexpr double kDefaultCutoffFraction = 0.45;
  static constexpr double kDefaultKaiserBeta = 6.0;

  // Cutoff 0.45 * min(input_sample_rate, output_sample_rate), beta 6.
  DefaultResamplingKernel(double input_sample_rate, double output_sample_rate);

  // Same radius rule with an explicit cutoff (Hz) and Kaiser beta. Valid only
  // when both rates, the radius, `cutoff` and `kaiser_beta` are > 0 and
  // `cutoff` <= 0.5 * input_sample_rate; otherwise the kernel is left
  // invalid (no message).
  DefaultResamplingKernel(double input_sample_rate, double output_sample_rate, double cutoff,
                          double kaiser_beta);

  double Eval(double x) const override;

 private:
  void Init(double cutoff, double kaiser_beta);

  double normalized_cutoff_ = 0.0;  // nu, cycles per input sample times 2
  double normalized_cutoff_times_pi_ = 0.0;
  double kaiser_beta_ = 0.0;
  double bessel_i0_beta_ = 1.0;
};

// The modified Bessel function of the first kind of order 0, in double
// precision: its power series for |x| < 21, its asymptotic expansion beyond.
double BesselI0(double x);

}  // namespace audio_dsp

#endif  // AUDIO_DSP_RESAMPLING_KERNEL_H_
