// Fuzz target: the tools' audio reader. The first byte picks how headerless
// input is treated and the raw rate and channels; the rest is the input, as
// a file or a stream would deliver it (every format libsndfile knows, or raw
// 16-bit PCM). What is read must be whole frames at an accepted rate.

#include <cstdint>
#include <string>

#include "base/fuzz_input.h"
#include "tools/common/audio_input.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  base::FuzzInput header(data, size);
  const uint8_t pick = header.Byte();
  vesk_tool::AudioInputOptions options;
  options.raw = static_cast<vesk_tool::AudioInputOptions::Raw>(pick % 3);
  options.raw_rate = (pick & 4) ? 8000 : 48000;
  options.raw_channels = 1 + (pick >> 3) % vesk_tool::kMaxInputChannels;
  const size_t skip = size > 0 ? 1 : 0;
  vesk_tool::DecodedAudio audio;
  std::string error;
  if (!vesk_tool::ReadAudio(data + skip, size - skip, options, &audio, &error)) {
    if (error.empty()) __builtin_trap();  // A refusal says why.
    return 0;
  }
  if (audio.channels < 1 || audio.channels > vesk_tool::kMaxInputChannels ||
      audio.sample_rate < vesk_tool::kMinInputRate ||
      audio.sample_rate > vesk_tool::kMaxInputRate ||
      audio.samples.size() % audio.channels != 0) {
    __builtin_trap();
  }
  return 0;
}
