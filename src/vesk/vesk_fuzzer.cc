// Fuzz target: the C interface. Any configuration and options (read around
// the edges that validation knows); what is accepted must encode the message
// and decode hostile PCM cut into chunks of any size (frames split between
// calls) or given as floats (non-finite ones included), with token,
// broadcaster, flush and wipe calls between. A status other than VESK_OK
// after acceptance, a fatal check, a crash or a sanitizer report is a
// finding.

#include <cstdint>
#include <limits>
#include <vector>

#include "base/fuzz_input.h"
#include "social/tandry/audio/fuzz_modem_config.h"
#include "vesk/vesk.h"
#include "vesk/vesk_fuzz_config.h"

namespace {

void Require(bool condition) {
  if (!condition) __builtin_trap();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  base::SilenceLogsForFuzzing();
  base::FuzzInput input(data, size);
  const audio_modem::FuzzModemConfig fuzz_config = audio_modem::ReadFuzzModemConfig(&input);
  // Microphone rates beyond int are out of reach of the C records.
  if (!(fuzz_config.microphone_rate > -2e9f && fuzz_config.microphone_rate < 2e9f)) return 0;
  vesk_config config;
  vesk_decoder_options options;
  vesk_fuzz::ToC(fuzz_config, &config, &options);
  options.poll_interval_seconds = input.Byte() / 128.0;
  options.hold_seconds = input.Byte() / 16.0;

  vesk_encoder* encoder = nullptr;
  if (vesk_encoder_create(&config, &encoder) == VESK_OK) {
    std::vector<uint8_t> message(config.message_bytes);
    for (uint8_t& byte : message) byte = input.Byte();
    vesk_pcm pcm;
    Require(vesk_encoder_encode(encoder, message.data(), message.size(), &pcm) == VESK_OK);
    Require(pcm.num_samples == pcm.transition_samples + pcm.token_samples);
    vesk_pcm_free(&pcm);
    vesk_encoder_destroy(encoder);
  }

  vesk_decoder* decoder = nullptr;
  if (vesk_decoder_create(&config, &options, &decoder) != VESK_OK) return 0;
  audio_modem::FuzzDecoderCalls calls;
  std::vector<float> floats;
  calls.process = [&](const audio_modem::FuzzProcessCall& call) {
    if (call.flags & 1) {
      // Float input (Web Audio's), with out-of-range and non-finite values
      // where the flags ask for them.
      floats.assign(call.samples.begin(), call.samples.end());
      for (size_t i = 0; i < floats.size(); ++i) {
        floats[i] /= 32768.0f;
        if ((call.flags & 2) && i % 97 == 0) floats[i] = std::numeric_limits<float>::quiet_NaN();
        if ((call.flags & 4) && i % 89 == 0) floats[i] = -std::numeric_limits<float>::infinity();
        if ((call.flags & 8) && i % 83 == 0) floats[i] = 3e9f;
      }
      Require(vesk_decoder_process_float(decoder, floats.data(), floats.size()) == VESK_OK);
      return;
    }
    // Two chunks, cut anywhere (frames split between calls).
    const int16_t* samples = call.samples.data();
    Require(vesk_decoder_process(decoder, samples, call.cut) == VESK_OK);
    Require(vesk_decoder_process(decoder, samples + call.cut, call.samples.size() - call.cut) ==
            VESK_OK);
  };
  calls.tokens = [&] {
    const vesk_token* tokens = nullptr;
    size_t count = 0;
    Require(vesk_decoder_take_tokens(decoder, &tokens, &count) == VESK_OK);
    for (size_t i = 0; i < count; ++i) {
      Require(tokens[i].message_bytes == static_cast<size_t>(config.message_bytes));
    }
  };
  calls.broadcaster = [&] {
    int heard = 0;
    Require(vesk_decoder_broadcaster(decoder, &heard) == VESK_OK);
  };
  calls.wipe = [&](uint8_t variant) {
    if (variant & 1) {
      Require(vesk_decoder_flush(decoder) == VESK_OK);
    } else {
      Require(vesk_decoder_wipe(decoder) == VESK_OK);
    }
  };
  audio_modem::RunFuzzDecoderCalls(&input, options.channels, calls);
  vesk_decoder_destroy(decoder);
  return 0;
}
