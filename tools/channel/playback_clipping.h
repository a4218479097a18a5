// A transmitter played too loud: the app scales the token above full scale
// and the phone's 16-bit output saturates. The clipping happens on the
// samples, before the loudspeaker, so its harmonics alias like any digital
// distortion.
//
// Stateless and thread-safe.

#ifndef TOOLS_CHANNEL_PLAYBACK_CLIPPING_H_
#define TOOLS_CHANNEL_PLAYBACK_CLIPPING_H_

#include <vector>

namespace vesk_channel {

// Multiplies every sample by 10^(overdrive_db / 20) and clips the result to
// [-1, 1]. overdrive_db is finite; at 0 dB or below nothing clips of a
// source within [-1, 1].
void ClipPlayback(double overdrive_db, std::vector<float>* samples);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_PLAYBACK_CLIPPING_H_
