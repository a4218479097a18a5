// Whole-buffer signal operations done in the frequency domain: a brick-wall
// band-pass by zeroing FFT bins, its high-pass special case, the bin masking on
// its own, and a resampler that changes a buffer's length by truncating or
// zero-padding its spectrum.
//
// Each call builds FFT transformers for its buffer length and transforms the
// whole buffer at once (any length; lengths with large prime factors take the
// Bluestein path rather than being padded, so output lengths are exact). They
// are meant for whole encoded tokens of tens of thousands of samples, not for
// streaming. Every function allocates; all are stateless and thread-safe.

#ifndef AUDIO_DSP_KISS_FFT_UTIL_H_
#define AUDIO_DSP_KISS_FFT_UTIL_H_

#include <complex>
#include <memory>
#include <vector>

#include "audio/dsp/kiss_fft.h"

namespace audio_dsp {

// Keeps the frequencies in [low_band_edge, high_band_edge] (Hz) of the real
// signal `input` sampled at `sample_rate` (Hz) and removes all others: bin k
// of the N-point spectrum (frequency k × sample_rate / N) survives exactly
// when its frequency lies in the band; there is no transition band.
// `output` gets input.size() samples and may be &input.
// Fatal checks: input not empty, 0 <= low_band_edge <= high_band_edge, and
// high_band_edge below the Nyquist frequency plus half a bin
// (sample_rate × (0.5 + 0.5 / N)), so high_band_edge = sample_rate / 2 is
// always accepted.
void BandPassFilter(const std::vector<float>& input, float low_band_edge, float high_band_edge,
                    float sample_rate, std::vector<float>* output);

// BandPassFilter with high_band_edge = 0.5 × sample_rate: keeps the bins at
// and above low_band_edge (Hz). `output` may be &input.
void HighPassFilter(const std::vector<float>& input, float low_band_edge, float sample_rate,
                    std::vector<float>* output);

// Masks a half spectrum: bin k (frequency k × bin_width, bin_width in Hz per
// bin, > 0) is copied when low_band_edge <= k × bin_width <= high_band_edge
// and set to zero otherwise. `output_spectrum` gets as many bins as
// `input_spectrum` and may be &input_spectrum.
// Fatal checks: input not empty, output not null, 0 <= low_band_edge <=
// high_band_edge <= bin_width × input_spectrum.size().
void BandPassSpectrum(const std::vector<std::complex<float>>& input_spectrum, float low_band_edge,
                      float high_band_edge, float bin_width,
                      std::vector<std::complex<float>>* output_spectrum);

// Resamples the whole buffer `input` from input_sample_rate to
// output_sample_rate (Hz, both > 0) by Fourier interpolation: the output has
// M = round(N × output_sample_rate / input_sample_rate) samples (computed in
// single precision, halves rounded away from zero) and its spectrum is the
// input spectrum zero-padded (growing; an even N's Nyquist bin is split in
// half) or truncated at the new Nyquist frequency (shrinking; an ideal
// low-pass without any transition band). Amplitudes of the kept frequencies
// are preserved. Equal lengths copy the input; an empty input, or one that
// would shrink to M = 0, gives an empty output. `output` may be &input.
void FftResample(const std::vector<float>& input, float input_sample_rate, float output_sample_rate,
                 std::vector<float>* output);

// FftResample for buffers of one length, planned once: the same output
// (within float rounding), optionally with a band kept first as
// BandPassFilter keeps it, for a buffer that is resampled again and again
// (every token of an encoder). Instead of full transforms of both lengths,
// which for lengths with large prime factors cost two Bluestein transforms
// each, it computes with two chirp-z transforms only the bins the output
// needs: the input's half spectrum up to the lower of the two Nyquist
// frequencies, and the real output from that half spectrum. Both run on one
// kissfft transform of a fast size (about 1.6 N) made at construction, with
// their chirps and kernel spectra; each call allocates two work buffers of
// that size. Const methods, thread-safe.
class FftResampler {
 public:
  // Buffers of input_size (> 0) samples at input_sample_rate, to
  // output_sample_rate (Hz, both > 0; fatal checks): output_size() =
  // round(input_size x output rate / input rate) as FftResample computes it.
  FftResampler(int input_size, float input_sample_rate, float output_sample_rate);
  ~FftResampler();

  int input_size() const { return input_size_; }
  int output_size() const { return output_size_; }

  // `input` holds input_size() samples; `output` (not &input) gets
  // output_size() samples.
  void Resample(const std::vector<float>& input, std::vector<float>* output) const;
  // The same after keeping only the input frequencies in [low_band_edge,
  // high_band_edge] (Hz), bin by bin as BandPassFilter does (fatal checks as
  // there).
  void BandPassAndResample(const std::vector<float>& input, float low_band_edge,
                           float high_band_edge, std::vector<float>* output) const;

 private:
  // Bins [first_bin, end_bin) of the input's half spectrum kept.
  void Run(const std::vector<float>& input, int first_bin, int end_bin,
           std::vector<float>* output) const;

  int input_size_;
  int output_size_;
  float input_sample_rate_;
  int num_bins_;  // Half-spectrum bins carried over: min(N, M) / 2 + 1.
  std::unique_ptr<ComplexFFTTransformer> inner_;
  // Forward (input -> bins): the input's chirp, the kernel spectrum, and the
  // bins' chirp with the inner inverse's 1 / L folded in.
  std::vector<std::complex<float>> forward_input_chirp_;
  std::vector<std::complex<float>> forward_kernel_spectrum_;
  std::vector<std::complex<float>> forward_bin_chirp_;
  // Inverse (bins -> output), likewise, the output's chirp also holding the
  // final 1 / N.
  std::vector<std::complex<float>> inverse_bin_chirp_;
  std::vector<std::complex<float>> inverse_kernel_spectrum_;
  std::vector<std::complex<float>> inverse_output_chirp_;
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_KISS_FFT_UTIL_H_
