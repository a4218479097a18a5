#include "tools/channel/channel_simulator.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>
#include <utility>
#include <vector>

#include "base/logging.h"
#include "tools/channel/babble.h"
#include "tools/channel/convolution.h"
#include "tools/channel/music.h"
#include "tools/channel/noise.h"
#include "tools/channel/playback_clipping.h"
#include "tools/channel/room.h"
#include "tools/channel/sinc_resampler.h"
#include "tools/channel/tones.h"
#include "tools/channel/walking_path.h"

namespace vesk_channel {
namespace {

// Independent random streams of one seed.
constexpr uint64_t kLeadInStream = 1;
constexpr uint64_t kBabbleStream = 2;
constexpr uint64_t kWalkStream = 3;
constexpr uint64_t kToneStream = 4;
constexpr uint64_t kImpulseStream = 5;
constexpr uint64_t kAgcStream = 6;
constexpr uint64_t kDropoutStream = 7;
constexpr uint64_t kMusicStream = 8;
constexpr uint64_t kRoomStream = 16;        // + channel
constexpr uint64_t kNoiseStream = 32;       // + channel
constexpr uint64_t kSecondRoomStream = 48;  // + channel

using Channels = std::vector<std::vector<float>>;

double MeanSquare(const std::vector<float>& x, int64_t begin, int64_t end) {
  double sum = 0.0;
  for (int64_t i = begin; i < end; ++i) sum += static_cast<double>(x[i]) * x[i];
  return end > begin ? sum / static_cast<double>(end - begin) : 0.0;
}

double DbToPower(double db) { return std::pow(10.0, db / 10.0); }

// How one transmitter reaches the microphone: where its source's first
// sample lands without the walk's extra delay (output frames), the
// resampling step (source samples per frame) and the listener's path.
struct Path {
  double lead_in = 0.0;
  double step = 1.0;
  double rate = 1.0;                  // Output frames per second.
  const WalkingPath* walk = nullptr;  // Null: standing still.

  // Source position heard at output frame f.
  double SourcePosition(double f) const {
    const double delay = walk ? rate * walk->ExtraDelay(f / rate) : 0.0;
    return (f - lead_in - delay) * step;
  }
  // The output frame at which source position p is heard (the walk's delay
  // changes by far less than a frame per frame, so the iteration settles in
  // a few rounds).
  double FrameOf(double p) const {
    double f = lead_in + p / step;
    if (walk == nullptr) return f;
    for (int round = 0; round < 8; ++round)
      f = lead_in + p / step + rate * walk->ExtraDelay(f / rate);
    return f;
  }
};

// Steps 1 to 5 of the header for one transmitter: the signal each
// microphone channel hears, `frames` long.
Channels Transmit(const std::vector<float>& source, const Path& path, int64_t frames,
                  uint64_t room_stream, const ChannelParams& params) {
  std::vector<float> played = source;
  if (params.overdrive_db > 0.0) ClipPlayback(params.overdrive_db, &played);
  const float gain =
      static_cast<float>(32768.0 * params.gain * std::pow(10.0, params.level_db / 20.0));
  const SincResampler resampler(path.step);
  std::vector<float> dry(static_cast<size_t>(frames));
  if (path.walk == nullptr) {
    resampler.Process(played, -path.lead_in * path.step, gain, frames, dry.data());
  } else {
    std::vector<double> positions(static_cast<size_t>(frames));
    std::vector<float> gains(static_cast<size_t>(frames));
    for (int64_t f = 0; f < frames; ++f) {
      positions[f] = path.SourcePosition(static_cast<double>(f));
      gains[f] = gain * static_cast<float>(path.walk->Gain(f / path.rate));
    }
    resampler.ProcessAt(played, positions, gains, dry.data());
  }
  dry = ApplyDeviceResponse(DeviceRole::kSpeaker, params.speaker, params.mic_rate, dry);
  Channels heard;
  for (int c = 0; c < params.channels; ++c) {
    std::vector<float> wet =
        params.reverb
            ? Convolve(dry, MakeRoomImpulseResponse(
                                params.mic_rate, params.rt60_s, params.direct_to_reverb_db,
                                params.early_reflections, DeriveSeed(params.seed, room_stream + c)))
            : dry;
    heard.push_back(
        ApplyDeviceResponse(DeviceRole::kMicrophone, params.microphone, params.mic_rate, wet));
  }
  return heard;
}

// `x` scaled to an RMS of 1 over its whole length (all zeros stay zeros).
std::vector<float> ToUnitRms(std::vector<float> x) {
  const double power = MeanSquare(x, 0, static_cast<int64_t>(x.size()));
  if (power == 0.0) return x;
  const float scale = static_cast<float>(1.0 / std::sqrt(power));
  for (float& v : x) v *= scale;
  return x;
}

// Step 8 of the header: babble, tones, music and impulses at their levels relative
// to each channel's signal power, then the noise.
void AddInterference(const ChannelParams& params, const std::vector<double>& signal_power,
                     Channels* wet) {
  const int64_t frames = static_cast<int64_t>(wet->front().size());
  const auto add_scaled = [&](const std::vector<float>& unit_rms, double sir_db) {
    for (int c = 0; c < params.channels; ++c) {
      const float level = static_cast<float>(std::sqrt(signal_power[c] / DbToPower(sir_db)));
      for (int64_t i = 0; i < frames; ++i) (*wet)[c][i] += level * unit_rms[i];
    }
  };
  if (std::isfinite(params.babble_sir_db)) {
    add_scaled(MakeBabbleSamples(frames, params.mic_rate, params.babble_talkers,
                                 DeriveSeed(params.seed, kBabbleStream)),
               params.babble_sir_db);
  }
  std::vector<double> tones = params.tone_frequencies_hz;
  const std::vector<double> drawn =
      RandomToneFrequencies(params.random_tones, params.random_tone_low_hz,
                            params.random_tone_high_hz, DeriveSeed(params.seed, kToneStream));
  tones.insert(tones.end(), drawn.begin(), drawn.end());
  if (!tones.empty()) {
    std::vector<float> unit(static_cast<size_t>(frames), 0.0f);
    AddTones(tones, 1.0, params.mic_rate, DeriveSeed(params.seed, kToneStream), &unit);
    add_scaled(unit, params.tone_sir_db);
  }
  if (std::isfinite(params.music_sir_db)) {
    add_scaled(ToUnitRms(MakeMusic(frames, params.mic_rate, params.music,
                                   DeriveSeed(params.seed, kMusicStream))),
               params.music_sir_db);
  }
  if (params.impulses.per_second > 0.0 && signal_power[0] > 0.0) {
    AddImpulses(params.impulses.per_second,
                std::sqrt(signal_power[0] * DbToPower(params.impulses.peak_over_signal_db)),
                params.mic_rate, DeriveSeed(params.seed, kImpulseStream), wet);
  }
  if (std::isfinite(params.snr_db)) {
    for (int c = 0; c < params.channels; ++c) {
      const double sigma = std::sqrt(signal_power[c] / DbToPower(params.snr_db));
      AddWhiteNoise(sigma, DeriveSeed(params.seed, kNoiseStream + c), &(*wet)[c]);
    }
  }
}

void CheckParams(const ChannelParams& params) {
  CHECK(params.mic_rate > 0);
  CHECK(params.channels == 1 || params.channels == 2);
  CHECK(params.speed > 0.0);
  CHECK(std::isfinite(params.level_db));
  CHECK(params.gain >= 0.0 && std::isfinite(params.gain));
  CHECK(params.snr_db > -INFINITY);
  CHECK(params.rt60_s > 0.0);
  CHECK(params.lead_in_s >= 0.0);
  CHECK(params.max_random_lead_in_s >= 0.0);
  CHECK(params.tail_s >= 0.0);
  CHECK(params.babble_sir_db > -INFINITY);
  CHECK(params.babble_talkers > 0);
  CHECK(params.overdrive_db >= 0.0 && std::isfinite(params.overdrive_db));
  CHECK(params.walk_speed_mps >= 0.0);
  CHECK(params.walk_closest_m > 0.0);
  CHECK(params.random_tones >= 0);
  CHECK(std::isfinite(params.tone_sir_db));
  CHECK(params.music_sir_db > -INFINITY);
  CHECK(params.second_power_db < INFINITY);
}

}  // namespace

ChannelOutput PlayThroughChannel(const std::vector<float>& source, double source_rate,
                                 const ChannelParams& params,
                                 const std::vector<float>& second_source) {
  CHECK(!source.empty());
  CHECK(source_rate > 0.0);
  CheckParams(params);

  const double rate = params.mic_rate;
  Path path;
  path.rate = rate;
  path.step = params.speed * source_rate / rate;  // source samples per frame
  path.lead_in = std::round(params.lead_in_s * rate);
  if (params.max_random_lead_in_s > 0.0) {
    Random random(DeriveSeed(params.seed, kLeadInStream));
    path.lead_in += random.Uniform() * params.max_random_lead_in_s * rate;
  }
  const double source_end = static_cast<double>(source.size());
  std::unique_ptr<WalkingPath> walk;
  if (params.walk_speed_mps > 0.0) {
    Random random(DeriveSeed(params.seed, kWalkStream));
    const double closest_frame = random.Uniform(path.lead_in, path.FrameOf(source_end));
    walk = std::make_unique<WalkingPath>(params.walk_speed_mps, params.walk_closest_m,
                                         closest_frame / rate);
    path.walk = walk.get();
  }
  const double start_exact = path.FrameOf(0.0);
  const int64_t start = static_cast<int64_t>(std::ceil(start_exact));
  const int64_t end = static_cast<int64_t>(std::ceil(path.FrameOf(source_end)));
  int64_t last = end;

  const bool second = std::isfinite(params.second_power_db);
  Path second_path = path;
  second_path.walk = nullptr;
  if (second) {
    CHECK(!second_source.empty());
    second_path.lead_in = path.lead_in + params.second_offset_s * rate;
    CHECK(second_path.lead_in >= 0.0);
    last = std::max(last, static_cast<int64_t>(std::ceil(
                              second_path.FrameOf(static_cast<double>(second_source.size())))));
  }
  const int64_t frames = last + std::llround(params.tail_s * rate);

  Channels wet = Transmit(source, path, frames, kRoomStream, params);
  std::vector<double> signal_power(params.channels);
  for (int c = 0; c < params.channels; ++c) signal_power[c] = MeanSquare(wet[c], start, end);
  if (second) {
    const Channels other = Transmit(second_source, second_path, frames, kSecondRoomStream, params);
    const int64_t other_start = static_cast<int64_t>(std::ceil(second_path.FrameOf(0.0)));
    const int64_t other_end = static_cast<int64_t>(
        std::ceil(second_path.FrameOf(static_cast<double>(second_source.size()))));
    for (int c = 0; c < params.channels; ++c) {
      const double power = MeanSquare(other[c], other_start, other_end);
      if (power == 0.0) continue;
      const float scale = static_cast<float>(
          std::sqrt(signal_power[c] * DbToPower(params.second_power_db) / power));
      for (int64_t i = 0; i < frames; ++i) wet[c][i] += scale * other[c][i];
    }
  }
  AddInterference(params, signal_power, &wet);
  ApplyAgc(params.agc, params.mic_rate, DeriveSeed(params.seed, kAgcStream), &wet);

  ChannelOutput output;
  output.rate = params.mic_rate;
  output.channels = params.channels;
  output.samples.resize(static_cast<size_t>(frames * params.channels));
  for (int64_t i = 0; i < frames; ++i) {
    for (int c = 0; c < params.channels; ++c) {
      output.samples[i * params.channels + c] = RoundToPcm16(wet[c][i]);
    }
  }
  if (walk) output.walk_closest_s = walk->closest_time_s();
  output.dropouts = ChooseDropouts(params.dropouts, params.mic_rate, frames,
                                   DeriveSeed(params.seed, kDropoutStream));
  RemoveDropouts(output.dropouts, params.channels, &output.samples);
  const auto moved = [&](double frame) {
    return frame - FramesRemovedBefore(output.dropouts, frame);
  };
  output.signal_start_exact = moved(start_exact);
  output.signal_start = static_cast<int64_t>(std::ceil(output.signal_start_exact));
  output.signal_length =
      static_cast<int64_t>(moved(static_cast<double>(end))) - output.signal_start;
  return output;
}

}  // namespace vesk_channel
