// Polyphase FIR resampler for a rational rate ratio.

#ifndef AUDIO_DSP_RATIONAL_FACTOR_RESAMPLER_H_
#define AUDIO_DSP_RATIONAL_FACTOR_RESAMPLER_H_

#include <complex>
#include <vector>

#include "audio/dsp/resampler.h"
#include "audio/dsp/resampling_kernel.h"
#include "audio/dsp/simd.h"

namespace audio_dsp {

// Converts a stream from kernel.input_sample_rate() to
// kernel.output_sample_rate(), the ratio input / output being approximated by
// a fraction p / q with q <= max_denominator. The kernel is tabulated once at
// construction into q polyphase filters of num_taps() = 2 * radius() + 1 taps
// (radius() = ceil(kernel.radius()) input samples); each output then costs
// num_taps() multiply-adds, summed in single precision.
//
// Timing: output k is the band-limited input evaluated at input time k * p / q
// (in input samples, counted from the first sample after construction or
// Reset()). The filter is centred on that instant, so there is no delay, but
// the first outputs ramp in (the stream is taken as zero before its start)
// and an output is produced only once radius() input samples past its instant
// have arrived; Flush() releases the remaining ones.
//
// Blocks may have any size, including 0; the concatenated output does not
// depend on how the input stream is cut into blocks.
//
// Real streams: where a call yields 4 L outputs or more (L the smallest
// multiple of q that is at least 32, with L <= 1024 and tables of at most
// 16384 four-lane taps and 4096 four-lane input samples), they are computed
// four at a time, outputs k, k + L, k + 2L and k + 3L side by side: these
// share a phase, so one tap vector serves all four lanes, and each lane sums
// exactly as the one-output code does (the output does not depend on which
// path computed it). 48 kHz to 44.1 kHz: q = 147, groups of 588 outputs.
//
// Outputs outside those groups are computed two (complex) or four (real)
// neighbours at a time, in eight-lane vectors on x86 processors with AVX
// (chosen at run time; with the same result, lane for lane).
//
// Allocation happens at construction; ProcessSamples() allocates only when
// the output vector has to grow. Instantiated for T = float and
// T = std::complex<float> (real taps times T). Not thread-safe.
template <typename T>
class RationalFactorResampler : public Resampler<T> {
 public:
  // `kernel` is read during construction only. The resampler is invalid
  // (check Valid()) when max_denominator < 1, when the kernel is invalid, or
  // when the rate ratio is unusable (p / q of 0, a ratio of 2^16 or more, or a
  // kernel too narrow for the decimation: p / q > 2 * radius()).
  // `wide_vectors` false keeps to four-lane vectors even where AVX is
  // available (for comparisons).
  RationalFactorResampler(const ResamplingKernel& kernel, int max_denominator,
                          bool wide_vectors = true);
  RationalFactorResampler(const RationalFactorResampler&) = delete;
  RationalFactorResampler& operator=(const RationalFactorResampler&) = delete;
  ~RationalFactorResampler() override = default;

  // Phase 0 and radius() zeros of history.
  void Reset() override;
  bool Valid() const override { return valid_; }
  // Replaces *output with every sample whose window is now complete; keeps at
  // most num_taps() - 1 input samples for the next call. An invalid resampler
  // produces nothing.
  void ProcessSamples(const std::vector<T>& input, std::vector<T>* output) override;
  // Processes 2 * radius() zeros: *output receives the samples held back at
  // the end of the stream (instants up to radius() samples past its last
  // input sample). The state is then as after processing those zeros.
  void Flush(std::vector<T>* output) override;

  int numerator() const { return numerator_; }      // p, input samples per q outputs
  int denominator() const { return denominator_; }  // q, number of filter phases
  int radius() const { return radius_; }            // input samples
  int num_taps() const { return num_taps_; }
  // Whether neighbouring outputs are computed in eight-lane vectors.
  bool wide() const { return wide_; }

 private:
  bool valid_ = false;
  int numerator_ = 0;
  int denominator_ = 0;
  int step_ = 0;             // p / q
  int phase_increment_ = 0;  // p mod q
  int radius_ = 0;
  int num_taps_ = 0;
  bool wide_ = false;
  // q filters of num_taps_ taps, phase after phase; for complex T every tap
  // is stored twice in a row to match the interleaved samples.
  std::vector<float> filters_;
  // Unconsumed input (at most num_taps_ - 1 samples between calls). During a
  // call the start of the new input is appended so that the windows that
  // straddle the old and the new samples read contiguous memory; capacity for
  // both is reserved at construction.
  std::vector<T> buffer_;
  int phase_ = 0;  // 0 to q - 1
  std::vector<T> flush_zeros_;
  // The four-lane path (real T only; empty and lane_run_ 0 otherwise):
  // lane_run_ = L outputs per lane, every tap of filters_ repeated in all four
  // lanes, and room for the four interleaved input stretches of one group of
  // 4 L outputs (element u: input u, u + D, u + 2D, u + 3D with D = L p / q).
  int lane_run_ = 0;
  std::vector<Float4> lane_taps_;
  std::vector<Float4> lane_input_;

  // Computes the group of 4 lane_run_ outputs starting at `out` whose first
  // window starts at `x` with phase `phase`.
  void ProcessLaneGroup(const float* x, int phase, float* out);
};

extern template class RationalFactorResampler<float>;
extern template class RationalFactorResampler<std::complex<float>>;

}  // namespace audio_dsp

#endif  // AUDIO_DSP_RATIONAL_FACTOR_RESAMPLER_H_
