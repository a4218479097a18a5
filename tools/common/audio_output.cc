#include "tools/common/audio_output.h"

#include <sndfile.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>

namespace vesk_tool {
namespace {

// A growable in-memory file for libsndfile.
struct MemoryFile {
  std::vector<uint8_t> bytes;
  sf_count_t position = 0;
};

sf_count_t FileLength(void* user) {
  return static_cast<sf_count_t>(static_cast<MemoryFile*>(user)->bytes.size());
}

sf_count_t FileSeek(sf_count_t offset, int whence, void* user) {
  MemoryFile* file = static_cast<MemoryFile*>(user);
  sf_count_t target = offset;
  if (whence == SEEK_CUR) target += file->position;
  if (whence == SEEK_END) target += static_cast<sf_count_t>(file->bytes.size());
  if (target < 0) return -1;
  file->position = target;
  return target;
}

sf_count_t FileRead(void* data, sf_count_t count, void* user) {
  MemoryFile* file = static_cast<MemoryFile*>(user);
  const sf_count_t size = static_cast<sf_count_t>(file->bytes.size());
  const sf_count_t n = std::max<sf_count_t>(0, std::min(count, size - file->position));
  if (n > 0) std::memcpy(data, file->bytes.data() + file->position, static_cast<size_t>(n));
  file->position += n;
  return n;
}

sf_count_t FileWrite(const void* data, sf_count_t count, void* user) {
  MemoryFile* file = static_cast<MemoryFile*>(user);
  const size_t end = static_cast<size_t>(file->position + count);
  if (file->bytes.size() < end) file->bytes.resize(end);
  if (count > 0) std::memcpy(file->bytes.data() + file->position, data, static_cast<size_t>(count));
  file->position += count;
  return count;
}

sf_count_t FileTell(void* user) { return static_cast<MemoryFile*>(user)->position; }

// Writes `count` interleaved samples with `write` into a WAV of `subformat`.
template <typename Sample, typename Write>
std::vector<uint8_t> MakeWav(const Sample* samples, size_t count, int rate, int channels,
                             int subformat, Write write) {
  SF_VIRTUAL_IO io = {FileLength, FileSeek, FileRead, FileWrite, FileTell};
  SF_INFO info = {};
  info.samplerate = rate;
  info.channels = channels;
  info.format = SF_FORMAT_WAV | subformat;
  MemoryFile file;
  SNDFILE* sndfile = sf_open_virtual(&io, SFM_WRITE, &info, &file);
  if (sndfile == nullptr) return {};
  sf_command(sndfile, SFC_SET_ADD_PEAK_CHUNK, nullptr, SF_FALSE);
  const sf_count_t written = write(sndfile, samples, static_cast<sf_count_t>(count));
  sf_close(sndfile);
  if (written != static_cast<sf_count_t>(count)) return {};
  return file.bytes;
}

}  // namespace

std::vector<uint8_t> WavBytes(const std::vector<int16_t>& samples, int rate, int channels) {
  return MakeWav(samples.data(), samples.size(), rate, channels, SF_FORMAT_PCM_16, sf_write_short);
}

std::vector<uint8_t> WavBytes(const std::vector<float>& samples, int rate, int channels) {
  return MakeWav(samples.data(), samples.size(), rate, channels, SF_FORMAT_FLOAT, sf_write_float);
}

bool WriteBytes(const std::string& path, const std::vector<uint8_t>& bytes, std::string* error) {
  const bool to_stdout = path == "-";
  FILE* file = to_stdout ? stdout : std::fopen(path.c_str(), "wb");
  if (file == nullptr) {
    *error = "cannot write " + path + ": " + std::strerror(errno);
    return false;
  }
  const bool written = std::fwrite(bytes.data(), 1, bytes.size(), file) == bytes.size();
  const bool flushed = to_stdout ? std::fflush(file) == 0 : std::fclose(file) == 0;
  if (!written || !flushed) {
    *error = "cannot write " + (to_stdout ? std::string("standard output") : path) + ": " +
             std::strerror(errno);
    return false;
  }
  return true;
}

}  // namespace vesk_tool
