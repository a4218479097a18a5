// The first steps of both streaming decoders (DSSS and DTMF) with every block
// of interleaved microphone samples: keeping the history within its bound
// (ComputeBufferTruncation), restarting on the tail of a block that overruns
// the whole buffer, and mixing the channels down to mono.
//
// Stateless; the decoders keep the mono scratch so that a block costs no
// allocation once the scratch has reached the block size.

#ifndef AUDIO_VESKNET_STREAM_INTAKE_H_
#define AUDIO_VESKNET_STREAM_INTAKE_H_

#include <algorithm>
#include <cstdint>
#include <limits>
#include <vector>

#include "audio/vesknet/compute_buffer_truncation.h"

namespace audio_vesknet {

// `value` limited to [0, 2^31 - 1]: the truncation rule counts in 32 bits.
inline int32_t ClampToFrameCount(int64_t value) {
  return static_cast<int32_t>(
      std::min<int64_t>(std::max<int64_t>(value, 0), std::numeric_limits<int32_t>::max()));
}

// Makes room for a block of `num_values` interleaved values (num_channels
// per frame) in a decoder that holds buffered_frames() input frames and may
// hold max_buffer_size, good_block_margin being the span a token needs beside
// the block (see ComputeBufferTruncation, which logs the warnings):
//   - when the block alone overruns the buffer, calls restart() (the decoder
//     forgets everything) and goes on with the block's last max_buffer_size
//     frames, asking buffered_frames() again;
//   - when older history must go, calls drop_frames(count) with a count of
//     input frames > 0.
// Returns the index of the first value of the block to take in (num_values
// when nothing is left of it).
template <typename BufferedFrames, typename Restart, typename DropFrames>
int64_t AdmitBlock(int64_t num_values, int num_channels, int64_t good_block_margin,
                   int64_t max_buffer_size, BufferedFrames buffered_frames, Restart restart,
                   DropFrames drop_frames) {
  int64_t first = 0;
  while (first < num_values) {
    int32_t frames_to_skip = 0;
    int32_t frames_to_drop = 0;
    ComputeBufferTruncation(ClampToFrameCount((num_values - first) / num_channels),
                            ClampToFrameCount(buffered_frames()),
                            ClampToFrameCount(good_block_margin),
                            ClampToFrameCount(max_buffer_size), &frames_to_skip, &frames_to_drop);
    const int64_t skipped_values = static_cast<int64_t>(frames_to_skip) * num_channels;
    if (skipped_values < 1) {
      if (frames_to_drop > 0) drop_frames(frames_to_drop);
      break;
    }
    // The block alone overruns the buffer: start afresh on its tail.
    restart();
    first += skipped_values;
  }
  return first;
}

// How the channels of a frame become one sample.
enum class Downmix {
  kSum,   // Their plain sum (the DSSS decoder).
  kMean,  // Their sum divided by the channel count (the DTMF decoder).
};

// mono[i] = interleaved[i * num_channels] + ... + the frame's last channel,
// summed in order in single precision; with Downmix::kMean then divided by
// (float) num_channels (a division, not a product with its reciprocal, which
// differs in the last bit for 3 channels). `mono` is resized to num_frames.
void DownmixChannels(const float* interleaved, int num_frames, int num_channels, Downmix downmix,
                     std::vector<float>* mono);

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_STREAM_INTAKE_H_
