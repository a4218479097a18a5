// Fuzzing support: everything a host can choose about a modem (both
// waveforms, the transmitter's settings and the receiver's options) read
// from a fuzzer's input with values drawn around the edges that validation
// knows, and written back in the same layout for seed inputs. Also the
// stream of decoder calls (process, tokens, broadcaster, wipe) that the
// decoder fuzz targets share.

#ifndef SOCIAL_TANDRY_AUDIO_FUZZ_MODEM_CONFIG_H_
#define SOCIAL_TANDRY_AUDIO_FUZZ_MODEM_CONFIG_H_

#include <cstdint>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "base/fuzz_input.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"

namespace audio_modem {

struct FuzzModemConfig {
  bool dtmf = false;
  int message_bytes = 6;
  int crc_check_bytes = 2;
  bool checksum_symbol = false;
  DsssWaveformConfig dsss;
  bool single_sideband = false;
  int broadcast_sample_rate = 48000;
  float transition_seconds = 0.005f;
  DtmfWaveformConfig dtmf_waveform;  // bytes_in_token and the checksum come from above.
  // Receiver.
  float microphone_rate = 48000.0f;
  int channels = 1;
  bool listening_mode = false;
  int max_tokens_per_call = 2;
  float buffer_length_tokens = 4.0f;
  float acquisition_window_seconds = 0.75f;
  float broadcaster_threshold = 5.0f;
  bool design_baseband_filter = false;

  // The product configuration of each modem.
  static FuzzModemConfig Dsss();
  static FuzzModemConfig Dtmf();

  // Bytes on air per token.
  int token_bytes() const { return message_bytes + crc_check_bytes; }

  DsssEncoderConfig ToDsssEncoderConfig() const;
  DtmfEncoderConfig ToDtmfEncoderConfig() const;
  DsssDecoderConfig ToDsssDecoderConfig() const;
  DtmfDecoderConfig ToDtmfDecoderConfig() const;
};

// Reads a configuration; Write makes the bytes that read back as `config`.
FuzzModemConfig ReadFuzzModemConfig(base::FuzzInput* input);
void WriteFuzzModemConfig(const FuzzModemConfig& config, base::FuzzSeed* seed);

// A configuration drawn at random around the same edges, for property
// tests: the product DSSS configuration with, on average, one field in ten
// changed to one of its edge values, a value near one (within 3 %, or one
// step for integers) or anywhere in its range; flags are coin tosses.
// Deterministic for a seeded `random`.
FuzzModemConfig RandomFuzzModemConfig(std::mt19937* random);

// One line naming every field, for reports.
std::string DescribeFuzzModemConfig(const FuzzModemConfig& config);

// One `process` call of a decoder fuzz target: whole frames of interleaved
// samples, and two details a target may use: where to cut them into two
// chunks (C interface: any sample) and flag bits (JNI: buffer placement).
struct FuzzProcessCall {
  std::vector<int16_t> samples;
  size_t cut = 0;     // <= samples.size().
  uint8_t flags = 0;  // Free for the target.
};

// The calls a decoder fuzz target makes, as an input asks for them.
struct FuzzDecoderCalls {
  std::function<void(const FuzzProcessCall& call)> process;
  std::function<void()> tokens;
  std::function<void()> broadcaster;
  std::function<void(uint8_t variant)> wipe;  // Wipe, or what else `variant` says.
};

// Reads calls until the input ends: each is an op byte, for `process` a
// frame count (0 to 65535), that many frames of samples, the cut and the
// flags; for `wipe` a variant byte.
void RunFuzzDecoderCalls(base::FuzzInput* input, int channels, const FuzzDecoderCalls& calls);

// Writes the ops that RunFuzzDecoderCalls reads back: `samples` (whole
// frames) fed in pieces of `piece_frames` (cut 0, flags 0), each followed by
// a request for the broadcaster and for tokens.
void WriteFuzzDecoderCalls(const std::vector<int16_t>& samples, int channels, int piece_frames,
                           base::FuzzSeed* seed);

}  // namespace audio_modem

#endif  // SOCIAL_TANDRY_AUDIO_FUZZ_MODEM_CONFIG_H_
