// Running box sums over float arrays: a one-dimensional strided form and a
// two-pass form over a row-major matrix.
//
// Window alignment: for a box of width w, let h = (w - 1) / 2 and r = w - h.
// Output k is the sum of the inputs at positions k - r + 1 .. k + h; an odd
// w = 2m + 1 is centred (k - m .. k + m), an even w = 2m has one more sample
// before k than after it (k - m .. k + m - 1). Positions outside the signal
// are simply absent: near the ends a box covers fewer samples, with no
// padding and no renormalisation. The outputs are sums, not means.
//
// The functions are stateless and thread-compatible.

#ifndef AUDIO_DSP_BOX_FILTER_H_
#define AUDIO_DSP_BOX_FILTER_H_

#include <vector>

namespace audio_dsp {

// Box sum of width `box_width` (>= 1) along one strided dimension: the
// samples are input[i * stride] for i in [0, num_samples), and the results go
// to output[i * stride]. num_samples >= 0; stride >= 1. The running sum is
// kept in double precision. input and output must not overlap (not in-place).
// Null pointers, a negative num_samples or a width below 1 are fatal.
void BoxFilter(const float* input, int num_samples, int stride, int box_width, float* output);

// Two-dimensional box sum of a row-major matrix stored flat, `num_columns`
// (>= 1) values per row. A first pass runs BoxFilter of width `row_box_width`
// over the whole flat vector as one sequence: it does not stop at row ends,
// so a box near the end of a row also sums the first values of the next row
// (deliberate). A second pass runs BoxFilter of width `column_box_width` down
// every column of that result.
//
// `output` is resized to input.size(). When the size is not a multiple of
// num_columns, the call is fatal unless `allow_ragged` is true; then the
// trailing values that do not fill a row are still summed into the first pass
// but are not filtered by the second: they are set to 0 in the output.
// `output` may be &input. Allocates one temporary of input.size() floats.
void BoxFilter2D(const std::vector<float>& input, int num_columns, int row_box_width,
                 int column_box_width, bool allow_ragged, std::vector<float>* output);

}  // namespace audio_dsp

#endif  // AUDIO_DSP_BOX_FILTER_H_
