// The DSSS waveform in plain values: what a transmitter and its receivers
// must agree on. Hosts (through the JNI entry points) and tools fill it; the
// front turns it into a SymbolWaveCoder.

#ifndef SOCIAL_TANDRY_AUDIO_DSSS_WAVEFORM_CONFIG_H_
#define SOCIAL_TANDRY_AUDIO_DSSS_WAVEFORM_CONFIG_H_

#include <memory>
#include <string>

#include "audio/vesknet/symbol_wave_coder.h"

namespace audio_modem {

// Defaults are the product waveform: the 7-tap code 0 on a 48000 Hz coder
// with 16 samples per chip and baseband decimation 4 (2032-sample frames,
// the configuration that the zintar listening mode hears), an 18500 Hz
// carrier, 4 bits per symbol and tones from 4 cycles per frame.
struct DsssWaveformConfig {
  int number_of_taps = 7;              // PN register length, 5 to 11.
  int code_number = 0;                 // 0 to 2 (5, 6 taps) or 0 to 3.
  float sample_rate = 48000.0f;        // Coder rate, Hz, > 0.
  int upsampling_factor = 16;          // Coder samples per chip, > 0.
  float carrier_frequency = 18500.0f;  // Hz, (0, sample_rate / 2].
  int bits_per_symbol = 4;             // 1, 2, 4 or 8.
  int min_cycles_per_frame = 4;        // >= 0.
  int baseband_decimation_factor = 4;  // Divides upsampling_factor.
  bool use_quadrature_carrier = false;
};

// The coder record's own defaults: 44100 Hz, upsampling 15, decimation 3
// (1905-sample frames), which the zintar listening mode does not hear.
DsssWaveformConfig Waveform44100();

// Empty when `config` makes a valid coder; otherwise a sentence saying what
// is wrong. Lets tools and hosts refuse a configuration instead of aborting.
std::string DsssWaveformConfigError(const DsssWaveformConfig& config);

// Seconds on air of a token of `token_bytes` bytes (check bytes included):
// the sync symbol, (8 / bits_per_symbol) x token_bytes data symbols and the
// checksum symbol when there is one, one frame each. For a configuration that
// DsssWaveformConfigError accepts.
double DsssTokenSeconds(const DsssWaveformConfig& config, int token_bytes, bool checksum_symbol);

// The coder for `config` (aborts on a configuration that the error function
// above refuses).
std::unique_ptr<audio_vesknet::SymbolWaveCoder> MakeSymbolWaveCoder(
    const DsssWaveformConfig& config);

}  // namespace audio_modem

#endif  // SOCIAL_TANDRY_AUDIO_DSSS_WAVEFORM_CONFIG_H_
