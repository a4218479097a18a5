// Physical and numerical constants of the channel simulator, named once.

#ifndef TOOLS_CHANNEL_CHANNEL_CONSTANTS_H_
#define TOOLS_CHANNEL_CHANNEL_CONSTANTS_H_

namespace vesk_channel {

constexpr double kPi = 3.14159265358979323846;
// m/s, in air at 20 °C: turns a listener's speed into a time scale.
constexpr double kSpeedOfSound = 343.0;

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_CHANNEL_CONSTANTS_H_
