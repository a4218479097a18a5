// Gamma filter: a cascade of identical one-pole low-pass stages. Its impulse
// response is a gamma-shaped bump whose width and delay grow with the decay
// and the number of stages; used to smooth envelopes and noise estimates.
//
// Each stage computes y[n] = y[n - 1] + (1 - a) * (x[n] - y[n - 1]), so a
// constant input passes at unit gain. State is carried between Step calls.
// Thread-compatible: one filter per thread, or external locking.

#ifndef AUDIO_DSP_GAMMA_FILTER_H_
#define AUDIO_DSP_GAMMA_FILTER_H_

#include <cmath>
#include <vector>

#include "base/logging.h"

namespace audio_dsp {

class GammaFilter {
 public:
  // sample_rate: Hz, > 0; kept only so that callers can express times.
  // order: number of stages, >= 1. decay: the pole a of every stage, [0, 1).
  // A non-positive sample rate or an order below 1 is fatal.
  GammaFilter(double sample_rate, int order, double decay)
      : sample_rate_(sample_rate), order_(order), decay_(decay), gain_(1.0 - decay) {
    CHECK(sample_rate > 0.0);
    CHECK(order >= 1);
    state_.assign(order, 0.0f);
  }

  // Feeds one sample and returns the output of the last stage. Each stage is
  // computed in double precision and stored as float, and the next stage
  // reads the stored value: (in - state) x gain + state, rounded to float.
  float Step(float x) {
    float in = x;
    for (float& stage : state_) {
      stage = StageStep(in, stage, gain_);
      in = stage;
    }
    return in;
  }

  // Step over input[0 .. count) in order, writing output i to output[i]
  // unless output is null. output may be input, or lie before it (output <=
  // input): each input is read before the output at or after it is written.
  // Filters of up to four stages keep their state in registers meanwhile;
  // the results equal Step's.
  void Process(const float* input, int count, float* output) {
    switch (order_) {
      case 1:
        return ProcessStages<1>(input, count, output);
      case 2:
        return ProcessStages<2>(input, count, output);
      case 3:
        return ProcessStages<3>(input, count, output);
      case 4:
        return ProcessStages<4>(input, count, output);
    }
    for (int i = 0; i < count; ++i) {
      const float y = Step(input[i]);
      if (output != nullptr) output[i] = y;
    }
  }

  // Group delay in samples: the mean of the impulse response,
  // order * a / (1 - a), rounded half away from zero.
  int Delay() const { return static_cast<int>(std::lround(order_ * decay_ / (1.0 - decay_))); }

  double decay() const { return decay_; }
  int order() const { return order_; }
  double sample_rate() const { return sample_rate_; }

  // Clears the state of every stage, as after construction.
  void Reset() { state_.assign(state_.size(), 0.0f); }
  // Sets every stage to `value`: the state after a long steady input of
  // `value`, so that a stream starting near it does not ramp up from zero.
  void Reset(float value) { state_.assign(state_.size(), value); }

 private:
  // One stage: (in - state) x gain + state in double, rounded to float.
  static float StageStep(float in, float state, double gain) {
    const double previous = state;
    return static_cast<float>((static_cast<double>(in) - previous) * gain + previous);
  }

  template <int kOrder>
  void ProcessStages(const float* input, int count, float* output) {
    float stages[kOrder];
    for (int k = 0; k < kOrder; ++k) stages[k] = state_[k];
    const double gain = gain_;
    for (int i = 0; i < count; ++i) {
      float in = input[i];
      for (int k = 0; k < kOrder; ++k) {
        stages[k] = StageStep(in, stages[k], gain);
        in = stages[k];
      }
      if (output != nullptr) output[i] = in;
    }
    for (int k = 0; k < kOrder; ++k) state_[k] = stages[k];
  }

  double sample_rate_;
  int order_;
  double decay_;
  double gain_;
  std::vector<float> state_;  // One value per stage.
};

// A GammaFilter whose impulse response has the standard deviation `stddev`
// (in samples). The response of n stages of decay a has variance
// n * a / (1 - a)^2; with v = stddev^2 / n this gives
// a = (1 - sqrt(4v + 1)) / (2v) + 1. A stddev of 0 gives a = 0 (the limit),
// a filter that passes its input unchanged.
inline GammaFilter GammaFilterFromStddev(double sample_rate, int order, double stddev) {
  const double v = stddev * stddev / order;
  const double decay = v > 0.0 ? (1.0 - std::sqrt(4.0 * v + 1.0)) / (2.0 * v) + 1.0 : 0.0;
  return GammaFilter(sample_rate, order, decay);
}

}  // namespace audio_dsp

#endif  // AUDIO_DSP_GAMMA_FILTER_H_
