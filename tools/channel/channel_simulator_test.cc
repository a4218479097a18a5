#include "tools/channel/channel_simulator.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "gtest/gtest.h"
#include "tools/channel/channel_test_util.h"
#include "tools/channel/walking_path.h"

namespace vesk_channel {
namespace {

std::vector<float> WhiteSource(double seconds, double rate, uint64_t seed) {
  Random random(seed);
  std::vector<float> x(static_cast<size_t>(seconds * rate));
  for (float& v : x) v = static_cast<float>(0.15 * random.Gaussian());
  return x;
}

std::vector<double> Channel(const ChannelOutput& out, int c) {
  std::vector<double> x;
  for (size_t i = c; i < out.samples.size(); i += out.channels) x.push_back(out.samples[i]);
  return x;
}

double Dot(const std::vector<double>& x, const std::vector<double>& y, int64_t begin, int64_t end) {
  double sum = 0;
  for (int64_t i = begin; i < end; ++i) sum += x[i] * y[i];
  return sum;
}
double Correlation(const std::vector<double>& x, const std::vector<double>& y, int64_t begin,
                   int64_t end) {
  return Dot(x, y, begin, end) / std::sqrt(Dot(x, x, begin, end) * Dot(y, y, begin, end));
}

// Frequency from the first and last upward zero crossings (interpolated).
double ZeroCrossingFrequency(const std::vector<double>& x, int64_t begin, int64_t end,
                             double rate) {
  double first = -1, last = -1;
  int crossings = 0;
  for (int64_t i = begin; i + 1 < end; ++i) {
    if (x[i] < 0 && x[i + 1] >= 0) {
      last = i + x[i] / (x[i] - x[i + 1]);
      if (crossings++ == 0) first = last;
    }
  }
  return (crossings - 1) * rate / (last - first);
}

TEST(PlayThroughChannelTest, SameSeedSameOutputOtherSeedOther) {
  const std::vector<float> source = Tone(18500, 48000, 0.5);
  ChannelParams p;
  p.channels = 2;
  p.speed = 1.002;
  p.snr_db = 5;
  p.babble_sir_db = 10;
  p.max_random_lead_in_s = 0.3;
  p.seed = 42;
  const ChannelOutput a = PlayThroughChannel(source, 48000, p);
  EXPECT_EQ(a.samples, PlayThroughChannel(source, 48000, p).samples);
  // Pinned: the same samples on every build, 32-bit included. Update
  // deliberately when the channel model changes.
  uint64_t hash = 14695981039346656037ULL;  // FNV-1a
  for (int16_t s : a.samples) hash = (hash ^ static_cast<uint16_t>(s)) * 1099511628211ULL;
  EXPECT_EQ(hash, 16092179408596176495ULL);
  p.seed = 43;
  const ChannelOutput c = PlayThroughChannel(source, 48000, p);
  EXPECT_NE(a.signal_start_exact, c.signal_start_exact);
  EXPECT_NE(a.samples, c.samples);
  // With reverberation too, on one build.
  p.reverb = true;
  EXPECT_EQ(PlayThroughChannel(source, 48000, p).samples,
            PlayThroughChannel(source, 48000, p).samples);
}

TEST(PlayThroughChannelTest, LeadInSpanAndTail) {
  ChannelParams p;
  const std::vector<float> source = Tone(1000, 44100, 1.0);
  ChannelOutput out = PlayThroughChannel(source, 44100, p);
  EXPECT_EQ(out.signal_start, 8820);
  EXPECT_EQ(out.signal_length, 44100);
  EXPECT_EQ(out.samples.size(), 8820u + 44100u + 8820u);
  // No noise by default: silence beyond the kernel's ringing at the edges.
  EXPECT_EQ(out.samples[8700], 0);
  EXPECT_EQ(out.samples[8820 + 44100 + 120], 0);
  p.lead_in_s = 0.1;
  p.max_random_lead_in_s = 0.5;
  out = PlayThroughChannel(source, 44100, p);
  EXPECT_GT(out.signal_start_exact, 4410);
  EXPECT_LT(out.signal_start_exact, 4410 + 22050);
  EXPECT_EQ(out.signal_start, static_cast<int64_t>(std::ceil(out.signal_start_exact)));
}

TEST(PlayThroughChannelTest, SpeedScalesFrequencyAndDuration) {
  for (double speed : {1.003, 0.996}) {
    ChannelParams p;
    p.speed = speed;
    const std::vector<float> source = Tone(1000, 48000, 2.0);
    const ChannelOutput out = PlayThroughChannel(source, 48000, p);
    const std::vector<double> x = Channel(out, 0);
    const int64_t start = out.signal_start, end = start + out.signal_length;
    EXPECT_NEAR(out.signal_length, 2.0 * 44100 / speed, 1.0);
    EXPECT_NEAR(ZeroCrossingFrequency(x, start + 500, end - 500, 44100), 1000 * speed, 0.01);
    // A constant source's band-limited edges (half height) mark the span.
    const ChannelOutput box = PlayThroughChannel(std::vector<float>(96000, 0.5f), 48000, p);
    const std::vector<double> y = Channel(box, 0);
    const auto high = [](double v) { return v > 8192; };
    EXPECT_EQ(std::find_if(y.begin(), y.end(), high) - y.begin(), start);
    EXPECT_NEAR(y.rend() - std::find_if(y.rbegin(), y.rend(), high), end, 1);
  }
}

TEST(PlayThroughChannelTest, MeasuredSnrMatchesRequestPerChannel) {
  const std::vector<float> source = WhiteSource(1.0, 48000, 3);
  for (double snr : {0.0, 20.0}) {
    ChannelParams p;
    p.channels = 2;
    p.snr_db = snr;
    p.lead_in_s = 1.0;
    const ChannelOutput out = PlayThroughChannel(source, 48000, p);
    const int64_t start = out.signal_start, end = start + out.signal_length;
    const std::vector<double> left = Channel(out, 0), right = Channel(out, 1);
    for (const auto& x : {left, right}) {
      const double noise = MeanSquare(x, 0, start - 100);
      const double measured = 10 * std::log10((MeanSquare(x, start, end) - noise) / noise);
      EXPECT_NEAR(measured, snr, 0.3);
    }
    // Independent noise in the two channels, the same signal.
    EXPECT_NE(left, right);
    EXPECT_NEAR(Correlation(left, right, 0, start - 100), 0.0, 0.03);
    EXPECT_NEAR(Correlation(left, right, start, end), 1.0 / (1.0 + std::pow(10, -snr / 10)), 0.02);
  }
}

TEST(PlayThroughChannelTest, ClipsToSixteenBits) {
  ChannelParams p;
  p.level_db = 20 * std::log10(3.0);
  const ChannelOutput out = PlayThroughChannel(Tone(440, 44100, 0.2), 44100, p);
  EXPECT_GT(std::count(out.samples.begin(), out.samples.end(), 32767), 1000);
  EXPECT_GT(std::count(out.samples.begin(), out.samples.end(), -32768), 1000);
  // A linear gain of 3 is the same level.
  ChannelParams linear;
  linear.gain = 3.0;
  const ChannelOutput same = PlayThroughChannel(Tone(440, 44100, 0.2), 44100, linear);
  ASSERT_EQ(same.samples.size(), out.samples.size());
  for (size_t i = 0; i < out.samples.size(); ++i) EXPECT_NEAR(same.samples[i], out.samples[i], 1);
}

TEST(PlayThroughChannelTest, LevelSetsTheScaleDownToAFewQuantiserSteps) {
  // Noise-like source at -60 dB: what the microphone delivers is the same
  // signal as at 0 dB, a thousand times smaller, plus the rounding to 16 bits:
  // an error within half a step, of power 1/12 step^2.
  const std::vector<float> source = WhiteSource(1.0, 44100, 8);
  ChannelParams p;
  const ChannelOutput loud = PlayThroughChannel(source, 44100, p);
  p.level_db = -60;
  const ChannelOutput quiet = PlayThroughChannel(source, 44100, p);
  ASSERT_EQ(loud.samples.size(), quiet.samples.size());
  const int64_t begin = quiet.signal_start, end = begin + quiet.signal_length;
  std::vector<double> error;
  for (int64_t i = begin; i < end; ++i) {
    error.push_back(quiet.samples[i] - 1e-3 * loud.samples[i]);
    ASSERT_LE(std::abs(error.back()), 0.5 + 1e-3) << i;
  }
  EXPECT_NEAR(MeanSquare(error, 0, error.size()), 1.0 / 12, 0.003);
  EXPECT_NEAR(std::sqrt(MeanSquare(quiet.samples, begin, end)), 0.15 * 32.768, 0.1);
}

TEST(PlayThroughChannelTest, LoudspeakerAndMicrophoneResponsesAdd) {
  // Two tones, 1 and 18.5 kHz, through a budget phone pair: each comes out
  // with the sum of the two curves' gains (dB) at its frequency.
  std::vector<float> source = Tone(1000, 48000, 1.0, 0.3);
  const std::vector<float> high = Tone(18500, 48000, 1.0, 0.3);
  for (size_t i = 0; i < source.size(); ++i) source[i] += high[i];
  ChannelParams p;
  p.mic_rate = 48000;
  const std::vector<double> flat = Channel(PlayThroughChannel(source, 48000, p), 0);
  p.speaker = DeviceProfile::kBudgetPhone;
  p.microphone = DeviceProfile::kBudgetPhone;
  const ChannelOutput out = PlayThroughChannel(source, 48000, p);
  const std::vector<double> phone = Channel(out, 0);
  const int64_t begin = out.signal_start + 10000,
                end = out.signal_start + out.signal_length - 10000;
  for (double hz : {1000.0, 18500.0}) {
    const double want = DeviceGainDb(DeviceRole::kSpeaker, DeviceProfile::kBudgetPhone, hz) +
                        DeviceGainDb(DeviceRole::kMicrophone, DeviceProfile::kBudgetPhone, hz);
    EXPECT_NEAR(
        ToDb(Amplitude(phone, begin, end, hz, 48000) / Amplitude(flat, begin, end, hz, 48000)),
        want, 0.25)
        << hz;
  }
}

// The fundamental and third harmonic of a 1 kHz sine of amplitude 2 sampled
// at 48 kHz and clipped at 1: the clipping acts on the samples, so the
// harmonics above 24 kHz alias onto the harmonics below (the 45th onto the
// third).
std::pair<double, double> ClippedSineHarmonics() {
  double first = 0, third = 0;
  for (int n = 0; n < 48; ++n) {
    const double phase = 2 * kPi * n / 48;
    const double v = std::max(-1.0, std::min(1.0, 2 * std::sin(phase)));
    first += v * std::sin(phase);
    third += v * std::sin(3 * phase);
  }
  return {2 * first / 48, 2 * third / 48};
}

TEST(PlayThroughChannelTest, OverdriveClipsAtFullScaleBeforeTheRoom) {
  ChannelParams p;
  p.mic_rate = 48000;
  p.overdrive_db = 20 * std::log10(2.0);
  const ChannelOutput out = PlayThroughChannel(Tone(1000, 48000, 1.0, 1.0), 48000, p);
  const std::vector<double> x = Channel(out, 0);
  const int64_t begin = out.signal_start + 1000, end = out.signal_start + out.signal_length - 1000;
  const auto harmonics = ClippedSineHarmonics();
  EXPECT_NEAR(Amplitude(x, begin, end, 1000, 48000) / 32768, harmonics.first, 0.002);
  EXPECT_NEAR(Amplitude(x, begin, end, 3000, 48000) / 32768, std::abs(harmonics.second), 0.002);
  EXPECT_GT(std::abs(harmonics.second), 0.1);  // Well above the measurement's error.
}

TEST(PlayThroughChannelTest, WalkingListenerHearsTheInstantaneousDopplerAndLevel) {
  ChannelParams p;
  p.mic_rate = 48000;
  p.walk_speed_mps = 1.2;
  p.walk_closest_m = 0.5;
  p.lead_in_s = 0.5;
  const double f0 = 3000;
  const ChannelOutput out = PlayThroughChannel(Tone(f0, 48000, 4.0), 48000, p);
  ASSERT_GT(out.walk_closest_s, 0.5);
  ASSERT_LT(out.walk_closest_s, 4.5);
  const WalkingPath path(1.2, 0.5, out.walk_closest_s);
  const std::vector<double> x = Channel(out, 0);
  const double window = 0.05 * 48000;
  int checked = 0;
  for (double t = 0.6; t < 4.4; t += 0.1) {
    const int64_t begin = static_cast<int64_t>(t * 48000 - window / 2);
    const int64_t end = static_cast<int64_t>(begin + window);
    // The source plays at 1 - v / c of its rate while the distance grows at
    // v (up to 10.5 Hz off at 1.2 m/s).
    const double want = f0 * (1 - path.RadialSpeed(t) / kSpeedOfSound);
    SCOPED_TRACE(t);
    EXPECT_NEAR(ZeroCrossingFrequency(x, begin, end, 48000), want, 0.3);
    EXPECT_NEAR(Amplitude(x, begin, end, want, 48000) / (0.5 * 32768), path.Gain(t), 0.01);
    ++checked;
  }
  EXPECT_GT(checked, 30);
}

TEST(PlayThroughChannelTest, TonesStandAtTheirLevelBelowTheSignal) {
  ChannelParams p;
  p.mic_rate = 48000;
  p.tone_frequencies_hz = {18600, 19000};
  p.random_tones = 1;
  p.random_tone_low_hz = 1000;
  p.random_tone_high_hz = 2000;
  p.tone_sir_db = -20;
  p.lead_in_s = 0.5;
  p.level_db = -30;  // Room for the tones within 16 bits.
  const ChannelOutput out = PlayThroughChannel(Tone(5000, 48000, 1.0), 48000, p);
  const std::vector<double> x = Channel(out, 0);
  const double signal = 0.5 * 32768 * std::pow(10, -1.5);
  // Each tone's power is 100 times the signal's: 10 times its amplitude.
  for (double hz : {18600.0, 19000.0}) {
    EXPECT_NEAR(Amplitude(x, 0, x.size(), hz, 48000) / signal, 10.0, 0.05) << hz;
  }
  // The third tone lies somewhere in 1-2 kHz: the lead-in holds the three
  // tones alone, three times the power of one.
  EXPECT_NEAR(MeanSquare(x, 0, out.signal_start) / (signal * signal / 2), 300.0, 3.0);
}

TEST(PlayThroughChannelTest, MusicStandsAtItsLevelBelowTheSignal) {
  ChannelParams p;
  p.mic_rate = 48000;
  p.lead_in_s = 0.5;
  p.level_db = -30;  // Room for the music within 16 bits.
  const std::vector<float> source = Tone(5000, 48000, 1.0);
  const std::vector<double> clean = Channel(PlayThroughChannel(source, 48000, p), 0);
  p.music_sir_db = -10;
  p.music.harmonics = 2;  // Every partial below 2.1 kHz, clear of the tone.
  const ChannelOutput out = PlayThroughChannel(source, 48000, p);
  std::vector<double> music = Channel(out, 0);
  ASSERT_EQ(music.size(), clean.size());
  for (size_t i = 0; i < music.size(); ++i) music[i] -= clean[i];
  // The tone of amplitude 0.5 at -30 dB has power (0.5 x 32768 x 10^-1.5)^2
  // / 2; the music over the whole output ten times that.
  const double signal = 0.5 * 32768 * std::pow(10, -1.5);
  EXPECT_NEAR(MeanSquare(music, 0, music.size()) / (signal * signal / 2), 10.0, 0.05);
  // Music and nothing else in the lead-in, and none of it at the tone.
  EXPECT_GT(MeanSquare(music, 0, out.signal_start), 0.5 * signal * signal);
  EXPECT_LT(Amplitude(music, 0, music.size(), 5000, 48000), 0.01 * signal);
}

TEST(PlayThroughChannelTest, SecondTransmitterAtItsPowerRatioAndOffset) {
  ChannelParams p;
  p.mic_rate = 48000;
  p.second_power_db = -6;
  p.second_offset_s = 0.3;
  const ChannelOutput out =
      PlayThroughChannel(Tone(1000, 48000, 1.0), 48000, p, Tone(2000, 48000, 1.0, 0.9));
  const std::vector<double> x = Channel(out, 0);
  const int64_t start = out.signal_start;
  EXPECT_EQ(x.size(), static_cast<size_t>(start + 1.3 * 48000 + 0.2 * 48000));
  // Before the offset only the first is heard; then both, 6 dB apart.
  // (Windows of whole periods of both tones.)
  EXPECT_LT(Amplitude(x, start + 960, start + 13920, 2000, 48000), 1.0);
  const int64_t both = start + static_cast<int64_t>(0.31 * 48000);
  EXPECT_NEAR(ToDb(Amplitude(x, both, both + 32640, 2000, 48000) /
                   Amplitude(x, both, both + 32640, 1000, 48000)),
              -6.0, 0.05);
}

TEST(PlayThroughChannelTest, DropoutsRemoveRunsOfTheSameRecording) {
  ChannelParams p;
  p.snr_db = 10;
  p.lead_in_s = 0.5;
  const std::vector<float> source = WhiteSource(2.0, 48000, 5);
  const ChannelOutput whole = PlayThroughChannel(source, 48000, p);
  p.dropouts.interval_s = 0.5;
  p.dropouts.length_s = 0.02;
  const ChannelOutput cut = PlayThroughChannel(source, 48000, p);
  ASSERT_GE(cut.dropouts.size(), 5u);
  std::vector<int16_t> want = whole.samples;
  RemoveDropouts(cut.dropouts, 1, &want);
  EXPECT_EQ(cut.samples, want);
  EXPECT_EQ(whole.samples.size() - cut.samples.size(), cut.dropouts.size() * 882);
  // The span moves with the runs before it and shrinks by those within it.
  int64_t before = 0, within = 0;
  for (const Dropout& d : cut.dropouts) {
    if (d.start + d.length <= whole.signal_start) before += d.length;
    if (d.start >= whole.signal_start &&
        d.start + d.length <= whole.signal_start + whole.signal_length) {
      within += d.length;
    }
  }
  EXPECT_EQ(cut.signal_start, whole.signal_start - before);
  EXPECT_NEAR(cut.signal_length, whole.signal_length - within, 882);
}

TEST(PlayThroughChannelTest, AgcStepsSignalAndNoiseTogether) {
  ChannelParams p;
  p.snr_db = 0;
  p.lead_in_s = 0.5;
  const std::vector<float> source = Tone(3000, 44100, 4.0);
  const std::vector<double> plain = Channel(PlayThroughChannel(source, 44100, p), 0);
  p.agc.step_db = 20;
  p.agc.interval_s = 1.0;
  const std::vector<double> stepped = Channel(PlayThroughChannel(source, 44100, p), 0);
  ASSERT_EQ(plain.size(), stepped.size());
  // Level ratio per 10 ms: at 0 dB (before the first step) and down to
  // -20 dB, nothing in between for long.
  double lowest = 0, highest = -100;
  int settled_low = 0;
  for (size_t begin = 0; begin + 441 <= plain.size(); begin += 441) {
    const double ratio_db = 10 * std::log10(MeanSquare(stepped, begin, begin + 441) /
                                            MeanSquare(plain, begin, begin + 441));
    lowest = std::min(lowest, ratio_db);
    highest = std::max(highest, ratio_db);
    settled_low += ratio_db < -19.5;
  }
  EXPECT_NEAR(lowest, -20.0, 0.3);
  EXPECT_NEAR(highest, 0.0, 0.3);
  EXPECT_GT(settled_low, 20);
}

TEST(PlayThroughChannelTest, ReverbAddsItsEnergyAndATailPerChannel) {
  const std::vector<float> source = WhiteSource(1.0, 44100, 4);
  ChannelParams p;
  p.channels = 2;
  p.tail_s = 0.4;
  const ChannelOutput dry = PlayThroughChannel(source, 44100, p);
  p.reverb = true;
  const ChannelOutput wet = PlayThroughChannel(source, 44100, p);
  const int64_t start = wet.signal_start, end = start + wet.signal_length;
  const std::vector<double> d = Channel(dry, 0), l = Channel(wet, 0), r = Channel(wet, 1);
  const double dry_power = MeanSquare(d, start, end);
  // Direct energy 1 plus reverberant energy 10^-0.3.
  EXPECT_NEAR(MeanSquare(l, start + 13230, end) / dry_power, 1.5, 0.1);
  EXPECT_NEAR(MeanSquare(r, start + 13230, end) / dry_power, 1.5, 0.1);
  // The tail decays: 0.1 s after the end about 20 dB below the reverberant
  // level, silence where the dry signal had ended.
  const double tail = MeanSquare(l, end + 4410 - 441, end + 4410 + 441) / (0.5 * dry_power);
  EXPECT_NEAR(10 * std::log10(tail), -20.0, 4.0);
  EXPECT_EQ(MeanSquare(d, end + 4410 - 441, end + 4410 + 441), 0.0);
  // Different rooms, the same direct path.
  EXPECT_NE(l, r);
  EXPECT_NEAR(Correlation(l, r, start, end), 1.0 / 1.5, 0.1);
  // Mono hears the left room.
  p.channels = 1;
  EXPECT_EQ(Channel(PlayThroughChannel(source, 44100, p), 0), l);
}

TEST(PlayThroughChannelDeathTest, ChecksItsArguments) {
  ChannelParams p;
  EXPECT_DEATH(PlayThroughChannel({}, 48000, p), "Check failed: !source.empty\\(\\)");
  p.channels = 3;
  EXPECT_DEATH(PlayThroughChannel({0.0f}, 48000, p),
               "Check failed: params.channels == 1 \\|\\| params.channels == 2");
}

}  // namespace
}  // namespace vesk_channel
