#include "tools/channel/music.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <vector>

#include "base/logging.h"
#include "tools/channel/channel_simulator.h"

namespace vesk_channel {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr double kRampSeconds = 0.005;  // Rise and fall of each chord.

// Chord shapes: semitones above the root; -1 ends a shorter chord.
constexpr int kShapes[][4] = {
    {0, 4, 7, -1},  {0, 3, 7, -1}, {0, 5, 7, -1},  // major, minor, suspended
    {0, 4, 7, 10},  {0, 3, 7, 10}, {0, 4, 7, 11},  // dominant, minor, major seventh
    {0, 7, 12, -1},                                // fifth and octave
};
constexpr int kNumShapes = sizeof(kShapes) / sizeof(kShapes[0]);
constexpr int kHighestInterval = 12;  // Semitones, the largest in kShapes.

std::vector<double> DrawNotes(const MusicParams& params, Random* random) {
  const int root =
      params.lowest_root + random->UniformInt(params.highest_root - params.lowest_root + 1);
  std::vector<double> notes;
  for (const int interval : kShapes[random->UniformInt(kNumShapes)]) {
    if (interval >= 0) notes.push_back(NoteHz(root + interval));
  }
  return notes;
}

// Adds the chord's partials to `sum` (its length samples). A rotating
// phasor in double precision: its magnitude drifts by about 1e-16 per sample,
// nothing over a chord.
void AddPartials(const std::vector<double>& notes_hz, int rate, int harmonics, Random* random,
                 std::vector<double>* sum) {
  for (const double note : notes_hz) {
    for (int k = 1; k <= harmonics && k * note < 0.5 * rate; ++k) {
      std::complex<double> phasor = std::polar(1.0 / k, 2.0 * kPi * random->Uniform());
      const std::complex<double> step = std::polar(1.0, 2.0 * kPi * k * note / rate);
      for (double& value : *sum) {
        value += phasor.imag();
        phasor *= step;
      }
    }
  }
}

// Raised-cosine rise and fall over the ends of `chord`, each at most half of it.
void ApplyRamps(int rate, std::vector<double>* chord) {
  const int64_t size = static_cast<int64_t>(chord->size());
  const int64_t ramp = std::min<int64_t>(std::llround(kRampSeconds * rate), size / 2);
  for (int64_t i = 0; i < ramp; ++i) {
    const double gain = 0.5 - 0.5 * std::cos(kPi * (i + 0.5) / ramp);
    (*chord)[i] *= gain;
    (*chord)[size - 1 - i] *= gain;
  }
}

}  // namespace

double NoteHz(int note) { return 440.0 * std::exp2((note - 69) / 12.0); }

std::vector<float> MakeMusic(int64_t num_samples, int rate, const MusicParams& params,
                             uint64_t seed, std::vector<Chord>* chords) {
  CHECK(num_samples >= 0);
  CHECK(rate > 0);
  CHECK(params.min_chord_s > 0.0);
  CHECK(params.max_chord_s >= params.min_chord_s);
  CHECK(params.lowest_root <= params.highest_root);
  CHECK(NoteHz(params.highest_root + kHighestInterval) < 0.5 * rate);
  CHECK(params.harmonics >= 1);
  CHECK(params.peak > 0.0 && params.peak <= 1.0);
  if (chords != nullptr) chords->clear();
  Random random(seed);
  std::vector<float> output(static_cast<size_t>(num_samples));
  std::vector<double> chord;
  for (int64_t start = 0; start < num_samples;) {
    const double seconds =
        params.min_chord_s + (params.max_chord_s - params.min_chord_s) * random.Uniform();
    const int64_t length =
        std::min(std::max<int64_t>(1, std::llround(seconds * rate)), num_samples - start);
    const std::vector<double> notes = DrawNotes(params, &random);
    chord.assign(static_cast<size_t>(length), 0.0);
    AddPartials(notes, rate, params.harmonics, &random, &chord);
    ApplyRamps(rate, &chord);
    double largest = 0.0;
    for (const double value : chord) largest = std::max(largest, std::fabs(value));
    const double scale = largest > 0.0 ? params.peak / largest : 0.0;
    for (int64_t i = 0; i < length; ++i) output[start + i] = static_cast<float>(scale * chord[i]);
    if (chords != nullptr) chords->push_back({start, length, notes});
    start += length;
  }
  return output;
}

}  // namespace vesk_channel
