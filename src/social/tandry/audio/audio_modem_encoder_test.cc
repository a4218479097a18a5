#include "social/tandry/audio/audio_modem_encoder.h"

#include <cmath>
#include <limits>
#include <vector>

#include "audio/vesknet/crc16_coder.h"
#include "base/scoped_log_capture.h"
#include "gtest/gtest.h"

namespace audio_modem {
namespace {

TEST(AudioModemEncoderTest, ProductConfigurationEncodesSixBytesWithCrc) {
  const auto encoder = MakeDsssAudioModemEncoder(DsssEncoderConfig());
  EXPECT_EQ(encoder->token_size(), 8);
  EXPECT_EQ(encoder->kind(), AudioModemEncoder::kDsss);
  EXPECT_EQ(encoder->GetSampleRate(), 48000.0f);
  std::vector<float> audio;
  encoder->Encode({1, 2, 3, 4, 5, 6}, &audio, 2);
  EXPECT_EQ(audio.size(), 17u * 2032);
  std::vector<float> transition;
  encoder->MakeStartTransition(audio, &transition);
  EXPECT_EQ(transition.size(), 240u);
}

// The CRC bytes are appended before modulation: a 6-byte token with CRC sounds
// exactly like the 8-byte token that carries those check bytes itself.
TEST(AudioModemEncoderTest, CrcBytesAreAppendedBeforeModulation) {
  const auto encoder = MakeDsssAudioModemEncoder(DsssEncoderConfig());
  const std::vector<uint8_t> message = {0xCA, 0xFE, 0x00, 0x42, 0x99, 0x07};
  std::vector<uint8_t> token = message;
  audio_vesknet::Crc16CoderParams params;
  params.num_message_bytes = 6;
  audio_vesknet::Crc16Coder(params).AppendCrc(&token);
  std::vector<float> with_crc, whole_token;
  encoder->Encode(message, &with_crc, 2);
  encoder->Encode(token, &whole_token, 0);
  ASSERT_FALSE(with_crc.empty());
  EXPECT_EQ(with_crc, whole_token);
}

TEST(AudioModemEncoderTest, RefusalsAreLoggedInOrderAndLeaveOutputAlone) {
  const auto encoder = MakeDsssAudioModemEncoder(DsssEncoderConfig());
  base::ScopedLogCapture capture;
  std::vector<float> output = {7};
  encoder->Encode(std::vector<uint8_t>(6), &output, 0);    // 6 + 0 != 8.
  encoder->Encode(std::vector<uint8_t>(10), &output, -2);  // Adds up; negative.
  encoder->Encode(std::vector<uint8_t>(7), &output, 1);    // Adds up; not 0 or 2.
  EXPECT_EQ(output, std::vector<float>{7});
  EXPECT_EQ(capture.Messages(base::LogSeverity::kError),
            (std::vector<std::string>{
                "token_bytes.size() and num_crc_check_bytes do not add to correct value",
                "num_crc_check_bytes must be non-negative",
                "Unsupported value for num_crc_check_bytes"}));
  // An empty audio vector has an empty transition.
  std::vector<float> transition = {1};
  encoder->MakeStartTransition({}, &transition);
  EXPECT_TRUE(transition.empty());
}

TEST(AudioModemEncoderTest, RecordDefaultsAreOneConfigurationAway) {
  DsssEncoderConfig config;
  config.waveform = Waveform44100();
  const auto encoder = MakeDsssAudioModemEncoder(config);
  std::vector<float> audio;
  encoder->Encode(std::vector<uint8_t>(8, 0xA5), &audio, 0);
  EXPECT_EQ(audio.size(), 35249u);
}

TEST(AudioModemEncoderTest, ConfigErrorsAreSentencesNotAborts) {
  EXPECT_EQ(DsssEncoderConfigError(DsssEncoderConfig()), "");
  DsssEncoderConfig config;
  config.waveform.code_number = 3;
  config.waveform.number_of_taps = 6;
  EXPECT_EQ(DsssEncoderConfigError(config), "code number must be 0 to 2 for 6 taps");
  config = DsssEncoderConfig();
  config.waveform.baseband_decimation_factor = 5;
  EXPECT_NE(DsssEncoderConfigError(config), "");
  config = DsssEncoderConfig();
  config.waveform.bits_per_symbol = 3;
  EXPECT_NE(DsssEncoderConfigError(config), "");
  config = DsssEncoderConfig();
  config.transition_duration = -1;
  EXPECT_NE(DsssEncoderConfigError(config), "");
  // The carrier must fit below half the broadcast rate as well as the
  // coder's: 18500 Hz needs a broadcast rate above 37000 Hz.
  config = DsssEncoderConfig();
  config.broadcast_sample_rate = 37001;
  EXPECT_EQ(DsssEncoderConfigError(config), "");
  config.broadcast_sample_rate = 37000;
  EXPECT_EQ(DsssEncoderConfigError(config),
            "the carrier (18500 Hz) must lie below half the broadcast sample rate");
  config.broadcast_sample_rate = 384001;
  EXPECT_EQ(DsssEncoderConfigError(config), "the broadcast sample rate must lie in [1, 384000] Hz");
  // A token must leave at least one sample at the broadcast rate: the
  // shortest one (5 taps, upsampling 1, 1 byte of 8 one-bit symbols and the
  // sync: 279 samples at 48 kHz, 5.8 ms) needs 172 Hz.
  config = DsssEncoderConfig();
  config.token_length_bytes = 1;
  config.waveform.number_of_taps = 5;
  config.waveform.upsampling_factor = 1;
  config.waveform.baseband_decimation_factor = 1;
  config.waveform.bits_per_symbol = 1;
  config.waveform.carrier_frequency = 10;
  EXPECT_DOUBLE_EQ(DsssTokenSeconds(config.waveform, 1, false), 9 * 31 / 48000.0);
  config.broadcast_sample_rate = 173;
  EXPECT_EQ(DsssEncoderConfigError(config), "");
  config.broadcast_sample_rate = 171;
  EXPECT_EQ(DsssEncoderConfigError(config),
            "a token must last at least one sample at the broadcast rate");
  // A transition of 2e8 s once overflowed its sample count.
  config = DsssEncoderConfig();
  config.transition_duration = 1;
  EXPECT_EQ(DsssEncoderConfigError(config), "");
  for (const float seconds : {1.0001f, 2e8f, std::numeric_limits<float>::infinity()}) {
    config.transition_duration = seconds;
    EXPECT_EQ(DsssEncoderConfigError(config), "the transition must last 0 to 1 s");
  }
}

TEST(AudioModemEncoderTest, DtmfProductConfiguration) {
  const auto encoder = MakeDtmfAudioModemEncoder(DtmfEncoderConfig());
  ASSERT_NE(encoder, nullptr);
  EXPECT_EQ(encoder->kind(), AudioModemEncoder::kDtmf);
  EXPECT_EQ(encoder->token_size(), 5);
  EXPECT_EQ(encoder->GetSampleRate(), 44100.0f);
  const std::vector<uint8_t> message = {0x12, 0x34, 0x56};
  std::vector<float> with_crc, whole_token;
  encoder->Encode(message, &with_crc, 2);
  EXPECT_EQ(with_crc.size(), 10u * 2208);  // Spacer, 8 symbols, checksum.
  std::vector<uint8_t> token = message;
  audio_vesknet::Crc16CoderParams params;
  params.num_message_bytes = 3;
  audio_vesknet::Crc16Coder(params).AppendCrc(&token);
  encoder->Encode(token, &whole_token, 0);
  EXPECT_EQ(with_crc, whole_token);
  std::vector<float> transition = {1, 2};
  encoder->MakeStartTransition(with_crc, &transition);
  EXPECT_TRUE(transition.empty());
}

TEST(AudioModemEncoderTest, DtmfOwnTonesAndRefusedEnvelope) {
  DtmfEncoderConfig config;
  config.sample_rate = 8000;
  config.baseband_decimation_factor = 4;
  config.window_duration = 0.04f;  // 320 samples.
  config.attack_time = config.release_time = 0.02f;
  config.tones_per_symbol = 3;
  config.tone_frequencies = {600, 900, 1300, 1800, 2400};  // 10 symbols of 3 tones.
  config.append_checksum_symbol = false;
  config.bytes_in_token = 2;  // 65535 needs 6 base-9 digits.
  EXPECT_EQ(DtmfEncoderConfigError(config), "");
  const auto encoder = MakeDtmfAudioModemEncoder(config);
  ASSERT_NE(encoder, nullptr);
  EXPECT_EQ(encoder->GetSampleRate(), 8000.0f);
  std::vector<float> audio;
  encoder->Encode({0xAB, 0xCD}, &audio, 0);
  EXPECT_EQ(audio.size(), 7u * 320);

  config.sustain_time = 0.001f;  // 0.041 s of envelope in a 0.04 s symbol.
  EXPECT_NE(DtmfEncoderConfigError(config), "");
  base::ScopedLogCapture capture;
  EXPECT_EQ(MakeDtmfAudioModemEncoder(config), nullptr);
  EXPECT_TRUE(capture.Contains(base::LogSeverity::kError,
                               "SetAdsrWindow(): Nonzero duration 0.041 exceeds 0.04."));
}

TEST(AudioModemEncoderTest, DtmfConfigErrors) {
  EXPECT_EQ(DtmfEncoderConfigError(DtmfEncoderConfig()), "");
  std::vector<DtmfEncoderConfig> bad(6);
  bad[0].window_duration = 0.0001f;  // Rounds to no decimated sample.
  bad[1].tones_per_symbol = 3;       // The default set is paired.
  bad[2].tone_frequencies = {500, 600, 22050};
  bad[3].tone_frequencies = {500, 600, 700, 800, 900, 1000};
  bad[3].tones_per_symbol = 3;  // 20 symbols, but only 15 pairs of tones.
  bad[4].sustain_amplitude = std::nanf("");
  bad[5].decay_time = std::numeric_limits<float>::infinity();
  const std::vector<std::string> expected = {
      "the symbol duration must round to between one decimated sample and 2^31 samples",
      "the default tone set makes symbols of 2 tones",
      "every tone must lie in [0, sample_rate / 2) Hz",
      "there may be no more symbols than pairs of tones",
      "the sustain amplitude must lie in [0, 1]",
      "envelope times must be finite and non-negative"};
  for (size_t i = 0; i < bad.size(); ++i) EXPECT_EQ(DtmfEncoderConfigError(bad[i]), expected[i]);
}

TEST(AudioModemEncoderDeathTest, NeedsAnEncoder) {
  EXPECT_DEATH(AudioModemEncoder(std::unique_ptr<audio_vesknet::VesknetEncoder>()),
               "Check failed: 'dsss_encoder' Must be non-null");
  EXPECT_DEATH(AudioModemEncoder(std::unique_ptr<audio_vesknet::DtmfEncoder>()),
               "Check failed: 'dtmf_encoder' Must be non-null");
}

}  // namespace
}  // namespace audio_modem
