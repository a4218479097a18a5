#include "audio/vesknet/stream_intake.h"

#include "base/logging.h"

namespace audio_vesknet {

void DownmixChannels(const float* interleaved, int num_frames, int num_channels, Downmix downmix,
                     std::vector<float>* mono) {
  CHECK(mono);
  mono->resize(num_frames);
  float* out = mono->data();
  const bool mean = downmix == Downmix::kMean;
  const float count = static_cast<float>(num_channels);
  for (int i = 0; i < num_frames; ++i) {
    float sum = 0.0f;
    for (int c = 0; c < num_channels; ++c) sum += interleaved[c];
    out[i] = mean ? sum / count : sum;
    interleaved += num_channels;
  }
}

}  // namespace audio_vesknet
