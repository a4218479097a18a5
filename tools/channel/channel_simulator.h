// A seeded acoustic channel for measuring the modems' robustness: the path
// from a loudspeaker playing encoder output to a phone microphone delivering
// 16-bit PCM.
//
// PlayThroughChannel applies, in this order:
//   1. level: the source (-1 ... 1) is scaled by 32768 × gain;
//   2. speed and rate: one band-limited resampling step plays the source
//      `speed` times faster (clock skew, Doppler) and converts it to the
//      microphone rate;
//   3. reverberation (optional): each channel is convolved with its own
//      synthetic room impulse response;
//   4. placement: a noise-only lead-in before the signal, a noise-only tail
//      (which carries the reverberation tail) after it;
//   5. babble (optional) at a signal-to-interference ratio and white Gaussian
//      noise (optional) at a signal-to-noise ratio, both relative to the
//      signal power measured per channel over the signal's span;
//   6. rounding to the nearest integer and clipping to -32768 ... 32767.
//
// Determinism: every random choice comes from the simulator's own generator
// (random.h), never from the standard library's distributions, and
// independent random streams are derived from the seed for the lead-in, each
// channel's room and noise, and the babble, so changing one setting (say the
// SNR) leaves the other draws unchanged. The arithmetic is plain IEEE single
// and double precision in a fixed order, and math-library functions (log,
// sin, cos, exp) enter only in double precision ahead of a rounding to float,
// so without reverberation the same parameters and seed give the same
// samples on the 64-bit, 32-bit x86 and sanitizer builds (a test pins a
// checksum). Reverberation runs on the library's FFT, whose 32-bit x86
// package computes in x87 extended precision: there a sample may differ by
// one step of 16 bits from the 64-bit build.
//
// The pieces are units of their own: random.h, sinc_resampler.h, room.h,
// convolution.h, noise.h, babble.h.
//
// All functions are stateless and thread-safe; they allocate their outputs
// and scratch memory on each call.

#ifndef TOOLS_CHANNEL_CHANNEL_SIMULATOR_H_
#define TOOLS_CHANNEL_CHANNEL_SIMULATOR_H_

#include <cmath>
#include <cstdint>
#include <vector>

#include "tools/channel/random.h"

namespace vesk_channel {

struct ChannelParams {
  int mic_rate = 44100;  // Hz, > 0: the output sample rate.
  int channels = 1;      // 1 or 2 (interleaved output).
  // > 0: the source is played this many times faster (1.003: every frequency
  // × 1.003, duration / 1.003).
  double speed = 1.0;
  // >= 0: the source's full scale 1.0 becomes 32768 × gain (the direct path's
  // level; reverberation adds its own energy on top).
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
  uint64_t seed = 1;
};

struct ChannelOutput {
  std::vector<int16_t> samples;  // interleaved, `channels` per frame
  int rate = 0;                  // Hz
  int channels = 1;
  // The signal's span in frames (samples per channel): frame signal_start is
  // the first at or after the source's first sample; the span covers every
  // frame whose source time lies within the source. Lead-in frames precede
  // it; the tail follows it up to the end of `samples`.
  int64_t signal_start = 0;
  int64_t signal_length = 0;
  // Exact output time of the source's first sample, in frames
  // (signal_start - 1 < signal_start_exact <= signal_start).
  double signal_start_exact = 0.0;
};

// Plays `source` (mono, -1 ... 1, not empty) sampled at `source_rate` Hz
// (> 0) through the channel described by `params`. Before reverberation,
// output frame f is the band-limited source at source time
// (f - signal_start_exact) × speed / mic_rate seconds; the output holds
// signal_start + signal_length + round(tail_s × mic_rate) frames.
// Resampling: a Kaiser-windowed sinc (beta 8) reaching 64 samples of the
// lower rate on each side, cut off (-6 dB) at 0.965 of the lower Nyquist
// frequency (the source's, or the microphone's divided by `speed`),
// tabulated at 1/512 input sample and interpolated linearly. From 48 to
// 44.1 kHz: flat within 0.02 dB up to 20.5 kHz, -6 dB at 21.3 kHz, aliases
// from above 22.6 kHz at -80 dB or less. A zero-power signal span receives
// no noise or babble. Fatal checks on the parameters' ranges.
ChannelOutput PlayThroughChannel(const std::vector<float>& source, double source_rate,
                                 const ChannelParams& params);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_CHANNEL_SIMULATOR_H_
