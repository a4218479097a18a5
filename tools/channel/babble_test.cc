#include "tools/channel/babble.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "audio/dsp/kiss_fft.h"
#include "gtest/gtest.h"

namespace vesk_channel {
namespace {

constexpr double kPi = 3.14159265358979323846;

TEST(BabbleTest, UnitRmsDeterministicAndMostEnergyBelowFourKilohertz) {
  const int size = 4096;
  const std::vector<float> babble = MakeBabble(10.0, 48000, 4, 3);
  ASSERT_EQ(babble.size(), 480000u);
  EXPECT_EQ(babble, MakeBabble(10.0, 48000, 4, 3));
  EXPECT_NE(babble, MakeBabble(10.0, 48000, 4, 4));
  const audio_dsp::RealFFTTransformer fft(size, false);
  std::vector<std::complex<float>> spectrum;
  double bands[3] = {0, 0, 0};  // below 80 Hz, 80 Hz ... 4 kHz, above
  for (size_t i = 0; i + size <= babble.size(); i += size) {
    fft.Forward(std::vector<float>(babble.begin() + i, babble.begin() + i + size), &spectrum);
    for (int k = 0; k <= size / 2; ++k) {
      const double hz = k * 48000.0 / size;
      bands[hz < 80 ? 0 : hz < 4000 ? 1 : 2] += std::norm(spectrum[k]) * (k % (size / 2) ? 2 : 1);
    }
  }
  // Parseval: the energy of 117 frames of 4096 unit-RMS samples.
  EXPECT_NEAR((bands[0] + bands[1] + bands[2]) / (117.0 * size * size), 1.0, 0.02);
  EXPECT_GT(bands[1], 0.95 * (bands[0] + bands[1] + bands[2]));
}

TEST(BabbleTest, OneTalkerHasSyllablesAndPauses) {
  const int rate = 16000;
  const std::vector<float> voice = MakeBabble(30.0, rate, 1, 11);
  std::vector<double> energies;  // of 10 ms frames
  double mean_energy = 0;
  for (size_t i = 0; i + rate / 100 <= voice.size(); i += rate / 100) {
    double sum = 0;
    for (int j = 0; j < rate / 100; ++j) sum += voice[i + j] * voice[i + j];
    energies.push_back(sum / (rate / 100));
    mean_energy += energies.back() / 3000;
  }
  // Syllabic rhythm: the modulation spectrum of the amplitude envelope is
  // strongest between 2 and 8 Hz, above the phrase rhythm below 2 Hz and far
  // above faster fluctuations.
  double mean = 0, bands[3] = {0, 0, 0};  // 0.25 ... 2, 2 ... 8, 8 ... 25 Hz
  for (double e : energies) mean += std::sqrt(e) / energies.size();
  for (double hz = 0.25; hz <= 25; hz += 0.25) {
    std::complex<double> sum = 0;
    for (size_t i = 0; i < energies.size(); ++i) {
      sum += (std::sqrt(energies[i]) - mean) * std::polar(1.0, -2 * kPi * hz * i / 100);
    }
    bands[hz < 2 ? 0 : hz <= 8 ? 1 : 2] += std::norm(sum);
  }
  EXPECT_GT(bands[1], bands[0]);
  EXPECT_GT(bands[1], 20 * bands[2]);
  // Pauses: many frames 30 dB below the mean energy.
  EXPECT_GT(std::count_if(energies.begin(), energies.end(),
                          [&](double e) { return e < 1e-3 * mean_energy; }),
            300);
}

}  // namespace
}  // namespace vesk_channel
