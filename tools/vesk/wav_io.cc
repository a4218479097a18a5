#include "tools/vesk/wav_io.h"

#include <sndfile.h>

namespace vesk_tool {

bool WriteWav(const std::string& path, const PcmAudio& audio, std::string* error) {
  SF_INFO info = {};
  info.samplerate = audio.sample_rate;
  info.channels = audio.channels;
  info.format = SF_FORMAT_WAV | SF_FORMAT_PCM_16;
  SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
  if (file == nullptr) {
    *error = "cannot write " + path + ": " + sf_strerror(nullptr);
    return false;
  }
  const sf_count_t count = static_cast<sf_count_t>(audio.samples.size());
  const sf_count_t written = sf_write_short(file, audio.samples.data(), count);
  sf_close(file);
  if (written != count) {
    *error = "short write to " + path;
    return false;
  }
  return true;
}

bool ReadAudioFile(const std::string& path, PcmAudio* audio, std::string* error) {
  SF_INFO info = {};
  SNDFILE* file = sf_open(path.c_str(), SFM_READ, &info);
  if (file == nullptr) {
    *error = "cannot read " + path + ": " + sf_strerror(nullptr);
    return false;
  }
  audio->sample_rate = info.samplerate;
  audio->channels = info.channels;
  audio->samples.resize(static_cast<size_t>(info.frames) * info.channels);
  const sf_count_t read =
      sf_read_short(file, audio->samples.data(), static_cast<sf_count_t>(audio->samples.size()));
  sf_close(file);
  audio->samples.resize(static_cast<size_t>(read));
  return true;
}

}  // namespace vesk_tool
