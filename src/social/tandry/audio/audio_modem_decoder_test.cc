#include "social/tandry/audio/audio_modem_decoder.h"

#include <cmath>
#include <cstdint>
#include <vector>

#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"
#include "social/tandry/audio/audio_modem_encoder.h"

namespace audio_modem {
namespace {

const std::vector<uint8_t> kMessage = {0x01, 0x23, 0x45, 0x67, 0x89, 0xAB};

// The product token (with CRC unless `token` gives 8 raw bytes) three times,
// as 16-bit samples at 48 kHz.
std::vector<float> Played(const std::vector<uint8_t>& token, int crc_bytes) {
  const auto encoder = MakeDsssAudioModemEncoder(DsssEncoderConfig());
  std::vector<float> audio;
  encoder->Encode(token, &audio, crc_bytes);
  std::vector<float> played(9600, 0.0f);
  for (int r = 0; r < 3; ++r) {
    for (float s : audio) played.push_back(32768.0f * s);
  }
  played.resize(played.size() + 9600, 0.0f);
  return played;
}

std::unique_ptr<AudioModemDecoder> Decoder() {
  DsssDecoderConfig config;
  config.input_sample_rate = 48000;
  return MakeDsssAudioModemDecoder(config);
}

TEST(AudioModemDecoderTest, VerifiesAndStripsCrcBytes) {
  const auto decoder = Decoder();
  EXPECT_EQ(decoder->token_size(), 8);
  EXPECT_EQ(decoder->kind(), AudioModemDecoder::kDsss);
  decoder->ProcessSamples(Played(kMessage, 2));
  DecodeResults results;
  ASSERT_TRUE(decoder->GetTokens(&results, 6, 2));
  EXPECT_EQ(results.tokens[0].bytes, kMessage);
  EXPECT_FALSE(results.frame_times.empty());
  // Unchecked, the same token comes back whole: message then CRC.
  ASSERT_TRUE(decoder->GetTokens(&results, 8, 0));
  ASSERT_EQ(results.tokens[0].bytes.size(), 8u);
  EXPECT_TRUE(std::equal(kMessage.begin(), kMessage.end(), results.tokens[0].bytes.begin()));
}

// 16-bit blocks are taken as their float values would be, for every kind.
TEST(AudioModemDecoderTest, SixteenBitBlocksAreTheirFloatValues) {
  std::vector<int16_t> pcm;
  std::vector<float> played;
  for (const float sample : Played(kMessage, 2)) {
    pcm.push_back(static_cast<int16_t>(sample));
    played.push_back(pcm.back());
  }
  DsssDecoderConfig zintar;
  zintar.input_sample_rate = 48000;
  zintar.use_zintar = true;
  for (const bool listening : {false, true}) {
    const auto floats = listening ? MakeDsssAudioModemDecoder(zintar) : Decoder();
    const auto ints = listening ? MakeDsssAudioModemDecoder(zintar) : Decoder();
    for (size_t start = 0; start < pcm.size(); start += 4096) {
      const size_t end = std::min(pcm.size(), start + 4096);
      floats->ProcessSamples(std::vector<float>(played.begin() + start, played.begin() + end));
      ints->ProcessPcm16(pcm.data() + start, static_cast<int>(end - start));
    }
    DecodeResults a, b;
    ASSERT_TRUE(floats->GetTokens(&a, 6, 2));
    ASSERT_TRUE(ints->GetTokens(&b, 6, 2));
    EXPECT_EQ(a.tokens[0].bytes, b.tokens[0].bytes);
    EXPECT_EQ(a.frame_times, b.frame_times);
    EXPECT_EQ(a.frame_scores, b.frame_scores);
  }
}

// A steady tone 20 dB over the token, 300 Hz above the carrier: the
// excision stage notches it and the token is heard; without the stage it is
// not. Blocks go in as the caller's floats and as 16-bit PCM (the stage
// then notches the front's own copy).
TEST(AudioModemDecoderTest, ExcisionStageTakesASteadyToneAwayFromTheDecoder) {
  std::vector<float> played = Played(kMessage, 2);
  double power = 0;
  for (float s : played) power += static_cast<double>(s) * s;
  const double amplitude = 10 * std::sqrt(2 * power / played.size());
  for (size_t i = 0; i < played.size(); ++i) {
    played[i] =
        0.05f * played[i] +
        static_cast<float>(0.05 * amplitude * std::sin(2 * 3.14159265358979 * 18800.0 * i / 48000));
  }
  std::vector<int16_t> pcm(played.begin(), played.end());
  for (const bool excision : {true, false}) {
    DsssDecoderConfig config;
    config.input_sample_rate = 48000;
    config.narrowband_excision = excision;
    const auto floats = MakeDsssAudioModemDecoder(config);
    const auto ints = MakeDsssAudioModemDecoder(config);
    ASSERT_EQ(floats->narrowband_excision() != nullptr, excision);
    for (size_t start = 0; start < played.size(); start += 4096) {
      const size_t end = std::min(played.size(), start + 4096);
      floats->ProcessSamples(std::vector<float>(played.begin() + start, played.begin() + end));
      ints->ProcessPcm16(pcm.data() + start, static_cast<int>(end - start));
    }
    DecodeResults a, b;
    EXPECT_EQ(floats->GetTokens(&a, 6, 2), excision);
    EXPECT_EQ(ints->GetTokens(&b, 6, 2), excision);
    if (!excision) continue;
    EXPECT_EQ(a.tokens.at(0).bytes, kMessage);
    EXPECT_EQ(b.tokens.at(0).bytes, kMessage);
    const std::vector<float> notches = floats->narrowband_excision()->NotchFrequencies();
    ASSERT_EQ(notches.size(), 1u);
    EXPECT_NEAR(notches[0], 18800.0f, 0.5f);
    // Forgetting the audio forgets the tone.
    floats->WipeInternalData();
    EXPECT_FALSE(floats->narrowband_excision()->filtering());
  }
}

TEST(AudioModemDecoderTest, ExcisionBandsFollowTheModemAndSpareTheListeningMode) {
  DsssDecoderConfig config;
  EXPECT_TRUE(config.narrowband_excision);
  config.num_channels = 2;
  const auto decoder = MakeDsssAudioModemDecoder(config);
  const audio_dsp::NarrowbandExcisionParams& dsss = decoder->narrowband_excision()->params();
  // The carrier +- the chip rate, 48000 / 16 Hz; the decoder's input.
  EXPECT_EQ(dsss.band_low_hz, 15500.0f);
  EXPECT_EQ(dsss.band_high_hz, 21500.0f);
  EXPECT_EQ(dsss.sample_rate, 44100.0f);
  EXPECT_EQ(dsss.num_channels, 2);
  EXPECT_TRUE(dsss.protected_hz.empty());
  config.num_channels = 1;
  config.input_sample_rate = 48000;
  config.use_zintar = true;
  EXPECT_EQ(MakeDsssAudioModemDecoder(config)->narrowband_excision(), nullptr);
  // DTMF: the tone set, 100 Hz wider, its tones protected.
  const auto dtmf = MakeDtmfAudioModemDecoder(DtmfDecoderConfig());
  const audio_dsp::NarrowbandExcisionParams& tones = dtmf->narrowband_excision()->params();
  EXPECT_EQ(tones.band_low_hz, 640.0f);
  EXPECT_NEAR(tones.band_high_hz, 2589.0f, 0.1f);
  EXPECT_EQ(tones.protected_hz, audio_vesknet::DtmfEncoderParams().tone_frequencies);
  DtmfDecoderConfig off;
  off.narrowband_excision = false;
  EXPECT_EQ(MakeDtmfAudioModemDecoder(off)->narrowband_excision(), nullptr);
}

TEST(AudioModemDecoderTest, TokensFailingTheCrcAreDropped) {
  const auto decoder = Decoder();
  // Eight bytes whose last two are not the CRC of the first six.
  decoder->ProcessSamples(Played({1, 2, 3, 4, 5, 6, 7, 8}, 0));
  DecodeResults results;
  results.tokens.resize(3);
  EXPECT_FALSE(decoder->GetTokens(&results, 6, 2));
  EXPECT_TRUE(results.tokens.empty());
  EXPECT_TRUE(decoder->GetTokens(&results, 8, 0));
}

TEST(AudioModemDecoderTest, RefusesWrongGeometryWithoutTouchingResults) {
  const auto decoder = Decoder();
  decoder->ProcessSamples(Played(kMessage, 2));
  base::ScopedLogCapture capture;
  DecodeResults results;
  results.tokens.resize(1);
  EXPECT_FALSE(decoder->GetTokens(&results, 6, 0));
  EXPECT_FALSE(decoder->GetTokens(&results, 0, 8));
  EXPECT_FALSE(decoder->GetTokens(&results, 10, -2));
  EXPECT_EQ(results.tokens.size(), 1u);
  EXPECT_FALSE(decoder->GetTokens(&results, 7, 1));  // Passes the first three tests.
  EXPECT_EQ(capture.Messages(base::LogSeverity::kError),
            (std::vector<std::string>{
                "num_message_bytes and num_crc_check_bytes do not add to correct value",
                "num_message_bytes must be positive", "num_crc_check_bytes must be non-negative",
                "Unsupported value for num_crc_check_bytes"}));
}

TEST(AudioModemDecoderTest, SafeInputShrinksAsHistoryGrowsAndWipeForgets) {
  const auto decoder = Decoder();
  const int empty = decoder->GetMaxSafeInputSize();
  decoder->ProcessSamples(std::vector<float>(48000, 0.0f));
  EXPECT_NEAR(decoder->GetMaxSafeInputSize(), empty - 48000, 40);  // The resampler holds some back.
  int16_t raw[4] = {1, 2, 3, 4};
  decoder->ProcessSamplesWithZintar(raw, 4);  // Ignored by a plain DSSS decoder.
  EXPECT_EQ(raw[1], 2);
  EXPECT_NEAR(decoder->GetMaxSafeInputSize(), empty - 48000, 40);  // The resampler holds some back.
  decoder->ProcessSamples(Played(kMessage, 2));
  decoder->WipeInternalData();
  EXPECT_EQ(decoder->GetMaxSafeInputSize(), empty);
  DecodeResults results;
  EXPECT_FALSE(decoder->GetTokens(&results, 6, 2));
}

TEST(AudioModemDecoderTest, ConfigErrors) {
  EXPECT_EQ(DsssDecoderConfigError(DsssDecoderConfig()), "");
  DsssDecoderConfig config;
  config.max_tokens_per_call = 7;
  EXPECT_EQ(DsssDecoderConfigError(config), "tokens per call must be 1 to 6");
  config = DsssDecoderConfig();
  config.num_channels = 0;
  EXPECT_NE(DsssDecoderConfigError(config), "");
  config = DsssDecoderConfig();
  config.waveform.bits_per_symbol = 5;
  EXPECT_NE(DsssDecoderConfigError(config), "");
}

// Each bound of the configuration checks, just inside and just outside.
TEST(AudioModemDecoderTest, ConfigLimitsAreInclusive) {
  struct Case {
    void (*set)(DsssDecoderConfig*, bool outside);
    const char* error;
  };
  const Case cases[] = {
      {[](DsssDecoderConfig* c, bool out) {
         c->token_length_bytes = out ? 257 : 256;
         c->buffer_length_tokens = 1;
       },
       "the token must have 1 to 256 bytes"},
      // One bit per symbol: 1 + 8 x 88 frames of 2032 / 48000 s last 29.8 s;
      // 89 bytes last 30.2 s.
      {[](DsssDecoderConfig* c, bool out) {
         c->waveform.bits_per_symbol = 1;
         c->token_length_bytes = out ? 89 : 88;
         c->buffer_length_tokens = 1;
       },
       "a token may last at most 30 s on air"},
      // The product token lasts 17 x 2032 / 48000 = 0.7197 s: 83 of them
      // 59.7 s, 84 of them 60.5 s.
      {[](DsssDecoderConfig* c, bool out) { c->buffer_length_tokens = out ? 84 : 83; },
       "the history (buffer length x token duration) may last at most 60 s"},
      {[](DsssDecoderConfig* c, bool out) { c->input_sample_rate = out ? 384001 : 384000; },
       "the microphone rate must lie in [1000, 384000] Hz"},
      {[](DsssDecoderConfig* c, bool out) { c->input_sample_rate = out ? 999 : 1000; },
       "the microphone rate must lie in [1000, 384000] Hz"},
      {[](DsssDecoderConfig* c, bool out) { c->num_channels = out ? 65 : 64; },
       "the microphone must have 1 to 64 channels"},
      {[](DsssDecoderConfig* c, bool out) {
         c->token_length_bytes = 1;
         c->buffer_length_tokens = out ? 100.01f : 100;
       },
       "the buffer must hold 1 to 100 tokens"},
      {[](DsssDecoderConfig* c, bool out) { c->acquisition_window_seconds = out ? 60.01f : 60; },
       "the acquisition window must lie in (0, 60] seconds"},
      // 11 taps: 2047 chips x 32 = 65504 samples per frame; x 33 is too long.
      {[](DsssDecoderConfig* c, bool out) {
         c->waveform.number_of_taps = 11;
         c->waveform.upsampling_factor = out ? 33 : 32;
         c->waveform.baseband_decimation_factor = 1;
         c->waveform.carrier_frequency = 1000;  // Few Doppler shifts to search.
         c->buffer_length_tokens = 1;
       },
       "a frame (code length x upsampling factor) may hold at most 65536 samples"},
      {[](DsssDecoderConfig* c, bool out) { c->waveform.sample_rate = out ? 384001 : 384000; },
       "the coder sample rate must lie in (0, 384000] Hz"},
      // 11 taps at 48 kHz: 12623 carrier cycles per frame, 179 Doppler shifts
      // (192 per history row); a 5 s window needs 65536 rows (48 MiB), 6 s
      // need 131072 (96 MiB).
      {[](DsssDecoderConfig* c, bool out) {
         c->waveform.number_of_taps = 11;
         c->buffer_length_tokens = 1;
         c->acquisition_window_seconds = out ? 6 : 5;
       },
       "the acquisition window and the Doppler search would take more than 64 MiB: shorten the "
       "window or lower the carrier's cycles per frame"},
  };
  for (const Case& c : cases) {
    DsssDecoderConfig config;
    c.set(&config, false);
    EXPECT_EQ(DsssDecoderConfigError(config), "") << c.error;
    c.set(&config, true);
    EXPECT_EQ(DsssDecoderConfigError(config), c.error);
  }
  DtmfDecoderConfig dtmf;
  dtmf.bytes_in_token = 257;
  EXPECT_EQ(DtmfDecoderConfigError(dtmf), "the token must have 1 to 256 bytes");
  // The product waveform's history fills exactly 2^24 floats with a 60 s window.
  DsssDecoderConfig product;
  product.acquisition_window_seconds = 60;
  EXPECT_EQ(DsssDecoderConfigError(product), "");
  dtmf = DtmfDecoderConfig();
  dtmf.tone_frequencies.resize(64);
  for (int i = 0; i < 64; ++i) dtmf.tone_frequencies[i] = 500.0f + 100.0f * i;
  EXPECT_EQ(DtmfDecoderConfigError(dtmf), "");
  dtmf.tone_frequencies.push_back(9000);
  EXPECT_EQ(DtmfDecoderConfigError(dtmf), "a tone set may have at most 64 tones");
  dtmf = DtmfDecoderConfig();
  dtmf.sample_rate = 384001;
  EXPECT_EQ(DtmfDecoderConfigError(dtmf), "the sample rate must lie in (0, 384000] Hz");
  // 256 bytes are 376 digits in base 44, plus the spacer and the checksum:
  // 378 symbols of 3312 samples (0.075 s) last 28.4 s, of 3536 (0.08 s) 30.3 s.
  DtmfEncoderConfig long_token;
  long_token.bytes_in_token = 256;
  long_token.window_duration = 0.075f;
  EXPECT_NEAR(DtmfTokenSeconds(long_token), 378 * 3312 / 44100.0, 1e-9);
  EXPECT_EQ(DtmfEncoderConfigError(long_token), "");
  long_token.window_duration = 0.08f;
  EXPECT_EQ(DtmfEncoderConfigError(long_token), "a token may last at most 30 s on air");
}

// The listening kind hears floats (values of 16-bit samples) exactly as it
// hears the 16-bit samples themselves.
TEST(AudioModemDecoderTest, ListeningFromFloatsEqualsListeningFrom16Bit) {
  DsssDecoderConfig config;
  config.input_sample_rate = 48000;
  config.num_channels = 2;
  config.use_zintar = true;
  const auto from_floats = MakeDsssAudioModemDecoder(config);
  const auto from_pcm = MakeDsssAudioModemDecoder(config);
  std::vector<float> stereo;
  for (const float s : Played(kMessage, 2)) stereo.insert(stereo.end(), {s, -s / 3});
  bool woke = false;
  for (size_t start = 0; start + 8192 <= stereo.size(); start += 8192) {
    const std::vector<float> block(stereo.begin() + start, stereo.begin() + start + 8192);
    std::vector<int16_t> pcm(block.begin(), block.end());
    from_floats->ProcessSamples(block);
    from_pcm->ProcessSamplesWithZintar(pcm.data(), static_cast<int>(pcm.size()));
    ASSERT_EQ(from_floats->listening(), from_pcm->listening()) << start;
    ASSERT_EQ(from_floats->GetMaxSafeInputSize(), from_pcm->GetMaxSafeInputSize()) << start;
    woke |= !from_pcm->listening();
  }
  EXPECT_TRUE(woke);
  DecodeResults a, b;
  ASSERT_TRUE(from_floats->GetTokens(&a, 6, 2));
  ASSERT_TRUE(from_pcm->GetTokens(&b, 6, 2));
  EXPECT_EQ(a.tokens[0].bytes, kMessage);
  EXPECT_EQ(a.frame_times, b.frame_times);
  EXPECT_EQ(a.frame_scores, b.frame_scores);
}

TEST(AudioModemDecoderDeathTest, ChecksItsArguments) {
  EXPECT_DEATH(AudioModemDecoder(std::unique_ptr<audio_vesknet::VesknetDecoder>()),
               "Check failed: 'dsss_decoder' Must be non-null");
  const auto decoder = Decoder();
  EXPECT_DEATH(decoder->GetTokens(nullptr, 6, 2), "Check failed: decode_results");
}

// The product DTMF transmitter's audio for `token` plus `crc` check bytes,
// played 3 times at a third of full scale, in the 16-bit range.
std::vector<float> DtmfAudio(const std::vector<uint8_t>& token, int crc) {
  std::vector<float> token_audio;
  MakeDtmfAudioModemEncoder(DtmfEncoderConfig())->Encode(token, &token_audio, crc);
  std::vector<float> played(5000, 0.0f);
  for (int r = 0; r < 3; ++r) {
    for (const float s : token_audio) played.push_back(10000.0f * s);
  }
  played.resize(played.size() + 10000, 0.0f);
  return played;
}

TEST(AudioModemDecoderTest, DtmfKindDecodesAndVerifiesCrc) {
  const auto decoder = MakeDtmfAudioModemDecoder(DtmfDecoderConfig());
  ASSERT_NE(decoder, nullptr);
  EXPECT_EQ(decoder->kind(), AudioModemDecoder::kDtmf);
  EXPECT_EQ(decoder->token_size(), 5);
  const std::vector<uint8_t> message = {0x12, 0x34, 0x56};
  decoder->ProcessSamples(DtmfAudio(message, 2));
  EXPECT_FALSE(decoder->DetectBroadcaster());

  DecodeResults results;
  ASSERT_TRUE(decoder->GetTokens(&results, 3, 2));
  EXPECT_EQ(results.tokens.at(0).bytes, message);
  EXPECT_TRUE(results.frame_times.empty());
  EXPECT_TRUE(results.frame_scores.empty());
  // Without verification the check bytes stay on.
  ASSERT_TRUE(decoder->GetTokens(&results, 5, 0));
  EXPECT_EQ(results.tokens.at(0).bytes.size(), 5u);
  EXPECT_EQ(
      std::vector<uint8_t>(results.tokens[0].bytes.begin(), results.tokens[0].bytes.begin() + 3),
      message);

  decoder->WipeInternalData();
  EXPECT_FALSE(decoder->GetTokens(&results, 3, 2));
}

TEST(AudioModemDecoderTest, DtmfTokenFailingItsCrcIsDroppedSilently) {
  const auto decoder = MakeDtmfAudioModemDecoder(DtmfDecoderConfig());
  decoder->ProcessSamples(DtmfAudio({1, 2, 3, 4, 5}, 0));  // No valid CRC in it.
  DecodeResults results;
  base::ScopedLogCapture capture;
  EXPECT_FALSE(decoder->GetTokens(&results, 3, 2));
  EXPECT_TRUE(results.tokens.empty());
  EXPECT_TRUE(capture.lines().empty());
  EXPECT_TRUE(decoder->GetTokens(&results, 5, 0));
}

TEST(AudioModemDecoderTest, DtmfGeometryRefusalsAreLoggedInOrder) {
  const auto decoder = MakeDtmfAudioModemDecoder(DtmfDecoderConfig());
  DecodeResults results;
  results.tokens.resize(1);
  base::ScopedLogCapture capture;
  EXPECT_FALSE(decoder->GetTokens(&results, 5, 2));   // 7 != 5.
  EXPECT_FALSE(decoder->GetTokens(&results, 0, 5));   // Adds up; no message.
  EXPECT_FALSE(decoder->GetTokens(&results, 7, -2));  // Adds up; negative.
  EXPECT_EQ(results.tokens.size(), 1u);               // Untouched so far.
  EXPECT_FALSE(decoder->GetTokens(&results, 4, 1));   // Nothing heard yet.
  EXPECT_EQ(capture.Messages(base::LogSeverity::kError),
            (std::vector<std::string>{
                "num_message_bytes and num_crc_check_bytes do not add to correct value",
                "num_message_bytes must be positive", "num_crc_check_bytes must be non-negative"}));
  decoder->ProcessSamples(DtmfAudio({1, 2, 3, 4, 5}, 0));
  EXPECT_FALSE(decoder->GetTokens(&results, 4, 1));
  EXPECT_TRUE(
      capture.Contains(base::LogSeverity::kError, "Unsupported value for num_crc_check_bytes"));
}

// Four tokens of 10 symbols of 2208 samples: 88320 frames, less the one
// strength's worth (16 samples) that an empty history stands for.
TEST(AudioModemDecoderTest, DtmfMaxSafeInputSizeCountsAllChannels) {
  DtmfDecoderConfig config;
  config.num_channels = 2;
  const auto decoder = MakeDtmfAudioModemDecoder(config);
  EXPECT_EQ(decoder->GetMaxSafeInputSize(), 2 * (88320 - 16));
  decoder->ProcessSamples(std::vector<float>(2 * 1600, 0.0f));
  EXPECT_EQ(decoder->GetMaxSafeInputSize(), 2 * (88320 - 1616));
  int16_t raw[4] = {1, 2, 3, 4};
  decoder->ProcessSamplesWithZintar(raw, 4);  // Not a zintar decoder: ignored.
  EXPECT_EQ(decoder->GetMaxSafeInputSize(), 2 * (88320 - 1616));
  decoder->WipeInternalData();
  EXPECT_EQ(decoder->GetMaxSafeInputSize(), 2 * (88320 - 16));
}

TEST(AudioModemDecoderTest, DtmfFactoryRefusalsAndTuning) {
  EXPECT_EQ(DtmfDecoderConfigError(DtmfDecoderConfig()), "");
  std::vector<DtmfDecoderConfig> bad(5);
  bad[0].max_tokens_per_call = 7;
  bad[1].input_sample_rate = 500;
  bad[2].num_channels = 0;
  bad[3].buffer_length_tokens = 0.5f;
  bad[4].tones_per_symbol = 3;
  const std::vector<std::string> expected = {
      "tokens per call must be 1 to 6", "the microphone rate must lie in [1000, 384000] Hz",
      "the microphone must have 1 to 64 channels", "the buffer must hold 1 to 100 tokens",
      "the default tone set makes symbols of 2 tones"};
  for (size_t i = 0; i < bad.size(); ++i) EXPECT_EQ(DtmfDecoderConfigError(bad[i]), expected[i]);

  DtmfDecoderConfig config;
  config.sustain_time = 0.01f;  // 0.06 s of envelope in a 0.05 s symbol.
  EXPECT_NE(DtmfDecoderConfigError(config), "");
  base::ScopedLogCapture capture;
  EXPECT_EQ(MakeDtmfAudioModemDecoder(config), nullptr);
  EXPECT_TRUE(capture.Contains(base::LogSeverity::kError, "SetAdsrWindow(): Nonzero duration"));

  // More tokens per call than the default rank: the rank follows.
  config = DtmfDecoderConfig();
  config.max_tokens_per_call = 6;
  const auto six = MakeDtmfAudioModemDecoder(config);
  six->ProcessSamples(DtmfAudio({1, 2, 3, 4, 5}, 0));
  DecodeResults six_results;
  EXPECT_TRUE(six->GetTokens(&six_results, 5, 0));

  // The tuning reaches the decoder: an unreachable threshold hears nothing.
  audio_vesknet::DtmfDecoderParams tuning;
  tuning.acquisition_threshold = 1e9f;
  const auto deaf = MakeDtmfAudioModemDecoder(DtmfDecoderConfig(), tuning);
  deaf->ProcessSamples(DtmfAudio({1, 2, 3, 4, 5}, 0));
  DecodeResults results;
  EXPECT_FALSE(deaf->GetTokens(&results, 5, 0));
}

TEST(AudioModemDecoderDeathTest, NeedsADtmfDecoder) {
  EXPECT_DEATH(AudioModemDecoder(std::unique_ptr<audio_vesknet::DtmfDecoder>()),
               "Check failed: 'dtmf_decoder' Must be non-null");
}

}  // namespace
}  // namespace audio_modem
