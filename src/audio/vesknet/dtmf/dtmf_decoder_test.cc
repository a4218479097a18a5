#include "audio/vesknet/dtmf/dtmf_decoder.h"

#include <algorithm>
#include <cmath>
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

TEST(DtmfDecoderTest, ChannelsAreAveragedAndMonoIsTakenAsItIs) {
  const std::vector<float> mono = Noise(5000, 7, 3000.0f);
  std::vector<float> stereo;
  for (const float x : mono) stereo.insert(stereo.end(), {2.0f * x, 0.0f});
  DtmfDecoder one(ProductParams()), two(ProductParams());
  one.Init(44100.0f, 1);
  two.Init(44100.0f, 2);
  one.ProcessSamples(mono);
  two.ProcessSamples(stereo);
  ToneStrengthFilter filter(44100.0f, one.params().tone_frequencies[3], one.tone_filter_bandwidth(),
                            16);
  std::vector<float> expected;
  filter.Process(mono, &expected);
  EXPECT_EQ(one.tone_strength_buffer_size(), 5000 / 16);
  EXPECT_EQ(one.ToneStrengths(3), expected);
  EXPECT_EQ(two.ToneStrengths(3), expected);
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

TEST(DtmfDecoderDeathTest, ChecksRejectBadParametersAndRates) {
  DtmfDecoderParams params = ProductParams();
  params.tone_normalization_params.division_floor = -1.0f;
  EXPECT_DEATH(DtmfDecoder{params},
               "Check failed: params\\.tone_normalization_params\\.division_floor >= 0\\.0");
  params = ProductParams();
  params.max_candidates_per_decode_token_call = 0;
  EXPECT_DEATH(DtmfDecoder{params},
               "Check failed: params\\.max_candidates_per_decode_token_call > 0");
  params = ProductParams();
  params.sample_rate = 0.0f;  // The transmitter's checks come first.
  params.max_buffer_duration_in_seconds = 0.0f;
  EXPECT_DEATH(DtmfDecoder{params}, "Check failed: params\\.sample_rate > 0\\.0f");
  DtmfDecoder decoder(ProductParams());
  EXPECT_DEATH(decoder.Init(0.0f, 1), "Check failed: received_sample_rate > 0\\.0");
  EXPECT_DEATH(decoder.Init(44100.0f, 0), "Check failed: num_channels >= 1");
}

}  // namespace
}  // namespace audio_vesknet
