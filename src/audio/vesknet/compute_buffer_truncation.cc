#include "audio/vesknet/compute_buffer_truncation.h"

#include <algorithm>

#include "base/logging.h"

namespace audio_vesknet {

void ComputeBufferTruncation(int32_t input_size, int32_t buffered_size, int32_t good_block_margin,
                             int32_t max_buffer_size, int32_t* samples_to_skip,
                             int32_t* samples_to_drop) {
  CHECK(samples_to_skip);
  CHECK(samples_to_drop);
  *samples_to_skip = 0;
  *samples_to_drop = 0;
  // 64-bit sums: the inputs are arbitrary 32-bit counts.
  if (static_cast<int64_t>(input_size) + buffered_size <= max_buffer_size) return;

  const int64_t max_good_block_size = static_cast<int64_t>(max_buffer_size) - good_block_margin;
  if (max_good_block_size < input_size) {
    if (input_size > max_buffer_size) {
      *samples_to_skip = input_size - max_buffer_size;
      *samples_to_drop = buffered_size;
      LOG(WARNING) << "Input of size " << input_size << " exceeds maximum buffer size "
                   << max_buffer_size << ", " << *samples_to_skip
                   << " samples skipped, signal may be lost.";
      return;
    }
    LOG(WARNING) << "Input of size " << input_size << " exceeds maximum good block size "
                 << max_good_block_size << ", signal may be lost.";
  }
  *samples_to_drop = static_cast<int32_t>(
      std::max<int64_t>(0, static_cast<int64_t>(input_size) - max_buffer_size + buffered_size));
}

}  // namespace audio_vesknet
