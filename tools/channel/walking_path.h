// A listener walking past the transmitter: a straight path at a steady
// walking speed that passes the loudspeaker at a closest distance. The
// distance d(t) = sqrt(closest^2 + (speed x (t - t0))^2) changes the
// propagation delay and the level (1 / d); its rate, the radial speed, runs
// smoothly from -speed (approaching) through 0 at the closest point t0 to
// +speed (leaving), fastest around t0: speed^2 / closest per second (at
// 1.2 m/s and 0.5 m, from -0.83 to +0.83 m/s within 0.8 s, about one DSSS
// token).
//
// Immutable; thread-safe.

#ifndef TOOLS_CHANNEL_WALKING_PATH_H_
#define TOOLS_CHANNEL_WALKING_PATH_H_

namespace vesk_channel {

class WalkingPath {
 public:
  // speed_mps >= 0 (0: standing at the closest distance), closest_m > 0,
  // closest_time_s: when the listener passes the closest point.
  WalkingPath(double speed_mps, double closest_m, double closest_time_s);

  // Distance to the loudspeaker at time t, m.
  double Distance(double t) const;
  // d'(t), m/s: positive while the listener moves away.
  double RadialSpeed(double t) const;
  // Extra propagation delay over the closest point's, s: (d(t) - closest) / c.
  double ExtraDelay(double t) const;
  // Amplitude relative to the closest point's: closest / d(t).
  double Gain(double t) const;

  double closest_time_s() const { return closest_time_; }

 private:
  double speed_;
  double closest_;
  double closest_time_;
};

}  // namespace vesk_channel

#endif  // TOOLS_CHANNEL_WALKING_PATH_H_
