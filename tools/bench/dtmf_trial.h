// One seeded over-the-air trial of the DTMF modem (see trial.h).

#ifndef TOOLS_BENCH_DTMF_TRIAL_H_
#define TOOLS_BENCH_DTMF_TRIAL_H_

#include <cstdint>
#include <memory>
#include <string>

#include "audio/vesknet/dtmf/dtmf_decoder.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "tools/bench/trial.h"

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
  int repeat = 3;           // Token repetitions played back to back.
  bool crc = false;         // 3 message + 2 CRC bytes, or 5 raw bytes.
  ExcisionTuning excision;  // The stage in front of the decoder.
};

TrialResult RunDtmfTrial(const DtmfTrial& trial, uint64_t seed);

// The trial's receiver (configuration, tuning and excision stage) for a
// microphone at `rate` Hz with `channels` channels; null when the envelope
// is refused.
std::unique_ptr<audio_modem::AudioModemDecoder> MakeDtmfTrialDecoder(const DtmfTrial& trial,
                                                                     int rate, int channels);

// Tokens reported from `seconds` of white noise (1000 rms) or speech babble
// (3000 rms) alone, with the same decoding loop: every one is a false token.
int CountDtmfFalseTokens(const DtmfTrial& trial, double seconds, bool babble, uint64_t seed);

// Applies "name=value" to the decoder tuning (its field names, and
// window_size, cross_frequency_weight, division_floor for the normalisation)
// or to the receiver configuration (buffer_length_tokens,
// max_tokens_per_call, checksum 0/1) or to the excision stage (see
// SetExcisionTuning); false for an unknown name or bad value.
bool SetDtmfTuning(const std::string& assignment, DtmfTrial* trial);

}  // namespace vesk_bench

#endif  // TOOLS_BENCH_DTMF_TRIAL_H_
