#include "social/tandry/audio/zintar_decoder.h"

#include <vector>

#include "gtest/gtest.h"
#include "social/tandry/audio/audio_modem_encoder.h"

namespace audio_modem {
namespace {

// The product token at 48 kHz, three times, as 16-bit samples.
std::vector<int16_t> ProductTransmission() {
  const auto encoder = MakeDsssAudioModemEncoder(DsssEncoderConfig());
  std::vector<float> audio;
  encoder->Encode({1, 2, 3, 4, 5, 6}, &audio, 2);
  std::vector<int16_t> pcm;
  for (int r = 0; r < 3; ++r) {
    for (float s : audio) pcm.push_back(static_cast<int16_t>(32767.0f * s));
  }
  return pcm;
}

struct Fixture {
  int64_t now_ms = 0;
  std::unique_ptr<ZintarDecoder> decoder;

  explicit Fixture(int channels) {
    auto coder = MakeSymbolWaveCoder(DsssWaveformConfig());
    audio_vesknet::VesknetDecoderParams params;
    params.symbols_in_token = 16;
    auto dsss = std::make_unique<audio_vesknet::VesknetDecoder>(std::move(coder), params);
    decoder = std::make_unique<ZintarDecoder>(
        std::move(dsss), ZintarDetectorHolder::Create(48000, channels), [this] { return now_ms; });
    decoder->Initialize(48000, channels);
  }

  // Feeds in 4096-sample blocks until the detector wakes; returns the block
  // index at which it did, or -1.
  int FeedUntilDetected(std::vector<int16_t> pcm) {
    for (size_t start = 0, block = 0; start < pcm.size(); start += 4096, ++block) {
      const int n = static_cast<int>(std::min<size_t>(4096, pcm.size() - start));
      decoder->ProcessSamples(pcm.data() + start, n);
      if (decoder->state() == ZintarDecoder::kDetected) return static_cast<int>(block);
    }
    return -1;
  }
};

TEST(ZintarDecoderTest, ListensUntilTheReferenceIsHeardThenHandsOverTheHistory) {
  Fixture f(1);
  EXPECT_EQ(f.decoder->token_size(), 8);
  std::vector<int16_t> pcm(20000, 0);  // Silence first: the history fills up.
  const std::vector<int16_t> token = ProductTransmission();
  pcm.insert(pcm.end(), token.begin(), token.end());
  const int block = f.FeedUntilDetected(pcm);
  ASSERT_GE(block, 5);  // Not during the silence.
  // The DSSS decoder received the history: at most 14400 samples.
  const int held = f.decoder->dsss_decoder().buffered_input_frames();
  EXPECT_GT(held, 14400 - 100);
  EXPECT_LE(held, 14400 + 10);
  // From now on every block goes to the DSSS decoder.
  f.decoder->ProcessSamples(pcm.data() + (block + 1) * 4096, 4096);
  EXPECT_GT(f.decoder->dsss_decoder().buffered_input_frames(), held + 4000);
  EXPECT_FALSE(ZintarDecoder::Wakes(25.0f));  // Exactly the threshold does not wake.
  EXPECT_TRUE(ZintarDecoder::Wakes(25.001f));
}

TEST(ZintarDecoderTest, SilenceNeverWakesAndListeningAnswersFalse) {
  Fixture f(1);
  const int empty = f.decoder->dsss_decoder().buffered_input_frames();
  std::vector<int16_t> silence(48000, 0);
  EXPECT_EQ(f.FeedUntilDetected(silence), -1);
  EXPECT_FALSE(f.decoder->DetectBroadcaster());
  audio_vesknet::VesknetDecodeResults results;
  EXPECT_FALSE(f.decoder->GetToken(&results));
  EXPECT_EQ(f.decoder->dsss_decoder().buffered_input_frames(), empty);  // Nothing handed over.
}

TEST(ZintarDecoderTest, FallsBackOnlyAfterMoreThanASecondWithoutAnswers) {
  Fixture f(1);
  ASSERT_GE(f.FeedUntilDetected(ProductTransmission()), 0);
  // Without questions it stays awake indefinitely.
  f.now_ms = 60000;
  f.decoder->ProcessSamples(std::vector<int16_t>(4096, 0).data(), 4096);
  EXPECT_EQ(f.decoder->state(), ZintarDecoder::kDetected);

  // Detection at 0, then only false answers (the history is wiped).
  Fixture g(1);
  ASSERT_GE(g.FeedUntilDetected(ProductTransmission()), 0);
  g.decoder->WipeInternalData();
  audio_vesknet::VesknetDecodeResults results;
  g.now_ms = 1000;
  EXPECT_FALSE(g.decoder->GetToken(&results));
  EXPECT_EQ(g.decoder->state(), ZintarDecoder::kDetected);
  g.now_ms = 1001;
  EXPECT_FALSE(g.decoder->DetectBroadcaster());
  EXPECT_EQ(g.decoder->state(), ZintarDecoder::kListening);
}

TEST(ZintarDecoderTest, PositiveAnswersKeepItAwake) {
  Fixture f(1);
  const std::vector<int16_t> pcm = ProductTransmission();
  const int block = f.FeedUntilDetected(pcm);
  ASSERT_GE(block, 0);
  for (size_t start = (block + 1) * 4096; start < pcm.size(); start += 4096) {
    f.decoder->ProcessSamples(const_cast<int16_t*>(pcm.data()) + start,
                              static_cast<int>(std::min<size_t>(4096, pcm.size() - start)));
  }
  audio_vesknet::VesknetDecodeResults results;
  f.now_ms = 5000;
  ASSERT_TRUE(f.decoder->GetToken(&results));  // True: the timer restarts at 5000.
  f.now_ms = 5900;
  f.decoder->WipeInternalData();
  EXPECT_FALSE(f.decoder->GetToken(&results));
  EXPECT_EQ(f.decoder->state(), ZintarDecoder::kDetected);
  f.now_ms = 6001;
  EXPECT_FALSE(f.decoder->GetToken(&results));
  EXPECT_EQ(f.decoder->state(), ZintarDecoder::kListening);
}

TEST(ZintarDecoderTest, MixesChannelsDownInPlaceWhileListening) {
  Fixture stereo(2);
  std::vector<int16_t> two = {10, 20, 30, 40};
  stereo.decoder->ProcessSamples(two.data(), 4);
  EXPECT_EQ(two[0], 15);
  EXPECT_EQ(two[1], 35);
  Fixture three(3);
  std::vector<int16_t> frames = {1, 3, 100, 5, 7, 100};
  three.decoder->ProcessSamples(frames.data(), 6);
  EXPECT_EQ(frames[0], 2);
  EXPECT_EQ(frames[1], 6);
  std::vector<int16_t> negative = {-3, 0};  // Toward zero: -1, not -2.
  stereo.decoder->ProcessSamples(negative.data(), 2);
  EXPECT_EQ(negative[0], -1);
}

TEST(ZintarDecoderTest, HistoryHoldsWholeFramesForAnyChannelCount) {
  // 7 channels do not divide the 14400-sample history: it holds 2057 frames
  // (14399 samples), and a wake-up hands the DSSS decoder whole frames.
  Fixture seven(7);
  EXPECT_EQ(seven.decoder->GetMaxSafeInputSize(), 2057 * 7);
  std::vector<int16_t> pcm;
  for (const int16_t s : ProductTransmission()) pcm.insert(pcm.end(), 7, s);
  const int block = 7 * 1000;
  size_t start = 0;
  while (seven.decoder->state() == ZintarDecoder::kListening && start + block <= pcm.size()) {
    std::vector<int16_t> chunk(pcm.begin() + start, pcm.begin() + start + block);
    seven.decoder->ProcessSamples(chunk.data(), block);
    start += block;
  }
  ASSERT_EQ(seven.decoder->state(), ZintarDecoder::kDetected);
  // The history went over as the decoder's first block: about 2057 frames
  // (its count is rounded to baseband samples).
  const int held = seven.decoder->dsss_decoder().buffered_input_frames();
  EXPECT_GT(held, 2057 - 100);
  EXPECT_LE(held, 2057 + 10);
  // Once awake, the safe size is the DSSS decoder's free space alone.
  EXPECT_GT(seven.decoder->GetMaxSafeInputSize(), 2057 * 7);
}

TEST(ZintarDecoderTest, NoDetectorBelowTheCentreFrequency) {
  EXPECT_EQ(ZintarDetectorHolder::Create(36000, 1), nullptr);
  EXPECT_NE(ZintarDetectorHolder::Create(44100, 1), nullptr);
}

TEST(ZintarDecoderDeathTest, NeedsBothParts) {
  auto coder = MakeSymbolWaveCoder(DsssWaveformConfig());
  auto dsss = std::make_unique<audio_vesknet::VesknetDecoder>(
      std::move(coder), audio_vesknet::VesknetDecoderParams());
  EXPECT_DEATH(ZintarDecoder(std::move(dsss), nullptr),
               "Check failed: 'zintar_detector' Must be non-null");
  EXPECT_DEATH(ZintarDecoder(nullptr, ZintarDetectorHolder::Create(48000, 1)),
               "Check failed: 'dsss_decoder' Must be non-null");
}

}  // namespace
}  // namespace audio_modem
