// Buffer dropouts of a recording: when an app does not read its
// AudioRecord in time, the recorder's buffer overruns and a run of samples
// is lost. The stream goes on without them: later samples arrive early, by
// the length of the run (nothing is zero-filled).
//
// One run in every interval, at a uniform random moment within it (from the
// seed); runs of a fixed length.
//
// Deterministic for a given seed; stateless and thread-safe.

#ifndef TOOLS_CHANNEL_DROPOUTS_H_
#define TOOLS_CHANNEL_DROPOUTS_H_

#include <cstddef>
#include <cstdint>
#include <vector>

namespace vesk_channel {

struct DropoutParams {
  double length_s = 0.02;   // s, > 0: each run of missing samples.
  double interval_s = 0.0;  // s, >= 0: one run in each interval; 0: none.
};

// A run of missing frames: [start, start + length) of the stream before
// anything was removed.
struct Dropout {
  int64_t start = 0;
  int64_t length = 0;
};

// The runs for a stream of `frames` frames at `rate` Hz, in order, not
// overlapping, each round(length_s x rate) frames (at least 1) and wholly
// inside the stream.
std::vector<Dropout> ChooseDropouts(const DropoutParams& params, int rate, int64_t frames,
                                    uint64_t seed);

// Removes the runs (from ChooseDropouts for this stream) from interleaved
// `samples` of `channels` channels.
template <typename Sample>
void RemoveDropouts(const std::vector<Dropout>& dropouts, int channels,
                    std::vector<Sample>* samples) {
  std::size_t write = 0, read = 0;
  for (const Dropout& d : dropouts) {
    const std::size_t begin = static_cast<std::size_t>(d.start) * channels;
    while (read < begin) (*samples)[write++] = (*samples)[read++];
    read = begin + static_cast<std::size_t>(d.length) * channels;
  }
  while (read < samples->size()) (*samples)[write++] = (*samples)[read++];
  samples->resize(write);
}

// Frames of `dropouts` that lie before position `frame` (real-valued) of the
// original stream; a position inside a run counts the part of the run before
// it. That position is at frame - FramesRemovedBefore(...) of the shortened
// stream.
double FramesRemovedBefore(const std::vector<Dropout>& dropouts, double frame);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_DROPOUTS_H_
