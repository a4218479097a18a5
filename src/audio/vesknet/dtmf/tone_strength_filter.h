// Measures how strongly one tone frequency is present in a real audio
// stream: one strength value per decimation_factor input samples.
//
// The input is mixed down by the tone frequency with a table oscillator
// (4096 entries per cycle, 32-bit phase), summed over each group of
// decimation_factor samples (integrate and dump: sums, not means), smoothed
// by two cascaded one-pole low-pass stages at the decimated rate, and
// squared: the strength is a power |I|^2 + |Q|^2 in (input units x
// decimation_factor)^2. A steady tone of amplitude a at the filter frequency
// settles near (a x decimation_factor / 2)^2. The oscillator runs on across
// calls, so consecutive blocks line up in phase.
//
// One table of 5120 floats is shared, read-only, by every filter. A filter
// holds per-stream state: one thread at a time per filter.

#ifndef AUDIO_VESKNET_DTMF_TONE_STRENGTH_FILTER_H_
#define AUDIO_VESKNET_DTMF_TONE_STRENGTH_FILTER_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace audio_vesknet {

class ToneStrengthFilter {
 public:
  // sample_rate and frequency in Hz; bandwidth in Hz is the cutoff of the
  // low-pass (the largest distance from `frequency` that still counts);
  // decimation_factor >= 1 (fatal otherwise).
  ToneStrengthFilter(float sample_rate, float frequency, float bandwidth, int decimation_factor);

  // Replaces *output_samples with one strength per group of
  // decimation_factor samples completed during this call; a partial group
  // is carried over to the next call. No allocation when *output_samples
  // already has room for input.size() / decimation_factor + 1 values.
  void Process(const std::vector<float>& input, std::vector<float>* output_samples);

  // Process for each of `count` filters over the same input, writing filter
  // i's strengths to outputs[i]: exactly what calling each one's Process
  // gives. Filters that share their decimation factor and the position in
  // their group (filters reset together and fed alike) run side by side, up
  // to ten at a time (six on targets with eight vector registers), the sine
  // and cosine of two filters per vector; others run one after another.
  static void ProcessAll(ToneStrengthFilter* filters, int count, const std::vector<float>& input,
                         std::vector<float>* outputs);

  // Forgets the partial group and the low-pass state; the oscillator phase
  // runs on.
  void Reset();

  int decimation_factor() const { return decimation_factor_; }
  // Group delay of the two low-pass stages, in output samples.
  int delay() const { return delay_; }
  // Coefficient of each low-pass stage: y += (x - y) x gain.
  float gain() const { return gain_; }

 private:
  // ProcessAll for filters[0 .. lanes) in step, 2 * kPairs - 1 <= lanes <=
  // 2 * kPairs; sets *produced to the strengths written per filter.
  template <int kPairs>
  static void ProcessPairs(ToneStrengthFilter* filters, int lanes, const std::vector<float>& input,
                           std::vector<float>* outputs, size_t* produced);

  // Oscillator.
  const float* sine_table_;
  double sample_rate_;        // Hz.
  uint32_t phase_;            // Fraction of a cycle, 2^32 = one cycle.
  uint32_t phase_increment_;  // Per input sample.
  double frequency_;          // Hz.
  // Integrate and dump.
  float cosine_sum_;
  float sine_sum_;
  int32_t decimation_factor_;
  int32_t countdown_;  // Input samples until the next output.
  // Two-stage low-pass.
  int32_t delay_;
  float gain_;
  float i1_;
  float q1_;
  float i2_;
  float q2_;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_DTMF_TONE_STRENGTH_FILTER_H_
