#include "audio/vesknet/acquisition_scorer.h"

#include <algorithm>
#include <cmath>
#include <random>
#include <vector>

#include "audio/vesknet/code_signal_generator.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

std::vector<float> Code(int taps) {
  std::vector<float> code;
  GenerateCodeSignal(taps, 0, &code);
  return code;
}

const std::vector<float> kShifts = {-2, -1, 0, 1, 2};

// Complex baseband: noise everywhere, plus code frames starting at `starts`,
// each turned by `cycles_per_frame` (a Doppler shift).
struct Signal {
  std::vector<float> real, imag;
};
Signal MakeSignal(const std::vector<float>& code, int length, const std::vector<int>& starts,
                  float cycles_per_frame, float noise, unsigned seed) {
  std::mt19937 rng(seed);
  std::normal_distribution<float> gauss(0.0f, noise);
  Signal s;
  for (int i = 0; i < length; ++i) {
    s.real.push_back(gauss(rng));
    s.imag.push_back(gauss(rng));
  }
  const int f = static_cast<int>(code.size());
  for (int start : starts) {
    for (int n = 0; n < f && start + n < length; ++n) {
      const double phase = 2 * M_PI * cycles_per_frame * n / f + 0.3;
      s.real[start + n] += code[n] * std::cos(phase);
      s.imag[start + n] += code[n] * std::sin(phase);
    }
  }
  return s;
}

TEST(AcquisitionScorerTest, GeometryFollowsTheConfiguration) {
  const std::vector<float> reference(100, 1.0f);
  const AcquisitionScorer wide(reference, kShifts, 16, 20.0f, 450);
  EXPECT_EQ(wide.detection_num_frames(), 3);
  EXPECT_EQ(wide.detection_num_shifts(), 151);
  EXPECT_EQ(wide.chunk_length(), 7);
  const AcquisitionScorer narrow(reference, kShifts, 16, 20.0f, 150);  // Raised to 199.
  EXPECT_EQ(narrow.detection_num_frames(), 1);
  EXPECT_EQ(narrow.detection_num_shifts(), 100);
  const int expected_delay[] = {2, 5, 13, 28};
  const float lengths[] = {10, 20, 50, 100};
  for (int i = 0; i < 4; ++i) {
    const AcquisitionScorer scorer(reference, kShifts, 16, lengths[i], 450);
    EXPECT_EQ(scorer.noise_delay(), expected_delay[i]) << lengths[i];
    EXPECT_EQ(scorer.warm_up(), std::max(expected_delay[i], 10));
  }
}

// Output i belongs to position i: a frame starting at 300 peaks at output 300.
TEST(AcquisitionScorerTest, PeaksWhereAFrameStarts) {
  const std::vector<float> code = Code(7);
  AcquisitionScorer scorer(code, kShifts, 8, 20.0f, 400);
  const Signal signal = MakeSignal(code, 1000, {300}, 0.0f, 0.3f, 1);
  std::vector<float> scores;
  scorer.ComputeScores(signal.real, signal.imag, &scores);
  // 1000 - 127 + 1 positions scored, the output trailing by the smoother's delay.
  EXPECT_EQ(static_cast<int>(scores.size()), 1000 - 127 + 1 - scorer.noise_delay());
  // Output i is made once position i + D is scored; until warm-up - 1
  // positions have been scored there is no background yet and it is 0.
  const int first_scored = scorer.warm_up() - 1 - scorer.noise_delay();
  for (int i = 0; i < first_scored; ++i) EXPECT_EQ(scores[i], 0.0f);
  EXPECT_GT(scores[first_scored], 0.0f);
  const int peak = std::max_element(scores.begin(), scores.end()) - scores.begin();
  EXPECT_EQ(peak, 300);
  EXPECT_GT(scores[300], 20.0f);  // Far above the background level of about 1.
}

TEST(AcquisitionScorerTest, BestShiftFollowsTheDoppler) {
  const std::vector<float> code = Code(7);
  const AcquisitionScorer scorer(code, kShifts, 16, 20.0f, 400);
  for (int shift_index = 0; shift_index < 5; ++shift_index) {
    const Signal frame = MakeSignal(code, 127, {0}, kShifts[shift_index], 0.0f, 1);
    std::vector<float> energies;
    scorer.ScoreFrame(frame.real, frame.imag, &energies);
    // The phasors turn forward, so shift s compensates a rotation of
    // -shifts[s]; the list is symmetric.
    const int best = std::max_element(energies.begin(), energies.end()) - energies.begin();
    EXPECT_EQ(best, 4 - shift_index);
    // Within a chunk the rotation is not compensated: at 2 cycles per frame
    // and 16 chunks that costs sinc^2(pi 2 / 16), about 5%.
    EXPECT_GT(energies[best], 0.94f * 127.0f * 127.0f);
    EXPECT_LE(energies[best], 1.001f * 127.0f * 127.0f);
  }
}

TEST(AcquisitionScorerTest, BlockSizesDoNotMatter) {
  const std::vector<float> code = Code(6);
  const Signal signal = MakeSignal(code, 900, {100, 163, 226}, 0.5f, 0.5f, 2);
  AcquisitionScorer whole(code, kShifts, 4, 20.0f, 200);
  AcquisitionScorer pieces(code, kShifts, 4, 20.0f, 200);
  std::vector<float> expected, scores, got;
  whole.ComputeScores(signal.real, signal.imag, &expected);
  for (size_t start = 0; start < signal.real.size(); start += 37) {
    const size_t end = std::min(start + 37, signal.real.size());
    pieces.ComputeScores({signal.real.begin() + start, signal.real.begin() + end},
                         {signal.imag.begin() + start, signal.imag.begin() + end}, &scores);
    got.insert(got.end(), scores.begin(), scores.end());
  }
  EXPECT_EQ(got, expected);
  EXPECT_FLOAT_EQ(pieces.GetBroadcasterScore(true), whole.GetBroadcasterScore(true));
}

TEST(AcquisitionScorerTest, BroadcasterScoreNeedsAWindowAndARepeatingCode) {
  const std::vector<float> code = Code(7);
  const int window = 127 * 5;
  AcquisitionScorer scorer(code, kShifts, 8, 20.0f, window);
  std::vector<float> scores;
  // Noise alone: nothing stands out.
  Signal noise = MakeSignal(code, window - 1, {}, 0.0f, 1.0f, 3);
  scorer.ComputeScores(noise.real, noise.imag, &scores);
  // window - 127 positions scored: not more than W - F yet.
  EXPECT_EQ(scorer.GetBroadcasterScore(true), 0.0f);
  noise = MakeSignal(code, 1000, {}, 0.0f, 1.0f, 4);
  scorer.ComputeScores(noise.real, noise.imag, &scores);
  const float noise_score = scorer.GetBroadcasterScore(true);
  EXPECT_GT(noise_score, 0.0f);
  EXPECT_LT(noise_score, 4.0f);
  // A code repeating every frame, well below the noise per sample.
  std::vector<int> starts;
  for (int s = 0; s < 2000; s += 127) starts.push_back(s);
  const Signal signal = MakeSignal(code, 2000, starts, 1.0f, 1.0f, 5);
  scorer.ComputeScores(signal.real, signal.imag, &scores);
  EXPECT_GT(scorer.GetBroadcasterScore(true), 4.0f * noise_score);
  scorer.Reset();
  EXPECT_EQ(scorer.GetBroadcasterScore(true), 0.0f);
}

TEST(AcquisitionScorerDeathTest, RefusesMismatchedInput) {
  const std::vector<float> code = Code(5);
  AcquisitionScorer scorer(code, kShifts, 4, 20.0f, 100);
  std::vector<float> scores;
  // The warning comes first, then the check ends the process.
  EXPECT_DEATH(scorer.ComputeScores({1, 2, 3}, {1, 2}, &scores),
               "Baseband signal size mismatch: 3 vs\\. 2.*Check failed: "
               "baseband_real_signal.size\\(\\) == baseband_imaginary_signal.size\\(\\)");
  EXPECT_DEATH(AcquisitionScorer(code, kShifts, 0, 20.0f, 100), "Check failed: num_chunks_ > 0");
}

}  // namespace
}  // namespace audio_vesknet
