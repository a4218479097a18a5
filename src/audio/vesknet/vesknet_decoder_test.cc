#include "audio/vesknet/vesknet_decoder.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <memory>
#include <random>
#include <vector>

#include "audio/dsp/box_filter.h"
#include "audio/vesknet/vesknet_encoder.h"
#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

SymbolWaveCoderParams Coder48k() {
  SymbolWaveCoderParams params;
  params.sample_rate = 48000;
  params.upsampling_factor = 16;
  params.baseband_decimation_factor = 4;
  return params;
}

const std::vector<uint8_t> kToken = {0xC0, 0xFF, 0xEE, 0x12, 0x34, 0x56, 0x78, 0x9A};

// The token played three times after some silence, in the 16-bit range.
std::vector<float> Transmission(const SymbolWaveCoderParams& coder_params, float rate) {
  VesknetEncoderParams params;
  params.broadcast_sample_rate = rate;
  const VesknetEncoder encoder(std::make_unique<SymbolWaveCoder>(coder_params), params);
  std::vector<float> token;
  EXPECT_TRUE(encoder.EncodeToken(kToken, &token));
  std::vector<float> audio(static_cast<size_t>(0.3 * rate), 0.0f);
  for (int r = 0; r < 3; ++r) {
    for (float s : token) audio.push_back(32768.0f * s);
  }
  audio.resize(audio.size() + static_cast<size_t>(0.3 * rate), 0.0f);
  return audio;
}

VesknetDecoderParams Params(const SymbolWaveCoder& coder) {
  VesknetDecoderParams params;
  params.max_buffer_duration = 4 * 16 * coder.frame_size() / coder.params().sample_rate;
  return params;
}

void Feed(VesknetDecoder* decoder, const std::vector<float>& audio, size_t block) {
  for (size_t start = 0; start < audio.size(); start += block) {
    decoder->ProcessSamples(std::vector<float>(
        audio.begin() + start, audio.begin() + std::min(audio.size(), start + block)));
  }
}

TEST(VesknetDecoderTest, GeometryOfBothCoders) {
  const SymbolWaveCoder coder44((SymbolWaveCoderParams()));
  const VesknetDecoder decoder44(&coder44, VesknetDecoderParams());
  EXPECT_EQ(decoder44.baseband_frame_size(), 635);
  EXPECT_FLOAT_EQ(decoder44.baseband_sample_rate(), 14700.0f);
  // The largest shift (1.2 m/s: 2.8 cycles per frame) turns a chunk of 15
  // samples by at most a sixteenth of a cycle.
  EXPECT_EQ(decoder44.chunk_length(), 15);
  EXPECT_EQ(decoder44.extended_size() % 15, 0);
  EXPECT_GE(decoder44.extended_size(), 635 + 2 * 318);
  EXPECT_EQ(decoder44.left_extension(), (decoder44.extended_size() - 635) / 2);

  const SymbolWaveCoder coder48(Coder48k());
  const VesknetDecoder decoder48(&coder48, VesknetDecoderParams());
  EXPECT_EQ(decoder48.baseband_frame_size(), 508);
  EXPECT_EQ(decoder48.chunk_length(), 12);
}

TEST(VesknetDecoderTest, DecodesCleanTokensOfBothCoders) {
  for (const SymbolWaveCoderParams& coder_params : {SymbolWaveCoderParams(), Coder48k()}) {
    for (const float rate : {44100.0f, 48000.0f}) {
      const SymbolWaveCoder coder(coder_params);
      VesknetDecoder decoder(&coder, Params(coder));
      decoder.Initialize(rate, 1);
      Feed(&decoder, Transmission(coder_params, rate), 2048);
      EXPECT_TRUE(decoder.DetectBroadcaster());
      VesknetDecodeResults results;
      ASSERT_TRUE(decoder.GetToken(&results)) << coder.frame_size() << " at " << rate;
      EXPECT_EQ(results.token_candidates[0].bytes, kToken);
      EXPECT_EQ(results.scores_table.rows(), 17);
      EXPECT_EQ(results.scores_table.cols(), 17);
      // The chosen group's frames lie one frame apart (give or take a sample).
      const float frame_s = coder.frame_size() / coder.params().sample_rate;
      ASSERT_GE(results.frame_times.size(), 17u);
      for (size_t i = 1; i < results.frame_times.size(); ++i) {
        const float gap = results.frame_times[i] - results.frame_times[i - 1];
        EXPECT_NEAR(gap / frame_s, std::round(gap / frame_s), 0.02);
      }
      EXPECT_EQ(results.frame_times.size(), results.frame_scores.size());
    }
  }
}

// The smoothed scores, brought up to date request by request, are the box
// sums of the whole score history (along each frame and across successive
// frames, small ones set to 0), also while old history is being dropped.
TEST(VesknetDecoderTest, SmoothedScoresFollowTheWholeHistory) {
  const SymbolWaveCoder coder(Coder48k());
  VesknetDecoderParams params = Params(coder);
  params.max_buffer_duration /= 2;       // Two tokens: the history moves.
  params.score_threshold_factor = 0.5f;  // Noise too stands above it.
  VesknetDecoder decoder(&coder, params);
  decoder.Initialize(44100, 1);
  std::vector<float> audio = Transmission(Coder48k(), 44100);
  std::mt19937 rng(3);
  std::normal_distribution<float> noise(0.0f, 3000.0f);
  for (float& sample : audio) sample += noise(rng);
  const float threshold =
      params.score_filter_length * params.score_filter_count * params.score_threshold_factor;
  int requests = 0, positive = 0;
  for (size_t start = 0, block = 0; start < audio.size(); start += 2048, ++block) {
    decoder.ProcessSamples(std::vector<float>(
        audio.begin() + start, audio.begin() + std::min(audio.size(), start + 2048)));
    if (block % 5 != 4) continue;
    VesknetDecodeResults results;
    decoder.GetToken(&results);
    ++requests;
    const StreamBuffer<float>& scores = decoder.acquisition_scores();
    std::vector<float> expected;
    audio_dsp::BoxFilter2D(std::vector<float>(scores.data(), scores.data() + scores.size()),
                           decoder.baseband_frame_size(), params.score_filter_length,
                           params.score_filter_count, /*allow_ragged=*/true, &expected);
    for (float& value : expected) {
      if (value < threshold) value = 0.0f;
    }
    const StreamBuffer<float>& smoothed = decoder.smoothed_scores();
    ASSERT_EQ(std::vector<float>(smoothed.data(), smoothed.data() + smoothed.size()), expected)
        << "request " << requests;
    positive += std::count_if(expected.begin(), expected.end(), [](float v) { return v > 0; });
  }
  EXPECT_GT(decoder.acquisition_scores().dropped(), 0);
  EXPECT_GT(requests, 10);
  EXPECT_GT(positive, 1000);
}

// With two channels the decoder hears their plain sum.
TEST(VesknetDecoderTest, ChannelsAreSummed) {
  const SymbolWaveCoder coder(Coder48k());
  const std::vector<float> mono = Transmission(Coder48k(), 48000);
  std::vector<float> stereo;
  for (float s : mono) {
    stereo.push_back(0.25f * s);
    stereo.push_back(0.75f * s);
  }
  VesknetDecoder one(&coder, Params(coder)), two(&coder, Params(coder));
  one.Initialize(48000, 1);
  two.Initialize(48000, 2);
  Feed(&one, mono, 4096);
  Feed(&two, stereo, 8192);
  VesknetDecodeResults a, b;
  ASSERT_TRUE(one.GetToken(&a));
  ASSERT_TRUE(two.GetToken(&b));
  EXPECT_EQ(a.frame_times, b.frame_times);
  EXPECT_EQ(a.token_candidates[0].bytes, b.token_candidates[0].bytes);
}

TEST(VesknetDecoderTest, SymbolScoresFindTheSymbolUnderDopplerAndPhase) {
  const SymbolWaveCoder coder((SymbolWaveCoderParams()));
  const VesknetDecoder decoder(&coder, VesknetDecoderParams());
  const int f = decoder.baseband_frame_size();
  const int n = decoder.extended_size();
  const std::vector<float>& code = coder.baseband_code();
  for (int symbol : {0, 7, 16}) {
    // Despread reference times the pedestal plus the symbol's tone, turned by
    // 1.3 cycles per frame and an arbitrary phase.
    std::vector<float> real(n), imag(n);
    for (int i = 0; i < n; ++i) {
      const int k = ((i - decoder.left_extension()) % f + f) % f;
      const double envelope = code[k] * (1.0 + coder.baseband_tones()(symbol, k));
      const double phase = 2 * M_PI * 1.3 * i / f + 2.1;
      real[i] = static_cast<float>(envelope * std::cos(phase));
      imag[i] = static_cast<float>(envelope * std::sin(phase));
    }
    std::vector<float> scores;
    decoder.ScoreSymbols(real, imag, &scores);
    ASSERT_EQ(scores.size(), 17u);
    EXPECT_EQ(std::max_element(scores.begin(), scores.end()) - scores.begin(), symbol);
  }
}

TEST(VesknetDecoderTest, OverlongInputRestartsOnItsTail) {
  const SymbolWaveCoder coder(Coder48k());
  VesknetDecoder decoder(&coder, Params(coder));
  decoder.Initialize(48000, 1);
  const std::vector<float> audio = Transmission(Coder48k(), 48000);
  base::ScopedLogCapture capture;
  // Far more than the buffer in one block: the restart keeps only the last
  // max_buffer_size samples, which still hold the token.
  std::vector<float> long_block(5 * decoder.max_buffer_size(), 0.0f);
  long_block.insert(long_block.end(), audio.begin(), audio.end());
  decoder.ProcessSamples(long_block);
  EXPECT_TRUE(
      capture.Contains(base::LogSeverity::kWarning,
                       "exceeds maximum buffer size " + std::to_string(decoder.max_buffer_size())));
  EXPECT_LE(decoder.buffered_input_frames(), decoder.max_buffer_size() + 8);
  VesknetDecodeResults results;
  EXPECT_TRUE(decoder.GetToken(&results));
}

TEST(VesknetDecoderTest, NeutralAnswersBeforeInitialize) {
  const SymbolWaveCoder coder(Coder48k());
  VesknetDecoder decoder(&coder, VesknetDecoderParams());
  base::ScopedLogCapture capture;
  decoder.ProcessSamples({1, 2, 3});
  EXPECT_FALSE(decoder.DetectBroadcaster());
  EXPECT_EQ(decoder.GetSignalScore(), 0.0f);
  VesknetDecodeResults results;
  EXPECT_FALSE(decoder.GetToken(&results));
  EXPECT_TRUE(decoder.GetReceivedSamples().empty());
  EXPECT_EQ(capture.Messages(base::LogSeverity::kError),
            (std::vector<std::string>{
                "ProcessSamples() called before call to Initialize().",
                "DetectBroadcaster() called before call to Initialize().",
                "GetSignalScore called before call to Initialize().",
                "GetToken() called before call to Initialize().",
                "GetReceivedSamples() called but save_received_samples is false."}));
}

TEST(VesknetDecoderTest, SavesTheLastThirtySeconds) {
  const SymbolWaveCoder coder(Coder48k());
  VesknetDecoderParams params = Params(coder);
  params.save_received_samples = true;
  VesknetDecoder decoder(&coder, params);
  decoder.Initialize(44100, 1);
  decoder.ProcessSamples({});  // Nothing happens.
  std::vector<float> second(44100);
  for (int s = 0; s < 40; ++s) {
    std::fill(second.begin(), second.end(), static_cast<float>(s));
    decoder.ProcessSamples(second);
  }
  const std::vector<float> saved = decoder.GetReceivedSamples();
  ASSERT_EQ(saved.size(), 1323000u);
  EXPECT_EQ(saved.front(), 10.0f);  // Seconds 10 to 39.
  EXPECT_EQ(saved.back(), 39.0f);
}

TEST(VesknetDecoderDeathTest, ChecksItsInputs) {
  const SymbolWaveCoder coder(Coder48k());
  EXPECT_DEATH(VesknetDecoder(static_cast<const SymbolWaveCoder*>(nullptr), VesknetDecoderParams()),
               "Check failed: symbol_wave_coder");
  VesknetDecoder decoder(&coder, VesknetDecoderParams());
  decoder.Initialize(44100, 2);
  EXPECT_DEATH(decoder.ProcessSamples({1, 2, 3}),
               "Check failed: received_samples.size\\(\\) % num_channels_ == 0");
  EXPECT_DEATH(decoder.GetToken(nullptr), "Check failed: results");
  EXPECT_DEATH(decoder.Initialize(-5, 1), "Check failed: sample_rate > 0\\.0");
  EXPECT_DEATH(decoder.Initialize(std::nanf(""), 1), "Check failed: sample_rate > 0\\.0");
  EXPECT_DEATH(decoder.Initialize(44100, 0), "Check failed: num_channels >= 1");
  // Positive, but 2^16 times the baseband rate or more: no resampler.
  EXPECT_DEATH(decoder.Initialize(1e9f, 1),
               "Check failed: baseband_resampler_->Valid\\(\\) Failed to "
               "initialize RationalFactorResampler.");
}

}  // namespace
}  // namespace audio_vesknet
