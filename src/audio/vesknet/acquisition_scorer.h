// Scores every baseband position by how strongly a frame of the spreading
// code starts there, over a range of Doppler shifts, relative to the recent
// background level.
//
// For each position the frame of F samples starting there is correlated with
// the code in C chunks; the chunk correlations are combined with one phasor
// row per Doppler shift (a shift of f cycles per frame turns the phase by
// 2 pi f / C per chunk), and the score of a shift is the energy |sum|^2.
// The output score of a position is its best shift's energy divided by a
// smoothed background (the mean energy over all shifts, through two one-pole
// stages); the output stream runs D positions behind the input, D being the
// smoother's group delay, and output i always belongs to position i.
//
// Not thread-safe. Allocates at construction and when inputs grow.

#ifndef AUDIO_VESKNET_ACQUISITION_SCORER_H_
#define AUDIO_VESKNET_ACQUISITION_SCORER_H_

#include <cstdint>
#include <vector>

#include "audio/vesknet/circular_array.h"

namespace audio_vesknet {

class AcquisitionScorer {
 public:
  // reference: the code at the baseband rate (F samples, the frame).
  // doppler_shifts: shifts in cycles per frame (S values).
  // num_chunks: C > 0.
  // noise_length: N > 0, the background smoother's effective length in positions.
  // detection_window: positions integrated by GetBroadcasterScore (raised to
  //   at least 2F - 1).
  AcquisitionScorer(const std::vector<float>& reference, const std::vector<float>& doppler_shifts,
                    int num_chunks, float noise_length, int detection_window);

  // Forgets all input and history.
  void Reset();

  // Takes in newly arrived baseband samples (equal lengths) and replaces
  // *acquisition_scores with one score per newly completed output position.
  void ComputeScores(const std::vector<float>& baseband_real_signal,
                     const std::vector<float>& baseband_imaginary_signal,
                     std::vector<float>* acquisition_scores);

  // How clearly a code frame repeats with the frame period over the last
  // detection window: the largest frame-integrated shift energy, normalised
  // (when asked) by the average. 0 until a whole window has been scored.
  float GetBroadcasterScore(bool normalize) const;

  // The S shift energies of one frame of exactly F samples.
  void ScoreFrame(const std::vector<float>& baseband_frame_real,
                  const std::vector<float>& baseband_frame_imaginary,
                  std::vector<float>* shift_scores) const;

  int frame_size() const { return frame_size_; }
  int num_shifts() const { return num_shifts_; }
  int chunk_length() const { return chunk_length_; }
  int noise_delay() const { return noise_delay_; }
  int warm_up() const { return warm_up_; }
  int detection_num_frames() const { return detection_num_frames_; }
  int detection_num_shifts() const { return detection_num_shifts_; }
  int64_t positions_scored() const { return positions_scored_; }

 private:
  // Shift energies of the frame at real[0 .. F), imag[0 .. F).
  void ScorePointers(const float* real, const float* imag, float* shift_scores) const;
  // Scores the position at the readers' read position and emits its output.
  void ScorePosition(std::vector<float>* acquisition_scores);

  int frame_size_;
  int num_shifts_;
  int num_chunks_;
  int chunk_length_;
  std::vector<float> reference_;
  // Phasor of shift s at chunk k: (phasor_real_, phasor_imag_)[s * C + k].
  std::vector<float> phasor_real_;
  std::vector<float> phasor_imag_;
  int detection_span_;
  int detection_num_frames_;
  int detection_num_shifts_;
  double noise_weight_;  // 1 - pole.
  int noise_delay_;
  int warm_up_;

  // Streaming state.
  std::vector<float> reader_real_;
  std::vector<float> reader_imag_;
  int read_position_ = 0;
  double noise_state1_ = 0.0;
  double noise_state2_ = 0.0;
  CircularArray<std::vector<float>> history_;
  int64_t positions_scored_ = 0;
  mutable std::vector<float> chunk_real_;
  mutable std::vector<float> chunk_imag_;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_ACQUISITION_SCORER_H_
