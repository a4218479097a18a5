// Parameters of the multi-tone (DTMF) modulation, shared by the DTMF encoder
// and decoder: sample rate, symbol length, the envelope window of every
// symbol, the tone set and which tones sound together for each symbol, the
// spacer symbol, the token length and the output peak.
//
// One symbol lasts frame_size = round(window_duration x sample_rate /
// baseband_decimation_factor) x baseband_decimation_factor samples, so that it
// spans a whole number of decimated (baseband) samples. With the defaults:
// 2208 samples (50.07 ms at 44100 Hz), 45 symbols of two tones each from a
// ten-tone pentatonic set, spacer 44, 5-byte tokens of 8 data symbols.
//
// The record is a plain value; the functions below are stateless.

#ifndef AUDIO_VESKNET_DTMF_DTMF_ENCODER_PARAMS_H_
#define AUDIO_VESKNET_DTMF_DTMF_ENCODER_PARAMS_H_

#include <cstdint>
#include <vector>

namespace audio_vesknet {

struct DtmfEncoderParams {
  // The field defaults below, the default tone set (SetDefaultToneTable) and
  // its last symbol as the spacer.
  DtmfEncoderParams();

  float sample_rate = 44100.0f;             // Hz, > 0.
  int32_t baseband_decimation_factor = 16;  // frame_size is a multiple of it, > 0.
  float window_duration = 0.05f;            // Nominal symbol length, seconds, > 0.
  // Envelope of one symbol, frame_size values >= 0; empty = not set yet (the
  // encoder then uses the half-sine of SetDefaultWindow).
  std::vector<float> window_samples;
  std::vector<float> tone_frequencies;  // Hz, each in [0, sample_rate / 2).
  int32_t tones_per_symbol = 2;         // Tones that sound at once, > 0.
  // Row s: indices into tone_frequencies of the tones of symbol s, exactly
  // tones_per_symbol of them. At least 3 rows (the alphabet), and at most as
  // many rows as there are tone pairs.
  std::vector<std::vector<int32_t>> symbol_table;
  int32_t spacer_symbol = 0;   // Separator row, never carries data; set by the constructor.
  int32_t bytes_in_token = 5;  // Token length, check bytes included, > 0.
  bool append_checksum_symbol = false;  // One checksum symbol after the data.
  float max_amplitude = 1.0f;           // Peak |sample| of an encoded token, > 0.
};

// Replaces tone_frequencies with the default set, a two-octave pentatonic
// scale on 740 Hz (740, 830.62, 932.34, 1108.75, 1244.53 Hz and their
// octaves), and symbol_table with all 45 pairs of them in lexicographic order
// ({0,1}, {0,2}, ..., {8,9}). Leaves spacer_symbol and tones_per_symbol alone.
void SetDefaultToneTable(DtmfEncoderParams* params);

// Samples per symbol (see the top of this file). 0 when the result does not
// fit in an int32 or the fields are NaN; negative for negative fields.
int32_t GetFrameSize(const DtmfEncoderParams& params);

// Length in seconds of one token on air: frame_size x (data symbols + leading
// spacer + checksum symbol if any) / sample_rate. 0.45061 s with the defaults.
float GetTokenDurationSeconds(const DtmfEncoderParams& params);

// Sets window_samples to the periodic half-sine of frame_size samples,
// w_i = sin(pi i / N): w_0 = 0, the last value just above zero.
void SetDefaultWindow(DtmfEncoderParams* params);

// Sets window_samples to an attack-decay-sustain-release envelope of
// frame_size samples: a smoothstep rise over attack_time to 1, a smoothstep
// fall over decay_time to sustain_amplitude, a hold for sustain_time, a
// smoothstep fall over release_time to 0, then zeros to the end of the frame.
// Times in seconds, amplitude in [0, 1]. A segment of length zero gives the
// smoothstep midpoint at the instant it is hit.
//
// Returns false, logging why at ERROR and leaving *params unchanged, when
// params is null, the sample rate is not positive, a time is negative, the
// amplitude is outside [0, 1], or the four times add up to more than
// window_duration (with a tolerance of four float ulps).
bool SetAdsrWindow(float attack_time, float decay_time, float sustain_time, float release_time,
                   float sustain_amplitude, DtmfEncoderParams* params);

// Checks every field (fatal on failure): positive rate, factor, duration and
// frame size; a window, if set, of frame_size finite non-negative values;
// tones in [0, Nyquist); at least 3 symbols and no more than the number of
// tone pairs; rows of tones_per_symbol valid indices; the spacer inside the
// table; a positive token length and peak. Duplicate rows or tones are not
// looked for.
void ValidateDtmfEncoderParams(const DtmfEncoderParams& params);

// Replaces *symbol_table with every tones_per_symbol-element combination of
// the indices of `frequencies`, in lexicographic order. tones_per_symbol
// must be >= 0; more tones than frequencies gives an empty table.
void MakeToneCombinations(const std::vector<float>& frequencies, int tones_per_symbol,
                          std::vector<std::vector<int32_t>>* symbol_table);

// Host-supplied tone set: copies `frequencies` into params->tone_frequencies,
// rebuilds params->symbol_table as above and makes its last row the spacer.
// params->tones_per_symbol is left alone; set it to the same count.
void MakeToneCombinations(const std::vector<float>& frequencies, int tones_per_symbol,
                          DtmfEncoderParams* params);

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_DTMF_DTMF_ENCODER_PARAMS_H_
