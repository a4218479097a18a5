#include "tools/channel/music.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <set>
#include <vector>

#include "audio/dsp/kiss_fft.h"
#include "gtest/gtest.h"

namespace vesk_channel {
namespace {

constexpr double kPi = 3.14159265358979323846;

// Hann window of `size` samples.
std::vector<double> Hann(int size) {
  std::vector<double> w(size);
  for (int i = 0; i < size; ++i) w[i] = 0.5 - 0.5 * std::cos(2 * kPi * i / size);
  return w;
}

// Amplitude of the sinusoid at `hz` in the `size` samples from `begin`,
// from one Hann-windowed DFT term computed directly.
double Amplitude(const std::vector<float>& x, int64_t begin, int size, double hz, int rate) {
  const std::vector<double> w = Hann(size);
  std::complex<double> sum = 0;
  for (int i = 0; i < size; ++i)
    sum += x[begin + i] * w[i] * std::polar(1.0, -2 * kPi * hz * i / rate);
  return 2 * std::abs(sum) / (0.5 * size);
}

TEST(MusicTest, ChordsAbutLastTheirDrawnTimeAndSoundEqualTemperedNotes) {
  const int rate = 8000;
  std::vector<Chord> chords;
  const std::vector<float> music = MakeMusic(60 * rate, rate, MusicParams(), 5, &chords);
  ASSERT_EQ(music.size(), 480000u);
  EXPECT_EQ(music, MakeMusic(60 * rate, rate, MusicParams(), 5));
  EXPECT_NE(music, MakeMusic(60 * rate, rate, MusicParams(), 6));
  EXPECT_DOUBLE_EQ(NoteHz(69), 440.0);
  EXPECT_NEAR(NoteHz(78), 739.989, 1e-3);  // F#5
  ASSERT_GE(chords.size(), 100u);
  int64_t next = 0;
  std::set<int> roots;
  for (size_t c = 0; c < chords.size(); ++c) {
    const Chord& chord = chords[c];
    EXPECT_EQ(chord.start, next);
    next = chord.start + chord.length;
    if (c + 1 < chords.size()) {
      EXPECT_GE(chord.length, 0.2 * rate);
      EXPECT_LE(chord.length, 0.6 * rate);
    }
    ASSERT_GE(chord.notes_hz.size(), 3u);
    ASSERT_LE(chord.notes_hz.size(), 4u);
    const double root = 69 + 12 * std::log2(chord.notes_hz[0] / 440);
    EXPECT_NEAR(root, std::round(root), 1e-9);
    EXPECT_GE(root, 45 - 1e-9);
    EXPECT_LE(root, 72 + 1e-9);
    roots.insert(static_cast<int>(std::lround(root)));
    for (size_t n = 1; n < chord.notes_hz.size(); ++n) {
      const double above = 12 * std::log2(chord.notes_hz[n] / chord.notes_hz[0]);
      EXPECT_NEAR(above, std::round(above), 1e-9);
      EXPECT_GE(above, 3 - 1e-9);
      EXPECT_LE(above, 12 + 1e-9);
      EXPECT_GT(chord.notes_hz[n], chord.notes_hz[n - 1]);
    }
  }
  EXPECT_EQ(next, 60 * rate);
  // Every root of the range, and none outside it (the checks above).
  EXPECT_EQ(roots.size(), 28u);
}

TEST(MusicTest, EveryChordPeaksAtTheLevelAndStartsAndEndsSilently) {
  const int rate = 44100;
  for (const double peak : {1.0, 0.25}) {
    MusicParams params;
    params.peak = peak;
    std::vector<Chord> chords;
    const std::vector<float> music = MakeMusic(5 * rate, rate, params, 9, &chords);
    for (const Chord& chord : chords) {
      float largest = 0;
      for (int64_t i = chord.start; i < chord.start + chord.length; ++i) {
        largest = std::max(largest, std::fabs(music[i]));
      }
      EXPECT_NEAR(largest, peak, 1e-6 * peak);
      EXPECT_LT(std::fabs(music[chord.start]), 1e-3 * peak);
      EXPECT_LT(std::fabs(music[chord.start + chord.length - 1]), 1e-3 * peak);
    }
  }
}

// In the steady middle of each chord: the spectrum holds the partials of its
// notes and nothing else (at 8 kHz the upper partials of every note lie above
// half the rate and must not alias), each fundamental carries a good share,
// and a triad's root has its second partial at half its amplitude.
TEST(MusicTest, SpectrumHoldsOnlyTheNotesPartialsBelowHalfTheRate) {
  for (const int rate : {8000, 48000}) {
    SCOPED_TRACE(rate);
    const int size = rate == 8000 ? 1024 : 8192;  // 7.8 / 5.9 Hz bins, under 0.2 s
    std::vector<Chord> chords;
    const std::vector<float> music = MakeMusic(20 * rate, rate, MusicParams(), 21, &chords);
    const audio_dsp::RealFFTTransformer fft(size, false);
    const std::vector<double> w = Hann(size);
    int triads = 0;
    for (const Chord& chord : chords) {
      if (chord.length < size + rate / 50) continue;
      const int64_t begin = chord.start + (chord.length - size) / 2;
      std::vector<float> frame(size);
      for (int i = 0; i < size; ++i) frame[i] = static_cast<float>(music[begin + i] * w[i]);
      std::vector<std::complex<float>> spectrum;
      fft.Forward(frame, &spectrum);
      std::vector<bool> expected(spectrum.size(), false);
      for (const double note : chord.notes_hz) {
        for (int k = 1; k <= 8 && k * note < rate / 2; ++k) {
          const int bin = static_cast<int>(std::lround(k * note * size / rate));
          for (int b = std::max(0, bin - 4); b <= bin + 4 && b < size / 2 + 1; ++b) {
            expected[b] = true;
          }
        }
      }
      double total = 0, outside = 0;
      for (size_t b = 0; b < spectrum.size(); ++b) {
        total += std::norm(spectrum[b]);
        if (!expected[b]) outside += std::norm(spectrum[b]);
      }
      EXPECT_LT(outside, 1e-4 * total);
      for (const double note : chord.notes_hz) {
        double near = 0;
        const int bin = static_cast<int>(std::lround(note * size / rate));
        for (int b = bin - 2; b <= bin + 2; ++b) near += std::norm(spectrum[b]);
        EXPECT_GT(near, 0.05 * total) << note << " Hz";
      }
      if (chord.notes_hz.size() == 3 && chord.notes_hz[2] < 1.6 * chord.notes_hz[0]) {
        ++triads;
        const double f = chord.notes_hz[0];
        EXPECT_NEAR(
            Amplitude(music, begin, size, f, rate) / Amplitude(music, begin, size, 2 * f, rate),
            2.0, 0.1);
      }
    }
    EXPECT_GE(triads, 5);
  }
}

}  // namespace
}  // namespace vesk_channel
