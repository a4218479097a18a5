#include "tools/common/stream_decoding.h"

#include <cstdint>
#include <memory>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "gtest/gtest.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"

namespace vesk_tool {
namespace {

const std::vector<uint8_t> kMessage = {1, 2, 3, 4, 5, 6};

// The product transmitter's token (start transition, then the token
// `repeat` times, `gap_s` of silence between repetitions) as 48 kHz PCM.
std::vector<int16_t> ProductToken(int repeat, double gap_s = 0.0) {
  const auto encoder = audio_modem::MakeDsssAudioModemEncoder(audio_modem::DsssEncoderConfig());
  std::vector<float> token, played;
  encoder->Encode(kMessage, &token, 2);
  encoder->MakeStartTransition(token, &played);
  for (int r = 0; r < repeat; ++r) {
    if (r > 0) played.resize(played.size() + static_cast<size_t>(gap_s * 48000), 0.0f);
    played.insert(played.end(), token.begin(), token.end());
  }
  std::vector<int16_t> pcm;
  for (const float s : played) pcm.push_back(audio_dsp::FloatToPcm16(s));
  return pcm;
}

std::unique_ptr<audio_modem::AudioModemDecoder> Decoder() {
  audio_modem::DsssDecoderConfig config;
  config.input_sample_rate = 48000;
  return audio_modem::MakeDsssAudioModemDecoder(config);
}

TEST(StreamDecodingTest, FinishReportsATokenThatEndsWithTheInput) {
  const std::vector<int16_t> pcm = ProductToken(1);
  const auto decoder = Decoder();
  StreamDecoder stream(decoder.get(), 48000, 1, 6, 2, StreamDecodingOptions());
  // Without audio after it, the decoder cannot report the token yet.
  EXPECT_TRUE(stream.Feed(pcm.data(), static_cast<int64_t>(pcm.size())).empty());
  const double length_s = pcm.size() / 48000.0;
  EXPECT_DOUBLE_EQ(stream.time_s(), length_s);
  const std::vector<FoundToken> found = stream.Finish();
  ASSERT_EQ(found.size(), 1u);
  EXPECT_EQ(found[0].bytes, kMessage);
  EXPECT_DOUBLE_EQ(found[0].time_s, length_s);
  EXPECT_DOUBLE_EQ(stream.time_s(), length_s);
}

TEST(StreamDecodingTest, ARepeatedTokenIsReportedOncePerSighting) {
  // Back to back: one report.
  std::vector<int16_t> pcm = ProductToken(3);
  auto decoder = Decoder();
  StreamDecoder together(decoder.get(), 48000, 1, 6, 2, StreamDecodingOptions());
  std::vector<FoundToken> found = together.Feed(pcm.data(), static_cast<int64_t>(pcm.size()));
  for (const FoundToken& token : together.Finish()) found.push_back(token);
  EXPECT_EQ(found.size(), 1u);
  // Apart by longer than the hold: reported again.
  StreamDecodingOptions options;
  options.repeat_hold_s = 1.0;
  pcm = ProductToken(2, 2.5);
  decoder = Decoder();
  StreamDecoder apart(decoder.get(), 48000, 1, 6, 2, options);
  found = apart.Feed(pcm.data(), static_cast<int64_t>(pcm.size()));
  for (const FoundToken& token : apart.Finish()) found.push_back(token);
  ASSERT_EQ(found.size(), 2u);
  EXPECT_EQ(found[0].bytes, kMessage);
  EXPECT_EQ(found[1].bytes, kMessage);
  EXPECT_GT(found[1].time_s - found[0].time_s, 2.5);
}

// A whole stream through a fresh decoder, and what it found.
struct StreamRun {
  std::unique_ptr<audio_modem::AudioModemDecoder> decoder;
  std::unique_ptr<StreamDecoder> stream;
  std::vector<FoundToken> found;
};
StreamRun Decode(const std::vector<int16_t>& pcm, const StreamDecodingOptions& options) {
  StreamRun run;
  run.decoder = Decoder();
  run.stream = std::make_unique<StreamDecoder>(run.decoder.get(), 48000, 1, 6, 2, options);
  run.found = run.stream->Feed(pcm.data(), static_cast<int64_t>(pcm.size()));
  for (const FoundToken& token : run.stream->Finish()) run.found.push_back(token);
  return run;
}

TEST(StreamDecodingTest, BroadcasterAnswersOnlyWhenAsked) {
  const std::vector<int16_t> pcm = ProductToken(3);
  StreamDecodingOptions options;
  const StreamRun asking = Decode(pcm, options);
  options.detect_broadcaster = false;
  const StreamRun silent = Decode(pcm, options);
  // One answer per request: every 0.25 s of the input and the flush, and one
  // more at the end.
  const int requests =
      static_cast<int>((pcm.size() / 48000.0 + StreamDecoder::kFlushSeconds) / 0.25) + 1;
  EXPECT_EQ(asking.stream->broadcaster_answers(), requests);
  EXPECT_GT(asking.stream->positive_broadcaster_answers(), 0);
  EXPECT_GE(asking.stream->broadcaster_time_s(), 0.0);
  EXPECT_EQ(silent.stream->broadcaster_answers(), 0);
  EXPECT_EQ(silent.stream->positive_broadcaster_answers(), 0);
  EXPECT_EQ(silent.stream->broadcaster_time_s(), -1.0);
  // The tokens do not depend on it.
  ASSERT_EQ(asking.found.size(), 1u);
  ASSERT_EQ(silent.found.size(), 1u);
  EXPECT_EQ(silent.found[0].bytes, asking.found[0].bytes);
  EXPECT_EQ(silent.found[0].time_s, asking.found[0].time_s);
}

}  // namespace
}  // namespace vesk_tool
