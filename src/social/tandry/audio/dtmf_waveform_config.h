// The DTMF waveform in plain values: what a transmitter and its receivers
// must agree on (token length and checksum symbol included). Hosts (through
// the JNI entry points) and tools fill it; the front turns it into the DTMF
// parameter record.

#ifndef SOCIAL_TANDRY_AUDIO_DTMF_WAVEFORM_CONFIG_H_
#define SOCIAL_TANDRY_AUDIO_DTMF_WAVEFORM_CONFIG_H_

#include <string>
#include <vector>

#include "audio/vesknet/dtmf/dtmf_encoder_params.h"

namespace audio_modem {

// Defaults are the product waveform: 5-byte tokens (check bytes included)
// with a checksum symbol (without it the receiver cannot tell wrong tokens
// from right ones), 44100 Hz, decimation 16, 0.05 s symbols (2208 samples) of
// 2 tones from the default ten-tone set, under a 25 ms attack and 25 ms
// release envelope (as sensitive as the half-sine; the 10/10/20/10 ms
// envelope with a half-level sustain costs 1.5 to 2 dB).
struct DtmfWaveformConfig {
  int bytes_in_token = 5;  // Check bytes included, > 0.
  bool append_checksum_symbol = true;
  float sample_rate = 44100.0f;  // Hz.
  int baseband_decimation_factor = 16;
  float window_duration = 0.05f;  // Nominal symbol length, seconds.
  int tones_per_symbol = 2;       // Must be 2 with the default tone set.
  // Envelope: seconds, adding up to at most window_duration, and the
  // sustain level in [0, 1].
  float attack_time = 0.025f;
  float decay_time = 0.0f;
  float sustain_time = 0.0f;
  float release_time = 0.025f;
  float sustain_amplitude = 1.0f;
  // Hz, each in [0, sample_rate / 2); every tones_per_symbol-combination is
  // a symbol, the last one the spacer. Empty = the default ten-tone set.
  std::vector<float> tone_frequencies;
};

// Empty when `config` is sound, and MakeDtmfEncoderParams then succeeds and
// gives a record that the DTMF encoder and decoder accept; otherwise a
// sentence saying what is wrong: a field that would abort in a check, or an
// envelope that would be refused (NaN or infinite times included). Lets
// tools refuse a configuration instead of aborting.
std::string DtmfWaveformConfigError(const DtmfWaveformConfig& config);

// Seconds on air of one token: its symbols, the spacer and the checksum
// symbol when there is one, one frame each. For a configuration that
// DtmfWaveformConfigError accepts.
double DtmfTokenSeconds(const DtmfWaveformConfig& config);

// Fills *params: the record's defaults, the fields of `config`, its tone set
// (when given) with the last combination as the spacer, and its envelope.
// Returns false, having logged why, when the envelope is refused (see
// audio_vesknet::SetAdsrWindow); *params is then incomplete. Other invalid
// fields are left for the encoder's and decoder's checks.
bool MakeDtmfEncoderParams(const DtmfWaveformConfig& config,
                           audio_vesknet::DtmfEncoderParams* params);

}  // namespace audio_modem

#endif  // SOCIAL_TANDRY_AUDIO_DTMF_WAVEFORM_CONFIG_H_
