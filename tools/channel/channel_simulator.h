// A seeded acoustic channel for measuring the modems' robustness: the path
// from a loudspeaker playing encoder output to a phone microphone delivering
// 16-bit PCM, with what real rooms and phones do to it.
//
// PlayThroughChannel applies, in this order:
//   1. playback: the source (-1 ... 1) is played `overdrive_db` over full
//      scale and clipped (playback_clipping.h);
//   2. path: one band-limited resampling step plays the source `speed` times
//      faster (clock skew, Doppler) and converts it to the microphone rate
//      (sinc_resampler.h); a walking listener (walking_path.h) adds a
//      delay and a level that change with the distance; the source's full
//      scale becomes 32768 x 10^(level_db / 20) at the closest distance;
//   3. loudspeaker response (device_response.h);
//   4. reverberation (optional): each channel is convolved with its own
//      synthetic room (room.h);
//   5. microphone response, its high-pass included (device_response.h);
//   6. placement: a noise-only lead-in before the signal, a noise-only tail
//      (which carries the reverberation tail) after it;
//   7. a second transmitter (optional): another source through steps 1 to 5
//      (its own room, no walking), at a power relative to the first and a
//      time offset;
//   8. interference relative to the signal power measured per channel over
//      the signal's span after step 5: babble (babble.h), steady tones
//      (tones.h), impulses (impulses.h), then white Gaussian noise at a
//      signal-to-noise ratio (noise.h);
//   9. recording: automatic gain control (agc.h), rounding to the nearest
//      integer and clipping to -32768 ... 32767, and buffer dropouts
//      (dropouts.h), which shorten the output.
// Every impairment is off by default; with all of them off the channel is
// what it was before any of them existed, sample for sample.
//
// Determinism: every random choice comes from the simulator's own generator
// (random.h), never from the standard library's distributions, and
// independent random streams are derived from the seed for each draw (the
// lead-in, each channel's room and noise, the babble, the tones, the
// music, the impulses, the walk, the AGC and the dropouts), so changing one setting
// (say the SNR) leaves the other draws unchanged. The arithmetic is plain
// IEEE single and double precision in a fixed order, and math-library
// functions (log, sin, cos, exp) enter only in double precision ahead of a
// rounding to float, so without reverberation and device responses the same
// parameters and seed give the same samples on the 64-bit, 32-bit x86 and
// sanitizer builds (a test pins a checksum). Reverberation and device
// responses run on the library's FFT, whose 32-bit x86 package computes in
// x87 extended precision: there a sample may differ by one step of 16 bits
// from the 64-bit build.
//
// All functions are stateless and thread-safe; they allocate their outputs
// and scratch memory on each call.

#ifndef TOOLS_CHANNEL_CHANNEL_SIMULATOR_H_
#define TOOLS_CHANNEL_CHANNEL_SIMULATOR_H_

#include <cmath>
#include <cstdint>
#include <vector>

#include "tools/channel/agc.h"
#include "tools/channel/device_response.h"
#include "tools/channel/dropouts.h"
#include "tools/channel/impulses.h"
#include "tools/channel/music.h"
#include "tools/channel/noise.h"
#include "tools/channel/random.h"

namespace vesk_channel {

struct ChannelParams {
  int mic_rate = 44100;  // Hz, > 0: the output sample rate.
  int channels = 1;      // 1 or 2 (interleaved output).
  // > 0: the source is played this many times faster (1.003: every frequency
  // x 1.003, duration / 1.003).
  double speed = 1.0;
  // dB, finite: the source's full scale 1.0 becomes 32768 x 10^(level_db /
  // 20) (the direct path's level; reverberation adds its own energy on top).
  // Low levels leave the signal a few steps of the 16-bit quantiser.
  double level_db = 0.0;
  // >= 0, finite: a linear factor on top of level_db, for programs that
  // think in amplitude (full scale becomes 32768 x gain x 10^(level_db / 20)).
  double gain = 1.0;
  // Full-band signal-to-noise ratio in dB; +infinity: no noise.
  double snr_db = INFINITY;
  bool reverb = false;
  double rt60_s = 0.3;               // s, > 0: 60 dB energy decay time.
  double direct_to_reverb_db = 3.0;  // dB: direct energy over all later energy.
  bool early_reflections = true;     // a few discrete reflections in 1 ... 15 ms.
  // s, >= 0: silence before the signal, rounded to whole samples...
  double lead_in_s = 0.2;
  // ... plus, when > 0, a random delay uniform in [0, max_random_lead_in_s)
  // s, with a fractional-sample part (the signal then starts between
  // samples).
  double max_random_lead_in_s = 0.0;
  double tail_s = 0.2;  // s, >= 0: after the signal's last sample.
  // Signal-to-babble ratio in dB (babble power over the whole output);
  // +infinity: no babble. The same babble reaches both channels. Needs
  // mic_rate >= 8000.
  double babble_sir_db = INFINITY;
  int babble_talkers = 4;  // > 0

  // dB, >= 0: the transmitter plays the source this much over full scale and
  // its output clips; 0: untouched.
  double overdrive_db = 0.0;
  // Phone loudspeaker and microphone responses; kFlat: none.
  DeviceProfile speaker = DeviceProfile::kFlat;
  DeviceProfile microphone = DeviceProfile::kFlat;
  // m/s, >= 0: the listener walks past the transmitter at this speed,
  // closest (walk_closest_m > 0, m) at a random moment of the signal; 0:
  // standing still.
  double walk_speed_mps = 0.0;
  double walk_closest_m = 0.5;
  // Steady tones at these frequencies (Hz, below half the microphone rate),
  // plus `random_tones` (>= 0) at frequencies drawn from [random_tone_low_hz,
  // random_tone_high_hz); each at tone_sir_db below the signal (signal power
  // over one tone's power, dB, finite).
  std::vector<double> tone_frequencies_hz;
  int random_tones = 0;
  double random_tone_low_hz = 0.0;
  double random_tone_high_hz = 0.0;
  double tone_sir_db = 0.0;
  // Signal-to-music ratio in dB (music power over the whole output);
  // +infinity: no music. The same music reaches both channels. `music.peak`
  // is ignored (the ratio sets the level); the chord roots and their notes
  // must lie below half the microphone rate.
  double music_sir_db = INFINITY;
  MusicParams music;
  // Claps and door slams; none by default. Needs mic_rate >= 8000.
  ImpulseParams impulses;
  // A second transmitter (PlayThroughChannel's second source): its power
  // over the first's, dB (-infinity: none), and its start after the
  // first's, s (negative: before it, but not before the output's start).
  double second_power_db = -INFINITY;
  double second_offset_s = 0.0;
  // The recording path's gain control and buffer dropouts; none by default.
  AgcParams agc;
  DropoutParams dropouts;
  uint64_t seed = 1;
};

struct ChannelOutput {
  std::vector<int16_t> samples;  // interleaved, `channels` per frame
  int rate = 0;                  // Hz
  int channels = 1;
  // The signal's span in frames (samples per channel): frame signal_start is
  // the first at or after the source's first sample; the span covers every
  // frame whose source time lies within the source. Lead-in frames precede
  // it; the tail follows it up to the end of `samples`. Dropouts move both
  // ends as they move the samples.
  int64_t signal_start = 0;
  int64_t signal_length = 0;
  // Exact output time of the source's first sample, in frames
  // (signal_start - 1 < signal_start_exact <= signal_start).
  double signal_start_exact = 0.0;
  // The runs of frames that dropouts removed, in frames of the output before
  // the removal.
  std::vector<Dropout> dropouts;
  // When a walking listener passed the closest point, s of the output
  // before dropouts; -1 without a walk.
  double walk_closest_s = -1.0;
};

// Plays `source` (mono, -1 ... 1, not empty) sampled at `source_rate` Hz
// (> 0) through the channel described by `params`, with `second_source`
// (same rate) as the second transmitter when params.second_power_db is
// finite (it must not be empty then). Before reverberation and without a
// walk, output frame f is the band-limited source at source time
// (f - signal_start_exact) x speed / mic_rate seconds; the output holds
// signal_start + signal_length + round(tail_s x mic_rate) frames (more when
// the second transmitter ends later; fewer after dropouts). A zero-power
// signal span receives no interference or noise. Fatal checks on the
// parameters' ranges.
ChannelOutput PlayThroughChannel(const std::vector<float>& source, double source_rate,
                                 const ChannelParams& params,
                                 const std::vector<float>& second_source = {});

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_CHANNEL_SIMULATOR_H_
