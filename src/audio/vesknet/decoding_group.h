// Groups candidate frame starts that lie on one common frame grid, that is,
// the frames of one transmission.
//
// A group opens with one position and accepts later positions that are close
// enough to its last member (the max gap) and close enough to a multiple of
// the frame period from its first member (the tolerance). Each member stands
// for a frame number: its distance from the first member in periods, rounded.
// Positions are integer sample positions in the receiver's baseband stream.
//
// Thread-compatible value type.

#ifndef AUDIO_VESKNET_DECODING_GROUP_H_
#define AUDIO_VESKNET_DECODING_GROUP_H_

#include <vector>

namespace audio_vesknet {

class DecodingGroup {
 public:
  // A group holding the one member `position` with acquisition score `score`.
  // period: frame length in samples, > 0.
  // tolerance_fraction: largest distance of a member from the grid, as a share
  //   of the period (rounded to whole samples), >= 0.
  // max_gap: largest distance in samples from the last member to a new one.
  DecodingGroup(int position, float score, int period, float tolerance_fraction, int max_gap);

  // Offers a new position, which must lie after the last member (fatal
  // otherwise). Returns whether it joined; a refused position leaves the group
  // unchanged.
  bool Add(int time, float score);

  // Whether the members' frame numbers, taken mod n (> 0), hit all of 0..n-1.
  bool CoversAllPositions(int n) const;

  // Index in times() of the member that stands for frame number k: the first
  // member, from half a period before the ideal grid point on, whose frame
  // number is at least k; the last member when there is none.
  int IndexOfFrame(int k) const;

  // round((position - first_position()) / period()), in float, halves away
  // from zero.
  int FrameNumber(int position) const;

  // Member positions, strictly increasing, never empty; first_position() first.
  const std::vector<int>& times() const { return times_; }
  float score_sum() const { return score_sum_; }  // Sum of the members' scores.
  int first_position() const { return first_position_; }
  int period() const { return period_; }
  int tolerance() const { return tolerance_; }  // Samples.
  int max_gap() const { return max_gap_; }

 private:
  int first_position_;
  float score_sum_;
  int period_;
  int tolerance_;
  int max_gap_;
  std::vector<int> times_;
};

// The group to decode among `groups`, n being the token period in frames:
// the covering group (CoversAllPositions(n)) with the largest positive score
// sum, else any group with the largest positive score sum; on equal sums the
// earlier group wins. nullptr when every sum is 0 or less or there are no
// groups. The result points into `groups`.
const DecodingGroup* SelectGroup(const std::vector<DecodingGroup>& groups, int n);

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_DECODING_GROUP_H_
