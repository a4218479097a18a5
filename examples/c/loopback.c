/*
 * Encodes a token with the default DSSS configuration, plays it (three
 * repetitions between stretches of silence) straight into a decoder, and
 * prints each message heard as hex on a line of its own. Exits 0 when the
 * message came back, 1 otherwise.
 */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <vesk/vesk.h>

static int check(vesk_status status, const char* what) {
  if (status != VESK_OK) {
    fprintf(stderr, "%s: %s: %s\n", what, vesk_status_name(status), vesk_last_error());
    return 0;
  }
  return 1;
}

int main(void) {
  const uint8_t message[6] = {0x01, 0x23, 0x45, 0x67, 0x89, 0xab};
  vesk_config config;
  vesk_encoder* encoder = NULL;
  vesk_decoder* decoder = NULL;
  vesk_pcm pcm;
  int16_t* played = NULL;
  int found = 0;

  printf("vesk %s\n", vesk_version());
  if (!check(vesk_config_defaults(&config, VESK_MODEM_DSSS), "defaults") ||
      !check(vesk_encoder_create(&config, &encoder), "encoder") ||
      !check(vesk_encoder_encode(encoder, message, sizeof message, &pcm), "encode")) {
    return 1;
  }

  /* Half a second of silence, the transition, the token three times, one
     second of silence: what a loudspeaker would play. */
  size_t rate = (size_t)pcm.sample_rate_hz;
  size_t total = rate / 2 + pcm.transition_samples + 3 * pcm.token_samples + rate;
  played = calloc(total, sizeof *played);
  if (played == NULL) return 1;
  size_t at = rate / 2;
  memcpy(played + at, pcm.samples, pcm.transition_samples * sizeof *played);
  at += pcm.transition_samples;
  for (int r = 0; r < 3; ++r) {
    memcpy(played + at, pcm.samples + pcm.transition_samples, pcm.token_samples * sizeof *played);
    at += pcm.token_samples;
  }

  vesk_decoder_options options;
  vesk_decoder_options_defaults(&options);
  options.microphone_rate_hz = (int)rate;
  if (!check(vesk_decoder_create(&config, &options, &decoder), "decoder")) return 1;
  /* A recording loop hands over 10 ms at a time. */
  for (size_t start = 0; start < total; start += rate / 100) {
    size_t n = total - start < rate / 100 ? total - start : rate / 100;
    if (!check(vesk_decoder_process(decoder, played + start, n), "process")) return 1;
    const vesk_token* tokens;
    size_t count;
    if (!check(vesk_decoder_take_tokens(decoder, &tokens, &count), "tokens")) return 1;
    for (size_t i = 0; i < count; ++i) {
      for (size_t b = 0; b < tokens[i].message_bytes; ++b) printf("%02x", tokens[i].message[b]);
      printf("\n");
      if (tokens[i].message_bytes == sizeof message &&
          memcmp(tokens[i].message, message, sizeof message) == 0) {
        found = 1;
      }
    }
  }

  vesk_decoder_destroy(decoder);
  free(played);
  vesk_pcm_free(&pcm);
  vesk_encoder_destroy(encoder);
  return found ? 0 : 1;
}
