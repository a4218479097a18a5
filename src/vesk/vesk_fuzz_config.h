// Fuzzing and property-test support: a FuzzModemConfig as the C
// interface's records.

#ifndef VESK_VESK_FUZZ_CONFIG_H_
#define VESK_VESK_FUZZ_CONFIG_H_

#include "social/tandry/audio/fuzz_modem_config.h"
#include "vesk/vesk.h"

namespace vesk_fuzz {

// Fills *config and *options from `f`. The tone list stays owned by `f`.
// The microphone rate must fit an int.
inline void ToC(const audio_modem::FuzzModemConfig& f, vesk_config* config,
                vesk_decoder_options* options) {
  vesk_config_defaults(config, f.dtmf ? VESK_MODEM_DTMF : VESK_MODEM_DSSS);
  config->message_bytes = f.message_bytes;
  config->crc_check_bytes = f.crc_check_bytes;
  config->checksum_symbol = f.checksum_symbol;
  vesk_dsss_waveform& w = config->dsss;
  w.number_of_taps = f.dsss.number_of_taps;
  w.code_number = f.dsss.code_number;
  w.coder_sample_rate_hz = f.dsss.sample_rate;
  w.upsampling_factor = f.dsss.upsampling_factor;
  w.baseband_decimation_factor = f.dsss.baseband_decimation_factor;
  w.carrier_frequency_hz = f.dsss.carrier_frequency;
  w.bits_per_symbol = f.dsss.bits_per_symbol;
  w.min_cycles_per_frame = f.dsss.min_cycles_per_frame;
  w.quadrature_carrier = f.dsss.use_quadrature_carrier;
  w.single_sideband = f.single_sideband;
  w.broadcast_sample_rate_hz = f.broadcast_sample_rate;
  w.transition_seconds = f.transition_seconds;
  vesk_dtmf_waveform& t = config->dtmf;
  t.sample_rate_hz = f.dtmf_waveform.sample_rate;
  t.baseband_decimation_factor = f.dtmf_waveform.baseband_decimation_factor;
  t.window_seconds = f.dtmf_waveform.window_duration;
  t.tones_per_symbol = f.dtmf_waveform.tones_per_symbol;
  t.attack_seconds = f.dtmf_waveform.attack_time;
  t.decay_seconds = f.dtmf_waveform.decay_time;
  t.sustain_seconds = f.dtmf_waveform.sustain_time;
  t.release_seconds = f.dtmf_waveform.release_time;
  t.sustain_level = f.dtmf_waveform.sustain_amplitude;
  t.tone_frequencies_hz = f.dtmf_waveform.tone_frequencies.data();
  t.num_tones = static_cast<int>(f.dtmf_waveform.tone_frequencies.size());
  vesk_decoder_options_defaults(options);
  options->microphone_rate_hz = static_cast<int>(f.microphone_rate);
  options->channels = f.channels;
  options->listening_mode = f.listening_mode;
  options->max_tokens_per_call = f.max_tokens_per_call;
  options->buffer_length_tokens = f.buffer_length_tokens;
  options->acquisition_window_seconds = f.acquisition_window_seconds;
  options->broadcaster_threshold = f.broadcaster_threshold;
  options->design_baseband_filter = f.design_baseband_filter;
}

}  // namespace vesk_fuzz

#endif  // VESK_VESK_FUZZ_CONFIG_H_
