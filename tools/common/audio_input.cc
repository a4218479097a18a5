#include "tools/common/audio_input.h"

#include <sndfile.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstring>

#include "audio/dsp/pcm_conversion.h"

namespace vesk_tool {
namespace {

class MemorySource : public ByteSource {
 public:
  MemorySource(const uint8_t* data, size_t size) : data_(data), size_(static_cast<int64_t>(size)) {}
  int64_t Read(void* data, int64_t size) override {
    const int64_t n = std::max<int64_t>(0, std::min(size, size_ - position_));
    if (n > 0) std::memcpy(data, data_ + position_, static_cast<size_t>(n));
    position_ += n;
    return n;
  }
  bool Seek(int64_t position) override {
    if (position < 0) return false;
    position_ = position;
    return true;
  }
  int64_t Tell() const override { return position_; }
  int64_t Length() const override { return size_; }

 private:
  const uint8_t* data_;
  int64_t size_;
  int64_t position_ = 0;
};

// A file is read through the descriptor's own seeks. A pipe is read once:
// kept_ holds the bytes [kept_begin_, fd_position_) so that the reader may
// seek back among them; all of them until ForgetPast(), then only those not
// yet read.
class FdSource : public ByteSource {
 public:
  FdSource(int fd, bool owns_fd) : fd_(fd), owns_fd_(owns_fd) {
    struct stat info;
    const off_t start = lseek(fd, 0, SEEK_CUR);
    if (start >= 0 && fstat(fd, &info) == 0 && S_ISREG(info.st_mode)) {
      start_ = start;
      length_ = std::max<int64_t>(0, static_cast<int64_t>(info.st_size) - start_);
    }
  }
  ~FdSource() override {
    if (owns_fd_) close(fd_);
  }

  int64_t Read(void* data, int64_t size) override {
    uint8_t* out = static_cast<uint8_t*>(data);
    if (seekable()) {
      const int64_t n = ReadFd(out, size);
      position_ += n;
      return n;
    }
    // Kept bytes first, then the pipe (reached only once the kept bytes are
    // read, so position_ == fd_position_ there).
    const int64_t kept = std::max<int64_t>(0, std::min(size, fd_position_ - position_));
    if (kept > 0) {
      std::memcpy(out, kept_.data() + (position_ - kept_begin_), static_cast<size_t>(kept));
      position_ += kept;
    }
    const int64_t fresh = ReadFd(out + kept, size - kept);
    if (keeping_) kept_.insert(kept_.end(), out + kept, out + kept + fresh);
    fd_position_ += fresh;
    position_ += fresh;
    if (!keeping_ && position_ == fd_position_) {
      kept_.clear();
      kept_begin_ = fd_position_;
    }
    return kept + fresh;
  }

  bool Seek(int64_t position) override {
    if (position < 0) return false;
    if (seekable()) {
      if (lseek(fd_, static_cast<off_t>(start_ + position), SEEK_SET) < 0) return false;
      position_ = position;
      return true;
    }
    if (position < kept_begin_) return false;
    if (position <= fd_position_) {
      position_ = position;
      return true;
    }
    // Forward over bytes not read yet: read them.
    position_ = fd_position_;
    std::vector<uint8_t> skipped(
        static_cast<size_t>(std::min<int64_t>(position - position_, 65536)));
    while (position_ < position) {
      const int64_t want = std::min<int64_t>(position - position_, skipped.size());
      if (Read(skipped.data(), want) < want) return false;
    }
    return true;
  }

  int64_t Tell() const override { return position_; }
  int64_t Length() const override { return length_; }

  void ForgetPast() override {
    if (seekable() || !keeping_) return;
    keeping_ = false;
    kept_.erase(kept_.begin(), kept_.begin() + (position_ - kept_begin_));
    kept_begin_ = position_;
  }

 private:
  bool seekable() const { return length_ >= 0; }

  // Blocks until `size` bytes, the end of the input or an error.
  int64_t ReadFd(uint8_t* out, int64_t size) {
    int64_t done = 0;
    while (done < size) {
      const ssize_t n = read(fd_, out + done, static_cast<size_t>(size - done));
      if (n < 0 && errno == EINTR) continue;
      if (n <= 0) break;
      done += n;
    }
    return done;
  }

  int fd_;
  bool owns_fd_;
  int64_t start_ = 0;    // The descriptor's offset of byte 0 (files).
  int64_t length_ = -1;  // -1 for a pipe.
  int64_t position_ = 0;
  int64_t fd_position_ = 0;  // Pipe: bytes read from the descriptor.
  bool keeping_ = true;
  int64_t kept_begin_ = 0;
  std::vector<uint8_t> kept_;
};

// libsndfile's view of a ByteSource.
sf_count_t VioLength(void* user_data) {
  const int64_t length = static_cast<ByteSource*>(user_data)->Length();
  // A pipe's length is unknown: as long as it lasts, as for libsndfile's own
  // pipes.
  return length >= 0 ? length : SF_COUNT_MAX;
}

sf_count_t VioSeek(sf_count_t offset, int whence, void* user_data) {
  ByteSource* source = static_cast<ByteSource*>(user_data);
  int64_t target = offset;
  if (whence == SEEK_CUR) target = source->Tell() + offset;
  if (whence == SEEK_END) {
    if (source->Length() < 0) return -1;
    target = source->Length() + offset;
  }
  return source->Seek(target) ? source->Tell() : -1;
}

sf_count_t VioRead(void* data, sf_count_t count, void* user_data) {
  return static_cast<ByteSource*>(user_data)->Read(data, count);
}

sf_count_t VioWrite(const void*, sf_count_t, void*) { return 0; }

sf_count_t VioTell(void* user_data) { return static_cast<ByteSource*>(user_data)->Tell(); }

std::string FormatName(int format) {
  SF_FORMAT_INFO info = {};
  info.format = format;
  if (sf_command(nullptr, SFC_GET_FORMAT_INFO, &info, sizeof(info)) != 0 || info.name == nullptr) {
    return "format " + std::to_string(format);
  }
  return info.name;
}

// Codecs whose samples are floating point: read as floats and scaled like the
// library's own output; every other codec reads as integers.
bool IsFloatCodec(int subformat) {
  switch (subformat) {
    case SF_FORMAT_FLOAT:
    case SF_FORMAT_DOUBLE:
    case SF_FORMAT_VORBIS:
    case SF_FORMAT_OPUS:
    case SF_FORMAT_MPEG_LAYER_I:
    case SF_FORMAT_MPEG_LAYER_II:
    case SF_FORMAT_MPEG_LAYER_III:
      return true;
    default:
      return false;
  }
}

std::string CheckGeometry(int rate, int channels) {
  if (rate < kMinInputRate || rate > kMaxInputRate) {
    return "a sample rate of " + std::to_string(rate) + " Hz is not supported (" +
           std::to_string(kMinInputRate) + " to " + std::to_string(kMaxInputRate) + " Hz)";
  }
  if (channels < 1 || channels > kMaxInputChannels) {
    return std::to_string(channels) + " channels are not supported (1 to " +
           std::to_string(kMaxInputChannels) + ")";
  }
  return std::string();
}

}  // namespace

const char kUnrecognisedFormat[] = "not an audio format that libsndfile recognises";

std::unique_ptr<ByteSource> MakeMemorySource(const uint8_t* data, size_t size) {
  return std::make_unique<MemorySource>(data, size);
}

std::unique_ptr<ByteSource> MakeFdSource(int fd, bool owns_fd) {
  return std::make_unique<FdSource>(fd, owns_fd);
}

std::unique_ptr<AudioInput> AudioInput::Open(std::unique_ptr<ByteSource> source,
                                             const AudioInputOptions& options, std::string* error) {
  std::unique_ptr<AudioInput> input(new AudioInput(std::move(source)));
  ByteSource* bytes = input->source_.get();
  uint8_t start[4] = {};
  const int64_t start_size = bytes->Read(start, sizeof(start));
  if (!bytes->Seek(0)) {
    *error = "cannot go back to the start of the input";
    return nullptr;
  }
  // An MPEG frame sync is 11 set bits that headerless PCM can start with (a
  // sample of -1 is FF FF): such input counts as a header only after an ID3
  // tag when it may be raw.
  const bool frame_sync = start_size >= 2 && start[0] == 0xFF && (start[1] & 0xE0) == 0xE0;
  const bool headerless_guess =
      options.raw == AudioInputOptions::Raw::kIfUnrecognised && frame_sync;
  if (options.raw != AudioInputOptions::Raw::kAlways && !headerless_guess) {
    SF_VIRTUAL_IO io = {VioLength, VioSeek, VioRead, VioWrite, VioTell};
    SF_INFO info = {};
    input->sndfile_ = sf_open_virtual(&io, SFM_READ, &info, bytes);
    if (input->sndfile_ != nullptr) {
      *error = CheckGeometry(info.samplerate, info.channels);
      if (!error->empty()) return nullptr;
      input->sample_rate_ = info.samplerate;
      input->channels_ = info.channels;
      // Streamed headers may announce any length: only a file's is known.
      input->frames_ = bytes->Length() >= 0 ? info.frames : -1;
      input->float_samples_ = IsFloatCodec(info.format & SF_FORMAT_SUBMASK);
      input->pcm16_samples_ = (info.format & SF_FORMAT_SUBMASK) == SF_FORMAT_PCM_16;
      input->format_ = FormatName(info.format & SF_FORMAT_TYPEMASK) + ", " +
                       FormatName(info.format & SF_FORMAT_SUBMASK);
      bytes->ForgetPast();
      return input;
    }
    const int reason = sf_error(nullptr);
    // A damaged WAV is an error, not headerless audio.
    const bool wav_family = start_size == 4 && (std::memcmp(start, "RIFF", 4) == 0 ||
                                                std::memcmp(start, "RIFX", 4) == 0 ||
                                                std::memcmp(start, "RF64", 4) == 0);
    if (options.raw == AudioInputOptions::Raw::kNever || wav_family) {
      *error = reason == SF_ERR_UNRECOGNISED_FORMAT
                   ? kUnrecognisedFormat
                   : std::string("unreadable audio: ") + sf_error_number(reason);
      return nullptr;
    }
    if (!bytes->Seek(0)) {
      *error = "cannot go back to the start of the input";
      return nullptr;
    }
  }
  *error = CheckGeometry(options.raw_rate, options.raw_channels);
  if (!error->empty()) return nullptr;
  input->sample_rate_ = options.raw_rate;
  input->channels_ = options.raw_channels;
  if (bytes->Length() >= 0) input->frames_ = bytes->Length() / (2 * options.raw_channels);
  input->format_ = "raw 16-bit PCM";
  bytes->ForgetPast();
  return input;
}

AudioInput::~AudioInput() {
  if (sndfile_ != nullptr) sf_close(sndfile_);
}

int64_t AudioInput::Read(int64_t max_frames, std::vector<int16_t>* samples) {
  return raw() ? ReadRaw(max_frames, samples) : ReadDecoded(max_frames, samples);
}

int64_t AudioInput::ReadRaw(int64_t max_frames, std::vector<int16_t>* samples) {
  const int64_t frame_bytes = 2 * channels_;
  bytes_.resize(static_cast<size_t>(max_frames * frame_bytes));
  const int64_t got = source_->Read(bytes_.data(), static_cast<int64_t>(bytes_.size()));
  const int64_t frames = got / frame_bytes;
  // Fewer bytes than asked for: the end of the input.
  ignored_bytes_ += got - frames * frame_bytes;
  samples->resize(static_cast<size_t>(frames * channels_));
  for (size_t i = 0; i < samples->size(); ++i) {
    (*samples)[i] = static_cast<int16_t>(bytes_[2 * i] | (bytes_[2 * i + 1] << 8));
  }
  return frames;
}

int64_t AudioInput::ReadDecoded(int64_t max_frames, std::vector<int16_t>* samples) {
  const size_t count = static_cast<size_t>(max_frames * channels_);
  sf_count_t frames;
  if (float_samples_) {
    floats_.resize(count);
    frames = sf_readf_float(sndfile_, floats_.data(), max_frames);
    samples->resize(static_cast<size_t>(frames * channels_));
    for (size_t i = 0; i < samples->size(); ++i) {
      const float x = floats_[i];
      if (!(std::fabs(x) <= 1.0f)) ++clipped_samples_;
      (*samples)[i] = audio_dsp::FloatToPcm16(x);
    }
  } else if (pcm16_samples_) {
    samples->resize(count);
    frames = sf_readf_short(sndfile_, samples->data(), max_frames);
    samples->resize(static_cast<size_t>(frames * channels_));
  } else {
    // Integers arrive left-aligned in 32 bits: the top half is the 16-bit sample.
    ints_.resize(count);
    frames = sf_readf_int(sndfile_, ints_.data(), max_frames);
    samples->resize(static_cast<size_t>(frames * channels_));
    for (size_t i = 0; i < samples->size(); ++i) {
      (*samples)[i] = static_cast<int16_t>(ints_[i] >> 16);
    }
  }
  return frames;
}

bool ReadAudio(const uint8_t* data, size_t size, const AudioInputOptions& options,
               DecodedAudio* audio, std::string* error) {
  std::unique_ptr<AudioInput> input =
      AudioInput::Open(MakeMemorySource(data, size), options, error);
  if (input == nullptr) return false;
  audio->sample_rate = input->sample_rate();
  audio->channels = input->channels();
  audio->format = input->format();
  audio->samples.clear();
  std::vector<int16_t> block;
  while (input->Read(65536, &block) > 0) {
    audio->samples.insert(audio->samples.end(), block.begin(), block.end());
  }
  audio->clipped_samples = input->clipped_samples();
  return true;
}

}  // namespace vesk_tool
