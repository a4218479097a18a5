// Small signal helpers of the DSSS decoder and its acquisition scorer:
// frequency-offset grids, a complex low-pass design, phasor matrices, the
// best row of a matrix-vector product and circular padding.
//
// All functions are stateless and thread-safe; each allocates its result.

#ifndef AUDIO_VESKNET_VESKNET_UTIL_H_
#define AUDIO_VESKNET_VESKNET_UTIL_H_

#include <complex>
#include <cstdint>
#include <utility>
#include <vector>

#include "audio/dsp/matrix.h"

namespace audio_vesknet {

// Fills `frequencies` with the 2n + 1 offsets k × frequency_step,
// k = −n .. n, in increasing order (0 in the middle), where
// n = round(max_offset / frequency_step) with halves rounded away from zero.
// Units are the caller's (typically Hz). A negative n (max_offset <=
// −frequency_step / 2) gives no offsets. Fatal checks: frequency_step > 0, frequencies not null.
void MakeFrequencyOffsets(float frequency_step, float max_offset, std::vector<float>* frequencies);

// Designs a complex low-pass FIR filter of `num_taps` taps. The frequency
// response is set on a 1024-point grid of normalised frequencies
// f = k / 1024, k = −511 .. 512 (cycles per sample): 0 below −cutoff, 1 from
// −cutoff up to e = cutoff + 0.5 / sharpness, then a quarter-cosine taper that
// reaches 0 at f = 0.5. The response is deliberately asymmetric (abrupt on the
// negative side). Its inverse FFT (unscaled) is windowed by the cosine
// cos(jπ / (2 × half + 2)), j = −half .. half with half = (num_taps − 1) / 2,
// and centred, so taps[half] is the response's zero-lag value. An even
// num_taps leaves its last tap 0; num_taps < 1 gives no taps.
std::vector<std::complex<float>> MakeComplexLowpassFilter(int32_t num_taps, float cutoff,
                                                          float sharpness);

// Resizes `phasor_matrix` to frequencies.size() rows × num_samples columns
// and sets row i to 1, z, z², ..., z^(num_samples − 1) with
// z = exp(j × frequencies[i] × phase_step). The caller folds 2π and the
// sample period into phase_step (radians per sample per frequency unit).
// Powers are accumulated in double precision, stored as complex float.
// Fatal checks: phasor_matrix not null; the matrix size fits in int32.
void MakePhasorMatrix(double phase_step, const std::vector<float>& frequencies, int32_t num_samples,
                      audio_dsp::MatrixXcf* phasor_matrix);

// Computes y = filter_matrix × signal and returns the index of the entry with
// the largest squared magnitude, and that squared magnitude. The first of
// equal maxima wins; an all-zero product (or a matrix without rows) gives
// (0, 0). Fatal check: filter_matrix.cols() == signal.size().
std::pair<int32_t, float> BestFilterRow(const audio_dsp::MatrixXcf& filter_matrix,
                                        const std::vector<std::complex<float>>& signal);

// Extends `signal` periodically: `padded_signal` gets
// pad_before + n + pad_after values (n = signal.size()), value i being
// signal[(i − pad_before) mod n] with a non-negative remainder. Negative pads
// trim instead; a negative total gives an empty result. `padded_signal` may
// be &signal. Fatal checks: signal not empty, padded_signal not null.
void CircularPad(const std::vector<float>& signal, int32_t pad_before, int32_t pad_after,
                 std::vector<float>* padded_signal);

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_VESKNET_UTIL_H_
