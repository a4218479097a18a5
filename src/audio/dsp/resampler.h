// Streaming sample-rate converter interface.

#ifndef AUDIO_DSP_RESAMPLER_H_
#define AUDIO_DSP_RESAMPLER_H_

#include <vector>

namespace audio_dsp {

// Converts a stream of samples of type T, delivered in blocks of any size,
// from one sample rate to another. Implementations keep the input that they
// could not consume yet between calls. Not thread-safe; one stream at a time.
template <typename T>
class Resampler {
 public:
  virtual ~Resampler() = default;

  // Returns to the state right after construction (start of a new stream).
  virtual void Reset() = 0;

  // Whether construction succeeded; no other operation may be used otherwise.
  virtual bool Valid() const = 0;

  // Consumes `input` and replaces the contents of `*output` with the samples
  // that can be produced so far. `output` must not be `&input`.
  virtual void ProcessSamples(const std::vector<T>& input, std::vector<T>* output) = 0;

  // Ends the stream: replaces `*output` with the samples still held back.
  virtual void Flush(std::vector<T>* output) = 0;
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_RESAMPLER_H_
