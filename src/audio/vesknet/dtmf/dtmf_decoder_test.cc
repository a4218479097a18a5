#include "audio/vesknet/dtmf/dtmf_decoder.h"

#include <algorithm>
#include <cmath>
#include <string>
#include <utility>
#include <vector>

#include "audio/dsp/max_filter.h"
#include "audio/vesknet/dtmf/dtmf_encoder.h"
#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

constexpr int kP = 138;  // Baseband samples per symbol with the defaults.

DtmfDecoderParams ProductParams() {
  DtmfDecoderParams params;
  params.append_checksum_symbol = true;
  return params;
}

// `audio` (-1 ... 1) at 10000 of the 16-bit range, `repeat` times, after
// `lead` samples of silence and followed by half a second of silence.
std::vector<float> Play(const std::vector<float>& audio, int repeat, int lead = 3000) {
  std::vector<float> played(lead, 0.0f);
  for (int r = 0; r < repeat; ++r) {
    for (const float s : audio) played.push_back(10000.0f * s);
  }
  played.resize(played.size() + 22050, 0.0f);
  return played;
}

std::vector<float> Noise(int n, uint32_t seed, float rms) {
  std::vector<float> samples(n);
  for (float& s : samples) {
    float sum = 0;
    for (int k = 0; k < 12; ++k) {
      seed = seed * 1664525u + 1013904223u;
      sum += static_cast<float>(seed >> 8) / 16777216.0f - 0.5f;
    }
    s = rms * sum;
  }
  return samples;
}

std::vector<DtmfDecodedToken> Decode(DtmfDecoder* decoder, const std::vector<float>& samples,
                                     size_t chunk) {
  for (size_t i = 0; i < samples.size(); i += chunk) {
    decoder->ProcessSamples(std::vector<float>(
        samples.begin() + i, samples.begin() + std::min(samples.size(), i + chunk)));
  }
  return decoder->GetToken();
}

TEST(DtmfDecoderTest, DecodesCleanTokensWhateverTheChunking) {
  const DtmfEncoder encoder(ProductParams());
  const std::vector<uint8_t> token = {0x10, 0xFF, 0x00, 0x7A, 0xC3};
  std::vector<float> audio;
  encoder.EncodeToken(token, &audio);
  DtmfDecoder decoder(ProductParams());
  EXPECT_EQ(decoder.samples_per_symbol(), kP);
  for (const size_t chunk : {441u, 4096u, 200000u}) {
    decoder.Init(44100.0f, 1);
    EXPECT_FALSE(decoder.has_resampler());
    const std::vector<DtmfDecodedToken> found = Decode(&decoder, Play(audio, 3), chunk);
    ASSERT_FALSE(found.empty()) << chunk;
    EXPECT_EQ(found[0].bytes, token);
    EXPECT_GT(found[0].score, 0.0f);
    for (const DtmfDecodedToken& t : found) EXPECT_EQ(t.bytes.size(), token.size());
  }
  decoder.Init(48000.0f, 2);
  EXPECT_TRUE(decoder.has_resampler());
}

// The tone filters pass one symbol's envelope, 0.594 cycles per symbol
// duration (0.594 x 44100 / 2208 = 11.864 Hz), plus the Doppler shift of the
// highest tone (2489.05 Hz x 1 m/s / 340 m/s = 7.321 Hz). A token is its
// spacer, 8 data symbols and the checksum symbol: 10 x 2208 samples at
// 44.1 kHz, round(10 x 48000 x 2208 / 44100) = 24033 samples at 48 kHz.
TEST(DtmfDecoderTest, FilterBandwidthAndTokenLength) {
  DtmfDecoderParams params = ProductParams();
  DtmfDecoder decoder(params);
  EXPECT_NEAR(decoder.tone_filter_bandwidth(), 11.86386, 1e-4);
  decoder.Init(44100.0f, 1);
  EXPECT_EQ(decoder.token_length_received_samples(), 22080);
  decoder.Init(48000.0f, 2);
  EXPECT_EQ(decoder.token_length_received_samples(), 24033);
  params.max_meters_per_second = 1.0f;
  EXPECT_NEAR(DtmfDecoder(params).tone_filter_bandwidth(), 11.86386 + 7.32075, 1e-4);
}

TEST(DtmfDecoderTest, CustomToneListIsHeard) {
  DtmfEncoderParams params;
  params.append_checksum_symbol = true;
  params.bytes_in_token = 4;
  MakeToneCombinations({600.0f, 750.0f, 900.0f, 1050.0f, 1200.0f, 1400.0f, 1650.0f}, 2, &params);
  const DtmfEncoder encoder(params);
  const std::vector<uint8_t> token = {1, 2, 250, 9};
  std::vector<float> audio;
  encoder.EncodeToken(token, &audio);
  DtmfDecoder decoder{DtmfDecoderParams(params)};
  EXPECT_EQ(decoder.num_frequencies(), 7);
  decoder.Init(44100.0f, 1);
  const std::vector<DtmfDecodedToken> found = Decode(&decoder, Play(audio, 3), 4096);
  ASSERT_FALSE(found.empty());
  EXPECT_EQ(found[0].bytes, token);
}

// Symbols that spell a number beyond 5 bytes (possible: 44^8 > 256^5) are
// not a token, even with a matching checksum; the largest 5-byte token is.
TEST(DtmfDecoderTest, SymbolsBeyondTheByteSpaceAreDropped) {
  const DtmfEncoder encoder(ProductParams());
  auto sound = [&](std::vector<int32_t> symbols) {
    const int32_t checksum = ChecksumSymbol(45, symbols);
    symbols.insert(symbols.begin(), 44);
    symbols.push_back(checksum);
    std::vector<float> audio, frame;
    for (const int32_t s : symbols) {
      encoder.SynthesizeSymbol(s, &frame);
      for (const float x : frame) audio.push_back(0.5f * x);
    }
    DtmfDecoder decoder(ProductParams());
    decoder.Init(44100.0f, 1);
    return Decode(&decoder, Play(audio, 3), 4096);
  };
  const std::vector<uint8_t> largest(5, 0xFF);
  const std::vector<DtmfDecodedToken> valid = sound(encoder.converter().BytesToSymbols(largest));
  ASSERT_FALSE(valid.empty());
  EXPECT_EQ(valid[0].bytes, largest);
  EXPECT_TRUE(sound(std::vector<int32_t>(8, 43)).empty());
}

// Channels are averaged by dividing their sum by the count: with three, a
// product with 1/3 would differ in the last bit of some samples, and so in
// the strengths.
TEST(DtmfDecoderTest, ChannelsAreAveragedAndMonoIsTakenAsItIs) {
  const std::vector<float> a = Noise(5000, 7, 3000.0f), b = Noise(5000, 8, 3000.0f),
                           c = Noise(5000, 9, 3000.0f);
  std::vector<float> stereo, three, mean_of_three;
  for (int i = 0; i < 5000; ++i) {
    stereo.insert(stereo.end(), {2.0f * a[i], 0.0f});
    three.insert(three.end(), {a[i], b[i], c[i]});
    mean_of_three.push_back((a[i] + b[i] + c[i]) / 3.0f);
  }
  DtmfDecoder one(ProductParams()), two(ProductParams()), trio(ProductParams());
  one.Init(44100.0f, 1);
  two.Init(44100.0f, 2);
  trio.Init(44100.0f, 3);
  one.ProcessSamples(a);
  two.ProcessSamples(stereo);
  trio.ProcessSamples(three);
  const float frequency = one.params().tone_frequencies[3];
  ToneStrengthFilter filter(44100.0f, frequency, one.tone_filter_bandwidth(), 16),
      filter_of_mean(44100.0f, frequency, one.tone_filter_bandwidth(), 16);
  std::vector<float> expected, expected_of_mean;
  filter.Process(a, &expected);
  filter_of_mean.Process(mean_of_three, &expected_of_mean);
  EXPECT_EQ(one.tone_strength_buffer_size(), 5000 / 16);
  EXPECT_EQ(one.ToneStrengths(3), expected);
  EXPECT_EQ(two.ToneStrengths(3), expected);
  EXPECT_EQ(trio.ToneStrengths(3), expected_of_mean);
  EXPECT_DEATH(two.ProcessSamples(std::vector<float>(3, 1.0f)),
               "Check failed: received_samples\\.size\\(\\) % num_channels_ == 0");
}

TEST(DtmfDecoderTest, OverlongInputRestartsOnItsTail) {
  DtmfDecoderParams params = ProductParams();
  params.max_buffer_duration_in_seconds = 0.5f;
  DtmfDecoder decoder(params), fresh(params);
  decoder.Init(44100.0f, 1);
  fresh.Init(44100.0f, 1);
  EXPECT_EQ(decoder.max_buffer_size(), 22050);
  const std::vector<float> input = Noise(44100, 3, 1000.0f);
  decoder.ProcessSamples(Noise(10000, 4, 1000.0f));
  // The oscillators run on through a restart: let both have heard as much.
  fresh.ProcessSamples(Noise(10000, 4, 1000.0f));
  fresh.Init(44100.0f, 1);
  base::ScopedLogCapture capture;
  decoder.ProcessSamples(input);
  EXPECT_TRUE(capture.Contains(base::LogSeverity::kWarning,
                               "Input of size 44100 exceeds maximum buffer size 22050, 22050 "
                               "samples skipped, signal may be lost."));
  fresh.ProcessSamples(std::vector<float>(input.begin() + 22050, input.end()));
  EXPECT_EQ(decoder.tone_strength_buffer_size(), 22050 / 16);
  EXPECT_EQ(decoder.ToneStrengths(9), fresh.ToneStrengths(9));
}

// Whatever the block sizes, every tone holds the same number of strengths,
// within the buffer, and history goes in whole symbols.
TEST(DtmfDecoderTest, HistoryStaysBoundedAndDropsWholeSymbols) {
  DtmfDecoderParams params = ProductParams();
  params.max_buffer_duration_in_seconds = 1.0f;
  DtmfDecoder decoder(params);
  decoder.Init(44100.0f, 1);
  int64_t fed = 0;
  uint32_t seed = 5;
  for (int block = 0; block < 60; ++block) {
    seed = seed * 1664525u + 1013904223u;
    const int size = 1 + static_cast<int>(seed >> 19);  // Up to 8192.
    decoder.ProcessSamples(Noise(size, seed, 500.0f));
    fed += size;
    const int held = decoder.tone_strength_buffer_size();
    for (int tone = 0; tone < 10; ++tone) ASSERT_EQ(decoder.ToneStrengths(tone).size(), held);
    ASSERT_LE(held * 16, decoder.max_buffer_size());
    ASSERT_EQ((fed / 16 - held) % kP, 0) << "block " << block;
  }
  EXPECT_GT(fed / 16, decoder.tone_strength_buffer_size());
}

// Requests bring the normalised strengths and acquisition scores kept
// between them up to date, new times and (after the history moved) the
// oldest ones: they equal the whole history's, computed afresh.
TEST(DtmfDecoderTest, ScoresKeptBetweenRequestsEqualTheWholeHistorys) {
  DtmfDecoderParams params = ProductParams();
  params.max_buffer_duration_in_seconds = 1.0f;
  DtmfDecoder decoder(params);
  decoder.Init(44100.0f, 1);
  const DtmfEncoder encoder(params);
  std::vector<float> token;
  encoder.EncodeToken({7, 6, 5, 4, 3}, &token);
  std::vector<float> audio = Play(token, 6);
  const std::vector<float> noise = Noise(static_cast<int>(audio.size()), 8, 300.0f);
  for (size_t i = 0; i < audio.size(); ++i) audio[i] += noise[i];
  const DtmfDecoderParams::ToneNormalizationParams& normalization =
      params.tone_normalization_params;
  const int window = static_cast<int>(kP * normalization.window_size);
  int requests = 0;
  for (size_t start = 0, block = 0; start < audio.size(); start += 3000, ++block) {
    decoder.ProcessSamples(std::vector<float>(
        audio.begin() + start, audio.begin() + std::min(audio.size(), start + 3000)));
    if (block % 3 != 2) continue;
    decoder.GetToken();
    ++requests;
    // The normalisation from scratch: running maxima, the strongest of them,
    // each strength over its divisor.
    const int n = decoder.tone_strength_buffer_size();
    std::vector<std::vector<float>> maxima(10, std::vector<float>(n));
    std::vector<float> strongest(n, 0.0f);
    for (int tone = 0; tone < 10; ++tone) {
      audio_dsp::MaxFilter(decoder.ToneStrengths(tone).data(), n, window, maxima[tone].data());
      for (int t = 0; t < n; ++t) {
        strongest[t] = tone == 0 ? maxima[0][t] : std::max(strongest[t], maxima[tone][t]);
      }
    }
    audio_dsp::MatrixXf tones;
    decoder.NormalizeToneStrengths(&tones);
    ASSERT_EQ(tones.cols(), n);
    for (int tone = 0; tone < 10; ++tone) {
      const std::vector<float> strengths = decoder.ToneStrengths(tone);
      for (int t = 0; t < n; ++t) {
        const float x = maxima[tone][t];
        ASSERT_EQ(tones(tone, t),
                  strengths[t] / ((strongest[t] - x) * normalization.cross_frequency_weight + x +
                                  normalization.division_floor))
            << "request " << requests << " tone " << tone << " time " << t;
      }
    }
    std::vector<float> acquisition;
    decoder.ComputeAcquisitionScores(tones, &acquisition);
    ASSERT_EQ(decoder.last_acquisition_scores(), acquisition) << "request " << requests;
  }
  EXPECT_GT(requests, 15);
  EXPECT_GT(decoder.tone_strength_buffer_size(), 0);
}

TEST(DtmfDecoderTest, ShortNoiseVectorBecomesItsMeanAndLongOneIsAligned) {
  DtmfDecoder decoder(ProductParams());
  // Order 2, stddev 2 symbols: a delay of about 2 x 194 baseband samples.
  std::vector<float> short_noise = {1.0f, 2.0f, 6.0f};
  decoder.SmoothNoiseEstimate(&short_noise);
  EXPECT_EQ(short_noise, std::vector<float>(3, 3.0f));
  std::vector<float> step(4000, 1.0f);
  std::fill(step.begin() + 2000, step.end(), 3.0f);
  decoder.SmoothNoiseEstimate(&step);
  EXPECT_NEAR(step[0], 1.0f, 1e-5);     // Starts at the head mean, no ramp from 0.
  EXPECT_NEAR(step[3999], 3.0f, 1e-3);  // Ends at the tail mean.
  EXPECT_NEAR(step[1000], 1.0f, 0.02);
  EXPECT_NEAR(step[3000], 3.0f, 0.02);
  // Delay removed: the step's middle lands near sample 2000, not 400 later.
  EXPECT_GT(step[2000], 1.8f);
  EXPECT_LT(step[2000], 2.4f);
}

// The smoother's delay with the defaults: sigma = 2 x 138 = 276 baseband
// samples over 2 stages gives the pole a = 0.9948891 (v = 276^2 / 2, a = (1 -
// sqrt(4v + 1)) / 2v + 1) and the delay round(2a / (1 - a)) = round(389.32) =
// 389. An impulse at 1000 then comes out from 1000 - 389 = 611 on, as the
// two-stage response (1 - a)^2 (m + 1) a^m.
TEST(DtmfDecoderTest, SmootherMovesAnImpulseBackByItsDelay) {
  DtmfDecoder decoder(ProductParams());
  std::vector<float> noise(3000, 0.0f);
  noise[1000] = 1.0f;
  decoder.SmoothNoiseEstimate(&noise);
  const double a = 0.9948891485, g = 1.0 - a;
  EXPECT_EQ(noise[610], 0.0f);
  for (const int m : {0, 1, 100, 194, 389, 1000}) {
    const double expected = g * g * (m + 1) * std::pow(a, m);
    EXPECT_NEAR(noise[611 + m], expected, 1e-4 * expected) << m;
  }
}

// The ends: the filter starts from the mean of the first delay values (fed
// through it first) and is run out on the mean of the last delay values;
// written here as one filter pass over the input with the tail mean
// appended, read from the delay on.
TEST(DtmfDecoderTest, SmootherPadsWithTheMeansOfItsEnds) {
  DtmfDecoder decoder(ProductParams());
  const int delay = 389, n = 1000;
  std::vector<float> noise(n);
  uint32_t seed = 11;
  for (float& x : noise) {
    seed = seed * 1664525u + 1013904223u;
    x = 1.0f + static_cast<float>(seed >> 8) / 16777216.0f;
  }
  double head = 0.0, tail = 0.0;
  for (int k = 0; k < delay; ++k) {
    head += noise[k];
    tail += noise[n - delay + k];
  }
  std::vector<float> padded = noise;
  padded.resize(n + delay, static_cast<float>(tail / delay));
  audio_dsp::GammaFilter filter =
      audio_dsp::GammaFilterFromStddev(decoder.baseband_sample_rate(), 2, 2.0 * kP);
  ASSERT_EQ(filter.Delay(), delay);
  filter.Reset(static_cast<float>(head / delay));
  std::vector<float> expected;
  for (int k = 0; k < n + delay; ++k) {
    const float y = filter.Step(padded[k]);
    if (k >= delay) expected.push_back(y);
  }
  decoder.SmoothNoiseEstimate(&noise);
  for (int k = 0; k < n; ++k) ASSERT_NEAR(noise[k], expected[k], 1e-6) << k;
}

// Ten tones at three times, by hand. The peak is the second largest value
// (tones_per_symbol = 2; ties count twice) and the noise the mean of the
// eight below it: (9, 4.5), (7, 2.6875), (2.25, 1.125). Three times are fewer
// than the smoother's delay, so the noise becomes its mean, 8.3125 / 3.
TEST(DtmfDecoderTest, AcquisitionScoreIsSecondLargestOverTheMeanOfTheRest) {
  DtmfDecoder decoder(ProductParams());
  decoder.Init(44100.0f, 1);
  decoder.ProcessSamples(std::vector<float>(3 * 16, 0.0f));
  ASSERT_EQ(decoder.tone_strength_buffer_size(), 3);
  const float columns[3][10] = {{1, 2, 3, 4, 5, 6, 7, 8, 9, 10},
                                {5, 0.5f, 7, 3, 7, 1, 2, 0, 4, 6},
                                {0.25f, 8, 0.5f, 0.75f, 1, 1.25f, 1.5f, 1.75f, 2, 2.25f}};
  audio_dsp::MatrixXf tones(10, 3);
  for (int t = 0; t < 3; ++t) {
    for (int i = 0; i < 10; ++i) tones(i, t) = columns[t][i];
  }
  std::vector<float> acquisition;
  decoder.ComputeAcquisitionScores(tones, &acquisition);
  const double noise = 8.3125 / 3;
  ASSERT_EQ(acquisition.size(), 3u);
  EXPECT_FLOAT_EQ(acquisition[0], 9 / noise);
  EXPECT_FLOAT_EQ(acquisition[1], 7 / noise);
  EXPECT_FLOAT_EQ(acquisition[2], 2.25 / noise);
}

TEST(DtmfDecoderTest, StartOffsetIsThePositionOfThePeakInsideASymbol) {
  const DtmfDecoder decoder(ProductParams());
  for (const int peak : {5, kP - 1, 0}) {
    std::vector<float> scores(5 * kP + 7, 0.1f);
    for (int j = 0; j < 5; ++j) scores[j * kP + peak] = 4.0f;
    scores[5 * kP + 3] = 1000.0f;  // The partial symbol at the end is not used.
    EXPECT_EQ(decoder.ComputeStartOffset(scores), peak);
  }
}

// Candidates on the grid start + jP are keyed by j; the first and the last
// are judged alone, the others with both neighbours.
TEST(DtmfDecoderTest, CandidatesAreKeyedBySymbolAndEndsStandAlone) {
  DtmfDecoder decoder(ProductParams());
  decoder.Init(44100.0f, 1);
  decoder.ProcessSamples(std::vector<float>(5 * kP * 16, 0.0f));
  ASSERT_EQ(decoder.tone_strength_buffer_size(), 5 * kP);
  audio_dsp::MatrixXf tones(10, 5 * kP);
  for (int t = 0; t < 5 * kP; ++t) {
    for (int i = 0; i < 10; ++i) tones(i, t) = static_cast<float>(i + 1);
  }
  std::vector<float> acquisition(5 * kP, 0.0f);
  // Grid 5, 143, 281, 419, 557: 143 lacks its neighbour at 5, 281 and 419
  // have theirs, 557 is within a symbol of the end.
  acquisition[5 + kP] = acquisition[5 + 2 * kP] = acquisition[5 + 3 * kP] = 3.0f;
  acquisition[5 + 4 * kP] = 3.0f;
  std::map<int, std::vector<float>> candidates;
  decoder.FindCandidates(tones, acquisition, 5, &candidates);
  std::vector<int> keys;
  for (const auto& entry : candidates) keys.push_back(entry.first);
  EXPECT_EQ(keys, (std::vector<int>{2, 3, 4}));
  acquisition[5] = 3.0f;  // Alone at the start; now 143 is supported too.
  decoder.FindCandidates(tones, acquisition, 5, &candidates);
  ASSERT_EQ(candidates.size(), 5u);
  // A symbol scores as its weakest tone: {0, 1} -> 1, {8, 9} -> 9.
  EXPECT_EQ(candidates[0].size(), 45u);
  EXPECT_EQ(candidates[0][0], 1.0f);
  EXPECT_EQ(candidates[0][44], 9.0f);
  // From start 0 the grid point P is still within a symbol of the start and
  // 4P within one of the end (4P + P = n): both stand alone.
  std::fill(acquisition.begin(), acquisition.end(), 0.0f);
  acquisition[kP] = acquisition[4 * kP] = 3.0f;
  decoder.FindCandidates(tones, acquisition, 0, &candidates);
  keys.clear();
  for (const auto& entry : candidates) keys.push_back(entry.first);
  EXPECT_EQ(keys, (std::vector<int>{1, 4}));
  EXPECT_DEATH(decoder.FindCandidates(tones, std::vector<float>(3), 5, &candidates),
               "Check failed: acquisition_scores\\.size\\(\\) == tone_strength_buffer_size_");
}

// Digital silence scores 0, not NaN, thanks to the division floor; a
// running maximum of zero width is widened to one sample.
TEST(DtmfDecoderTest, SilenceAndDegenerateWindowStayFinite) {
  DtmfDecoderParams params = ProductParams();
  params.tone_normalization_params.window_size = 0.0f;
  for (const DtmfDecoderParams& p : {ProductParams(), params}) {
    DtmfDecoder decoder(p);
    decoder.Init(44100.0f, 1);
    decoder.ProcessSamples(std::vector<float>(44100, 0.0f));
    audio_dsp::MatrixXf tones;
    std::vector<float> acquisition;
    decoder.NormalizeToneStrengths(&tones);
    decoder.ComputeAcquisitionScores(tones, &acquisition);
    ASSERT_EQ(acquisition.size(), 44100u / 16);
    for (const float a : acquisition) ASSERT_TRUE(std::isfinite(a));
    EXPECT_TRUE(decoder.GetToken().empty());
  }
}

TEST(DtmfDecoderTest, CallsBeforeInitAreLoggedAndIgnored) {
  DtmfDecoder decoder(ProductParams());
  base::ScopedLogCapture capture;
  decoder.ProcessSamples({1.0f, 2.0f});
  EXPECT_TRUE(decoder.GetToken().empty());
  decoder.Reset();  // Nothing to restart yet.
  EXPECT_EQ(capture.Messages(base::LogSeverity::kError),
            (std::vector<std::string>{"ProcessSamples() called before call to Init().",
                                      "GetToken() called before call to Init()."}));
  EXPECT_FALSE(decoder.initialized());
}

// Every receiver field's range, in the order checked; the transmitter's
// checks come first.
TEST(DtmfDecoderDeathTest, ChecksRejectBadParametersAndRates) {
  using Params = DtmfDecoderParams;
  const std::vector<std::pair<void (*)(Params*), const char*>> cases = {
      {[](Params* p) { p->max_meters_per_second = -1; }, "params\\.max_meters_per_second >= 0\\.0"},
      {[](Params* p) { p->max_buffer_duration_in_seconds = 0; },
       "params\\.max_buffer_duration_in_seconds > 0\\.0"},
      {[](Params* p) { p->tone_normalization_params.window_size = -1; },
       "params\\.tone_normalization_params\\.window_size >= 0\\.0"},
      {[](Params* p) { p->tone_normalization_params.cross_frequency_weight = -1; },
       "params\\.tone_normalization_params\\.cross_frequency_weight >= 0\\.0"},
      {[](Params* p) { p->tone_normalization_params.division_floor = -1; },
       "params\\.tone_normalization_params\\.division_floor >= 0\\.0"},
      {[](Params* p) { p->noise_estimate_filter_order = 0; },
       "params\\.noise_estimate_filter_order > 0"},
      {[](Params* p) { p->noise_estimate_filter_stddev = 0; },
       "params\\.noise_estimate_filter_stddev > 0\\.0"},
      {[](Params* p) { p->acquisition_threshold = -1; }, "params\\.acquisition_threshold >= 0\\.0"},
      {[](Params* p) { p->max_candidates_rank = 0; }, "params\\.max_candidates_rank > 0"},
      {[](Params* p) { p->max_candidates_per_decode_token_call = 0; },
       "params\\.max_candidates_per_decode_token_call > 0"},
      {[](Params* p) { p->token_threshold_factor = -1; }, "params\\.token_threshold_factor >= 0"},
      {[](Params* p) {
         p->sample_rate = 0;
         p->max_buffer_duration_in_seconds = 0;
       },
       "params\\.sample_rate > 0\\.0f"},
  };
  for (const auto& [spoil, text] : cases) {
    Params params = ProductParams();
    spoil(&params);
    EXPECT_DEATH(DtmfDecoder{params}, std::string("Check failed: ") + text) << text;
  }
  DtmfDecoder decoder(ProductParams());
  EXPECT_DEATH(decoder.Init(0.0f, 1), "Check failed: received_sample_rate > 0\\.0");
  EXPECT_DEATH(decoder.Init(44100.0f, 0), "Check failed: num_channels >= 1");
}

}  // namespace
}  // namespace audio_vesknet
