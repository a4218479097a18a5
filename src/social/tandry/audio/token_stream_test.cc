#include "social/tandry/audio/token_stream.h"

#include <cmath>
#include <cstdint>
#include <limits>
#include <string>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "gtest/gtest.h"
#include "social/tandry/audio/audio_modem_encoder.h"

namespace audio_modem {
namespace {

const std::vector<uint8_t> kMessage = {0x01, 0x23, 0x45, 0x67, 0x89, 0xAB};
const std::vector<uint8_t> kOther = {0xFE, 0xDC, 0xBA, 0x98, 0x76, 0x54};
constexpr int kRate = 48000;

// One repetition of the product token carrying `message` and its CRC, as
// 16-bit samples at 48 kHz.
std::vector<int16_t> TokenAudio(const std::vector<uint8_t>& message) {
  std::vector<float> audio;
  MakeDsssAudioModemEncoder(DsssEncoderConfig())->Encode(message, &audio, 2);
  std::vector<int16_t> pcm;
  for (const float s : audio) pcm.push_back(audio_dsp::FloatToPcm16(s));
  return pcm;
}

void AppendSilence(double seconds, std::vector<int16_t>* pcm) {
  pcm->resize(pcm->size() + static_cast<size_t>(seconds * kRate), 0);
}

void AppendRepeated(const std::vector<int16_t>& token, int repetitions, std::vector<int16_t>* pcm) {
  for (int r = 0; r < repetitions; ++r) pcm->insert(pcm->end(), token.begin(), token.end());
}

// Every channel of a frame carries the same sample.
std::vector<int16_t> Interleaved(const std::vector<int16_t>& mono, int channels) {
  std::vector<int16_t> pcm;
  for (const int16_t s : mono) pcm.insert(pcm.end(), channels, s);
  return pcm;
}

DsssDecoderConfig Dsss(int channels = 1) {
  DsssDecoderConfig config;
  config.input_sample_rate = kRate;
  config.num_channels = channels;
  return config;
}

std::unique_ptr<TokenStream> Stream(const DsssDecoderConfig& config,
                                    const TokenStreamOptions& options = TokenStreamOptions()) {
  std::string error;
  std::unique_ptr<TokenStream> stream = TokenStream::Create(config, 2, options, &error);
  EXPECT_EQ(error, "");
  return stream;
}

// Feeds `pcm` in chunks of `chunk` samples and takes every token reported.
std::vector<StreamToken> FeedAll(TokenStream* stream, const std::vector<int16_t>& pcm,
                                 size_t chunk) {
  for (size_t start = 0; start < pcm.size(); start += chunk) {
    stream->Feed(pcm.data() + start, std::min(chunk, pcm.size() - start));
  }
  std::vector<StreamToken> tokens;
  stream->TakeTokens(&tokens);
  return tokens;
}

TEST(TokenStreamTest, ReportsARepeatedTokenOnceAtAPollTime) {
  const std::vector<int16_t> token = TokenAudio(kMessage);
  std::vector<int16_t> pcm;
  AppendSilence(0.4, &pcm);
  AppendRepeated(token, 3, &pcm);
  AppendSilence(2.0, &pcm);
  const auto stream = Stream(Dsss());
  const std::vector<StreamToken> tokens = FeedAll(stream.get(), pcm, 960);
  ASSERT_EQ(tokens.size(), 1u);
  EXPECT_EQ(tokens[0].message, kMessage);
  // Requests fall every 12000 samples; the first that can hold the whole
  // token follows the end of its first repetition.
  const double first_end = 0.4 + static_cast<double>(token.size()) / kRate;
  EXPECT_EQ(std::fmod(tokens[0].time_seconds, 0.25), 0.0);
  EXPECT_GE(tokens[0].time_seconds, first_end);
  EXPECT_LE(tokens[0].time_seconds, first_end + 0.25);
  EXPECT_EQ(stream->stream_seconds(), static_cast<double>(pcm.size()) / kRate);
}

TEST(TokenStreamTest, HoldDecidesWhenATokenCountsAsHeardAgain) {
  const std::vector<int16_t> token = TokenAudio(kMessage);
  std::vector<int16_t> pcm;
  AppendRepeated(token, 2, &pcm);
  AppendSilence(6.0, &pcm);  // Longer than the history and the hold together.
  AppendRepeated(token, 2, &pcm);
  AppendRepeated(TokenAudio(kOther), 2, &pcm);
  AppendSilence(1.0, &pcm);

  const auto held = Stream(Dsss());
  const std::vector<StreamToken> sightings = FeedAll(held.get(), pcm, 4096);
  ASSERT_EQ(sightings.size(), 3u);
  EXPECT_EQ(sightings[0].message, kMessage);
  EXPECT_EQ(sightings[1].message, kMessage);
  EXPECT_EQ(sightings[2].message, kOther);
  EXPECT_GT(sightings[1].time_seconds - sightings[0].time_seconds, 6.0);

  // Without a hold every request that decodes the token reports it, each at
  // its own request time.
  TokenStreamOptions every;
  every.hold_seconds = 0;
  const auto raw = Stream(Dsss(), every);
  const std::vector<StreamToken> reports = FeedAll(raw.get(), pcm, 4096);
  ASSERT_GT(reports.size(), 6u);
  for (size_t i = 1; i < reports.size(); ++i) {
    EXPECT_GE(reports[i].time_seconds, reports[i - 1].time_seconds);
  }
  EXPECT_EQ(reports.front().time_seconds, sightings[0].time_seconds);
}

TEST(TokenStreamTest, ChunkSizesDoNotChangeTheReports) {
  std::vector<int16_t> mono;
  AppendSilence(0.3, &mono);
  AppendRepeated(TokenAudio(kMessage), 3, &mono);
  AppendSilence(1.0, &mono);
  const std::vector<int16_t> stereo = Interleaved(mono, 2);
  TokenStreamOptions every;
  every.hold_seconds = 0;

  const auto reference_stream = Stream(Dsss(2), every);
  const std::vector<StreamToken> reference = FeedAll(reference_stream.get(), stereo, stereo.size());
  ASSERT_GT(reference.size(), 2u);
  // Odd chunks split frames between calls.
  for (const size_t chunk : {size_t{1}, size_t{441}, size_t{4095}, size_t{96001}}) {
    const auto stream = Stream(Dsss(2), every);
    const std::vector<StreamToken> tokens = FeedAll(stream.get(), stereo, chunk);
    ASSERT_EQ(tokens.size(), reference.size()) << "chunk " << chunk;
    for (size_t i = 0; i < tokens.size(); ++i) {
      EXPECT_EQ(tokens[i].message, reference[i].message);
      EXPECT_EQ(tokens[i].time_seconds, reference[i].time_seconds);
    }
  }
}

TEST(TokenStreamTest, FlushDecodesTheTailAtTheEndOfTheStream) {
  // The token ends 1000 frames after the third request (every 12000
  // frames) and the recording 6000 frames after it, half a frame later.
  const std::vector<int16_t> token = TokenAudio(kMessage);
  std::vector<int16_t> mono(37000 - token.size(), 0);
  AppendRepeated(token, 1, &mono);
  AppendSilence(5000.0 / kRate, &mono);
  std::vector<int16_t> stereo = Interleaved(mono, 2);
  stereo.push_back(0);
  const auto stream = Stream(Dsss(2));
  EXPECT_TRUE(FeedAll(stream.get(), stereo, 1000).empty());
  stream->Flush();
  std::vector<StreamToken> tokens;
  stream->TakeTokens(&tokens);
  ASSERT_EQ(tokens.size(), 1u);
  EXPECT_EQ(tokens[0].time_seconds, 42000.0 / kRate);
  EXPECT_EQ(stream->stream_seconds(), 42000.0 / kRate);
}

TEST(TokenStreamTest, WipeForgetsTheReportedTokens) {
  std::vector<int16_t> pcm;
  AppendRepeated(TokenAudio(kMessage), 2, &pcm);
  AppendSilence(0.5, &pcm);
  const auto stream = Stream(Dsss());
  ASSERT_EQ(FeedAll(stream.get(), pcm, 4096).size(), 1u);
  EXPECT_TRUE(stream->broadcaster());
  stream->Wipe();
  EXPECT_FALSE(stream->broadcaster());
  // Heard again after the wipe: a new sighting, within the hold.
  EXPECT_EQ(FeedAll(stream.get(), pcm, 4096).size(), 1u);
}

TEST(TokenStreamTest, ListeningModeFallsBackOnStreamTime) {
  DsssDecoderConfig config = Dsss();
  config.use_zintar = true;
  std::vector<int16_t> pcm;
  AppendSilence(0.5, &pcm);
  AppendRepeated(TokenAudio(kMessage), 3, &pcm);
  const auto stream = Stream(config);
  EXPECT_TRUE(stream->decoder().listening());
  const std::vector<StreamToken> tokens = FeedAll(stream.get(), pcm, 4800);
  ASSERT_EQ(tokens.size(), 1u);
  EXPECT_EQ(tokens[0].message, kMessage);
  EXPECT_FALSE(stream->decoder().listening());
  // The history still holds the token for a while: the timer is rearmed
  // until it has gone, then a second of stream time without answers sends
  // the decoder back to listening, however fast the audio is fed.
  std::vector<int16_t> silence;
  AppendSilence(6.0, &silence);
  FeedAll(stream.get(), silence, silence.size());
  EXPECT_TRUE(stream->decoder().listening());
}

TEST(TokenStreamTest, DtmfStreamsDecodeWithoutABroadcaster) {
  DtmfEncoderConfig waveform;
  std::vector<float> audio;
  MakeDtmfAudioModemEncoder(waveform)->Encode({1, 2, 3, 4, 5}, &audio, 0);
  std::vector<int16_t> pcm(4410, 0);
  for (int r = 0; r < 3; ++r) {
    for (const float s : audio) pcm.push_back(audio_dsp::FloatToPcm16(s));
  }
  pcm.resize(pcm.size() + 22050, 0);
  DtmfDecoderConfig config;
  std::string error;
  const auto stream = TokenStream::Create(config, 0, TokenStreamOptions(), &error);
  ASSERT_NE(stream, nullptr) << error;
  const std::vector<StreamToken> tokens = FeedAll(stream.get(), pcm, 441);
  ASSERT_EQ(tokens.size(), 1u);
  EXPECT_EQ(tokens[0].message, (std::vector<uint8_t>{1, 2, 3, 4, 5}));
  EXPECT_FALSE(stream->broadcaster());
}

TEST(TokenStreamTest, RefusesWhatItCannotRun) {
  struct Case {
    int crc_check_bytes;
    double poll_interval_seconds;
    double hold_seconds;
    const char* error;
  };
  const double nan = std::numeric_limits<double>::quiet_NaN();
  const double inf = std::numeric_limits<double>::infinity();
  for (const Case& c : {
           Case{1, 0.25, 3, "check bytes must be 0 or 2"},
           Case{-2, 0.25, 3, "check bytes must be 0 or 2"},
           Case{2, 0, 3, "the poll interval must lie in (0, 1] seconds"},
           Case{2, 1.001, 3, "the poll interval must lie in (0, 1] seconds"},
           Case{2, nan, 3, "the poll interval must lie in (0, 1] seconds"},
           Case{2, 0.25, -0.1, "the hold time must be finite and not negative"},
           Case{2, 0.25, inf, "the hold time must be finite and not negative"},
       }) {
    TokenStreamOptions options;
    options.poll_interval_seconds = c.poll_interval_seconds;
    options.hold_seconds = c.hold_seconds;
    std::string error;
    EXPECT_EQ(TokenStream::Create(Dsss(), c.crc_check_bytes, options, &error), nullptr);
    EXPECT_EQ(error, c.error);
  }
  DsssDecoderConfig two_bytes = Dsss();
  two_bytes.token_length_bytes = 2;
  std::string error;
  EXPECT_EQ(TokenStream::Create(two_bytes, 2, TokenStreamOptions(), &error), nullptr);
  EXPECT_EQ(error, "the token needs at least one message byte");
  DsssDecoderConfig no_channels = Dsss();
  no_channels.num_channels = 0;
  EXPECT_EQ(TokenStream::Create(no_channels, 2, TokenStreamOptions(), &error), nullptr);
  EXPECT_EQ(error, "the microphone must have 1 to 64 channels");
}

}  // namespace
}  // namespace audio_modem
