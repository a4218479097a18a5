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
#include <vector>

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

}  // namespace audio_dsp

#endif  // AUDIO_DSP_KISS_FFT_UTIL_H_
