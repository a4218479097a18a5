// The encoder object that the JNI layer holds: one lower encoder (DSSS or
// DTMF) behind a token-size check and optional CRC-16 bytes.
//
// Not thread-safe: one thread at a time, like everything the JNI layer owns.

#ifndef SOCIAL_TANDRY_AUDIO_AUDIO_MODEM_ENCODER_H_
#define SOCIAL_TANDRY_AUDIO_AUDIO_MODEM_ENCODER_H_

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "audio/vesknet/dtmf/dtmf_encoder.h"
#include "audio/vesknet/vesknet_encoder.h"
#include "social/tandry/audio/dsss_waveform_config.h"
#include "social/tandry/audio/dtmf_waveform_config.h"

namespace audio_modem {

class AudioModemEncoder {
 public:
  enum Kind { kDsss = 0, kDtmf = 1 };

  // Takes ownership of a DSSS encoder. Token size = bits_per_symbol x
  // symbols_per_token / 8 bytes, check bytes included.
  explicit AudioModemEncoder(std::unique_ptr<audio_vesknet::VesknetEncoder> dsss_encoder);
  // Takes ownership of a DTMF encoder. Token size = its bytes_in_token,
  // check bytes included.
  explicit AudioModemEncoder(std::unique_ptr<audio_vesknet::DtmfEncoder> dtmf_encoder);
  // Destroys the DTMF encoder first, then the DSSS encoder.
  ~AudioModemEncoder();

  // Replaces *output with the audio of `token_bytes` followed by
  // `num_crc_check_bytes` (0 or 2) CRC-16 bytes. A token whose size and
  // check bytes do not add up to token_size(), a negative count or a count
  // other than 0 and 2 is logged at ERROR and leaves *output unchanged.
  void Encode(const std::vector<uint8_t>& token_bytes, std::vector<float>* output,
              int num_crc_check_bytes) const;

  // Replaces *transition with the fade-in to play before `audio` (empty for
  // an empty `audio`). A DTMF token starts and ends at silence and needs
  // none: always empty.
  void MakeStartTransition(const std::vector<float>& audio, std::vector<float>* transition) const;

  // Sample rate of the encoded audio, Hz: the DSSS broadcast rate or the
  // DTMF sample_rate.
  float GetSampleRate() const;

  int token_size() const { return token_size_; }
  Kind kind() const { return kind_; }

 private:
  // Exactly one of the two is set. Declared in this order so that the DTMF
  // encoder is destroyed first.
  std::unique_ptr<audio_vesknet::VesknetEncoder> dsss_encoder_;
  std::unique_ptr<audio_vesknet::DtmfEncoder> dtmf_encoder_;
  Kind kind_;
  int token_size_;
};

// Everything a host chooses about a DSSS encoder, in plain values; defaults
// are the product configuration: 6 message + 2 CRC bytes on the product
// waveform, broadcast at 48000 Hz after a 5 ms transition.
struct DsssEncoderConfig {
  int token_length_bytes = 8;  // Check bytes included, >= 1.
  bool append_checksum_symbol = false;
  bool single_sideband = false;
  DsssWaveformConfig waveform;
  int broadcast_sample_rate = 48000;   // Hz, > 0.
  float transition_duration = 0.005f;  // Seconds, >= 0.
};

// Empty when `config` can be built; otherwise a sentence saying what is wrong.
// Lets tools refuse a configuration instead of aborting in a check.
std::string DsssEncoderConfigError(const DsssEncoderConfig& config);

// Builds the coder, the DSSS encoder and the front object from `config`.
// Symbols per token = (8 / bits_per_symbol) x token_length_bytes, the
// division first. A configuration that the coder rejects aborts.
std::unique_ptr<AudioModemEncoder> MakeDsssAudioModemEncoder(const DsssEncoderConfig& config);

// Everything a host chooses about a DTMF encoder: the waveform alone (see
// DtmfWaveformConfig for the product defaults).
struct DtmfEncoderConfig : DtmfWaveformConfig {};

// Empty when `config` is sound, and MakeDtmfAudioModemEncoder(config) then
// builds an encoder; otherwise a sentence saying what is wrong: a field that
// would abort in a check, or an envelope that would be refused (NaN or
// infinite times included). Lets tools refuse a configuration instead of
// aborting.
std::string DtmfEncoderConfigError(const DtmfEncoderConfig& config);

// Builds the DTMF parameter record, its envelope window, the DTMF encoder and
// the front object from `config`. Returns null, having logged why, when the
// envelope is refused (see audio_vesknet::SetAdsrWindow); any other invalid
// field aborts in the encoder's checks.
std::unique_ptr<AudioModemEncoder> MakeDtmfAudioModemEncoder(const DtmfEncoderConfig& config);

}  // namespace audio_modem

#endif  // SOCIAL_TANDRY_AUDIO_AUDIO_MODEM_ENCODER_H_
