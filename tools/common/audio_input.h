// Audio input of the tools: any file or stream that libsndfile reads (WAV,
// AIFF, FLAC, OGG and the rest), or headerless 16-bit PCM, delivered as
// interleaved 16-bit samples, the range the decoders work in.
//
// Sample formats:
// - integer PCM of 8 to 32 bits keeps its top 16 bits (an arithmetic shift:
//   8 and 16 bits exactly, 24 and 32 bits rounded toward minus infinity);
// - floating point (32- and 64-bit float, and the lossy codecs, which decode
//   to float) is scaled by 32768 and truncated toward zero, clamped to
//   -32768 ... 32767: the rule the library applies to its own output
//   (audio_dsp::FloatToPcm16), so a float recording of the encoder's samples
//   reads as exactly the PCM of its 16-bit file. Samples beyond full scale
//   (|x| > 1, and NaN) are clipped and counted.
//
// Streams: a pipe is read once, front to back. While the header is being
// recognised the bytes read are kept, so that headerless input can be read
// as raw PCM from its first byte; afterwards memory stays bounded.
//
// The reader works on a ByteSource, so tests and fuzzers drive it from
// memory exactly as the tools drive it from files and standard input. Not
// thread-safe; one AudioInput per thread.

#ifndef TOOLS_COMMON_AUDIO_INPUT_H_
#define TOOLS_COMMON_AUDIO_INPUT_H_

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

struct sf_private_tag;  // libsndfile's SNDFILE.

namespace vesk_tool {

// The message of AudioInput::Open for input that must carry a header and
// does not.
extern const char kUnrecognisedFormat[];

// Input the tools accept: sample rates in Hz and interleaved channels.
constexpr int kMinInputRate = 8000;
constexpr int kMaxInputRate = 192000;
constexpr int kMaxInputChannels = 8;

// Where an input's bytes come from.
class ByteSource {
 public:
  virtual ~ByteSource() = default;
  // Reads up to `size` bytes at the current position into `data`; fewer only
  // at the end of the input. Returns the count read (0 at the end).
  virtual int64_t Read(void* data, int64_t size) = 0;
  // Moves to absolute byte `position` (>= 0). False when the source cannot
  // go there (a pipe's bytes that are no longer kept).
  virtual bool Seek(int64_t position) = 0;
  virtual int64_t Tell() const = 0;
  // Total bytes, or -1 when unknown (a pipe).
  virtual int64_t Length() const = 0;
  // From now on a pipe need not keep the bytes before the current position.
  virtual void ForgetPast() {}
};

// The `size` bytes at `data`, which must outlive the source.
std::unique_ptr<ByteSource> MakeMemorySource(const uint8_t* data, size_t size);

// The file descriptor `fd` (a file or a pipe, read from its current
// position); closed by the source when `owns_fd`.
std::unique_ptr<ByteSource> MakeFdSource(int fd, bool owns_fd);

struct AudioInputOptions {
  enum class Raw {
    kNever,  // Input must carry a header that libsndfile recognises.
    // Input that libsndfile does not recognise is raw 16-bit PCM, and so is
    // input that starts with an MPEG frame sync but no ID3 tag (raw PCM may
    // start so: a sample of -1 is FF FF). A damaged WAV is still an error.
    kIfUnrecognised,
    kAlways,  // Raw 16-bit PCM, whatever it starts with.
  };
  Raw raw = Raw::kIfUnrecognised;
  // Raw input: signed 16-bit little-endian samples at this rate (Hz,
  // kMinInputRate to kMaxInputRate) with this many interleaved channels (1 to
  // kMaxInputChannels).
  int raw_rate = 44100;
  int raw_channels = 1;
};

class AudioInput {
 public:
  // Recognises the input's format (or takes it as raw, as `options` allow)
  // and checks its rate and channels. Null with a one-line message in
  // *error when the input cannot be read.
  static std::unique_ptr<AudioInput> Open(std::unique_ptr<ByteSource> source,
                                          const AudioInputOptions& options, std::string* error);
  ~AudioInput();
  AudioInput(const AudioInput&) = delete;
  AudioInput& operator=(const AudioInput&) = delete;

  int sample_rate() const { return sample_rate_; }  // Hz.
  int channels() const { return channels_; }
  // Frames (samples per channel) in the input, or -1 when unknown.
  int64_t frames() const { return frames_; }
  // What was recognised, e.g. "WAV, 32-bit float" or "raw 16-bit PCM".
  const std::string& format() const { return format_; }
  bool raw() const { return sndfile_ == nullptr; }

  // Replaces *samples with up to `max_frames` (> 0) interleaved frames and
  // returns the count; 0 at the end of the input (or on a read error).
  int64_t Read(int64_t max_frames, std::vector<int16_t>* samples);

  // Floating-point samples so far that lay beyond full scale and were clipped.
  int64_t clipped_samples() const { return clipped_samples_; }
  // Raw input: bytes of an incomplete last frame, ignored.
  int64_t ignored_bytes() const { return ignored_bytes_; }

 private:
  explicit AudioInput(std::unique_ptr<ByteSource> source) : source_(std::move(source)) {}
  int64_t ReadRaw(int64_t max_frames, std::vector<int16_t>* samples);
  int64_t ReadDecoded(int64_t max_frames, std::vector<int16_t>* samples);

  std::unique_ptr<ByteSource> source_;
  sf_private_tag* sndfile_ = nullptr;  // libsndfile's SNDFILE, or null for raw input.
  bool float_samples_ = false;
  bool pcm16_samples_ = false;  // 16-bit PCM: read as it is.
  int sample_rate_ = 0;
  int channels_ = 0;
  int64_t frames_ = -1;
  std::string format_;
  int64_t clipped_samples_ = 0;
  int64_t ignored_bytes_ = 0;
  std::vector<int32_t> ints_;  // Scratch of ReadDecoded().
  std::vector<float> floats_;
  std::vector<uint8_t> bytes_;  // Scratch of ReadRaw().
};

// A whole input in memory.
struct DecodedAudio {
  int sample_rate = 0;  // Hz.
  int channels = 0;
  std::vector<int16_t> samples;  // Interleaved.
  int64_t clipped_samples = 0;
  std::string format;
};

// Reads the `size` bytes at `data` as AudioInput reads a stream. False with a
// one-line message in *error when they cannot be read.
bool ReadAudio(const uint8_t* data, size_t size, const AudioInputOptions& options,
               DecodedAudio* audio, std::string* error);

}  // namespace vesk_tool

#endif  // TOOLS_COMMON_AUDIO_INPUT_H_
