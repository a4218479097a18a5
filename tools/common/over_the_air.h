// The over-the-air chain of the tools, in one place: a transmitter plays a
// token (start transition, then repetitions) through the simulated room into
// a microphone; the microphone PCM is decoded as an app decodes it (chunks,
// tokens requested every 0.25 s); what was reported is judged against what
// was sent. vesk demo, the robustness programs and the loopback tests all
// run it, so their figures describe the same thing.
//
// Everything here is deterministic for a given channel seed, stateless and
// thread-safe (each call builds its own decoder and buffers).

#ifndef TOOLS_COMMON_OVER_THE_AIR_H_
#define TOOLS_COMMON_OVER_THE_AIR_H_

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "social/tandry/audio/audio_modem_decoder.h"
#include "social/tandry/audio/audio_modem_encoder.h"
#include "tools/channel/channel_simulator.h"
#include "tools/common/option_parser.h"
#include "tools/common/stream_decoding.h"

namespace vesk_tool {

// How a token travels: how often it is played and the room and microphone
// it is played into (channel.seed chooses the room's random draws).
struct OverTheAir {
  int repeat = 3;  // Token repetitions after the start transition, >= 1.
  vesk_channel::ChannelParams channel;
};

// Registers the options that describe `air`, with its current values as the
// defaults, each with the range the simulator accepts: the room (--repeat,
// --snr, --speed, --reverb, --rt60, --mic-rate, --channels, --babble,
// --lead-in, --random-lead-in, --tail, --level) and the impairments of real
// phones and rooms (--speaker, --microphone, --overdrive, --agc,
// --agc-interval, --dropout, --dropout-every, --walk, --walk-closest,
// --tones, --random-tones, --tone-band-low, --tone-band-high, --tone-sir,
// --impulses, --impulse-peak, --second, --second-offset). vesk demo and
// every robustness program take these; a new channel impairment becomes an
// option of all of them here.
void AddOverTheAirOptions(OptionParser* parser, OverTheAir* air);

// Empty when the options' values fit together (what single ranges cannot
// say: tones below half the microphone rate, a tone band in order, a second
// transmitter that starts within the recording); otherwise a sentence naming
// the option. Check it after parsing, before a trial.
std::string OverTheAirError(const OverTheAir& air);

// The impairments of `channel` that are on, in words for a report
// ("budget speaker, overdrive 6 dB, ..."); "none" when none is.
std::string DescribeImpairments(const vesk_channel::ChannelParams& channel);

// The token a second transmitter sends when the channel has one: the
// message with every byte inverted, so that it differs in every byte.
std::vector<uint8_t> SecondMessage(const std::vector<uint8_t>& message);

// What a transmitter plays for one token: the start transition (none for
// DTMF), then the token audio `repeat` times; floats in -1 ... 1 at
// encoder.GetSampleRate().
struct Playback {
  std::vector<float> samples;     // Empty when the encoder refused the token.
  size_t transition_samples = 0;  // At the front of `samples`.
  size_t token_samples = 0;       // Of one repetition.
};
Playback MakePlayback(const audio_modem::AudioModemEncoder& encoder,
                      const std::vector<uint8_t>& message, int crc_bytes, int repeat);

// MakePlayback() played through air.channel (with SecondMessage(message)
// from the same encoder as the second transmitter when the channel has one):
// the microphone's 16-bit PCM. The encoder must accept the token.
vesk_channel::ChannelOutput PlayOverTheAir(const audio_modem::AudioModemEncoder& encoder,
                                           const std::vector<uint8_t>& message, int crc_bytes,
                                           const OverTheAir& air);

// Builds a decoder for the microphone's rate (Hz) and channel count.
using DecoderFactory =
    std::function<std::unique_ptr<audio_modem::AudioModemDecoder>(int rate, int channels)>;

// What the receiving side heard and reported.
struct Reception {
  vesk_channel::ChannelOutput heard;  // The microphone PCM.
  std::vector<FoundToken> found;      // Tokens reported, each once, in order.
  double broadcaster_time_s = -1.0;   // First positive DetectBroadcaster, stream s; -1: none.
  double signal_start_s = 0.0;        // Stream time of the transmission's first sample.
  float transmit_rate = 0.0f;         // Hz, of the transmitter's audio.
  size_t token_samples = 0;           // Of one repetition, at transmit_rate.
  // The second transmitter's message; empty when the channel has none.
  std::vector<uint8_t> second_message;
};

// PlayOverTheAir(), then decodes the microphone PCM with a decoder from
// `make_decoder` fed as `options` say. Tokens are message + `crc_bytes`
// check bytes on air. With `finish` the stream ends as a recording ends
// (StreamDecoder::Finish), so a token in its last moments is still reported;
// without, as an app that keeps listening stops: the robustness programs
// leave their tail to the regular requests (one more request over flushed
// silence adds wrong tokens at -20 dB).
Reception SendOverTheAir(const audio_modem::AudioModemEncoder& encoder,
                         const std::vector<uint8_t>& message, int crc_bytes, const OverTheAir& air,
                         const DecoderFactory& make_decoder, const StreamDecodingOptions& options,
                         bool finish = false);

// A reception judged against the message sent.
struct TrialResult {
  bool correct = false;         // The sent token was reported.
  bool second_correct = false;  // The second transmitter's token was reported.
  int wrong = 0;                // Tokens that neither transmitter sent.
  double found_delay_s = -1;    // From the signal's start to the first correct report.
  double heard_delay_s = -1;    // From the signal's start to DetectBroadcaster's first true.
};

TrialResult Judge(const Reception& reception, const std::vector<uint8_t>& message);

}  // namespace vesk_tool

#endif  // TOOLS_COMMON_OVER_THE_AIR_H_
