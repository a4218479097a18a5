// Narrowband interference excision: finds steady spectral lines (other
// devices' pilots and beacons, TV and charger whine, held musical notes) that
// stand far above their neighbours in a band, and notches them out of a
// stream before a receiver sees it.
//
// Detection. Every analysis_interval_s one block of analysis_size samples
// of the first channel is Hann-windowed and transformed. A bin inside the
// band is a line when it is a local maximum and its power exceeds
// threshold_db over the median power of its neighbours on either side (bins
// 3 to 10 away): medians, so that another line among the neighbours does
// not hide it; either side, so that the last line of a comb at the edge of
// a signal's spectrum is no line. A peak near a stronger line must stand
// 10 dB over that line's window sidelobes. A line's frequency is
// refined from the ratio of the larger neighbour bin to the peak, exact for
// a lone sinusoid under the Hann window. A line seen at the same frequency
// (within 1.5 bins) in `confirmations` analyses in a row is steady and gets a
// notch; a notch goes when its line has been missing from `release`
// analyses in a row. Lines within protect_width_hz of a protected frequency
// (a receiver's own tones) are never notched. At most max_notches notches,
// the strongest lines first.
//
// Notching. A second-order notch per line (unity gain far from it, -3 dB at
// notch_bandwidth_hz / 2 either side, infinitely deep at its centre), run in
// double precision on every channel; its centre follows the line's averaged
// frequency estimate.
//
// Cost: with no line present, one transform of analysis_size samples per
// interval and nothing per sample; per notch, a biquad per sample and
// channel. Allocation happens at construction only: Analyze and Filter never
// allocate. Not thread-safe: one stream, one thread at a time.

#ifndef AUDIO_DSP_NARROWBAND_EXCISION_H_
#define AUDIO_DSP_NARROWBAND_EXCISION_H_

#include <complex>
#include <cstdint>
#include <vector>

#include "audio/dsp/kiss_fft.h"

namespace audio_dsp {

struct NarrowbandExcisionParams {
  float sample_rate = 44100.0f;  // Hz, > 0.
  int num_channels = 1;          // Interleaved channels, >= 1.
  // Hz: lines are looked for in [band_low_hz, band_high_hz], 0 <= low <= high.
  float band_low_hz = 0.0f;
  float band_high_hz = 22050.0f;
  // Hz: never notched, nor anything within protect_width_hz (>= 0) of them.
  std::vector<float> protected_hz;
  float protect_width_hz = 10.0f;
  // Samples per analysis, a power of two >= 64; 0: the smallest power of two
  // of at least 40 ms (about 25 Hz per bin).
  int analysis_size = 0;
  float analysis_interval_s = 0.5f;  // s, > 0: between analyses.
  float threshold_db = 15.0f;        // dB, > 0.
  int confirmations = 2;             // >= 1.
  int release = 4;                   // >= 1.
  int max_notches = 4;               // >= 0.
  float notch_bandwidth_hz = 30.0f;  // Hz, > 0.
};

class NarrowbandExcision {
 public:
  // Fatal checks on the ranges above.
  explicit NarrowbandExcision(const NarrowbandExcisionParams& params);
  ~NarrowbandExcision();
  NarrowbandExcision(const NarrowbandExcision&) = delete;
  NarrowbandExcision& operator=(const NarrowbandExcision&) = delete;

  // Takes in the next block of the stream (`count` interleaved samples,
  // whole frames) for analysis; adds and removes notches as the analyses
  // that the block completes decide. Does not change the samples.
  void Analyze(const float* samples, int count);

  // Notches the block in place (the same block that Analyze has just
  // seen); does nothing while filtering() is false.
  void Filter(float* samples, int count);

  // Whether any notch is in place, i.e. whether Filter changes samples.
  bool filtering() const { return num_notches_ > 0; }

  // The centres of the notches in place, Hz (tests and diagnostics).
  std::vector<float> NotchFrequencies() const;

  // Forgets every line and notch and restarts the analysis schedule.
  void Reset();

  const NarrowbandExcisionParams& params() const { return params_; }
  int analysis_size() const { return analysis_size_; }

 private:
  // A line being watched: seen in `seen` analyses in a row (or notched, and
  // missing from `missing` in a row).
  struct Line {
    bool used = false;
    double frequency_hz = 0.0;
    double power = 0.0;
    int seen = 0;
    int missing = 0;
    int notch = -1;  // Index into notches_, or -1.
    bool matched = false;
  };
  // Numerator gain * (1 - 2 c z^-1 + z^-2) = gain + a1 z^-1 + gain z^-2
  // (a1 = -2 c gain), denominator 1 + a1 z^-1 + a2 z^-2.
  struct Notch {
    double gain = 1.0, a1 = 0.0, a2 = 0.0;
  };
  // A peak of the current spectrum that qualifies as a line.
  struct Peak {
    int bin = 0;
    double power = 0.0;
    double frequency_hz = 0.0;
  };

  // Transforms the collected block and updates lines and notches.
  void RunAnalysis();
  // Peaks of the current spectrum that qualify as lines.
  void FindLines();
  // The median power of the neighbour bins from `first` on (one side).
  double SideMedian(int first);
  void UpdateLines();
  void SetNotch(int index, double frequency_hz);
  bool IsProtected(double frequency_hz) const;

  NarrowbandExcisionParams params_;
  int analysis_size_;
  int64_t interval_frames_;
  double threshold_;  // Power ratio.
  RealFFTTransformer fft_;
  std::vector<float> window_;
  std::vector<float> block_;  // Analysis samples collected so far.
  int collected_ = 0;         // ... how many.
  int64_t wait_frames_ = 0;   // Frames to skip before collecting again.
  std::vector<std::complex<float>> spectrum_;
  std::vector<double> power_;
  std::vector<double> prefix_;  // prefix_[k] = power_[0] + ... + power_[k - 1].
  int first_bin_;
  int last_bin_;
  std::vector<Peak> found_;   // Lines of the current analysis.
  std::vector<double> side_;  // SideMedian scratch.
  std::vector<Line> lines_;
  std::vector<Notch> notches_;
  std::vector<bool> notch_used_;
  int num_notches_ = 0;
  // Filter state: two values per notch slot and channel.
  std::vector<double> state_;
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_NARROWBAND_EXCISION_H_
