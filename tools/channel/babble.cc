#include "tools/channel/babble.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "base/logging.h"
#include "tools/channel/channel_constants.h"
#include "tools/channel/random.h"

namespace vesk_channel {
namespace {

// Average formant frequencies (Hz) of ten vowels of adult male speakers;
// higher voices scale them up by up to 18 %.
constexpr double kVowels[][3] = {
    {730, 1090, 2440}, {270, 2290, 3010}, {530, 1840, 2480}, {660, 1720, 2410}, {300, 870, 2240},
    {570, 840, 2410},  {440, 1020, 2240}, {490, 1350, 1690}, {390, 1990, 2550}, {520, 1190, 2390}};
constexpr int kNumVowels = sizeof(kVowels) / sizeof(kVowels[0]);
constexpr double kBandwidths[3] = {80.0, 100.0, 140.0};  // Hz
constexpr double kGlottalCorner = 150.0;                 // Hz, two poles: -12 dB/octave above
constexpr int kControlPeriod = 32;                       // samples between control updates
constexpr double kFormantGlide = 0.03;                   // s, time constant
constexpr double kPitchGlide = 0.06;                     // s, time constant

// One synthetic voice.
class Talker {
 public:
  Talker(int rate, uint64_t seed) : rate_(rate), random_(seed) {
    base_pitch_ = 100.0 + 120.0 * random_.Uniform();
    formant_scale_ = 1.0 + 0.18 * (base_pitch_ - 100.0) / 120.0;
    pitch_ = pitch_target_ = base_pitch_;
    for (int k = 0; k < 3; ++k) {
      formants_[k] = formant_targets_[k] = kVowels[0][k] * formant_scale_;
      radii_[k] = std::exp(-kPi * kBandwidths[k] / rate_);
    }
    // Start silent for up to a second so that talkers are out of step.
    segment_length_ = static_cast<int64_t>(random_.Uniform() * rate_);
    syllables_left_ = 4 + random_.UniformInt(9);
    glottal_coefficient_ = 1.0 - std::exp(-2.0 * kPi * kGlottalCorner / rate_);
    formant_glide_ = 1.0 - std::exp(-kControlPeriod / (kFormantGlide * rate_));
    pitch_glide_ = 1.0 - std::exp(-kControlPeriod / (kPitchGlide * rate_));
    // Aspiration noise 20 dB below the voiced excitation, whose power per
    // sample is pulse_gain² × pitch / rate = 100 / rate.
    noise_amplitude_ = std::sqrt(12.0 * 0.01 * 100.0 / rate_);
  }

  // Adds the next `count` samples of this voice to `output`.
  void AddTo(float* output, int64_t count) {
    for (int64_t done = 0; done < count; done += kControlPeriod) {
      UpdateControls();
      Run(output + done, std::min<int64_t>(kControlPeriod, count - done));
    }
  }

 private:
  // Up to kControlPeriod samples with fixed controls; the filter states live
  // in locals (registers) meanwhile.
  void Run(float* output, int64_t count) {
    const double step = pitch_ / rate_, glottal = glottal_coefficient_;
    const double excitation_gain = envelope_, pulse = pulse_gain_, noise = noise_amplitude_;
    const double a0 = a_[0], b0 = b_[0], c0 = c_[0], a1 = a_[1], b1 = b_[1], c1 = c_[1];
    const double a2 = a_[2], b2 = b_[2], c2 = c_[2];
    double phase = phase_, g0 = glottal_[0], g1 = glottal_[1];
    double y0 = state_[0][0], z0 = state_[0][1], y1 = state_[1][0], z1 = state_[1][1];
    double y2 = state_[2][0], z2 = state_[2][1];
    for (int64_t i = 0; i < count; ++i) {
      if (segment_position_ >= segment_length_) NextSegment();
      ++segment_position_;
      phase += step;
      double excitation = noise * (random_.Uniform() - 0.5);
      if (phase >= 1.0) {
        phase -= 1.0;
        excitation += pulse;
      }
      g0 += glottal * (excitation_gain * excitation - g0);
      const double previous = g1;
      g1 += glottal * (g0 - g1);
      const double x = g1 - previous;  // lip radiation: +6 dB/octave
      // Resonators; each sum starts with its own recursion term, which
      // keeps the per-sample dependency chain short.
      double out = b0 * y0 + (a0 * x + c0 * z0);
      z0 = y0;
      y0 = out;
      out = b1 * y1 + (a1 * y0 + c1 * z1);
      z1 = y1;
      y1 = out;
      out = b2 * y2 + (a2 * y1 + c2 * z2);
      z2 = y2;
      y2 = out;
      output[i] += static_cast<float>(y2);
    }
    phase_ = phase;
    glottal_[0] = g0;
    glottal_[1] = g1;
    state_[0][0] = y0, state_[0][1] = z0, state_[1][0] = y1, state_[1][1] = z1;
    state_[2][0] = y2, state_[2][1] = z2;
  }

  void NextSegment() {
    segment_position_ = 0;
    if (syllables_left_ > 0) {
      --syllables_left_;
      in_syllable_ = true;
      segment_length_ = std::lround(rate_ / (3.0 + 3.0 * random_.Uniform()));
      syllable_amplitude_ = 0.5 + 0.5 * random_.Uniform();
      const double* vowel = kVowels[random_.UniformInt(kNumVowels)];
      for (int k = 0; k < 3; ++k) formant_targets_[k] = vowel[k] * formant_scale_;
      pitch_target_ =
          std::clamp(base_pitch_ * std::exp2(0.4 * random_.Uniform() - 0.2), 90.0, 250.0);
    } else {
      in_syllable_ = false;
      segment_length_ = std::lround(rate_ * (0.15 + 0.45 * random_.Uniform()));
      syllables_left_ = 4 + random_.UniformInt(9);
    }
  }

  void UpdateControls() {
    const double s = std::sin(kPi * segment_position_ / std::max<int64_t>(1, segment_length_));
    envelope_ = in_syllable_ ? syllable_amplitude_ * s * s : 0.0;
    pitch_ += pitch_glide_ * (pitch_target_ - pitch_);
    // Equal voiced power whatever the pitch: pulses come pitch_ times a
    // second.
    pulse_gain_ = std::sqrt(100.0 / pitch_);
    for (int k = 0; k < 3; ++k) {
      formants_[k] += formant_glide_ * (formant_targets_[k] - formants_[k]);
      // Two-pole resonator with unit gain at DC.
      b_[k] = 2.0 * radii_[k] * std::cos(2.0 * kPi * formants_[k] / rate_);
      c_[k] = -radii_[k] * radii_[k];
      a_[k] = 1.0 - b_[k] - c_[k];
    }
  }

  const double rate_;
  Random random_;
  double base_pitch_ = 0.0;     // Hz
  double formant_scale_ = 1.0;  // × the male vowel formants
  double pitch_ = 0.0, pitch_target_ = 0.0;
  double formants_[3] = {}, formant_targets_[3] = {}, radii_[3] = {};
  int64_t segment_position_ = 0, segment_length_ = 0;
  int syllables_left_ = 0;
  bool in_syllable_ = false;
  double syllable_amplitude_ = 0.0;
  double envelope_ = 0.0;
  double pulse_gain_ = 1.0;
  double noise_amplitude_ = 0.0;
  double phase_ = 0.0;
  double glottal_coefficient_ = 0.0, formant_glide_ = 0.0, pitch_glide_ = 0.0;
  double glottal_[2] = {};
  double a_[3] = {}, b_[3] = {}, c_[3] = {};
  double state_[3][2] = {};  // last and second-to-last output of each resonator
};

}  // namespace

std::vector<float> MakeBabbleSamples(int64_t num_samples, int rate, int talkers, uint64_t seed) {
  CHECK(num_samples >= 0);
  CHECK(rate >= 8000);
  CHECK(talkers > 0);
  std::vector<float> output(static_cast<size_t>(num_samples), 0.0f);
  for (int t = 0; t < talkers; ++t) {
    Talker(rate, DeriveSeed(seed, static_cast<uint64_t>(t))).AddTo(output.data(), num_samples);
  }
  double energy = 0.0;
  for (float v : output) energy += static_cast<double>(v) * v;
  if (energy > 0.0) {
    const float scale = static_cast<float>(std::sqrt(static_cast<double>(num_samples) / energy));
    for (float& v : output) v *= scale;
  }
  return output;
}

std::vector<float> MakeBabble(double seconds, int rate, int talkers, uint64_t seed) {
  CHECK(seconds >= 0.0);
  return MakeBabbleSamples(std::llround(seconds * rate), rate, talkers, seed);
}

}  // namespace vesk_channel
