// Audio output of the tools: WAV files (16-bit PCM or 32-bit float) made in
// memory with libsndfile, and any bytes written to a file or to standard
// output. (Headerless 16-bit PCM is audio_dsp::FloatsToPcm16Bytes.) Building the whole file in
// memory first lets a WAV go down a pipe with its lengths filled in.

#ifndef TOOLS_COMMON_AUDIO_OUTPUT_H_
#define TOOLS_COMMON_AUDIO_OUTPUT_H_

#include <cstdint>
#include <string>
#include <vector>

namespace vesk_tool {

// A 16-bit PCM WAV file of interleaved `samples` at `rate` Hz (> 0) with
// `channels` (> 0) channels.
std::vector<uint8_t> WavBytes(const std::vector<int16_t>& samples, int rate, int channels);

// A 32-bit float WAV file of interleaved `samples` (full scale -1 ... 1),
// the values kept exactly; no PEAK chunk, so the same samples give the same
// bytes.
std::vector<uint8_t> WavBytes(const std::vector<float>& samples, int rate, int channels);

// Writes `bytes` to the file `path`, or to standard output for "-". False
// with a one-line message on failure.
bool WriteBytes(const std::string& path, const std::vector<uint8_t>& bytes, std::string* error);

}  // namespace vesk_tool

#endif  // TOOLS_COMMON_AUDIO_OUTPUT_H_
