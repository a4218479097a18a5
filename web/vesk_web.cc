// What the JavaScript module needs beyond vesk/vesk.h: where each field of
// the C records lies in WebAssembly memory, so that web/vesk.js reads and
// writes them by name instead of by offsets written down twice.

#include <cstddef>
#include <cstdint>
#include <string>
#include <type_traits>
#include <utility>

#include "vesk/vesk.h"

namespace {

// The JavaScript type name of a field: how it is stored.
template <typename T>
const char* KindOf() {
  using U = std::remove_cv_t<T>;
  if constexpr (std::is_pointer_v<U>) {
    static_assert(sizeof(U) == 4, "wasm32 pointers");
    return "ptr";
  } else if constexpr (std::is_same_v<U, double>) {
    return "f64";
  } else if constexpr (std::is_same_v<U, float>) {
    return "f32";
  } else if constexpr (std::is_same_v<U, size_t>) {
    static_assert(sizeof(U) == 4, "wasm32 size_t");
    return "u32";
  } else {
    static_assert(std::is_integral_v<U> || std::is_enum_v<U>, "a field of an unknown kind");
    static_assert(sizeof(U) == 4, "32-bit integer fields only");
    return "i32";
  }
}

void AddField(std::string* json, const char* name, size_t offset, const char* kind) {
  if (json->back() != '[') *json += ',';
  *json += "[\"";
  *json += name;
  *json += "\",";
  *json += std::to_string(offset);
  *json += ",\"";
  *json += kind;
  *json += "\"]";
}

void BeginRecord(std::string* json, const char* name, size_t size) {
  if (json->back() != '{') *json += ',';
  *json += '"';
  *json += name;
  *json += "\":{\"size\":";
  *json += std::to_string(size);
  *json += ",\"fields\":[";
}

void EndRecord(std::string* json) { *json += "]}"; }

// A field's name (nested ones as "dsss.carrier_frequency_hz"), offset and kind.
#define VESK_WEB_FIELD(json, record, member)        \
  AddField(json, #member, offsetof(record, member), \
           KindOf<decltype(std::declval<record&>().member)>())

std::string Layout() {
  std::string json = "{";
  BeginRecord(&json, "config", sizeof(vesk_config));
  VESK_WEB_FIELD(&json, vesk_config, modem);
  VESK_WEB_FIELD(&json, vesk_config, message_bytes);
  VESK_WEB_FIELD(&json, vesk_config, crc_check_bytes);
  VESK_WEB_FIELD(&json, vesk_config, checksum_symbol);
  VESK_WEB_FIELD(&json, vesk_config, dsss.number_of_taps);
  VESK_WEB_FIELD(&json, vesk_config, dsss.code_number);
  VESK_WEB_FIELD(&json, vesk_config, dsss.coder_sample_rate_hz);
  VESK_WEB_FIELD(&json, vesk_config, dsss.upsampling_factor);
  VESK_WEB_FIELD(&json, vesk_config, dsss.baseband_decimation_factor);
  VESK_WEB_FIELD(&json, vesk_config, dsss.carrier_frequency_hz);
  VESK_WEB_FIELD(&json, vesk_config, dsss.bits_per_symbol);
  VESK_WEB_FIELD(&json, vesk_config, dsss.min_cycles_per_frame);
  VESK_WEB_FIELD(&json, vesk_config, dsss.quadrature_carrier);
  VESK_WEB_FIELD(&json, vesk_config, dsss.single_sideband);
  VESK_WEB_FIELD(&json, vesk_config, dsss.broadcast_sample_rate_hz);
  VESK_WEB_FIELD(&json, vesk_config, dsss.transition_seconds);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.sample_rate_hz);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.baseband_decimation_factor);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.window_seconds);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.tones_per_symbol);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.attack_seconds);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.decay_seconds);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.sustain_seconds);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.release_seconds);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.sustain_level);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.tone_frequencies_hz);
  VESK_WEB_FIELD(&json, vesk_config, dtmf.num_tones);
  EndRecord(&json);
  BeginRecord(&json, "options", sizeof(vesk_decoder_options));
  VESK_WEB_FIELD(&json, vesk_decoder_options, microphone_rate_hz);
  VESK_WEB_FIELD(&json, vesk_decoder_options, channels);
  VESK_WEB_FIELD(&json, vesk_decoder_options, listening_mode);
  VESK_WEB_FIELD(&json, vesk_decoder_options, max_tokens_per_call);
  VESK_WEB_FIELD(&json, vesk_decoder_options, buffer_length_tokens);
  VESK_WEB_FIELD(&json, vesk_decoder_options, acquisition_window_seconds);
  VESK_WEB_FIELD(&json, vesk_decoder_options, broadcaster_threshold);
  VESK_WEB_FIELD(&json, vesk_decoder_options, design_baseband_filter);
  VESK_WEB_FIELD(&json, vesk_decoder_options, poll_interval_seconds);
  VESK_WEB_FIELD(&json, vesk_decoder_options, hold_seconds);
  VESK_WEB_FIELD(&json, vesk_decoder_options, narrowband_excision);
  EndRecord(&json);
  BeginRecord(&json, "pcm", sizeof(vesk_pcm));
  VESK_WEB_FIELD(&json, vesk_pcm, samples);
  VESK_WEB_FIELD(&json, vesk_pcm, num_samples);
  VESK_WEB_FIELD(&json, vesk_pcm, transition_samples);
  VESK_WEB_FIELD(&json, vesk_pcm, token_samples);
  VESK_WEB_FIELD(&json, vesk_pcm, sample_rate_hz);
  EndRecord(&json);
  BeginRecord(&json, "token", sizeof(vesk_token));
  VESK_WEB_FIELD(&json, vesk_token, message);
  VESK_WEB_FIELD(&json, vesk_token, message_bytes);
  VESK_WEB_FIELD(&json, vesk_token, time_seconds);
  EndRecord(&json);
  json += '}';
  return json;
}

}  // namespace

// The records' sizes and fields as JSON:
//   {"config": {"size": N, "fields": [["message_bytes", 4, "i32"], ...]},
//    "options": ..., "pcm": ..., "token": ...}
// Kinds: i32, u32, f32, f64, ptr. The text lives as long as the module.
extern "C" const char* vesk_web_layout(void) {
  static const std::string* const layout = new std::string(Layout());
  return layout->c_str();
}
