#include "tools/channel/channel_simulator.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <utility>
#include <vector>

#include "base/logging.h"
#include "tools/channel/babble.h"
#include "tools/channel/convolution.h"
#include "tools/channel/noise.h"
#include "tools/channel/random.h"
#include "tools/channel/room.h"
#include "tools/channel/sinc_resampler.h"

namespace vesk_channel {
namespace {

// Independent random streams of one seed.
constexpr uint64_t kLeadInStream = 1;
constexpr uint64_t kBabbleStream = 2;
constexpr uint64_t kRoomStream = 16;   // + channel
constexpr uint64_t kNoiseStream = 32;  // + channel

double MeanSquare(const std::vector<float>& x, int64_t begin, int64_t end) {
  double sum = 0.0;
  for (int64_t i = begin; i < end; ++i) sum += static_cast<double>(x[i]) * x[i];
  return end > begin ? sum / static_cast<double>(end - begin) : 0.0;
}

}  // namespace

ChannelOutput PlayThroughChannel(const std::vector<float>& source, double source_rate,
                                 const ChannelParams& params) {
  CHECK(!source.empty());
  CHECK(source_rate > 0.0);
  CHECK(params.mic_rate > 0);
  CHECK(params.channels == 1 || params.channels == 2);
  CHECK(params.speed > 0.0);
  CHECK(params.gain >= 0.0);
  CHECK(params.snr_db > -INFINITY);
  CHECK(params.rt60_s > 0.0);
  CHECK(params.lead_in_s >= 0.0);
  CHECK(params.max_random_lead_in_s >= 0.0);
  CHECK(params.tail_s >= 0.0);
  CHECK(params.babble_sir_db > -INFINITY);
  CHECK(params.babble_talkers > 0);

  const double rate = params.mic_rate;
  double lead_in = std::round(params.lead_in_s * rate);
  if (params.max_random_lead_in_s > 0.0) {
    Random random(DeriveSeed(params.seed, kLeadInStream));
    lead_in += random.Uniform() * params.max_random_lead_in_s * rate;
  }
  const double step = params.speed * source_rate / rate;  // source samples per frame
  const int64_t start = static_cast<int64_t>(std::ceil(lead_in));
  const int64_t end =
      static_cast<int64_t>(std::ceil(lead_in + static_cast<double>(source.size()) / step));
  const int64_t frames = end + std::llround(params.tail_s * rate);

  std::vector<float> dry(static_cast<size_t>(frames));
  SincResampler(step).Process(source, -lead_in * step, static_cast<float>(32768.0 * params.gain),
                              frames, dry.data());

  std::vector<std::vector<float>> wet;
  for (int c = 0; c < params.channels; ++c) {
    if (params.reverb) {
      wet.push_back(Convolve(
          dry, MakeRoomImpulseResponse(params.mic_rate, params.rt60_s, params.direct_to_reverb_db,
                                       params.early_reflections,
                                       DeriveSeed(params.seed, kRoomStream + c))));
    } else {
      wet.push_back(dry);
    }
  }

  std::vector<double> signal_power(params.channels);
  for (int c = 0; c < params.channels; ++c) signal_power[c] = MeanSquare(wet[c], start, end);

  if (std::isfinite(params.babble_sir_db)) {
    const std::vector<float> babble = MakeBabbleSamples(
        frames, params.mic_rate, params.babble_talkers, DeriveSeed(params.seed, kBabbleStream));
    for (int c = 0; c < params.channels; ++c) {
      const float level = static_cast<float>(
          std::sqrt(signal_power[c] / std::pow(10.0, params.babble_sir_db / 10)));
      for (int64_t i = 0; i < frames; ++i) wet[c][i] += level * babble[i];
    }
  }
  if (std::isfinite(params.snr_db)) {
    for (int c = 0; c < params.channels; ++c) {
      const double sigma = std::sqrt(signal_power[c] / std::pow(10.0, params.snr_db / 10.0));
      AddWhiteNoise(sigma, DeriveSeed(params.seed, kNoiseStream + c), &wet[c]);
    }
  }

  ChannelOutput output;
  output.rate = params.mic_rate;
  output.channels = params.channels;
  output.signal_start = start;
  output.signal_length = end - start;
  output.signal_start_exact = lead_in;
  output.samples.resize(static_cast<size_t>(frames * params.channels));
  for (int64_t i = 0; i < frames; ++i) {
    for (int c = 0; c < params.channels; ++c) {
      output.samples[i * params.channels + c] = RoundToPcm16(wet[c][i]);
    }
  }
  return output;
}

}  // namespace vesk_channel
