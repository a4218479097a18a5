// How a streaming receiver keeps its sample history within a fixed bound.
//
// Before a receiver takes in a new block it asks how many frames of the block
// to skip and how many of its oldest history to drop. All counts are input
// sample frames (one sample per channel). Pure apart from two warnings.

#ifndef AUDIO_VESKNET_COMPUTE_BUFFER_TRUNCATION_H_
#define AUDIO_VESKNET_COMPUTE_BUFFER_TRUNCATION_H_

#include <cstdint>

namespace audio_vesknet {

// input_size: frames in the new block.
// buffered_size: frames' worth of history held now.
// good_block_margin: the span that must fit beside a block for a token
//   straddling it to stay decodable; max_buffer_size - good_block_margin is
//   the largest "good" block.
// max_buffer_size: the most frames the receiver may hold.
// *samples_to_skip: out, frames to discard from the start of the new block.
//   When positive the whole history is lost too (*samples_to_drop ==
//   buffered_size) and a warning is logged.
// *samples_to_drop: out, frames to discard from the oldest end of the history.
// Both 0 when everything fits (exactly full is fine). A block larger than the
// largest good block but within max_buffer_size logs a warning and is kept.
void ComputeBufferTruncation(int32_t input_size, int32_t buffered_size, int32_t good_block_margin,
                             int32_t max_buffer_size, int32_t* samples_to_skip,
                             int32_t* samples_to_drop);

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_COMPUTE_BUFFER_TRUNCATION_H_
