#include "social/tandry/audio/audio_modem_decoder.h"

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

TEST(AudioModemDecoderDeathTest, ChecksItsArguments) {
  EXPECT_DEATH(AudioModemDecoder(std::unique_ptr<audio_vesknet::VesknetDecoder>()),
               "Check failed: 'dsss_decoder' Must be non-null");
  const auto decoder = Decoder();
  EXPECT_DEATH(decoder->GetTokens(nullptr, 6, 2), "Check failed: decode_results");
}

}  // namespace
}  // namespace audio_modem
