// The bounds that the front's configuration checks (the *ConfigError
// functions) put on what hosts may ask for, named once. Within them every
// configuration that a check accepts builds and runs; beyond them a request
// is refused with a sentence instead of exhausting memory or overflowing.
// Hosts that validate on their own side (the Java API, the C API) mirror
// these values.

#ifndef SOCIAL_TANDRY_AUDIO_CONFIG_LIMITS_H_
#define SOCIAL_TANDRY_AUDIO_CONFIG_LIMITS_H_

#include <cstdint>

namespace audio_modem {

// Bytes per token, check bytes included: a 256-byte DSSS token already
// lasts about 22 s on air.
constexpr int kMaxTokenBytes = 256;
// Any sample rate (coder, broadcast, microphone, DTMF), Hz: the fastest
// audio interfaces run at 384 kHz.
constexpr float kMaxSampleRateHz = 384000.0f;
// Interleaved microphone channels.
constexpr int kMaxChannels = 64;
// Duration of one token on air, seconds, and of the history a decoder keeps
// (its buffer length in tokens times that): they bound the memory that an
// encoder and a decoder take (a minute of 384 kHz audio is 90 MiB of floats).
constexpr double kMaxTokenSeconds = 30.0;
constexpr double kMaxHistorySeconds = 60.0;
// Floats of acquisition history a DSSS decoder may keep (64 MiB): the
// acquisition window times the Doppler shifts searched, which grow with the
// baseband rate and with the carrier's cycles per frame.
constexpr int64_t kMaxAcquisitionFloats = int64_t{1} << 24;
// Tones of a DTMF tone set: its decoder follows every tone over the whole
// history (the default set has ten).
constexpr int kMaxDtmfTones = 64;
// Coder samples per DSSS frame (code length x upsampling factor): 11 taps
// at upsampling 32. Longer frames make tokens of minutes.
constexpr int kMaxDsssFrameSamples = 65536;

}  // namespace audio_modem

#endif  // SOCIAL_TANDRY_AUDIO_CONFIG_LIMITS_H_
