#include "tools/channel/convolution.h"

#include <algorithm>
#include <complex>
#include <cstdint>

#include "audio/dsp/kiss_fft.h"
#include "base/logging.h"

namespace vesk_channel {

std::vector<float> Convolve(const std::vector<float>& input, const std::vector<float>& filter,
                            int delay) {
  CHECK(!filter.empty());
  CHECK(delay >= 0);
  const int64_t length = static_cast<int64_t>(input.size());
  const int64_t filter_length = static_cast<int64_t>(filter.size());
  // Transforms of at least twice the filter: each block of input then
  // yields at least as many new samples as the filter is long.
  int size = 64;
  while (size < 2 * filter_length) size *= 2;
  const int64_t block = size - filter_length + 1;
  const audio_dsp::RealFFTTransformer fft(size, /*scale_inverse=*/true);
  const int bins = fft.GetTransformedSize();

  std::vector<float> padded(size, 0.0f);
  std::copy(filter.begin(), filter.end(), padded.begin());
  std::vector<std::complex<float>> response(bins);
  fft.Forward(padded.data(), response.data());

  std::vector<float> output(input.size(), 0.0f);
  std::vector<std::complex<float>> spectrum(bins);
  std::vector<float> piece(size);
  // Blocks of input whose convolution reaches the output window [delay,
  // delay + length) of the full result.
  for (int64_t offset = 0; offset < length; offset += block) {
    if (offset + block + filter_length - 1 <= delay) continue;
    if (offset >= delay + length) break;
    std::fill(padded.begin(), padded.end(), 0.0f);
    const int64_t count = std::min(block, length - offset);
    std::copy(input.begin() + offset, input.begin() + offset + count, padded.begin());
    fft.Forward(padded.data(), spectrum.data());
    for (int k = 0; k < bins; ++k) spectrum[k] *= response[k];
    fft.Inverse(spectrum.data(), piece.data());
    // Sample j of this piece is sample offset + j of the full convolution.
    const int64_t first = std::max<int64_t>(0, delay - offset);
    const int64_t last = std::min<int64_t>(count + filter_length - 1, delay + length - offset);
    for (int64_t j = first; j < last; ++j) output[offset + j - delay] += piece[j];
  }
  return output;
}

}  // namespace vesk_channel
