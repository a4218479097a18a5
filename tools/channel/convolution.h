// Linear convolution of a long signal with a filter by FFT overlap-add, on
// the library's FFT (audio_dsp::RealFFTTransformer): the rooms and device
// responses of the channel simulator.
//
// Single precision: each output carries a rounding error near 1e-7 of the
// signal's scale, so on the 16-bit scale a sample may differ in its last bit
// between builds whose FFT rounds differently. Stateless and thread-safe.

#ifndef TOOLS_CHANNEL_CONVOLUTION_H_
#define TOOLS_CHANNEL_CONVOLUTION_H_

#include <vector>

namespace vesk_channel {

// output[i] = sum over j of filter[j] x input[i + delay - j] for i in
// [0, input.size()): the full convolution advanced by `delay` samples
// (>= 0; the centre tap of a linear-phase filter makes it zero-phase) and cut
// to the input's length. `filter` is not empty.
std::vector<float> Convolve(const std::vector<float>& input, const std::vector<float>& filter,
                            int delay = 0);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_CONVOLUTION_H_
