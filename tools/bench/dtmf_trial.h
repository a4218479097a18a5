// One seeded over-the-air trial of the DTMF modem: encode a token, play it
// through the simulated channel, decode the microphone stream as an app
// would (4096-byte chunks, tokens requested every 0.25 s), and judge.

#ifndef TOOLS_BENCH_DTMF_TRIAL_H_
#define TOOLS_BENCH_DTMF_TRIAL_H_

#include <cstdint>
#include <string>

#include "audio/vesknet/dtmf/dtmf_decoder.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "tools/channel/channel_simulator.h"

namespace vesk_bench {

// The symbol envelope the transmitter uses.
enum class DtmfWindow {
  kConfigured,  // The configuration's envelope (product: 25 ms attack, 25 ms release).
  kHalfSine,    // The encoder's own default, sin(pi i / N).
  kAdsr,        // 10 ms attack, 10 ms decay to 0.5, 20 ms sustain, 10 ms release.
};

struct DtmfTrial {
  // Waveform and receiver configuration, product defaults; the microphone
  // rate and channels are taken from `channel`.
  audio_modem::DtmfDecoderConfig config;
  audio_vesknet::DtmfDecoderParams tuning;  // Decoder tuning (defaults).
  vesk_channel::ChannelParams channel;      // Set per experiment.
  DtmfWindow window = DtmfWindow::kConfigured;
  int repeat = 3;    // Token repetitions played back to back.
  bool crc = false;  // 3 message + 2 CRC bytes, or 5 raw bytes.
};

struct DtmfTrialResult {
  bool correct = false;       // The sent token was reported.
  int wrong = 0;              // Other tokens reported.
  double found_delay_s = -1;  // From the signal's start to the first correct report.
};

// Channel defaults for trials: 0.5 s fixed plus up to 1 s random lead-in,
// 1 s tail, 44.1 kHz mono, no noise.
vesk_channel::ChannelParams DefaultDtmfTrialChannel();

DtmfTrialResult RunDtmfTrial(const DtmfTrial& trial, uint64_t seed);

// Tokens reported from `seconds` of white noise (1000 rms) or speech babble
// (3000 rms) alone, with the same decoding loop: every one is a false token.
int CountDtmfFalseTokens(const DtmfTrial& trial, double seconds, bool babble, uint64_t seed);

// Applies "name=value" to the decoder tuning (its field names, and
// window_size, cross_frequency_weight, division_floor for the normalisation)
// or to the receiver configuration (buffer_length_tokens,
// max_tokens_per_call, checksum 0/1); false for an unknown name or bad value.
bool SetDtmfTuning(const std::string& assignment, DtmfTrial* trial);

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_DTMF_TRIAL_H_
