// The C interface over the modem front. Each function validates its
// arguments, converts the C records to the front's configurations, and turns
// every failure (a refused configuration, an allocation, anything thrown)
// into a status and a sentence: nothing here aborts or lets an exception out.

#include "vesk/vesk.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <memory>
#include <new>
#include <string>
#include <utility>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "audio/vesknet/dtmf/dtmf_encoder_params.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "social/tandry/audio/config_limits.h"
#include "social/tandry/audio/token_stream.h"

struct vesk_encoder {
  std::unique_ptr<audio_modem::AudioModemEncoder> encoder;
  int message_bytes = 0;
  int crc_check_bytes = 0;
  size_t pcm_samples = 0;  // Known after the first encoding.
  std::vector<uint8_t> message;
  std::vector<float> audio;
  std::vector<float> transition;
};

struct vesk_decoder {
  std::unique_ptr<audio_modem::TokenStream> stream;
  std::vector<audio_modem::StreamToken> taken;
  std::vector<vesk_token> records;
  std::vector<int16_t> converted;  // Float input on its way to the stream.
};

namespace {

// The calling thread's last failure. Per thread, so that objects used on
// different threads do not mix their messages.
thread_local std::string last_error;

vesk_status Fail(vesk_status status, std::string message) {
  last_error = std::move(message);
  return status;
}

vesk_status Ok() {
  last_error.clear();
  return VESK_OK;
}

// Runs `body`, turning anything thrown into a status.
template <typename Body>
vesk_status Guarded(Body&& body) {
  try {
    return body();
  } catch (const std::bad_alloc&) {
    return Fail(VESK_ERROR_NO_MEMORY, "out of memory");
  } catch (const std::exception& e) {
    return Fail(VESK_ERROR_INTERNAL, std::string("internal error: ") + e.what());
  } catch (...) {
    return Fail(VESK_ERROR_INTERNAL, "internal error");
  }
}

bool IsFlag(int value) { return value == 0 || value == 1; }

// Why `config`'s token layout cannot be used; empty when it can.
std::string LayoutError(const vesk_config& config) {
  if (config.modem != VESK_MODEM_DSSS && config.modem != VESK_MODEM_DTMF) {
    return "modem must be VESK_MODEM_DSSS or VESK_MODEM_DTMF";
  }
  if (config.crc_check_bytes != 0 && config.crc_check_bytes != 2) {
    return "crc_check_bytes must be 0 or 2";
  }
  const int max_message = audio_modem::kMaxTokenBytes - config.crc_check_bytes;
  if (config.message_bytes < 1 || config.message_bytes > max_message) {
    return "message_bytes must be 1 to " + std::to_string(max_message) + " with " +
           std::to_string(config.crc_check_bytes) + " check bytes";
  }
  if (!IsFlag(config.checksum_symbol)) return "checksum_symbol must be 0 or 1";
  if (config.modem == VESK_MODEM_DSSS) {
    const vesk_dsss_waveform& w = config.dsss;
    if (!IsFlag(w.quadrature_carrier)) return "quadrature_carrier must be 0 or 1";
    if (!IsFlag(w.single_sideband)) return "single_sideband must be 0 or 1";
  } else {
    const vesk_dtmf_waveform& w = config.dtmf;
    if (w.num_tones < 0) return "num_tones must not be negative";
    if (w.num_tones > 0 && w.tone_frequencies_hz == nullptr) {
      return "tone_frequencies_hz is NULL but num_tones is " + std::to_string(w.num_tones);
    }
  }
  return std::string();
}

int TokenBytes(const vesk_config& config) { return config.message_bytes + config.crc_check_bytes; }

audio_modem::DsssWaveformConfig DsssWaveform(const vesk_dsss_waveform& w) {
  audio_modem::DsssWaveformConfig waveform;
  waveform.number_of_taps = w.number_of_taps;
  waveform.code_number = w.code_number;
  waveform.sample_rate = w.coder_sample_rate_hz;
  waveform.upsampling_factor = w.upsampling_factor;
  waveform.carrier_frequency = w.carrier_frequency_hz;
  waveform.bits_per_symbol = w.bits_per_symbol;
  waveform.min_cycles_per_frame = w.min_cycles_per_frame;
  waveform.baseband_decimation_factor = w.baseband_decimation_factor;
  waveform.use_quadrature_carrier = w.quadrature_carrier != 0;
  return waveform;
}

void FillDtmfWaveform(const vesk_config& config, audio_modem::DtmfWaveformConfig* waveform) {
  const vesk_dtmf_waveform& w = config.dtmf;
  waveform->bytes_in_token = TokenBytes(config);
  waveform->append_checksum_symbol = config.checksum_symbol != 0;
  waveform->sample_rate = w.sample_rate_hz;
  waveform->baseband_decimation_factor = w.baseband_decimation_factor;
  waveform->window_duration = w.window_seconds;
  waveform->tones_per_symbol = w.tones_per_symbol;
  waveform->attack_time = w.attack_seconds;
  waveform->decay_time = w.decay_seconds;
  waveform->sustain_time = w.sustain_seconds;
  waveform->release_time = w.release_seconds;
  waveform->sustain_amplitude = w.sustain_level;
  waveform->tone_frequencies.assign(w.tone_frequencies_hz, w.tone_frequencies_hz + w.num_tones);
}

// The encoder of `config`, or null with *error set.
std::unique_ptr<audio_modem::AudioModemEncoder> MakeEncoder(const vesk_config& config,
                                                            std::string* error) {
  if (config.modem == VESK_MODEM_DSSS) {
    audio_modem::DsssEncoderConfig dsss;
    dsss.token_length_bytes = TokenBytes(config);
    dsss.append_checksum_symbol = config.checksum_symbol != 0;
    dsss.single_sideband = config.dsss.single_sideband != 0;
    dsss.waveform = DsssWaveform(config.dsss);
    dsss.broadcast_sample_rate = config.dsss.broadcast_sample_rate_hz;
    dsss.transition_duration = config.dsss.transition_seconds;
    *error = audio_modem::DsssEncoderConfigError(dsss);
    if (!error->empty()) return nullptr;
    return audio_modem::MakeDsssAudioModemEncoder(dsss);
  }
  audio_modem::DtmfEncoderConfig dtmf;
  FillDtmfWaveform(config, &dtmf);
  *error = audio_modem::DtmfEncoderConfigError(dtmf);
  if (!error->empty()) return nullptr;
  std::unique_ptr<audio_modem::AudioModemEncoder> encoder =
      audio_modem::MakeDtmfAudioModemEncoder(dtmf);
  if (!encoder) *error = "the envelope was refused";
  return encoder;
}

std::string OptionsError(const vesk_decoder_options& options, int modem) {
  if (!IsFlag(options.listening_mode)) return "listening_mode must be 0 or 1";
  if (!IsFlag(options.design_baseband_filter)) return "design_baseband_filter must be 0 or 1";
  if (!IsFlag(options.narrowband_excision)) return "narrowband_excision must be 0 or 1";
  if (options.listening_mode && modem != VESK_MODEM_DSSS) {
    return "the listening mode hears DSSS transmitters only";
  }
  return std::string();
}

// The token stream of `config` and `options`, or null with *error set.
std::unique_ptr<audio_modem::TokenStream> MakeStream(const vesk_config& config,
                                                     const vesk_decoder_options& options,
                                                     std::string* error) {
  *error = OptionsError(options, config.modem);
  if (!error->empty()) return nullptr;
  audio_modem::TokenStreamOptions stream_options;
  stream_options.poll_interval_seconds = options.poll_interval_seconds;
  stream_options.hold_seconds = options.hold_seconds;
  if (config.modem == VESK_MODEM_DSSS) {
    audio_modem::DsssDecoderConfig dsss;
    dsss.token_length_bytes = TokenBytes(config);
    dsss.use_checksum_symbol = config.checksum_symbol != 0;
    dsss.design_baseband_filter = options.design_baseband_filter != 0;
    dsss.waveform = DsssWaveform(config.dsss);
    dsss.acquisition_window_seconds = options.acquisition_window_seconds;
    dsss.broadcaster_threshold = options.broadcaster_threshold;
    dsss.max_tokens_per_call = options.max_tokens_per_call;
    dsss.input_sample_rate = static_cast<float>(options.microphone_rate_hz);
    dsss.num_channels = options.channels;
    dsss.buffer_length_tokens = options.buffer_length_tokens;
    dsss.use_zintar = options.listening_mode != 0;
    dsss.narrowband_excision = options.narrowband_excision != 0;
    return audio_modem::TokenStream::Create(dsss, config.crc_check_bytes, stream_options, error);
  }
  audio_modem::DtmfDecoderConfig dtmf;
  FillDtmfWaveform(config, &dtmf);
  dtmf.max_tokens_per_call = options.max_tokens_per_call;
  dtmf.input_sample_rate = static_cast<float>(options.microphone_rate_hz);
  dtmf.num_channels = options.channels;
  dtmf.buffer_length_tokens = options.buffer_length_tokens;
  dtmf.narrowband_excision = options.narrowband_excision != 0;
  return audio_modem::TokenStream::Create(dtmf, config.crc_check_bytes, stream_options, error);
}

// The highest frequency that a transmitter of `config` puts out as a
// carrier or tone, Hz; `config` has passed LayoutError.
float HighestFrequency(const vesk_config& config) {
  if (config.modem == VESK_MODEM_DSSS) return config.dsss.carrier_frequency_hz;
  audio_modem::DtmfWaveformConfig waveform;
  FillDtmfWaveform(config, &waveform);
  // An empty tone set is the default set, which the encoder's record holds.
  const std::vector<float> tones = waveform.tone_frequencies.empty()
                                       ? audio_vesknet::DtmfEncoderParams().tone_frequencies
                                       : waveform.tone_frequencies;
  return *std::max_element(tones.begin(), tones.end());
}

// Encodes `message` into the encoder's scratch vectors.
vesk_status EncodeToScratch(vesk_encoder* encoder, const uint8_t* message, size_t message_bytes) {
  if (message == nullptr) return Fail(VESK_ERROR_ARGUMENT, "message is NULL");
  if (message_bytes != static_cast<size_t>(encoder->message_bytes)) {
    return Fail(VESK_ERROR_ARGUMENT, "the message must have " +
                                         std::to_string(encoder->message_bytes) + " bytes, not " +
                                         std::to_string(message_bytes));
  }
  encoder->message.assign(message, message + message_bytes);
  encoder->audio.clear();
  encoder->encoder->Encode(encoder->message, &encoder->audio, encoder->crc_check_bytes);
  if (encoder->audio.empty()) return Fail(VESK_ERROR_INTERNAL, "the encoder produced no audio");
  encoder->encoder->MakeStartTransition(encoder->audio, &encoder->transition);
  encoder->pcm_samples = encoder->transition.size() + encoder->audio.size();
  return VESK_OK;
}

// Writes the scratch audio as PCM to `samples` and describes it in *pcm.
void WritePcm(const vesk_encoder& encoder, int16_t* samples, vesk_pcm* pcm) {
  int16_t* out = samples;
  for (const float s : encoder.transition) *out++ = audio_dsp::FloatToPcm16(s);
  for (const float s : encoder.audio) *out++ = audio_dsp::FloatToPcm16(s);
  pcm->samples = samples;
  pcm->num_samples = encoder.pcm_samples;
  pcm->transition_samples = encoder.transition.size();
  pcm->token_samples = encoder.audio.size();
  pcm->sample_rate_hz = encoder.encoder->GetSampleRate();
}

}  // namespace

extern "C" {

const char* vesk_version(void) { return VESK_VERSION_STRING; }

const char* vesk_status_name(int status) {
  switch (status) {
    case VESK_OK:
      return "VESK_OK";
    case VESK_ERROR_ARGUMENT:
      return "VESK_ERROR_ARGUMENT";
    case VESK_ERROR_CONFIG:
      return "VESK_ERROR_CONFIG";
    case VESK_ERROR_BUFFER_TOO_SMALL:
      return "VESK_ERROR_BUFFER_TOO_SMALL";
    case VESK_ERROR_NO_MEMORY:
      return "VESK_ERROR_NO_MEMORY";
    case VESK_ERROR_INTERNAL:
      return "VESK_ERROR_INTERNAL";
  }
  return "unknown status";
}

const char* vesk_last_error(void) { return last_error.c_str(); }

vesk_status vesk_config_defaults(vesk_config* config, int modem) {
  if (config == nullptr) return Fail(VESK_ERROR_ARGUMENT, "config is NULL");
  if (modem != VESK_MODEM_DSSS && modem != VESK_MODEM_DTMF) {
    return Fail(VESK_ERROR_ARGUMENT, "modem must be VESK_MODEM_DSSS or VESK_MODEM_DTMF");
  }
  const audio_modem::DsssEncoderConfig dsss;
  const audio_modem::DtmfWaveformConfig dtmf;
  *config = vesk_config();
  config->modem = modem;
  if (modem == VESK_MODEM_DSSS) {
    // Six message bytes and two CRC bytes: without a check the decoder may
    // return the runner-up symbol sequence as a second, wrong token.
    config->message_bytes = dsss.token_length_bytes - 2;
    config->crc_check_bytes = 2;
    config->checksum_symbol = dsss.append_checksum_symbol;
  } else {
    // The checksum symbol is the DTMF modem's check.
    config->message_bytes = dtmf.bytes_in_token;
    config->crc_check_bytes = 0;
    config->checksum_symbol = dtmf.append_checksum_symbol;
  }
  vesk_dsss_waveform& w = config->dsss;
  w.number_of_taps = dsss.waveform.number_of_taps;
  w.code_number = dsss.waveform.code_number;
  w.coder_sample_rate_hz = dsss.waveform.sample_rate;
  w.upsampling_factor = dsss.waveform.upsampling_factor;
  w.baseband_decimation_factor = dsss.waveform.baseband_decimation_factor;
  w.carrier_frequency_hz = dsss.waveform.carrier_frequency;
  w.bits_per_symbol = dsss.waveform.bits_per_symbol;
  w.min_cycles_per_frame = dsss.waveform.min_cycles_per_frame;
  w.quadrature_carrier = dsss.waveform.use_quadrature_carrier;
  w.single_sideband = dsss.single_sideband;
  w.broadcast_sample_rate_hz = dsss.broadcast_sample_rate;
  w.transition_seconds = dsss.transition_duration;
  vesk_dtmf_waveform& t = config->dtmf;
  t.sample_rate_hz = dtmf.sample_rate;
  t.baseband_decimation_factor = dtmf.baseband_decimation_factor;
  t.window_seconds = dtmf.window_duration;
  t.tones_per_symbol = dtmf.tones_per_symbol;
  t.attack_seconds = dtmf.attack_time;
  t.decay_seconds = dtmf.decay_time;
  t.sustain_seconds = dtmf.sustain_time;
  t.release_seconds = dtmf.release_time;
  t.sustain_level = dtmf.sustain_amplitude;
  t.tone_frequencies_hz = nullptr;
  t.num_tones = 0;
  return Ok();
}

vesk_status vesk_config_min_microphone_rate(const vesk_config* config, float* rate_hz) {
  return Guarded([&] {
    if (config == nullptr) return Fail(VESK_ERROR_ARGUMENT, "config is NULL");
    if (rate_hz == nullptr) return Fail(VESK_ERROR_ARGUMENT, "rate_hz is NULL");
    std::string error = LayoutError(*config);
    if (error.empty()) {
      // The waveform's own checks; the decoder's options play no part.
      if (config->modem == VESK_MODEM_DSSS) {
        error = audio_modem::DsssWaveformConfigError(DsssWaveform(config->dsss));
      } else {
        audio_modem::DtmfWaveformConfig waveform;
        FillDtmfWaveform(*config, &waveform);
        error = audio_modem::DtmfWaveformConfigError(waveform);
      }
    }
    if (!error.empty()) return Fail(VESK_ERROR_CONFIG, error);
    *rate_hz = 2 * HighestFrequency(*config);
    return Ok();
  });
}

vesk_status vesk_decoder_options_defaults(vesk_decoder_options* options) {
  if (options == nullptr) return Fail(VESK_ERROR_ARGUMENT, "options is NULL");
  const audio_modem::DsssDecoderConfig dsss;
  const audio_modem::TokenStreamOptions stream;
  options->microphone_rate_hz = static_cast<int>(dsss.input_sample_rate);
  options->channels = dsss.num_channels;
  options->listening_mode = dsss.use_zintar;
  options->max_tokens_per_call = dsss.max_tokens_per_call;
  options->buffer_length_tokens = dsss.buffer_length_tokens;
  options->acquisition_window_seconds = dsss.acquisition_window_seconds;
  options->broadcaster_threshold = dsss.broadcaster_threshold;
  options->design_baseband_filter = dsss.design_baseband_filter;
  options->poll_interval_seconds = stream.poll_interval_seconds;
  options->hold_seconds = stream.hold_seconds;
  options->narrowband_excision = dsss.narrowband_excision;
  return Ok();
}

vesk_status vesk_encoder_create(const vesk_config* config, vesk_encoder** encoder) {
  return Guarded([&] {
    if (config == nullptr) return Fail(VESK_ERROR_ARGUMENT, "config is NULL");
    if (encoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "encoder is NULL");
    std::string error = LayoutError(*config);
    if (!error.empty()) return Fail(VESK_ERROR_CONFIG, error);
    auto made = std::make_unique<vesk_encoder>();
    made->encoder = MakeEncoder(*config, &error);
    if (!made->encoder) return Fail(VESK_ERROR_CONFIG, error);
    made->message_bytes = config->message_bytes;
    made->crc_check_bytes = config->crc_check_bytes;
    *encoder = made.release();
    return Ok();
  });
}

void vesk_encoder_destroy(vesk_encoder* encoder) { delete encoder; }

vesk_status vesk_encoder_encode(vesk_encoder* encoder, const uint8_t* message, size_t message_bytes,
                                vesk_pcm* pcm) {
  return Guarded([&] {
    if (encoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "encoder is NULL");
    if (pcm == nullptr) return Fail(VESK_ERROR_ARGUMENT, "pcm is NULL");
    const vesk_status status = EncodeToScratch(encoder, message, message_bytes);
    if (status != VESK_OK) return status;
    auto* samples = static_cast<int16_t*>(std::malloc(encoder->pcm_samples * sizeof(int16_t)));
    if (samples == nullptr) return Fail(VESK_ERROR_NO_MEMORY, "out of memory");
    WritePcm(*encoder, samples, pcm);
    return Ok();
  });
}

void vesk_pcm_free(vesk_pcm* pcm) {
  if (pcm == nullptr) return;
  std::free(pcm->samples);
  *pcm = vesk_pcm();
}

vesk_status vesk_encoder_pcm_samples(vesk_encoder* encoder, size_t* num_samples) {
  return Guarded([&] {
    if (encoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "encoder is NULL");
    if (num_samples == nullptr) return Fail(VESK_ERROR_ARGUMENT, "num_samples is NULL");
    if (encoder->pcm_samples == 0) {
      // Every token of an encoder has the same length: encode one to learn it.
      const std::vector<uint8_t> zeros(encoder->message_bytes, 0);
      const vesk_status status = EncodeToScratch(encoder, zeros.data(), zeros.size());
      if (status != VESK_OK) return status;
    }
    *num_samples = encoder->pcm_samples;
    return Ok();
  });
}

vesk_status vesk_encoder_encode_into(vesk_encoder* encoder, const uint8_t* message,
                                     size_t message_bytes, int16_t* samples, size_t max_samples,
                                     vesk_pcm* pcm) {
  return Guarded([&] {
    if (encoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "encoder is NULL");
    if (pcm == nullptr) return Fail(VESK_ERROR_ARGUMENT, "pcm is NULL");
    if (samples == nullptr) return Fail(VESK_ERROR_ARGUMENT, "samples is NULL");
    const vesk_status status = EncodeToScratch(encoder, message, message_bytes);
    if (status != VESK_OK) return status;
    if (max_samples < encoder->pcm_samples) {
      pcm->num_samples = encoder->pcm_samples;
      return Fail(VESK_ERROR_BUFFER_TOO_SMALL, "the buffer holds " + std::to_string(max_samples) +
                                                   " samples; the token needs " +
                                                   std::to_string(encoder->pcm_samples));
    }
    WritePcm(*encoder, samples, pcm);
    return Ok();
  });
}

vesk_status vesk_decoder_create(const vesk_config* config, const vesk_decoder_options* options,
                                vesk_decoder** decoder) {
  return Guarded([&] {
    if (config == nullptr) return Fail(VESK_ERROR_ARGUMENT, "config is NULL");
    if (decoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "decoder is NULL");
    vesk_decoder_options defaults;
    vesk_decoder_options_defaults(&defaults);
    std::string error = LayoutError(*config);
    if (!error.empty()) return Fail(VESK_ERROR_CONFIG, error);
    auto made = std::make_unique<vesk_decoder>();
    made->stream = MakeStream(*config, options != nullptr ? *options : defaults, &error);
    if (!made->stream) return Fail(VESK_ERROR_CONFIG, error);
    *decoder = made.release();
    return Ok();
  });
}

void vesk_decoder_destroy(vesk_decoder* decoder) { delete decoder; }

vesk_status vesk_decoder_process(vesk_decoder* decoder, const int16_t* samples,
                                 size_t num_samples) {
  return Guarded([&] {
    if (decoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "decoder is NULL");
    if (samples == nullptr && num_samples > 0) return Fail(VESK_ERROR_ARGUMENT, "samples is NULL");
    decoder->stream->Feed(samples, num_samples);
    return Ok();
  });
}

vesk_status vesk_decoder_process_float(vesk_decoder* decoder, const float* samples,
                                       size_t num_samples) {
  return Guarded([&] {
    if (decoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "decoder is NULL");
    if (samples == nullptr && num_samples > 0) return Fail(VESK_ERROR_ARGUMENT, "samples is NULL");
    // Pieces of one stream block at most: the buffer stays small whatever
    // the caller hands in.
    constexpr size_t kPiece = audio_modem::TokenStream::kPieceFrames;
    for (size_t start = 0; start < num_samples; start += kPiece) {
      const size_t n = std::min(kPiece, num_samples - start);
      decoder->converted.resize(n);
      for (size_t i = 0; i < n; ++i) {
        decoder->converted[i] = audio_dsp::FloatToPcm16(samples[start + i]);
      }
      decoder->stream->Feed(decoder->converted.data(), n);
    }
    return Ok();
  });
}

vesk_status vesk_decoder_flush(vesk_decoder* decoder) {
  return Guarded([&] {
    if (decoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "decoder is NULL");
    decoder->stream->Flush();
    return Ok();
  });
}

vesk_status vesk_decoder_take_tokens(vesk_decoder* decoder, const vesk_token** tokens,
                                     size_t* count) {
  return Guarded([&] {
    if (decoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "decoder is NULL");
    if (tokens == nullptr) return Fail(VESK_ERROR_ARGUMENT, "tokens is NULL");
    if (count == nullptr) return Fail(VESK_ERROR_ARGUMENT, "count is NULL");
    decoder->stream->TakeTokens(&decoder->taken);
    decoder->records.clear();
    for (const audio_modem::StreamToken& token : decoder->taken) {
      decoder->records.push_back({token.message.data(), token.message.size(), token.time_seconds});
    }
    *tokens = decoder->records.data();
    *count = decoder->records.size();
    return Ok();
  });
}

vesk_status vesk_decoder_broadcaster(const vesk_decoder* decoder, int* heard) {
  if (decoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "decoder is NULL");
  if (heard == nullptr) return Fail(VESK_ERROR_ARGUMENT, "heard is NULL");
  *heard = decoder->stream->broadcaster() ? 1 : 0;
  return Ok();
}

vesk_status vesk_decoder_stream_seconds(const vesk_decoder* decoder, double* seconds) {
  if (decoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "decoder is NULL");
  if (seconds == nullptr) return Fail(VESK_ERROR_ARGUMENT, "seconds is NULL");
  *seconds = decoder->stream->stream_seconds();
  return Ok();
}

vesk_status vesk_decoder_wipe(vesk_decoder* decoder) {
  return Guarded([&] {
    if (decoder == nullptr) return Fail(VESK_ERROR_ARGUMENT, "decoder is NULL");
    decoder->stream->Wipe();
    return Ok();
  });
}

}  // extern "C"
