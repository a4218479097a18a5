// Test support for the C interface: default configurations and broadcast
// audio made through the interface itself.

#ifndef VESK_VESK_TEST_UTIL_H_
#define VESK_VESK_TEST_UTIL_H_

#include <cstdint>
#include <vector>

#include "gtest/gtest.h"
#include "vesk/vesk.h"

namespace vesk_test {

inline const std::vector<uint8_t> kSix = {0x01, 0x23, 0x45, 0x67, 0x89, 0xAB};
inline const std::vector<uint8_t> kFive = {0x10, 0x32, 0x54, 0x76, 0x98};

inline vesk_config Defaults(vesk_modem modem) {
  vesk_config config;
  EXPECT_EQ(vesk_config_defaults(&config, modem), VESK_OK);
  return config;
}

// The older 44.1 kHz DSSS coder: upsampling 15, decimation 3.
inline void UseCoder44100(vesk_config* config) {
  config->dsss.coder_sample_rate_hz = 44100;
  config->dsss.upsampling_factor = 15;
  config->dsss.baseband_decimation_factor = 3;
}

// A token as the decoder reported it.
struct Heard {
  std::vector<uint8_t> message;
  double time_seconds;
  bool operator==(const Heard& other) const {
    return message == other.message && time_seconds == other.time_seconds;
  }
};

// Takes the decoder's queued tokens and appends them to *heard.
inline void TakeHeard(vesk_decoder* decoder, std::vector<Heard>* heard) {
  const vesk_token* tokens = nullptr;
  size_t count = 0;
  ASSERT_EQ(vesk_decoder_take_tokens(decoder, &tokens, &count), VESK_OK);
  for (size_t i = 0; i < count; ++i) {
    heard->push_back(
        {std::vector<uint8_t>(tokens[i].message, tokens[i].message + tokens[i].message_bytes),
         tokens[i].time_seconds});
  }
}

// What a loudspeaker plays: half a second of silence, the transition, the
// token three times and a second of silence, as the encoder's PCM.
inline std::vector<int16_t> Broadcast(const vesk_config& config,
                                      const std::vector<uint8_t>& message) {
  vesk_encoder* encoder = nullptr;
  EXPECT_EQ(vesk_encoder_create(&config, &encoder), VESK_OK) << vesk_last_error();
  vesk_pcm pcm;
  EXPECT_EQ(vesk_encoder_encode(encoder, message.data(), message.size(), &pcm), VESK_OK)
      << vesk_last_error();
  const size_t rate = static_cast<size_t>(pcm.sample_rate_hz);
  std::vector<int16_t> played(rate / 2, 0);
  played.insert(played.end(), pcm.samples, pcm.samples + pcm.transition_samples);
  const int16_t* token = pcm.samples + pcm.transition_samples;
  for (int r = 0; r < 3; ++r) played.insert(played.end(), token, token + pcm.token_samples);
  played.resize(played.size() + rate, 0);
  vesk_pcm_free(&pcm);
  vesk_encoder_destroy(encoder);
  return played;
}

}  // namespace vesk_test

#endif  // VESK_VESK_TEST_UTIL_H_
