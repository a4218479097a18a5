// Fuzz target: a decoder of any configuration the front's checks accept (DSSS
// with either coder, the listening mode, DTMF; any microphone rate and
// channel count), fed hostile PCM in chunks of sizes taken from the input,
// with token, broadcaster and wipe calls between. A fatal check, a crash or
// a sanitizer report is a finding.

#include <cstdint>
#include <memory>
#include <vector>

#include "base/fuzz_input.h"
#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/fuzz_modem_config.h"

namespace audio_modem {
namespace {

std::unique_ptr<AudioModemDecoder> MakeDecoder(const FuzzModemConfig& config) {
  if (config.dtmf) {
    const DtmfDecoderConfig dtmf = config.ToDtmfDecoderConfig();
    if (!DtmfDecoderConfigError(dtmf).empty()) return nullptr;
    std::unique_ptr<AudioModemDecoder> decoder = MakeDtmfAudioModemDecoder(dtmf);
    // Accepted by the check, so it must build.
    if (!decoder) __builtin_trap();
    return decoder;
  }
  const DsssDecoderConfig dsss = config.ToDsssDecoderConfig();
  if (!DsssDecoderConfigError(dsss).empty()) return nullptr;
  return MakeDsssAudioModemDecoder(dsss);
}

}  // namespace
}  // namespace audio_modem

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  using namespace audio_modem;
  base::SilenceLogsForFuzzing();
  base::FuzzInput input(data, size);
  const FuzzModemConfig config = ReadFuzzModemConfig(&input);
  const std::unique_ptr<AudioModemDecoder> decoder = MakeDecoder(config);
  if (!decoder) return 0;
  std::vector<float> floats;
  std::vector<int16_t> raw;
  DecodeResults results;
  FuzzDecoderCalls calls;
  calls.process = [&](const FuzzProcessCall& call) {
    if (decoder->kind() == AudioModemDecoder::kZintar && (call.flags & 1) != 0) {
      raw = call.samples;
      decoder->ProcessSamplesWithZintar(raw.data(), static_cast<int>(raw.size()));
    } else {
      floats.assign(call.samples.begin(), call.samples.end());
      decoder->ProcessSamples(floats);
    }
  };
  calls.tokens = [&] {
    decoder->GetTokens(&results, config.message_bytes, config.crc_check_bytes);
  };
  calls.broadcaster = [&] { decoder->DetectBroadcaster(); };
  calls.wipe = [&](uint8_t variant) {
    if (variant & 1) {
      decoder->GetMaxSafeInputSize();
    } else {
      decoder->WipeInternalData();
    }
  };
  RunFuzzDecoderCalls(&input, config.channels, calls);
  return 0;
}
