/*
 * Vesk: an audio modem. The C interface of libvesk, for programs on Linux
 * hosts and for bindings to other languages.
 *
 * An encoder turns a short token (message bytes, optionally followed by two
 * CRC-16 check bytes) into 16-bit PCM for a loudspeaker; a decoder is fed
 * microphone PCM in chunks of any size and reports every token it hears,
 * with the stream time at which it heard it. Two modems: DSSS (a pseudo-noise
 * code on a near-ultrasonic carrier) and DTMF (audible multi-tone symbols);
 * the DSSS decoder has a cheap listening mode that wakes it only when a
 * transmitter is heard.
 *
 *   vesk_config config;
 *   vesk_config_defaults(&config, VESK_MODEM_DSSS);
 *   vesk_encoder* encoder;
 *   if (vesk_encoder_create(&config, &encoder) != VESK_OK) {
 *     fprintf(stderr, "%s\n", vesk_last_error());
 *   }
 *   vesk_pcm pcm;
 *   vesk_encoder_encode(encoder, message, config.message_bytes, &pcm);
 *   ... play pcm.samples at pcm.sample_rate_hz ...
 *   vesk_pcm_free(&pcm);
 *   vesk_encoder_destroy(encoder);
 *
 * Errors: every call that can fail returns a vesk_status; anything but
 * VESK_OK leaves its outputs untouched (unless a function says otherwise),
 * and vesk_last_error() says why in a sentence. No call aborts the process
 * or lets an exception out: a configuration that the create functions accept
 * runs, and one they refuse is answered with VESK_ERROR_CONFIG.
 *
 * Threads: the library starts none. Encoders and decoders are independent
 * objects; each may be used by one thread at a time, and any number may
 * exist at once.
 */

#ifndef VESK_VESK_H_
#define VESK_VESK_H_

#include <stddef.h>
#include <stdint.h>

#if defined(_WIN32)
#define VESK_API
#elif defined(__GNUC__)
#define VESK_API __attribute__((visibility("default")))
#else
#define VESK_API
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* The version of this header; vesk_version() gives the library's. Before
   1.0 a new minor version may add fields to the structs (0.3 added
   vesk_decoder_options.narrowband_excision): build against the header of the
   library you load. */
#define VESK_VERSION_MAJOR 0
#define VESK_VERSION_MINOR 3
#define VESK_VERSION_PATCH 0
#define VESK_VERSION_STRING "0.3.0"

/* "MAJOR.MINOR.PATCH" of the library that is loaded. */
VESK_API const char* vesk_version(void);

typedef enum vesk_status {
  VESK_OK = 0,
  /* A null pointer, a length that does not fit, a destroyed object. */
  VESK_ERROR_ARGUMENT = 1,
  /* A configuration or option that cannot be used (the message says which). */
  VESK_ERROR_CONFIG = 2,
  /* A caller's buffer is too small; the needed size is reported. */
  VESK_ERROR_BUFFER_TOO_SMALL = 3,
  /* Memory could not be allocated. */
  VESK_ERROR_NO_MEMORY = 4,
  /* Anything else that went wrong inside the library. */
  VESK_ERROR_INTERNAL = 5
} vesk_status;

/* A fixed name for a status, such as "VESK_ERROR_CONFIG". (Plain ints here
   and in the records, so that any value a caller passes is well defined.) */
VESK_API const char* vesk_status_name(int status);

/*
 * Why the calling thread's most recent failing vesk call failed, in a
 * sentence; "" when its most recent call succeeded. The text stays valid
 * until the thread's next vesk call.
 */
VESK_API const char* vesk_last_error(void);

typedef enum vesk_modem { VESK_MODEM_DSSS = 0, VESK_MODEM_DTMF = 1 } vesk_modem;

/*
 * The DSSS waveform: what a transmitter and its receivers must agree on,
 * plus the transmitter's own output settings. Defaults (in parentheses) are
 * the product waveform; the older 44.1 kHz coder is coder_sample_rate_hz
 * 44100, upsampling_factor 15, baseband_decimation_factor 3.
 */
typedef struct vesk_dsss_waveform {
  int number_of_taps;             /* PN code register length, 5 to 11 (7). */
  int code_number;                /* 0 to 2 for 5 or 6 taps, else 0 to 3 (0). */
  float coder_sample_rate_hz;     /* Rate the symbols are made at, > 0 (48000). */
  int upsampling_factor;          /* Coder samples per chip, >= 1 (16). */
  int baseband_decimation_factor; /* Divides upsampling_factor (4). */
  float carrier_frequency_hz;     /* (0, coder rate / 2] (18500). */
  int bits_per_symbol;            /* 1, 2, 4 or 8 (4). */
  int min_cycles_per_frame;       /* Lowest symbol tone, carrier cycles per frame, >= 0 (4). */
  int quadrature_carrier;         /* Symbol tones on the cosine carrier, 0 or 1 (0). */
  /* Transmitter only: */
  int single_sideband;          /* Keep only the upper sideband, 0 or 1 (0). */
  int broadcast_sample_rate_hz; /* Rate of the encoded PCM (48000). */
  float transition_seconds;     /* Fade-in before the token, >= 0 (0.005). */
} vesk_dsss_waveform;

/*
 * The DTMF waveform. Defaults are the product waveform: 44.1 kHz, 50 ms
 * symbols of 2 tones from a ten-tone set (740 to 2489 Hz) under a 25 ms
 * attack and 25 ms release envelope.
 */
typedef struct vesk_dtmf_waveform {
  float sample_rate_hz;           /* Rate of the encoded PCM, > 0 (44100). */
  int baseband_decimation_factor; /* >= 1 (16). */
  float window_seconds;           /* Nominal symbol duration, > 0 (0.05). */
  int tones_per_symbol;           /* Tones sounding together (2). */
  /* Envelope segments, seconds, finite, >= 0, adding up to at most
     window_seconds (0.025, 0, 0, 0.025); sustain level in [0, 1] (1). */
  float attack_seconds;
  float decay_seconds;
  float sustain_seconds;
  float release_seconds;
  float sustain_level;
  /* The tone set, Hz, each in [0, sample_rate_hz / 2); every combination of
     tones_per_symbol of them is a symbol. NULL with num_tones 0 (the
     default) selects the default set. Copied by the create functions. */
  const float* tone_frequencies_hz;
  int num_tones;
} vesk_dtmf_waveform;

/* A modem and its token layout. Fill it with vesk_config_defaults(). */
typedef struct vesk_config {
  int modem;               /* A vesk_modem. */
  int message_bytes;       /* Message bytes per token, >= 1 (DSSS 6, DTMF 5). */
  int crc_check_bytes;     /* CRC-16 bytes after the message, 0 or 2 (DSSS 2, DTMF 0). */
  int checksum_symbol;     /* A checksum symbol ends the token, 0 or 1 (DSSS 0, DTMF 1). */
  vesk_dsss_waveform dsss; /* Used when modem is VESK_MODEM_DSSS. */
  vesk_dtmf_waveform dtmf; /* Used when modem is VESK_MODEM_DTMF. */
} vesk_config;

/* Fills *config with the product defaults of `modem` (both waveforms are
   filled; only the modem's own is used). */
VESK_API vesk_status vesk_config_defaults(vesk_config* config, int modem);

/*
 * The lowest microphone rate, Hz, that hears the transmitters of `config`:
 * twice the DSSS carrier (the microphone then passes the whole band below
 * the carrier, which carries a token on its own) or twice the highest DTMF
 * tone. Decoders accept lower rates but hear nothing at them. Web Audio and
 * similar hosts pick the rate themselves: compare it with this before
 * listening. VESK_ERROR_CONFIG when `config` cannot be used.
 */
VESK_API vesk_status vesk_config_min_microphone_rate(const vesk_config* config, float* rate_hz);

/* How a decoder listens. Fill it with vesk_decoder_options_defaults(). */
typedef struct vesk_decoder_options {
  int microphone_rate_hz; /* >= 1000 (44100); the listening mode needs >= 36994. */
  int channels;           /* Interleaved channels of the PCM fed, >= 1 (1). */
  /* DSSS only: the cheap detector listens and wakes the decoder when the
     product waveform is heard, 0 or 1 (0). */
  int listening_mode;
  int max_tokens_per_call;          /* Tokens decoded per request, 1 to 6 (2). */
  float buffer_length_tokens;       /* History held, token durations, >= 1 (4). */
  float acquisition_window_seconds; /* DSSS: scores integrated for the broadcaster, > 0 (0.75). */
  float broadcaster_threshold;      /* DSSS: broadcaster score that counts as heard (5). */
  int design_baseband_filter;       /* DSSS: designed instead of fixed low-pass, 0 or 1 (0). */
  /* Stream time between two requests for tokens, seconds, in (0, 1] (0.25). */
  double poll_interval_seconds;
  /* A token is reported again only after it went unheard for this long,
     seconds, >= 0; 0 reports it at every request that decodes it (3). */
  double hold_seconds;
  /* Notch steady tones (other devices' pilots, whine) out of the input in
     the modem's band before decoding; not in the listening mode. 0 or 1
     (1): with no such tone it changes nothing and costs a few percent. */
  int narrowband_excision;
} vesk_decoder_options;

VESK_API vesk_status vesk_decoder_options_defaults(vesk_decoder_options* options);

/* ----------------------------------------------------------------------- */
/* Encoding                                                                 */

typedef struct vesk_encoder vesk_encoder;

/* Encoded audio: 16-bit mono PCM, the start transition (DSSS; none for
   DTMF) followed by one repetition of the token. To repeat a token, play the
   transition once and the token part as often as wanted. */
typedef struct vesk_pcm {
  int16_t* samples; /* transition_samples + token_samples samples. */
  size_t num_samples;
  size_t transition_samples; /* The first samples: the fade-in. */
  size_t token_samples;      /* The token itself. */
  float sample_rate_hz;      /* The broadcast rate (DSSS) or the DTMF rate. */
} vesk_pcm;

/* A new encoder in *encoder; VESK_ERROR_CONFIG (and *encoder untouched)
   when the configuration cannot be used. */
VESK_API vesk_status vesk_encoder_create(const vesk_config* config, vesk_encoder** encoder);
/* Frees the encoder; NULL is ignored. */
VESK_API void vesk_encoder_destroy(vesk_encoder* encoder);

/* Encodes `message` (exactly the configured message_bytes bytes) into a
   buffer the library allocates; free it with vesk_pcm_free(). */
VESK_API vesk_status vesk_encoder_encode(vesk_encoder* encoder, const uint8_t* message,
                                         size_t message_bytes, vesk_pcm* pcm);
/* Frees the samples of *pcm and empties it; NULL or an empty pcm is ignored. */
VESK_API void vesk_pcm_free(vesk_pcm* pcm);

/* Samples every encoding of this encoder takes (transition and token): the
   size a caller's buffer needs for vesk_encoder_encode_into(). */
VESK_API vesk_status vesk_encoder_pcm_samples(vesk_encoder* encoder, size_t* num_samples);

/* Encodes into the caller's `samples` (capacity `max_samples`): the
   transition, then the token. *pcm describes what was written (its samples
   pointer is `samples`; never pass it to vesk_pcm_free). When the buffer is
   too small, returns VESK_ERROR_BUFFER_TOO_SMALL and sets only
   pcm->num_samples, to the size needed. */
VESK_API vesk_status vesk_encoder_encode_into(vesk_encoder* encoder, const uint8_t* message,
                                              size_t message_bytes, int16_t* samples,
                                              size_t max_samples, vesk_pcm* pcm);

/* ----------------------------------------------------------------------- */
/* Decoding                                                                 */

typedef struct vesk_decoder vesk_decoder;

/* A token heard. */
typedef struct vesk_token {
  const uint8_t* message; /* message_bytes bytes, check bytes verified and removed. */
  size_t message_bytes;
  double time_seconds; /* Stream time (seconds of audio fed) of the request that decoded it. */
} vesk_token;

/* A new decoder for transmitters using `config` (its transmitter-only
   fields are ignored), listening as `options` say (NULL: the defaults). */
VESK_API vesk_status vesk_decoder_create(const vesk_config* config,
                                         const vesk_decoder_options* options,
                                         vesk_decoder** decoder);
/* Frees the decoder; NULL is ignored. */
VESK_API void vesk_decoder_destroy(vesk_decoder* decoder);

/*
 * Feeds `num_samples` interleaved 16-bit samples: chunks of any size, not
 * necessarily whole frames. The decoder works in blocks of the poll
 * interval: whenever a block is complete it is decoded, and the tokens
 * heard are queued with that moment's stream time. The same audio gives the
 * same tokens however it is chunked.
 */
VESK_API vesk_status vesk_decoder_process(vesk_decoder* decoder, const int16_t* samples,
                                          size_t num_samples);

/*
 * Feeds `num_samples` interleaved float samples in -1 ... 1, the range of Web
 * Audio and most audio APIs: each becomes the 16-bit sample that the
 * encoder would make of it (x 32768, truncated toward zero, clamped) and is
 * fed as vesk_decoder_process() feeds it, so the two calls may be mixed.
 * Converts in pieces through a buffer of the decoder's: no allocation per
 * call.
 */
VESK_API vesk_status vesk_decoder_process_float(vesk_decoder* decoder, const float* samples,
                                                size_t num_samples);

/* Decodes the samples of an incomplete block now (at the end of a
   recording); a partial frame is dropped. */
VESK_API vesk_status vesk_decoder_flush(vesk_decoder* decoder);

/*
 * The tokens queued since the last call, oldest first: *tokens points to
 * *count records owned by the decoder, valid until the next call on it.
 * The queue holds at most 1000 untaken tokens; older ones are dropped.
 */
VESK_API vesk_status vesk_decoder_take_tokens(vesk_decoder* decoder, const vesk_token** tokens,
                                              size_t* count);

/* Whether a DSSS transmitter was audible at the latest request (1) or not
   (0); always 0 for DTMF and while the listening mode listens. */
VESK_API vesk_status vesk_decoder_broadcaster(const vesk_decoder* decoder, int* heard);

/* Seconds of audio fed so far (whole frames / microphone rate). */
VESK_API vesk_status vesk_decoder_stream_seconds(const vesk_decoder* decoder, double* seconds);

/* Forgets the audio heard so far and which tokens were reported (a token
   heard again is reported again); queued tokens stay. */
VESK_API vesk_status vesk_decoder_wipe(vesk_decoder* decoder);

#ifdef __cplusplus
} /* extern "C" */
#endif

#endif /* VESK_VESK_H_ */
