// Accepted means it runs: thousands of seeded random configurations, drawn
// around the edges that validation knows, go through the C interface (and
// with it the front's checks). Each runs in a child process, so that an
// abort is a failure naming the configuration, not the end of the test run:
// an accepted encoder must encode, an accepted decoder must take audio (the
// encoded token when there is one, and noise) in odd-sized chunks, answer
// every request and be destroyed; a refused one must say why.

#include <sys/wait.h>
#include <unistd.h>

#include <cmath>
#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "social/tandry/audio/fuzz_modem_config.h"
#include "vesk/vesk.h"
#include "vesk/vesk_fuzz_config.h"

namespace {

#if defined(__SANITIZE_ADDRESS__)
constexpr int kConfigurations = 300;  // The sanitizers run everything about ten times slower.
#else
constexpr int kConfigurations = 2000;
#endif

// Exit codes of the child, besides 0 (ran) and 1 (refused).
enum Failure { kRefusedSilently = 10, kEncodeFailed, kCallFailed };

// Runs `f` through the C interface; the child's exit code.
int Exercise(const audio_modem::FuzzModemConfig& f, uint32_t seed) {
  vesk_config config;
  vesk_decoder_options options;
  vesk_fuzz::ToC(f, &config, &options);
  std::mt19937 random(seed);
  options.poll_interval_seconds = std::uniform_real_distribution<double>(0.01, 1.0)(random);
  options.hold_seconds = random() % 2 == 0 ? 0.0 : 3.0;
  options.narrowband_excision = static_cast<int>(random() % 2);

  std::vector<int16_t> audio;
  vesk_encoder* encoder = nullptr;
  const vesk_status encoder_status = vesk_encoder_create(&config, &encoder);
  if (encoder_status != VESK_OK && vesk_last_error()[0] == '\0') return kRefusedSilently;
  if (encoder_status == VESK_OK) {
    std::vector<uint8_t> message(config.message_bytes, 0x5A);
    vesk_pcm pcm;
    if (vesk_encoder_encode(encoder, message.data(), message.size(), &pcm) != VESK_OK ||
        pcm.token_samples == 0) {
      return kEncodeFailed;
    }
    // Two seconds at most, every channel alike.
    const size_t frames = std::min<size_t>(pcm.num_samples, 2 * 48000);
    for (size_t i = 0; i < frames; ++i) audio.insert(audio.end(), f.channels, pcm.samples[i]);
    vesk_pcm_free(&pcm);
    vesk_encoder_destroy(encoder);
  }

  vesk_decoder* decoder = nullptr;
  const vesk_status decoder_status = vesk_decoder_create(&config, &options, &decoder);
  if (decoder_status != VESK_OK) {
    if (vesk_last_error()[0] == '\0') return kRefusedSilently;
    return encoder_status == VESK_OK ? 0 : 1;
  }
  // Half a second of loud noise after the token.
  std::normal_distribution<float> noise(0.0f, 8000.0f);
  const size_t noise_samples = static_cast<size_t>(options.microphone_rate_hz / 2) * f.channels;
  for (size_t i = 0; i < noise_samples; ++i) {
    audio.push_back(static_cast<int16_t>(std::clamp(noise(random), -32768.0f, 32767.0f)));
  }
  for (size_t start = 0; start < audio.size();) {
    const size_t chunk = std::min<size_t>(1 + random() % 5000, audio.size() - start);
    const vesk_token* tokens = nullptr;
    size_t count = 0;
    int heard = 0;
    if (vesk_decoder_process(decoder, audio.data() + start, chunk) != VESK_OK ||
        vesk_decoder_take_tokens(decoder, &tokens, &count) != VESK_OK ||
        vesk_decoder_broadcaster(decoder, &heard) != VESK_OK) {
      return kCallFailed;
    }
    start += chunk;
  }
  if (vesk_decoder_flush(decoder) != VESK_OK || vesk_decoder_wipe(decoder) != VESK_OK) {
    return kCallFailed;
  }
  vesk_decoder_destroy(decoder);
  return 0;
}

TEST(VeskPropertyTest, EveryAcceptedConfigurationRuns) {
  std::mt19937 random(20261123);
  int accepted = 0;
  for (int i = 0; i < kConfigurations; ++i) {
    const audio_modem::FuzzModemConfig config = audio_modem::RandomFuzzModemConfig(&random);
    const uint32_t seed = random();
    // Rates beyond an int cannot be said in the C records.
    if (!(std::fabs(config.microphone_rate) < 2e9f)) continue;
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) _exit(Exercise(config, seed));
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    const std::string described = audio_modem::DescribeFuzzModemConfig(config);
    if (WIFSIGNALED(status)) {
      ADD_FAILURE() << "configuration " << i << " killed the process (signal " << WTERMSIG(status)
                    << "): " << described;
      continue;
    }
    const int code = WEXITSTATUS(status);
    EXPECT_TRUE(code == 0 || code == 1)
        << "configuration " << i << " failed with " << code << ": " << described;
    accepted += code == 0;
  }
  // The draws must reach past validation often enough to mean something.
  EXPECT_GT(accepted, kConfigurations / 5);
  std::cout << accepted << " of " << kConfigurations << " configurations accepted and run\n";
}

}  // namespace
