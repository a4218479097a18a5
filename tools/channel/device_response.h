// Frequency responses of phone loudspeakers and microphones.
//
// Small loudspeakers and MEMS microphones with their ports and the phone's
// capture filters roll off steeply near 18-20 kHz, right where the DSSS
// carrier sits; micro-speakers also lose their bass below their resonance,
// and phone microphones sit behind a high-pass near 100 Hz (wind and
// handling noise). Each profile is a smooth magnitude curve through the
// anchor points of device_response.cc (monotone cubic interpolation in log
// frequency); the curves are chosen as follows:
//
//   budget speaker:   -9 dB at 400 Hz, flat 1-6 kHz (+2 dB presence near
//                     3 kHz), -6 dB at 17 kHz, -10 at 18, -15 at 19, -30 at
//                     20 kHz: a small speaker whose diaphragm breaks up
//                     above 16 kHz (about -12 dB at the 18.5 kHz carrier);
//   flagship speaker: -4 dB at 400 Hz, flat to 15 kHz, -3 dB at 18, -5 at
//                     19, -9 at 20 kHz;
//   budget microphone: flat 200 Hz-12 kHz, -3 dB at 17 kHz, -9 at 19, -16 at
//                     20 kHz (port resonance damped, steep decimation filter);
//   flagship microphone: flat to 17 kHz, -2 dB at 19, -4 at 20 kHz;
//   both phone microphones add a second-order Butterworth high-pass at
//   100 Hz (-3 dB at 100 Hz, -12 dB per octave below).
// So a budget phone pair puts the DSSS band (about 15.5-21.5 kHz) through a
// tilt from about -6 dB to -60 dB, -19 dB at the carrier; a flagship pair
// from 0 to -22 dB, -5 dB at the carrier.
//
// Deterministic; stateless and thread-safe.

#ifndef TOOLS_CHANNEL_DEVICE_RESPONSE_H_
#define TOOLS_CHANNEL_DEVICE_RESPONSE_H_

#include <string>
#include <vector>

namespace vesk_channel {

enum class DeviceProfile { kFlat, kBudgetPhone, kFlagshipPhone };
enum class DeviceRole { kSpeaker, kMicrophone };

// "flat", "budget" or "flagship"; false for any other name.
bool ParseDeviceProfile(const std::string& name, DeviceProfile* profile);
const char* DeviceProfileName(DeviceProfile profile);

// The magnitude response, dB, of `role` of `profile` at `frequency_hz` (> 0),
// the microphones' high-pass included. 0 for kFlat.
double DeviceGainDb(DeviceRole role, DeviceProfile profile, double frequency_hz);

// `samples` at `rate` Hz (>= 8000) through the device: a zero-phase
// linear-phase FIR of 2^k + 1 taps (about 0.09 s; within 0.2 dB of the curve
// from 200 Hz up) realising the curve without the high-pass, then, for phone
// microphones, the high-pass as a causal biquad. The output has the input's
// length; kFlat returns the input unchanged.
std::vector<float> ApplyDeviceResponse(DeviceRole role, DeviceProfile profile, int rate,
                                       const std::vector<float>& samples);

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_DEVICE_RESPONSE_H_
