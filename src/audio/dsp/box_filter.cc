#include "audio/dsp/box_filter.h"

#include <algorithm>
#include <cstddef>

#include "base/logging.h"

namespace audio_dsp {

void BoxFilter(const float* input, int num_samples, int stride, int box_width, float* output) {
  CHECK(input);
  CHECK(num_samples >= 0);
  CHECK(box_width >= 1);
  CHECK(output);
  CHECK(stride >= 1);
  const std::ptrdiff_t step = stride;
  auto in = [input, step](int i) { return static_cast<double>(input[i * step]); };
  auto out = [output, step](int i, double value) { output[i * step] = static_cast<float>(value); };

  const int h = (box_width - 1) / 2;  // Samples after k.
  const int r = box_width - h;        // Samples up to and including k.
  double sum = 0.0;
  for (int i = 0; i < std::min(num_samples, h); ++i) sum += in(i);

  // Leading edge: the box grows at its front only.
  int k = 0;
  for (; k < std::min(num_samples - h, r); ++k) {
    sum += in(k + h);
    out(k, sum);
  }
  if (num_samples >= box_width) {
    for (; k < num_samples - h; ++k) {
      sum += in(k + h) - in(k - r);
      out(k, sum);
    }
  } else {
    // The box is wider than the signal: it covers all of it here.
    for (; k < std::min(r, num_samples); ++k) out(k, sum);
  }
  // Trailing edge: the box shrinks at its back only.
  for (; k < num_samples; ++k) {
    sum -= in(k - r);
    out(k, sum);
  }
}

void BoxFilter2D(const std::vector<float>& input, int num_columns, int row_box_width,
                 int column_box_width, bool allow_ragged, std::vector<float>* output) {
  CHECK(output);
  const int size = static_cast<int>(input.size());
  if (size == 0) {
    output->clear();
    return;
  }
  CHECK(num_columns >= 1);
  const int rows = size / num_columns;
  if (rows * num_columns != size && !allow_ragged) {
    LOG(FATAL) << "input of size " << size << " is not divisible by " << num_columns;
  }
  // Read all of the input before writing, so that output may alias it.
  std::vector<float> row_sums(input.size());
  BoxFilter(input.data(), size, 1, row_box_width, row_sums.data());
  output->resize(input.size());
  for (int c = 0; rows > 0 && c < num_columns; ++c) {
    BoxFilter(row_sums.data() + c, rows, num_columns, column_box_width, output->data() + c);
  }
  std::fill(output->begin() + static_cast<std::ptrdiff_t>(rows) * num_columns, output->end(), 0.0f);
}

}  // namespace audio_dsp
