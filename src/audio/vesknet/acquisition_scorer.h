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
// Cost: per position, one pass over the frame (F multiply-adds per part) for
// twelve positions at a time, their chunk correlations held in four-lane
// vectors whose lanes are positions, and one pass over the chunks per pair of
// opposite shifts (a shift and its mirror share their products). On x86
// processors with AVX the same loops run on eight-lane vectors (24 positions
// at a time), with AVX-512 on sixteen-lane ones (48); every lane performs the
// same operations in the same order whatever the width, so the scores are
// bit-identical. The broadcaster score costs
// nothing per position; a request adds up the detection window's energies,
// four shifts per vector.
//
// Not thread-safe. Allocates at construction and when an input block is
// larger than every earlier one; otherwise ComputeScores does not allocate
// (the output vector keeps its capacity).

#ifndef AUDIO_VESKNET_ACQUISITION_SCORER_H_
#define AUDIO_VESKNET_ACQUISITION_SCORER_H_

#include <cstdint>
#include <vector>

#include "audio/vesknet/circular_array.h"

namespace audio_vesknet {

class AcquisitionScorer {
 public:
  // Vector width of the per-position loops (the scores do not depend on it).
  enum class Kernel {
    kWidest,       // The widest of the three below that the processor runs.
    kFourLane,     // SSE on x86, NEON on ARM, scalar code elsewhere.
    kEightLane,    // AVX (x86 only).
    kSixteenLane,  // AVX-512 (x86 only).
  };

  // Whether this processor runs `kernel` (kWidest and kFourLane always).
  static bool KernelAvailable(Kernel kernel);

  // Floats of energy history that a scorer of these arguments keeps (the
  // bulk of its memory), without building it. Arguments as the constructor's;
  // frame_size F > 0, num_shifts S > 0.
  static int64_t HistoryFloats(int frame_size, int num_shifts, float noise_length,
                               int detection_window);

  // reference: the code at the baseband rate (F samples, the frame).
  // doppler_shifts: shifts in cycles per frame (S values).
  // num_chunks: C > 0.
  // noise_length: N > 0, the background smoother's effective length in positions.
  // detection_window: positions integrated by GetBroadcasterScore (raised to
  //   at least 2F - 1).
  // kernel: the vector width; one the processor lacks falls back to four
  //   lanes.
  AcquisitionScorer(const std::vector<float>& reference, const std::vector<float>& doppler_shifts,
                    int num_chunks, float noise_length, int detection_window,
                    Kernel kernel = Kernel::kWidest);

  // Forgets all input and history.
  void Reset();

  // Takes in newly arrived baseband samples (equal lengths) and replaces
  // *acquisition_scores with one score per newly completed output position.
  // The scores do not depend on how the stream is cut into blocks.
  void ComputeScores(const std::vector<float>& baseband_real_signal,
                     const std::vector<float>& baseband_imaginary_signal,
                     std::vector<float>* acquisition_scores);
  // The same for `count` samples of each part.
  void ComputeScores(const float* baseband_real_signal, const float* baseband_imaginary_signal,
                     int count, std::vector<float>* acquisition_scores);

  // How clearly a code frame repeats with the frame period over the last
  // detection window: the largest frame-integrated shift energy, normalised
  // (when asked) by the average. 0 until a whole window has been scored.
  float GetBroadcasterScore(bool normalize) const;

  // The S shift energies of one frame of exactly F samples, computed directly
  // (chunk by chunk, then shift by shift): the definition that the streaming
  // scores follow within float rounding.
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
  // Positions scored together: 12, 24 or 48 (four, eight or sixteen lanes).
  int lanes() const { return lanes_; }

 private:
  // Positions scored together, one per vector lane: three vectors per part
  // (with their accumulators, the reference value and a load they fill the
  // eight vector registers of 32-bit x86), of four, eight or sixteen lanes.
  static constexpr int kMaxLanes = 48;

  // A Doppler shift, and the shift whose phasors are its exact conjugates
  // (-1 when the list has none): the two energies come from the same four
  // chunk-phasor products.
  struct ShiftTerm {
    int shift;
    int mirror;
  };

  // Shift energies of the frame at real[0 .. F), imag[0 .. F), directly.
  void ScorePointers(const float* real, const float* imag, float* shift_scores) const;
  // Shift energies of the `count` (<= lanes_) positions starting at `real`
  // and `imag` into the history, for the positions from positions_scored_
  // on, with each one's largest energy and its energies' sum into
  // block_best_ and block_sum_. Reads lanes_ - 1 + F samples of each part
  // whatever the count.
  void ScoreBlock(const float* real, const float* imag, int count);
  // The vector part of ScoreBlock for `Vector` (4, 8 or 16 floats): the
  // energies of all lanes_ positions into block_energies_, each one's
  // largest into block_best_ and their sum into block_sum_.
  template <typename Vector>
  void ScoreLanes(const float* real, const float* imag);
  void ScoreLanesFour(const float* real, const float* imag);
  void ScoreLanesEight(const float* real, const float* imag);
  void ScoreLanesSixteen(const float* real, const float* imag);
  // Background and output of the next `count` positions, whose largest
  // energies and energy sums are in block_best_ and block_sum_; counts them.
  void FinishBlock(int count, std::vector<float>* acquisition_scores);
  // The S energies of `position` in the history (row_stride_ floats, the
  // ones beyond S being 0).
  float* Energies(int64_t position) {
    return energies_.data() + (position & energies_mask_) * row_stride_;
  }
  const float* Energies(int64_t position) const {
    return energies_.data() + (position & energies_mask_) * row_stride_;
  }

  int frame_size_;
  int num_shifts_;
  int num_chunks_;
  int chunk_length_;
  int row_stride_;  // S rounded up to a multiple of 16.
  Kernel kernel_;   // One the processor runs (never kWidest).
  int lanes_;       // 12, 24 or 48: three vectors of the kernel's width.
  std::vector<float> reference_;
  // Phasor of shift s at chunk k: (phasor_real_, phasor_imag_)[s * C + k].
  std::vector<float> phasor_real_;
  std::vector<float> phasor_imag_;
  std::vector<ShiftTerm> terms_;
  // The phasors of terms_[t] at chunk k, each once per vector lane (real,
  // then imaginary): 2W floats at (t * C + k) * 2W for W-lane vectors.
  std::vector<float> term_phasors_;
  int detection_span_;
  int detection_num_frames_;
  int detection_num_shifts_;
  double noise_weight_;  // 1 - pole.
  int noise_delay_;
  int warm_up_;

  // Streaming state.
  // Samples not yet consumed, [0, buffered_), followed by lanes_ - 1 zeros
  // that a last, partial block reads.
  std::vector<float> reader_real_;
  std::vector<float> reader_imag_;
  int buffered_ = 0;
  double noise_state1_ = 0.0;
  double noise_state2_ = 0.0;
  // Shift energies of the positions held, ring-indexed by position AND
  // energies_mask_ (the capacity covers the detection span).
  std::vector<float> energies_;
  int64_t energies_mask_;
  // Each position's largest energy, for its output D positions later.
  CircularArray<float> best_energy_;
  int64_t positions_scored_ = 0;
  // Per-block scratch: chunk correlations (C x lanes_, lanes innermost),
  // energies (S x lanes_) and each lane's largest energy and energy sum.
  std::vector<float> chunk_real_;
  std::vector<float> chunk_imag_;
  std::vector<float> block_energies_;
  float block_best_[kMaxLanes];
  double block_sum_[kMaxLanes];
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_ACQUISITION_SCORER_H_
