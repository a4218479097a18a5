// 16-bit PCM WAV files through libsndfile.

#ifndef TOOLS_VESK_WAV_IO_H_
#define TOOLS_VESK_WAV_IO_H_

#include <cstdint>
#include <string>
#include <vector>

namespace vesk_tool {

struct PcmAudio {
  int sample_rate = 0;  // Hz.
  int channels = 1;     // Interleaved in `samples`.
  std::vector<int16_t> samples;
};

// Writes a 16-bit PCM WAV file. False with a message on failure.
bool WriteWav(const std::string& path, const PcmAudio& audio, std::string* error);

// Reads any file libsndfile understands as 16-bit samples. False with a
// message on failure.
bool ReadAudioFile(const std::string& path, PcmAudio* audio, std::string* error);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_WAV_IO_H_
