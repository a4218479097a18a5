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
