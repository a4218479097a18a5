// Synthetic music: an interferer of sustained harmonic tones, as a radio or
// an instrument in the room plays them, made without recordings.
//
// The music is a sequence of chords that abut. Each chord lasts a random
// time in [min_chord_s, max_chord_s] and sounds 3 or 4 equal-tempered notes
// (A4 = 440 Hz) built on a random root: a major, minor or suspended triad, a
// seventh chord, or a root with its fifth and octave. Every note is a
// harmonic tone: partials k × f for k = 1 ... harmonics, of amplitude 1 / k
// and random phase; partials at or above half the rate are left out, so
// nothing aliases. A chord rises and falls over 5 ms at its ends (no clicks),
// is steady in between, and is scaled so that its largest |sample| is
// exactly `peak`.
//
// Equal temperament is what makes music hostile to a multi-tone modem: its
// notes and their harmonics fall on the same pitches as tones chosen from a
// musical scale.
//
// Deterministic for a given seed (the generator of channel_simulator.h).
// Stateless and thread-safe.

#ifndef TOOLS_CHANNEL_MUSIC_H_
#define TOOLS_CHANNEL_MUSIC_H_

#include <cstdint>
#include <vector>

namespace vesk_channel {

struct MusicParams {
  double min_chord_s = 0.2;  // s, > 0: the shortest chord.
  double max_chord_s = 0.6;  // s, >= min_chord_s: the longest.
  // Range of the chord roots as note numbers (69 is A4 = 440 Hz, one per
  // semitone), lowest_root <= highest_root; the other notes of a chord lie
  // up to 12 semitones above its root, below half the rate.
  int lowest_root = 45;   // A2, 110 Hz.
  int highest_root = 72;  // C5, 523.25 Hz.
  int harmonics = 8;      // Partials per note, >= 1.
  double peak = 1.0;      // (0, 1]: largest |sample| of every chord.
};

// One chord as played.
struct Chord {
  int64_t start = 0;             // First sample.
  int64_t length = 0;            // Samples, >= 1.
  std::vector<double> notes_hz;  // Fundamentals, ascending.
};

// The frequency of note number `note`: 440 × 2^((note - 69) / 12) Hz.
double NoteHz(int note);

// `num_samples` (>= 0) samples of music at `rate` Hz (> 0), in -peak ...
// peak. When `chords` is not null it receives the chords played, in order
// (the last one cut short by the end of the buffer). Fatal checks on the
// parameters' ranges.
std::vector<float> MakeMusic(int64_t num_samples, int rate, const MusicParams& params,
                             uint64_t seed, std::vector<Chord>* chords = nullptr);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_MUSIC_H_
