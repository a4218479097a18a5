// Fuzz target: an encoder of any configuration the front's checks accept
// (either modem, every waveform parameter), encoding a message taken from
// the input with 0 or 2 check bytes, its start transition and its PCM.

#include <cstdint>
#include <memory>
#include <vector>

#include "audio/dsp/pcm_conversion.h"
#include "base/fuzz_input.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "social/tandry/audio/fuzz_modem_config.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  using namespace audio_modem;
  base::SilenceLogsForFuzzing();
  base::FuzzInput input(data, size);
  const FuzzModemConfig config = ReadFuzzModemConfig(&input);
  std::unique_ptr<AudioModemEncoder> encoder;
  if (config.dtmf) {
    const DtmfEncoderConfig dtmf = config.ToDtmfEncoderConfig();
    if (!DtmfEncoderConfigError(dtmf).empty()) return 0;
    encoder = MakeDtmfAudioModemEncoder(dtmf);
    if (!encoder) __builtin_trap();  // Accepted by the check, so it must build.
  } else {
    const DsssEncoderConfig dsss = config.ToDsssEncoderConfig();
    if (!DsssEncoderConfigError(dsss).empty()) return 0;
    encoder = MakeDsssAudioModemEncoder(dsss);
  }
  // The message: the configured length, or (a wrong one) any other. Never
  // empty: every entry point refuses an empty message before the encoder
  // sees it, and the CRC coder's fatal check guards that contract.
  const size_t length = input.Bool() ? input.Byte() : static_cast<size_t>(config.message_bytes);
  if (length < 1 || config.message_bytes < 1) return 0;
  std::vector<uint8_t> message;
  for (size_t i = 0; i < length; ++i) message.push_back(input.Byte());
  std::vector<float> audio, transition;
  encoder->Encode(message, &audio, config.crc_check_bytes);
  const bool well_formed = message.size() == static_cast<size_t>(config.message_bytes) &&
                           (config.crc_check_bytes == 0 || config.crc_check_bytes == 2);
  // A sound configuration and a well-formed message always make audio.
  if (well_formed && audio.empty()) __builtin_trap();
  encoder->MakeStartTransition(audio, &transition);
  audio_dsp::FloatsToPcm16Bytes(audio);
  return 0;
}
