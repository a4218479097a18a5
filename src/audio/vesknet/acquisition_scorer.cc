#include "audio/vesknet/acquisition_scorer.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstring>

#include "audio/dsp/matrix.h"
#include "audio/dsp/number_util.h"
#include "audio/dsp/simd.h"
#include "audio/vesknet/vesknet_util.h"
#include "base/logging.h"

// Some checks compare a vector's size with an int member, as their texts read.
#pragma GCC diagnostic ignored "-Wsign-compare"

// Eight- and sixteen-lane vectors through functions compiled for AVX and
// AVX-512, chosen at run time.
#if defined(__x86_64__) || defined(__i386__)
#define VESK_WIDE_KERNELS 1
#endif

namespace audio_vesknet {
namespace {

typedef float Float8 __attribute__((vector_size(32)));
typedef float Float16 __attribute__((vector_size(64)));

// Unaligned loads and stores of a vector of any width, inlined into the
// kernel that uses them (so that the wide ones are compiled for AVX or
// AVX-512; vectors pass by reference, as wide values cannot cross into code
// compiled without those).
template <typename Vector>
inline __attribute__((always_inline)) void LoadVector(const float* p, Vector* v) {
  std::memcpy(v, p, sizeof(*v));
}
template <typename Vector>
inline __attribute__((always_inline)) void StoreVector(float* p, const Vector& v) {
  std::memcpy(p, &v, sizeof(v));
}

int HistorySize(int delay, int span, int warm_up) {
  return std::max(std::max(delay + 1, span), warm_up);
}

// Shifts per history row: a multiple of the sixteen summed per vector.
int RowStride(int num_shifts) { return (num_shifts + 15) / 16 * 16; }

int DetectionSpan(int frame_size, int detection_window) {
  return std::max(2 * frame_size - 1, detection_window);
}

// The background smoother: two cascaded one-pole stages whose impulse
// response has the spread of a box of noise_length positions.
double NoisePole(float noise_length) {
  const double q = static_cast<double>(noise_length) * noise_length / 24.0;
  return 1.0 + (1.0 - std::sqrt(2.0 * q + 1.0)) / q;
}
int NoiseDelay(double pole) { return static_cast<int>(std::round(2.0 * pole / (1.0 - pole))); }

}  // namespace

int64_t AcquisitionScorer::HistoryFloats(int frame_size, int num_shifts, float noise_length,
                                         int detection_window) {
  const int delay = NoiseDelay(NoisePole(noise_length));
  const int history = static_cast<int>(audio_dsp::NextPowerOfTwo(static_cast<unsigned>(
      HistorySize(delay, DetectionSpan(frame_size, detection_window), std::max(delay, 10)))));
  return static_cast<int64_t>(history) * RowStride(num_shifts);
}

AcquisitionScorer::AcquisitionScorer(const std::vector<float>& reference,
                                     const std::vector<float>& doppler_shifts, int num_chunks,
                                     float noise_length, int detection_window, Kernel kernel)
    : frame_size_(static_cast<int>(reference.size())),
      num_shifts_(static_cast<int>(doppler_shifts.size())),
      num_chunks_(num_chunks),
      reference_(reference),
      best_energy_(1) {
  CHECK(num_chunks_ > 0);
  CHECK(frame_size_ > 0);
  CHECK(num_shifts_ > 0);
  chunk_length_ = (frame_size_ + num_chunks_ - 1) / num_chunks_;
  row_stride_ = RowStride(num_shifts_);
  kernel_ = kernel;
  if (kernel_ == Kernel::kWidest) {
    kernel_ = KernelAvailable(Kernel::kSixteenLane) ? Kernel::kSixteenLane : Kernel::kEightLane;
  }
  if (!KernelAvailable(kernel_)) kernel_ = Kernel::kFourLane;
  // Three vectors per part.
  const int width = kernel_ == Kernel::kSixteenLane ? 16 : kernel_ == Kernel::kEightLane ? 8 : 4;
  lanes_ = 3 * width;

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
  // Pair each shift with its mirror: the phasors of -f are computed with the
  // same operations as those of f, up to signs, so they are exact conjugates.
  std::vector<bool> paired(num_shifts_, false);
  for (int s = 0; s < num_shifts_; ++s) {
    if (paired[s]) continue;
    paired[s] = true;
    int mirror = -1;
    for (int t = s + 1; t < num_shifts_ && mirror < 0; ++t) {
      if (paired[t]) continue;
      bool conjugate = true;
      for (int k = 0; k < num_chunks_ && conjugate; ++k) {
        conjugate = phasor_real_[t * num_chunks_ + k] == phasor_real_[s * num_chunks_ + k] &&
                    phasor_imag_[t * num_chunks_ + k] == -phasor_imag_[s * num_chunks_ + k];
      }
      if (conjugate) mirror = t;
    }
    if (mirror >= 0) paired[mirror] = true;
    terms_.push_back({s, mirror});
  }
  term_phasors_.resize(terms_.size() * num_chunks_ * 2 * width);
  for (size_t t = 0; t < terms_.size(); ++t) {
    for (int k = 0; k < num_chunks_; ++k) {
      float* phasor = term_phasors_.data() + (t * num_chunks_ + k) * 2 * width;
      std::fill(phasor, phasor + width, phasor_real_[terms_[t].shift * num_chunks_ + k]);
      std::fill(phasor + width, phasor + 2 * width,
                phasor_imag_[terms_[t].shift * num_chunks_ + k]);
    }
  }

  detection_span_ = DetectionSpan(frame_size_, detection_window);
  detection_num_frames_ = (detection_span_ + 1 - frame_size_) / frame_size_;
  CHECK(detection_num_frames_ >= 1);
  detection_num_shifts_ = detection_span_ + 1 - frame_size_ * detection_num_frames_;
  CHECK(detection_num_shifts_ >= frame_size_);

  CHECK(noise_length > 0.0f);
  const double pole = NoisePole(noise_length);
  noise_weight_ = 1.0 - pole;
  noise_delay_ = NoiseDelay(pole);
  warm_up_ = std::max(noise_delay_, 10);

  const int history = static_cast<int>(audio_dsp::NextPowerOfTwo(
      static_cast<unsigned>(HistorySize(noise_delay_, detection_span_, warm_up_))));
  energies_.resize(static_cast<size_t>(history) * row_stride_);
  energies_mask_ = history - 1;
  best_energy_ = CircularArray<float>(noise_delay_ + 1);
  chunk_real_.resize(num_chunks_ * lanes_);
  chunk_imag_.resize(num_chunks_ * lanes_);
  block_energies_.resize(num_shifts_ * lanes_);
  Reset();
}

void AcquisitionScorer::Reset() {
  buffered_ = 0;
  reader_real_.assign(lanes_ - 1, 0.0f);
  reader_imag_.assign(lanes_ - 1, 0.0f);
  noise_state1_ = 0.0;
  noise_state2_ = 0.0;
  positions_scored_ = 0;
  std::fill(energies_.begin(), energies_.end(), 0.0f);
}

void AcquisitionScorer::ScorePointers(const float* real, const float* imag,
                                      float* shift_scores) const {
  const float* reference = reference_.data();
  std::vector<float> chunk_real(num_chunks_), chunk_imag(num_chunks_);
  for (int k = 0; k < num_chunks_; ++k) {
    const int begin = std::min(k * chunk_length_, frame_size_);
    const int end = std::min(begin + chunk_length_, frame_size_);
    float sum_real = 0.0f, sum_imag = 0.0f;
    for (int n = begin; n < end; ++n) {
      sum_real += real[n] * reference[n];
      sum_imag += imag[n] * reference[n];
    }
    chunk_real[k] = sum_real;
    chunk_imag[k] = sum_imag;
  }
  for (int s = 0; s < num_shifts_; ++s) {
    const float* pr = phasor_real_.data() + s * num_chunks_;
    const float* pi = phasor_imag_.data() + s * num_chunks_;
    float y_real = 0.0f, y_imag = 0.0f;
    for (int k = 0; k < num_chunks_; ++k) {
      y_real += pr[k] * chunk_real[k] - pi[k] * chunk_imag[k];
      y_imag += pr[k] * chunk_imag[k] + pi[k] * chunk_real[k];
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

template <typename Vector>
inline __attribute__((always_inline)) void AcquisitionScorer::ScoreLanes(const float* real,
                                                                         const float* imag) {
  constexpr int kWidth = sizeof(Vector) / sizeof(float);
  constexpr int kLanes = 3 * kWidth;
  // Chunk correlations of the kLanes positions: lane p of every vector
  // belongs to the frame starting p samples on, so one pass over the
  // reference serves all of them and no sum crosses lanes.
  const float* reference = reference_.data();
  for (int k = 0; k < num_chunks_; ++k) {
    const int begin = std::min(k * chunk_length_, frame_size_);
    const int end = std::min(begin + chunk_length_, frame_size_);
    Vector real0 = {}, real1 = {}, real2 = {}, imag0 = {}, imag1 = {}, imag2 = {};
    for (int n = begin; n < end; ++n) {
      const float r = reference[n];
      Vector v[6];
      LoadVector(real + n, &v[0]);
      LoadVector(real + n + kWidth, &v[1]);
      LoadVector(real + n + 2 * kWidth, &v[2]);
      LoadVector(imag + n, &v[3]);
      LoadVector(imag + n + kWidth, &v[4]);
      LoadVector(imag + n + 2 * kWidth, &v[5]);
      real0 += v[0] * r;
      real1 += v[1] * r;
      real2 += v[2] * r;
      imag0 += v[3] * r;
      imag1 += v[4] * r;
      imag2 += v[5] * r;
    }
    float* chunk_real = chunk_real_.data() + k * kLanes;
    float* chunk_imag = chunk_imag_.data() + k * kLanes;
    StoreVector(chunk_real, real0);
    StoreVector(chunk_real + kWidth, real1);
    StoreVector(chunk_real + 2 * kWidth, real2);
    StoreVector(chunk_imag, imag0);
    StoreVector(chunk_imag + kWidth, imag1);
    StoreVector(chunk_imag + 2 * kWidth, imag2);
  }

  // Shift energies, one vector of lanes at a time. With the phasor (c, d) of
  // shift f at chunk k and the chunk correlation (x, y):
  //   shift  f: (sum cx - dy)^2 + (sum cy + dx)^2,
  //   shift -f: (sum cx + dy)^2 + (sum cy - dx)^2.
  for (int group = 0; group < kLanes; group += kWidth) {
    const float* cr = chunk_real_.data() + group;
    const float* ci = chunk_imag_.data() + group;
    const float* phasors = term_phasors_.data();
    for (const ShiftTerm& term : terms_) {
      Vector cx = {}, dy = {}, cy = {}, dx = {};
      for (int k = 0; k < num_chunks_; ++k, phasors += 2 * kWidth) {
        Vector x, y, c, d;
        LoadVector(cr + k * kLanes, &x);
        LoadVector(ci + k * kLanes, &y);
        LoadVector(phasors, &c);
        LoadVector(phasors + kWidth, &d);
        cx += x * c;
        dy += y * d;
        cy += y * c;
        dx += x * d;
      }
      const Vector re = cx - dy, im = cy + dx;
      const Vector energy = re * re + im * im;
      StoreVector(block_energies_.data() + term.shift * kLanes + group, energy);
      if (term.mirror >= 0) {
        const Vector mirror_re = cx + dy, mirror_im = cy - dx;
        const Vector mirror_energy = mirror_re * mirror_re + mirror_im * mirror_im;
        StoreVector(block_energies_.data() + term.mirror * kLanes + group, mirror_energy);
      }
    }
  }
  // Each lane's largest energy, and its energy sum (in double, shift by
  // shift, as the background's mean is defined).
  typedef double DoubleVector __attribute__((vector_size(2 * sizeof(Vector))));
  for (int group = 0; group < kLanes; group += kWidth) {
    Vector best;
    LoadVector(block_energies_.data() + group, &best);
    DoubleVector sum = __builtin_convertvector(best, DoubleVector);
    for (int s = 1; s < num_shifts_; ++s) {
      Vector energies;
      LoadVector(block_energies_.data() + s * kLanes + group, &energies);
      best = energies > best ? energies : best;
      sum += __builtin_convertvector(energies, DoubleVector);
    }
    StoreVector(block_best_ + group, best);
    std::memcpy(block_sum_ + group, &sum, sizeof(sum));
  }
}

void AcquisitionScorer::ScoreLanesFour(const float* real, const float* imag) {
  ScoreLanes<audio_dsp::Float4>(real, imag);
}

#ifdef VESK_WIDE_KERNELS
// Compiled for AVX or AVX-512 alone (no FMA, which would round differently),
// called only where the processor has it.
__attribute__((target("avx"))) void AcquisitionScorer::ScoreLanesEight(const float* real,
                                                                       const float* imag) {
  ScoreLanes<Float8>(real, imag);
}

__attribute__((target("avx512f"))) void AcquisitionScorer::ScoreLanesSixteen(const float* real,
                                                                             const float* imag) {
  ScoreLanes<Float16>(real, imag);
}

bool AcquisitionScorer::KernelAvailable(Kernel kernel) {
  switch (kernel) {
    case Kernel::kEightLane:
      return __builtin_cpu_supports("avx");
    case Kernel::kSixteenLane:
      return __builtin_cpu_supports("avx512f");
    default:
      return true;
  }
}
#else
void AcquisitionScorer::ScoreLanesEight(const float* real, const float* imag) {
  ScoreLanesFour(real, imag);
}

void AcquisitionScorer::ScoreLanesSixteen(const float* real, const float* imag) {
  ScoreLanesFour(real, imag);
}

bool AcquisitionScorer::KernelAvailable(Kernel kernel) {
  return kernel == Kernel::kWidest || kernel == Kernel::kFourLane;
}
#endif

void AcquisitionScorer::ScoreBlock(const float* real, const float* imag, int count) {
  switch (kernel_) {
    case Kernel::kSixteenLane:
      ScoreLanesSixteen(real, imag);
      audio_dsp::ClearUpperVectorState();
      break;
    case Kernel::kEightLane:
      ScoreLanesEight(real, imag);
      audio_dsp::ClearUpperVectorState();
      break;
    default:
      ScoreLanesFour(real, imag);
      break;
  }
  // Into the history (a row of shifts per position, where the block holds a
  // row of positions per shift), four positions by four shifts at a time.
  // Only the positions asked for: the others' slots may still hold history.
  using audio_dsp::Float4;
  const float* block = block_energies_.data();
  const int stride = lanes_;
  const int num_shifts = num_shifts_;
  const int whole_shifts = num_shifts & ~3;
  int lane = 0;
  for (; lane + 4 <= count; lane += 4) {
    float* rows[4];
#pragma GCC unroll 4
    for (int j = 0; j < 4; ++j) rows[j] = Energies(positions_scored_ + lane + j);
    const float* column = block + lane;
    for (int s = 0; s < whole_shifts; s += 4, column += 4 * stride) {
      Float4 square[4];
#pragma GCC unroll 4
      for (int i = 0; i < 4; ++i) square[i] = audio_dsp::Load4(column + i * stride);
      audio_dsp::Transpose4(square);
#pragma GCC unroll 4
      for (int j = 0; j < 4; ++j) audio_dsp::Store4(rows[j] + s, square[j]);
    }
    for (int s = whole_shifts; s < num_shifts; ++s, column += stride) {
#pragma GCC unroll 4
      for (int j = 0; j < 4; ++j) rows[j][s] = column[j];
    }
  }
  for (; lane < count; ++lane) {
    float* energies = Energies(positions_scored_ + lane);
    for (int s = 0; s < num_shifts; ++s) energies[s] = block[s * stride + lane];
  }
}

void AcquisitionScorer::FinishBlock(int count, std::vector<float>* acquisition_scores) {
  // The smoother's state and the position count live in locals across the
  // block, so that the chain of dependent operations stays in registers.
  double state1 = noise_state1_, state2 = noise_state2_;
  int64_t n = positions_scored_;
  for (int lane = 0; lane < count; ++lane, ++n) {
    best_energy_[n] = block_best_[lane];
    if (n == warm_up_ - 1) {
      // Start the background at the mean of the first positions rather than
      // at zero, so that early scores are not inflated.
      double warm_sum = 0.0;
      for (int64_t p = 0; p < warm_up_; ++p) {
        const float* energies = Energies(p);
        for (int s = 0; s < num_shifts_; ++s) warm_sum += energies[s];
      }
      state1 = state2 = warm_sum / (static_cast<double>(warm_up_) * num_shifts_);
    } else if (n > warm_up_ - 1) {
      const double mean = block_sum_[lane] / num_shifts_;
      state1 += noise_weight_ * (mean - state1);
      state2 += noise_weight_ * (state1 - state2);
    }
    // Position n - D is the one whose background the smoother now stands for.
    if (n + 1 > noise_delay_) {
      float output = 0.0f;
      if (n >= warm_up_ - 1) {
        output = static_cast<float>(best_energy_[n - noise_delay_] / (state2 + 1e-12));
      }
      acquisition_scores->push_back(output);
    }
  }
  noise_state1_ = state1;
  noise_state2_ = state2;
  positions_scored_ = n;
}

void AcquisitionScorer::ComputeScores(const std::vector<float>& baseband_real_signal,
                                      const std::vector<float>& baseband_imaginary_signal,
                                      std::vector<float>* acquisition_scores) {
  if (baseband_real_signal.size() != baseband_imaginary_signal.size()) {
    LOG(WARNING) << "Baseband signal size mismatch: " << baseband_real_signal.size() << " vs. "
                 << baseband_imaginary_signal.size();
  }
  CHECK(baseband_real_signal.size() == baseband_imaginary_signal.size());
  ComputeScores(baseband_real_signal.data(), baseband_imaginary_signal.data(),
                static_cast<int>(baseband_real_signal.size()), acquisition_scores);
}

void AcquisitionScorer::ComputeScores(const float* baseband_real_signal,
                                      const float* baseband_imaginary_signal, int count,
                                      std::vector<float>* acquisition_scores) {
  CHECK(acquisition_scores);
  acquisition_scores->clear();
  if (count <= 0) return;

  // The readers keep the unconsumed samples; a position is scored once a
  // whole frame beyond it has arrived. The zeros behind the samples are read
  // only by lanes of a last block that stand for no position.
  const int total = buffered_ + count;
  reader_real_.resize(total + lanes_ - 1);
  reader_imag_.resize(total + lanes_ - 1);
  std::copy(baseband_real_signal, baseband_real_signal + count, reader_real_.begin() + buffered_);
  std::copy(baseband_imaginary_signal, baseband_imaginary_signal + count,
            reader_imag_.begin() + buffered_);
  std::fill(reader_real_.begin() + total, reader_real_.end(), 0.0f);
  std::fill(reader_imag_.begin() + total, reader_imag_.end(), 0.0f);

  const int positions = std::max(0, total - frame_size_ + 1);
  for (int start = 0; start < positions; start += lanes_) {
    const int lanes = std::min(lanes_, positions - start);
    ScoreBlock(reader_real_.data() + start, reader_imag_.data() + start, lanes);
    FinishBlock(lanes, acquisition_scores);
  }
  // Consumed samples go in bulk, so each sample is moved about once.
  if (positions > 0) {
    std::copy(reader_real_.begin() + positions, reader_real_.begin() + total, reader_real_.begin());
    std::copy(reader_imag_.begin() + positions, reader_imag_.begin() + total, reader_imag_.begin());
  }
  buffered_ = total - positions;
  std::fill(reader_real_.begin() + buffered_, reader_real_.begin() + buffered_ + lanes_ - 1, 0.0f);
  std::fill(reader_imag_.begin() + buffered_, reader_imag_.begin() + buffered_ + lanes_ - 1, 0.0f);
}

float AcquisitionScorer::GetBroadcasterScore(bool normalize) const {
  using audio_dsp::Float4;
  using audio_dsp::Load4;
  if (frame_size_ + positions_scored_ <= detection_span_) return 0.0f;
  // Lag l integrates the energies at latest - 1 - l, one frame earlier, and
  // so on, newest first, sixteen shifts at a time (in single precision: a
  // window of a few dozen frames).
  const int64_t latest = positions_scored_;
  double best = 0.0;
  double total = 0.0;
  for (int lag = 0; lag < detection_num_shifts_; ++lag) {
    for (int first = 0; first < row_stride_; first += 16) {
      Float4 sum0 = {}, sum1 = {}, sum2 = {}, sum3 = {};
      for (int frame = 0; frame < detection_num_frames_; ++frame) {
        const float* energies =
            Energies(latest - 1 - lag - static_cast<int64_t>(frame) * frame_size_) + first;
        sum0 += Load4(energies);
        sum1 += Load4(energies + 4);
        sum2 += Load4(energies + 8);
        sum3 += Load4(energies + 12);
      }
      float sums[16];
      audio_dsp::Store4(sums, sum0);
      audio_dsp::Store4(sums + 4, sum1);
      audio_dsp::Store4(sums + 8, sum2);
      audio_dsp::Store4(sums + 12, sum3);
      for (int s = 0; s < std::min(16, num_shifts_ - first); ++s) {
        best = std::max(best, static_cast<double>(sums[s]));
        total += sums[s];
      }
    }
  }
  if (!normalize) return static_cast<float>(best);
  // The divisor deliberately leaves out the number of shifts.
  const double average =
      total / (static_cast<double>(detection_num_shifts_) * detection_num_frames_);
  return static_cast<float>(best / std::max(average, 1e-12));
}

}  // namespace audio_vesknet
