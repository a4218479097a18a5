#include "audio/vesknet/acquisition_scorer.h"

#include <algorithm>
#include <cmath>
#include <complex>

#include "audio/dsp/matrix.h"
#include "audio/vesknet/vesknet_util.h"
#include "base/logging.h"

// Some checks compare a vector's size with an int member, as their texts read.
#pragma GCC diagnostic ignored "-Wsign-compare"

namespace audio_vesknet {
namespace {

int HistorySize(int delay, int span, int warm_up) {
  return std::max(std::max(delay + 1, span), warm_up);
}

}  // namespace

AcquisitionScorer::AcquisitionScorer(const std::vector<float>& reference,
                                     const std::vector<float>& doppler_shifts, int num_chunks,
                                     float noise_length, int detection_window)
    : frame_size_(static_cast<int>(reference.size())),
      num_shifts_(static_cast<int>(doppler_shifts.size())),
      num_chunks_(num_chunks),
      reference_(reference),
      history_(1) {
  CHECK(num_chunks_ > 0);
  CHECK(frame_size_ > 0);
  CHECK(num_shifts_ > 0);
  chunk_length_ = (frame_size_ + num_chunks_ - 1) / num_chunks_;

  // MakePhasorMatrix builds shifts x chunks; row s is this shift's phasor
  // over the chunks.
  audio_dsp::MatrixXcf phasors;
  MakePhasorMatrix(2.0 * M_PI / num_chunks_, doppler_shifts, num_chunks_, &phasors);
  phasor_real_.resize(num_shifts_ * num_chunks_);
  phasor_imag_.resize(num_shifts_ * num_chunks_);
  for (int s = 0; s < num_shifts_; ++s) {
    for (int k = 0; k < num_chunks_; ++k) {
      phasor_real_[s * num_chunks_ + k] = phasors(s, k).real();
      phasor_imag_[s * num_chunks_ + k] = phasors(s, k).imag();
    }
  }

  detection_span_ = std::max(2 * frame_size_ - 1, detection_window);
  detection_num_frames_ = (detection_span_ + 1 - frame_size_) / frame_size_;
  CHECK(detection_num_frames_ >= 1);
  detection_num_shifts_ = detection_span_ + 1 - frame_size_ * detection_num_frames_;
  CHECK(detection_num_shifts_ >= frame_size_);

  // Two cascaded one-pole stages whose impulse response has the spread of a
  // box of noise_length positions.
  CHECK(noise_length > 0.0f);
  const double q = static_cast<double>(noise_length) * noise_length / 24.0;
  const double pole = 1.0 + (1.0 - std::sqrt(2.0 * q + 1.0)) / q;
  noise_weight_ = 1.0 - pole;
  noise_delay_ = static_cast<int>(std::round(2.0 * pole / (1.0 - pole)));
  warm_up_ = std::max(noise_delay_, 10);

  history_ =
      CircularArray<std::vector<float>>(HistorySize(noise_delay_, detection_span_, warm_up_));
  history_.Fill(std::vector<float>(num_shifts_, 0.0f));
  chunk_real_.resize(num_chunks_);
  chunk_imag_.resize(num_chunks_);
  Reset();
}

void AcquisitionScorer::Reset() {
  reader_real_.clear();
  reader_imag_.clear();
  read_position_ = 0;
  noise_state1_ = 0.0;
  noise_state2_ = 0.0;
  positions_scored_ = 0;
  history_.Fill(std::vector<float>(num_shifts_, 0.0f));
}

void AcquisitionScorer::ScorePointers(const float* real, const float* imag,
                                      float* shift_scores) const {
  const float* reference = reference_.data();
  for (int k = 0; k < num_chunks_; ++k) {
    const int begin = std::min(k * chunk_length_, frame_size_);
    const int end = std::min(begin + chunk_length_, frame_size_);
    float sum_real = 0.0f, sum_imag = 0.0f;
#pragma omp simd reduction(+ : sum_real, sum_imag)
    for (int n = begin; n < end; ++n) {
      sum_real += real[n] * reference[n];
      sum_imag += imag[n] * reference[n];
    }
    chunk_real_[k] = sum_real;
    chunk_imag_[k] = sum_imag;
  }
  const float* cr = chunk_real_.data();
  const float* ci = chunk_imag_.data();
  for (int s = 0; s < num_shifts_; ++s) {
    const float* pr = phasor_real_.data() + s * num_chunks_;
    const float* pi = phasor_imag_.data() + s * num_chunks_;
    float y_real = 0.0f, y_imag = 0.0f;
#pragma omp simd reduction(+ : y_real, y_imag)
    for (int k = 0; k < num_chunks_; ++k) {
      y_real += pr[k] * cr[k] - pi[k] * ci[k];
      y_imag += pr[k] * ci[k] + pi[k] * cr[k];
    }
    // Energies, not magnitudes: every later comparison is on energies.
    shift_scores[s] = y_real * y_real + y_imag * y_imag;
  }
}

void AcquisitionScorer::ScoreFrame(const std::vector<float>& baseband_frame_real,
                                   const std::vector<float>& baseband_frame_imaginary,
                                   std::vector<float>* shift_scores) const {
  CHECK(baseband_frame_real.size() == frame_size_);
  CHECK(baseband_frame_imaginary.size() == frame_size_);
  CHECK(shift_scores);
  shift_scores->resize(num_shifts_);
  ScorePointers(baseband_frame_real.data(), baseband_frame_imaginary.data(), shift_scores->data());
}

void AcquisitionScorer::ScorePosition(std::vector<float>* acquisition_scores) {
  const int64_t n = positions_scored_;
  std::vector<float>& scores = history_[n];
  ScorePointers(reader_real_.data() + read_position_, reader_imag_.data() + read_position_,
                scores.data());

  if (n == warm_up_ - 1) {
    // Start the background at the mean of the first positions rather than
    // at zero, so that early scores are not inflated.
    double sum = 0.0;
    for (int64_t p = 0; p < warm_up_; ++p) {
      for (float v : history_[p]) sum += v;
    }
    noise_state1_ = noise_state2_ = sum / (static_cast<double>(warm_up_) * num_shifts_);
  } else if (n > warm_up_ - 1) {
    double sum = 0.0;
    for (float v : scores) sum += v;
    const double mean = sum / num_shifts_;
    noise_state1_ += noise_weight_ * (mean - noise_state1_);
    noise_state2_ += noise_weight_ * (noise_state1_ - noise_state2_);
  }
  ++positions_scored_;
  // Position n - D is the one whose background the smoother now stands for.
  if (positions_scored_ > noise_delay_) {
    float output = 0.0f;
    if (n >= warm_up_ - 1) {
      const std::vector<float>& delayed = history_[n - noise_delay_];
      const float best = *std::max_element(delayed.begin(), delayed.end());
      output = static_cast<float>(best / (noise_state2_ + 1e-12));
    }
    acquisition_scores->push_back(output);
  }
}

void AcquisitionScorer::ComputeScores(const std::vector<float>& baseband_real_signal,
                                      const std::vector<float>& baseband_imaginary_signal,
                                      std::vector<float>* acquisition_scores) {
  if (baseband_real_signal.size() != baseband_imaginary_signal.size()) {
    LOG(WARNING) << "Baseband signal size mismatch: " << baseband_real_signal.size() << " vs. "
                 << baseband_imaginary_signal.size();
  }
  CHECK(baseband_real_signal.size() == baseband_imaginary_signal.size());
  CHECK(acquisition_scores);
  acquisition_scores->clear();

  // The readers keep the unconsumed samples; a position is scored once a
  // whole frame beyond it has arrived. Consumed samples are discarded in
  // bulk, so each sample is moved about once.
  reader_real_.insert(reader_real_.end(), baseband_real_signal.begin(), baseband_real_signal.end());
  reader_imag_.insert(reader_imag_.end(), baseband_imaginary_signal.begin(),
                      baseband_imaginary_signal.end());
  const int available = static_cast<int>(reader_real_.size());
  while (available - read_position_ >= frame_size_) {
    ScorePosition(acquisition_scores);
    ++read_position_;
  }
  if (read_position_ > 0) {
    reader_real_.erase(reader_real_.begin(), reader_real_.begin() + read_position_);
    reader_imag_.erase(reader_imag_.begin(), reader_imag_.begin() + read_position_);
    read_position_ = 0;
  }
}

float AcquisitionScorer::GetBroadcasterScore(bool normalize) const {
  if (frame_size_ + positions_scored_ <= detection_span_) return 0.0f;
  const int64_t latest = positions_scored_;
  std::vector<double> summed(num_shifts_);
  double best = 0.0;
  double total = 0.0;
  for (int lag = 0; lag < detection_num_shifts_; ++lag) {
    std::fill(summed.begin(), summed.end(), 0.0);
    for (int frame = 0; frame < detection_num_frames_; ++frame) {
      const std::vector<float>& scores =
          history_[latest - 1 - lag - static_cast<int64_t>(frame) * frame_size_];
      for (int s = 0; s < num_shifts_; ++s) summed[s] += scores[s];
    }
    for (int s = 0; s < num_shifts_; ++s) {
      best = std::max(best, summed[s]);
      total += summed[s];
    }
  }
  if (!normalize) return static_cast<float>(best);
  // The divisor deliberately leaves out the number of shifts.
  const double average =
      total / (static_cast<double>(detection_num_shifts_) * detection_num_frames_);
  return static_cast<float>(best / std::max(average, 1e-12));
}

}  // namespace audio_vesknet
