#include "social/tandry/audio/zintar_decoder.h"

#include <cmath>
#include <random>
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
    params.save_received_samples = true;  // What the DSSS decoder was handed.
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

  // Waking restarts the timer: detection at 5000, then false answers.
  Fixture late(1);
  late.now_ms = 5000;
  ASSERT_GE(late.FeedUntilDetected(ProductTransmission()), 0);
  late.decoder->WipeInternalData();
  late.now_ms = 6000;
  EXPECT_FALSE(late.decoder->GetToken(&results));
  EXPECT_EQ(late.decoder->state(), ZintarDecoder::kDetected);
  late.now_ms = 6001;
  EXPECT_FALSE(late.decoder->GetToken(&results));
  EXPECT_EQ(late.decoder->state(), ZintarDecoder::kListening);
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

// Feeds `pcm` to `decoder` in blocks of `block` samples until it wakes;
// the samples fed, or all of `pcm` when it never wakes.
size_t FeedInBlocks(ZintarDecoder* decoder, std::vector<int16_t> pcm, size_t block) {
  size_t start = 0;
  while (start < pcm.size() && decoder->state() == ZintarDecoder::kListening) {
    const size_t n = std::min(block, pcm.size() - start);
    decoder->ProcessSamples(pcm.data() + start, static_cast<int>(n));
    start += n;
  }
  return start;
}

std::vector<float> Floats(const int16_t* begin, const int16_t* end) {
  return std::vector<float>(begin, end);
}

// What the DSSS decoder is handed on waking: exactly the last 14400 samples
// heard (of a long block, its first 14400), and after falling back and
// waking again only what was heard since.
TEST(ZintarDecoderTest, WakingHandsOverExactlyTheHistory) {
  std::vector<int16_t> pcm(3 * 4096 + 100, 7);  // Quiet first: the history fills up.
  const std::vector<int16_t> token = ProductTransmission();
  pcm.insert(pcm.end(), token.begin(), token.end());

  Fixture blocks(1);
  const size_t fed = FeedInBlocks(blocks.decoder.get(), pcm, 4096);
  ASSERT_EQ(blocks.decoder->state(), ZintarDecoder::kDetected);
  EXPECT_EQ(blocks.decoder->dsss_decoder().GetReceivedSamples(),
            Floats(pcm.data() + fed - 14400, pcm.data() + fed));

  Fixture long_block(1);
  long_block.decoder->ProcessSamples(
      std::vector<int16_t>(token.begin(), token.begin() + 30000).data(), 30000);
  ASSERT_EQ(long_block.decoder->state(), ZintarDecoder::kDetected);
  EXPECT_EQ(long_block.decoder->dsss_decoder().GetReceivedSamples(),
            Floats(token.data(), token.data() + 14400));

  // Fall back (no answers for over a second), then hear 6000 samples of
  // quiet and the token again: the second hand-over starts with the quiet.
  long_block.decoder->WipeInternalData();
  long_block.now_ms = 2000;
  audio_vesknet::VesknetDecodeResults results;
  ASSERT_FALSE(long_block.decoder->GetToken(&results));
  ASSERT_EQ(long_block.decoder->state(), ZintarDecoder::kListening);
  std::vector<int16_t> again(6000, -5);
  again.insert(again.end(), token.begin(), token.end());
  const size_t refed = FeedInBlocks(long_block.decoder.get(), again, 4000);
  ASSERT_EQ(long_block.decoder->state(), ZintarDecoder::kDetected);
  const size_t handed = std::min<size_t>(refed, 14400);
  EXPECT_EQ(long_block.decoder->dsss_decoder().GetReceivedSamples(),
            Floats(again.data() + refed - handed, again.data() + refed));
}

// The detector's score of each 4096-sample block, for seeded noise, a tone
// at the centre frequency and the product token (values of this
// implementation, pinned: they change with any tap, window, table or
// normalisation of the detector).
TEST(ZintarDecoderTest, BlockScoresArePinned) {
  std::vector<int16_t> noise(3 * 4096), tone(3 * 4096);
  std::mt19937 random(1);
  std::normal_distribution<float> gauss(0, 3000);
  for (int16_t& s : noise) s = static_cast<int16_t>(std::lround(gauss(random)));
  for (size_t i = 0; i < tone.size(); ++i) {
    tone[i] =
        static_cast<int16_t>(std::lround(10000 * std::sin(2 * M_PI * 18496.0625 * i / 48000)));
  }
  const std::vector<int16_t> token = ProductTransmission();
  struct Case {
    const std::vector<int16_t>* pcm;
    std::vector<float> scores;
  };
  const Case cases[] = {
      {&noise, {5.285364f, 5.73144f, 5.760193f}},
      {&tone, {2.434895f, 2.434876f, 2.434667f}},
      {&token, {62.56318f, 58.48773f, 61.45462f, 58.63065f, 59.25503f, 58.93664f}},
  };
  for (const Case& c : cases) {
    const auto detector = ZintarDetectorHolder::Create(48000, 1);
    Fixture mono(1), stereo(2);
    for (size_t b = 0; b < c.scores.size(); ++b) {
      std::vector<int16_t> block(c.pcm->begin() + b * 4096, c.pcm->begin() + (b + 1) * 4096);
      EXPECT_NEAR(detector->Process(block.data(), 4096), c.scores[b], 1e-4 * c.scores[b])
          << "block " << b;
      // The decoders score what they hear while listening: as stereo with
      // both channels alike, the same as in mono.
      if (mono.decoder->state() == ZintarDecoder::kDetected) continue;
      std::vector<int16_t> both;
      for (const int16_t s : block) both.insert(both.end(), {s, s});
      mono.decoder->ProcessSamples(block.data(), 4096);
      stereo.decoder->ProcessSamples(both.data(), 8192);
      EXPECT_NEAR(mono.decoder->last_score(), c.scores[b], 1e-4 * c.scores[b]) << "block " << b;
      EXPECT_EQ(stereo.decoder->last_score(), mono.decoder->last_score()) << "block " << b;
    }
  }
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
