// Complex and real discrete Fourier transforms of any positive size.
//
// Sizes whose odd part is 3^a × 5^b × (a remainder below 26) go straight to
// kissfft; every other size goes through Bluestein's chirp-z algorithm on a
// kissfft transform of the next fast size at or above 2N − 1, so awkward frame
// lengths such as 1905 = 3 × 5 × 127 are transformed exactly, without padding.
// Real transforms of even fast sizes use kissfft's real transform; odd or slow
// real sizes run through a complex transform of the same size.
//
// Both directions are unnormalised:
//   forward  X[k] = Σ_j x[j] e^(−2πijk/N)
//   inverse  x[j] = Σ_k X[k] e^(+2πijk/N)
// A transformer built with scale_inverse = true multiplies every inverse
// output by 1.0f / N, so that forward followed by inverse is the identity.
// Real transforms exchange N real samples with the N / 2 + 1 bins 0 .. N / 2
// of the (Hermitian) spectrum; the imaginary parts of bin 0 and, for even N,
// of bin N / 2 are ignored by the inverse.
//
// A transformer is built for one size; all configurations and, for the fast
// paths, all scratch memory are allocated at construction, so Forward and
// Inverse of a fast size never allocate (the vector forms only resize their
// output). Slow sizes allocate two temporary buffers of about 2N complex
// values on each call.
//
// Aliasing: the complex transforms accept input == output (in place), but for
// fast sizes kissfft then allocates a temporary buffer on every call; use
// separate buffers on hot paths. Partially overlapping buffers are not
// allowed. Real transforms need input and output to be separate buffers.
//
// Thread-safety: Forward and Inverse are const but use scratch memory held by
// the transformer (kissfft's own real configurations included), so one
// instance serves one thread at a time. Separate instances are independent.

#ifndef AUDIO_DSP_KISS_FFT_H_
#define AUDIO_DSP_KISS_FFT_H_

#include <complex>
#include <memory>
#include <vector>

namespace audio_dsp {

// Whether kissfft transforms `size` points directly: after dividing out the
// factors 2, 3 and 5, what remains is below 26 (so 1, 7, 11, 13, 17, 19 or
// 23). False for sizes below 1.
bool IsFastFftSize(int size);

class ComplexFFTTransformerImpl;
class RealFFTTransformerImpl;

class ComplexFFTTransformer {
 public:
  // `size` > 0 points; fatal check otherwise.
  ComplexFFTTransformer(int size, bool scale_inverse);
  ~ComplexFFTTransformer();
  ComplexFFTTransformer(ComplexFFTTransformer&&) noexcept;
  ComplexFFTTransformer& operator=(ComplexFFTTransformer&&) noexcept;
  ComplexFFTTransformer(const ComplexFFTTransformer&) = delete;
  ComplexFFTTransformer& operator=(const ComplexFFTTransformer&) = delete;

  int GetSize() const;

  // `input` must hold GetSize() values; `output` is resized to GetSize().
  // `output` may be &input.
  void Forward(const std::vector<std::complex<float>>& input,
               std::vector<std::complex<float>>* output) const;
  void Inverse(const std::vector<std::complex<float>>& input,
               std::vector<std::complex<float>>* output) const;

  // Both pointers address GetSize() values; they may be equal.
  void Forward(const std::complex<float>* input, std::complex<float>* output) const;
  void Inverse(const std::complex<float>* input, std::complex<float>* output) const;

 private:
  std::unique_ptr<ComplexFFTTransformerImpl> impl_;
  bool scale_inverse_;
};

class RealFFTTransformer {
 public:
  // `size` > 0 points; fatal check otherwise. Odd sizes are allowed.
  RealFFTTransformer(int size, bool scale_inverse);
  ~RealFFTTransformer();
  RealFFTTransformer(RealFFTTransformer&&) noexcept;
  RealFFTTransformer& operator=(RealFFTTransformer&&) noexcept;
  RealFFTTransformer(const RealFFTTransformer&) = delete;
  RealFFTTransformer& operator=(const RealFFTTransformer&) = delete;

  // N, the number of real samples.
  int GetSize() const;
  // N / 2 + 1, the number of spectrum bins.
  int GetTransformedSize() const;

  // `input` holds GetSize() samples; `output` is resized to
  // GetTransformedSize() bins.
  void Forward(const std::vector<float>& input, std::vector<std::complex<float>>* output) const;
  // `input` holds GetTransformedSize() bins; `output` is resized to GetSize().
  void Inverse(const std::vector<std::complex<float>>& input, std::vector<float>* output) const;

  // Pointer forms: GetSize() samples and GetTransformedSize() bins; the two
  // buffers must not overlap.
  void Forward(const float* input, std::complex<float>* output) const;
  void Inverse(const std::complex<float>* input, float* output) const;

 private:
  std::unique_ptr<RealFFTTransformerImpl> impl_;
  bool scale_inverse_;
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_KISS_FFT_H_
