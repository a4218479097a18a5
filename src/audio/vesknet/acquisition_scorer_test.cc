#include "audio/vesknet/acquisition_scorer.h"

#include <algorithm>
#include <cmath>
#include <memory>
#include <random>
#include <vector>

#include "audio/vesknet/code_signal_generator.h"
#include "audio/vesknet/vesknet_decoder.h"
#include "audio/vesknet/vesknet_encoder.h"
#include "audio/vesknet/vesknet_util.h"
#include "gtest/gtest.h"

#if defined(__x86_64__) || defined(__i386__)
#include <xmmintrin.h>
#endif

namespace audio_vesknet {
namespace {

std::vector<float> Code(int taps) {
  std::vector<float> code;
  GenerateCodeSignal(taps, 0, &code);
  return code;
}

const std::vector<float> kShifts = {-2, -1, 0, 1, 2};

// The scorer computed directly: every position's frame correlated with the
// reference chunk by chunk, the chunk sums turned by each shift's phasors,
// the background smoothed position by position, and the broadcaster score
// summed over the whole window on request. The streaming scorer must agree
// with it within float rounding.
class DirectScorer {
 public:
  DirectScorer(const std::vector<float>& reference, const std::vector<float>& shifts,
               int num_chunks, float noise_length, int detection_window)
      : scorer_(reference, shifts, num_chunks, noise_length, detection_window),
        frame_size_(static_cast<int>(reference.size())),
        span_(std::max(2 * frame_size_ - 1, detection_window)) {
    const double q = static_cast<double>(noise_length) * noise_length / 24.0;
    const double pole = 1.0 + (1.0 - std::sqrt(2.0 * q + 1.0)) / q;
    weight_ = 1.0 - pole;
  }

  void Add(const std::vector<float>& real, const std::vector<float>& imag,
           std::vector<float>* out) {
    real_.insert(real_.end(), real.begin(), real.end());
    imag_.insert(imag_.end(), imag.begin(), imag.end());
    const int delay = scorer_.noise_delay();
    const int warm_up = scorer_.warm_up();
    while (static_cast<int>(real_.size()) - static_cast<int>(history_.size()) >= frame_size_) {
      const int n = static_cast<int>(history_.size());
      const std::vector<float> frame_real(real_.begin() + n, real_.begin() + n + frame_size_);
      const std::vector<float> frame_imag(imag_.begin() + n, imag_.begin() + n + frame_size_);
      std::vector<float> energies;
      scorer_.ScoreFrame(frame_real, frame_imag, &energies);
      history_.push_back(energies);
      if (n == warm_up - 1) {
        double sum = 0.0;
        for (int p = 0; p < warm_up; ++p) {
          for (float v : history_[p]) sum += v;
        }
        state1_ = state2_ = sum / (static_cast<double>(warm_up) * energies.size());
      } else if (n > warm_up - 1) {
        double sum = 0.0;
        for (float v : energies) sum += v;
        state1_ += weight_ * (sum / energies.size() - state1_);
        state2_ += weight_ * (state1_ - state2_);
      }
      if (n + 1 > delay) {
        float output = 0.0f;
        if (n >= warm_up - 1) {
          const std::vector<float>& delayed = history_[n - delay];
          output = static_cast<float>(*std::max_element(delayed.begin(), delayed.end()) /
                                      (state2_ + 1e-12));
        }
        out->push_back(output);
      }
    }
  }

  float BroadcasterScore() const {
    const int latest = static_cast<int>(history_.size());
    if (frame_size_ + latest <= span_) return 0.0f;
    const int frames = scorer_.detection_num_frames();
    const int lags = scorer_.detection_num_shifts();
    double best = 0.0, total = 0.0;
    for (int lag = 0; lag < lags; ++lag) {
      std::vector<double> summed(history_[0].size(), 0.0);
      for (int frame = 0; frame < frames; ++frame) {
        const std::vector<float>& scores = history_[latest - 1 - lag - frame * frame_size_];
        for (size_t s = 0; s < summed.size(); ++s) summed[s] += scores[s];
      }
      for (double value : summed) {
        best = std::max(best, value);
        total += value;
      }
    }
    return static_cast<float>(best / std::max(total / (static_cast<double>(lags) * frames), 1e-12));
  }

 private:
  const AcquisitionScorer scorer_;  // Only for ScoreFrame and the geometry.
  const int frame_size_;
  const int span_;
  double weight_;
  std::vector<float> real_, imag_;
  std::vector<std::vector<float>> history_;
  double state1_ = 0.0, state2_ = 0.0;
};

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

TEST(AcquisitionScorerTest, KernelWidthFollowsTheProcessor) {
  using Kernel = AcquisitionScorer::Kernel;
  const std::vector<float> code = Code(5);
  const auto lanes = [&](Kernel kernel) {
    return AcquisitionScorer(code, kShifts, 4, 20.0f, 100, kernel).lanes();
  };
  EXPECT_EQ(lanes(Kernel::kFourLane), 12);
  EXPECT_EQ(lanes(Kernel::kEightLane),
            AcquisitionScorer::KernelAvailable(Kernel::kEightLane) ? 24 : 12);
  EXPECT_EQ(lanes(Kernel::kSixteenLane),
            AcquisitionScorer::KernelAvailable(Kernel::kSixteenLane) ? 48 : 12);
  EXPECT_EQ(lanes(Kernel::kWidest),
            std::max(lanes(Kernel::kEightLane), lanes(Kernel::kSixteenLane)));
}

#if defined(__x86_64__) || defined(__i386__)
// The 32-bit build resets the wide registers' state after each wide kernel,
// reloading the SSE control register on the way: the rounding and
// flush-to-zero settings a host has chosen must come back unchanged.
TEST(AcquisitionScorerTest, ScoringKeepsTheFloatingPointControlState) {
  using Kernel = AcquisitionScorer::Kernel;
  const std::vector<float> code = Code(5);
  const int f = static_cast<int>(code.size());
  const Signal signal = MakeSignal(code, 6 * f, {f}, 0.5f, 0.5f, 3);
  constexpr unsigned kFlushToZero = 1u << 15, kDenormalsAreZero = 1u << 6;
  constexpr unsigned kRoundDown = 1u << 13;
  constexpr unsigned kExceptionFlags = 0x3f;  // Sticky, set by the arithmetic.
  const unsigned saved = _mm_getcsr();
  for (const Kernel kernel : {Kernel::kFourLane, Kernel::kEightLane, Kernel::kSixteenLane}) {
    AcquisitionScorer scorer(code, kShifts, 4, 20.0f, 100, kernel);
    const unsigned chosen =
        (saved & ~kExceptionFlags) | kFlushToZero | kDenormalsAreZero | kRoundDown;
    _mm_setcsr(chosen);
    std::vector<float> scores;
    scorer.ComputeScores(signal.real, signal.imag, &scores);
    const unsigned after = _mm_getcsr();
    _mm_setcsr(saved);
    EXPECT_EQ(after & ~kExceptionFlags, chosen) << static_cast<int>(kernel);
    EXPECT_FALSE(scores.empty());
  }
}
#endif

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

// Largest |a - b| / max(|b|, floor) over two equally long score streams.
double LargestRelativeError(const std::vector<float>& a, const std::vector<float>& b,
                            double floor) {
  EXPECT_EQ(a.size(), b.size());
  double largest = 0.0;
  for (size_t i = 0; i < std::min(a.size(), b.size()); ++i) {
    largest = std::max(largest, std::fabs(a[i] - b[i]) / std::max<double>(std::fabs(b[i]), floor));
  }
  return largest;
}

// The streaming scores equal the direct computation within float rounding:
// symmetric shift lists (paired shifts) and lists with unpaired shifts,
// frames whose length the chunks do not divide, random block sizes, and the
// broadcaster score along the way.
TEST(AcquisitionScorerTest, EqualsTheDirectComputation) {
  struct Case {
    int taps;
    std::vector<float> shifts;
    int num_chunks;
    float cycles_per_frame;
  };
  const Case cases[] = {
      {7, kShifts, 16, 1.5f},
      {7, {-3, -2.5f, -2, -1.5f, -1, -0.5f, 0, 0.5f, 1, 1.5f, 2, 2.5f, 3}, 16, -2.0f},
      {6, {-1, 0, 0.5f, 2}, 5, 0.5f},
      {5, {0.25f}, 3, 0.0f}};
  std::mt19937 rng(7);
  for (const Case& c : cases) {
    const std::vector<float> code = Code(c.taps);
    const int f = static_cast<int>(code.size());
    std::vector<int> starts;
    for (int start = 3 * f + 5; start < 20 * f; start += f) starts.push_back(start);
    const Signal signal = MakeSignal(code, 25 * f, starts, c.cycles_per_frame, 0.5f, 11);
    // The widest kernel against the direct form, the others against it.
    AcquisitionScorer scorer(code, c.shifts, c.num_chunks, 20.0f, 4 * f);
    using Kernel = AcquisitionScorer::Kernel;
    std::vector<AcquisitionScorer> narrower;
    for (const Kernel kernel : {Kernel::kFourLane, Kernel::kEightLane}) {
      narrower.emplace_back(code, c.shifts, c.num_chunks, 20.0f, 4 * f, kernel);
    }
    DirectScorer direct(code, c.shifts, c.num_chunks, 20.0f, 4 * f);
    std::vector<float> got, want, scores;
    std::vector<std::vector<float>> got_narrower(narrower.size());
    std::uniform_int_distribution<int> block(1, 3 * f);
    for (size_t start = 0; start < signal.real.size();) {
      const size_t end = std::min(signal.real.size(), start + block(rng));
      const std::vector<float> real(signal.real.begin() + start, signal.real.begin() + end);
      const std::vector<float> imag(signal.imag.begin() + start, signal.imag.begin() + end);
      scorer.ComputeScores(real, imag, &scores);
      got.insert(got.end(), scores.begin(), scores.end());
      for (size_t i = 0; i < narrower.size(); ++i) {
        narrower[i].ComputeScores(real, imag, &scores);
        got_narrower[i].insert(got_narrower[i].end(), scores.begin(), scores.end());
        EXPECT_EQ(narrower[i].GetBroadcasterScore(true), scorer.GetBroadcasterScore(true));
      }
      direct.Add(real, imag, &want);
      const float broadcaster = direct.BroadcasterScore();
      EXPECT_NEAR(scorer.GetBroadcasterScore(true), broadcaster, 1e-5f * broadcaster) << c.taps;
      start = end;
    }
    // The vector width changes nothing, to the bit.
    for (const std::vector<float>& other : got_narrower) EXPECT_EQ(other, got) << c.taps;
    ASSERT_EQ(got.size(), want.size());
    EXPECT_GT(*std::max_element(want.begin(), want.end()), 5.0f);  // The frames stand out.
    // Scores are ratios to a background near 1: below 0.01 only the absolute
    // error counts.
    EXPECT_LT(LargestRelativeError(got, want, 0.01), 1e-5) << c.taps;
  }
}

// The same on the baseband of a real transmission: a token of the 44.1 kHz
// coder played three times at 10 dB SNR into a decoder's front end, scored
// by the decoder as it streams and, over the decoder's whole baseband
// history, directly.
TEST(AcquisitionScorerTest, EqualsTheDirectComputationOnTokenAudio) {
  VesknetEncoderParams encoder_params;
  encoder_params.broadcast_sample_rate = 44100;
  const VesknetEncoder encoder(std::make_unique<SymbolWaveCoder>(SymbolWaveCoderParams()),
                               encoder_params);
  std::vector<float> token;
  ASSERT_TRUE(encoder.EncodeToken({1, 2, 3, 4, 5, 6, 7, 8}, &token));
  std::mt19937 rng(4);
  std::normal_distribution<float> noise(0.0f, 0.5f / std::sqrt(2.0f) / std::sqrt(10.0f));
  std::vector<float> audio(6000);
  for (int r = 0; r < 3; ++r) audio.insert(audio.end(), token.begin(), token.end());
  audio.resize(audio.size() + 6000);
  for (float& sample : audio) sample = 32768.0f * (sample + noise(rng));

  const SymbolWaveCoder& coder = encoder.symbol_wave_coder();
  VesknetDecoderParams params;
  params.max_buffer_duration = 10.0f;  // Nothing is dropped.
  VesknetDecoder decoder(&coder, params);
  decoder.Initialize(44100, 1);
  for (size_t start = 0; start < audio.size(); start += 2048) {
    decoder.ProcessSamples(std::vector<float>(
        audio.begin() + start, audio.begin() + std::min(audio.size(), start + 2048)));
  }
  ASSERT_EQ(decoder.baseband_real().dropped(), 0);

  std::vector<float> shifts;
  MakeFrequencyOffsets(params.acquisition_doppler_step,
                       coder.carrier_cycles_per_frame() * params.max_speed / 340.0f, &shifts);
  DirectScorer direct(coder.baseband_code(), shifts, params.acquisition_num_chunks,
                      static_cast<float>(params.noise_smoothing_length),
                      static_cast<int>(std::round(params.acquisition_window_duration *
                                                  decoder.baseband_sample_rate())));
  const StreamBuffer<float>& real = decoder.baseband_real();
  const StreamBuffer<float>& imag = decoder.baseband_imag();
  std::vector<float> want;
  direct.Add(std::vector<float>(real.data(), real.data() + real.size()),
             std::vector<float>(imag.data(), imag.data() + imag.size()), &want);
  const StreamBuffer<float>& scores = decoder.acquisition_scores();
  const std::vector<float> got(scores.data(), scores.data() + scores.size());
  EXPECT_GT(*std::max_element(want.begin(), want.end()), 50.0f);
  EXPECT_LT(LargestRelativeError(got, want, 0.01), 1e-5);
  const float broadcaster = direct.BroadcasterScore();
  EXPECT_GT(broadcaster, params.broadcaster_threshold);
  EXPECT_NEAR(decoder.GetSignalScore(), broadcaster, 1e-5f * broadcaster);
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
