#include "audio/dsp/narrowband_excision.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

#include "base/logging.h"

namespace audio_dsp {
namespace {

constexpr double kPi = 3.14159265358979323846;
// The Hann window's main lobe reaches 2 bins either side of a line; its
// neighbours are the bins kNear to kFar away.
constexpr int kNear = 3;
constexpr int kFar = 10;
// Lines watched at once besides the notched ones.
constexpr int kSpareLines = 8;
// A line's frequency estimate averages at most this many analyses, so that
// it follows a slow drift.
constexpr int kAveraged = 8;
// A peak within this many bins of a stronger line counts only when it stands
// kSidelobeMargin over the stronger line's Hann sidelobes there: a tone 60 dB
// over the noise has sidelobes over the noise up to 10 bins away.
constexpr int kSidelobeReach = 16;
constexpr double kSidelobeMargin = 10.0;

// The envelope of the Hann window's sidelobes, power relative to the main
// lobe's peak, `bins` (>= 2) from it: |sinc(x) / (1 - x^2)|^2 <= 1 /
// (pi x (x^2 - 1))^2.
double HannSidelobe(double bins) {
  const double v = kPi * bins * (bins * bins - 1.0);
  return 1.0 / (v * v);
}

bool IsPowerOfTwo(int n) { return n > 0 && (n & (n - 1)) == 0; }

int AnalysisSize(const NarrowbandExcisionParams& params) {
  if (params.analysis_size > 0) return params.analysis_size;
  int size = 64;
  while (size < 0.04 * params.sample_rate) size *= 2;
  return size;
}

}  // namespace

NarrowbandExcision::NarrowbandExcision(const NarrowbandExcisionParams& params)
    : params_(params),
      analysis_size_(AnalysisSize(params)),
      interval_frames_(0),
      threshold_(std::pow(10.0, params.threshold_db / 10.0)),
      fft_(AnalysisSize(params), /*scale_inverse=*/false) {
  CHECK(params.sample_rate > 0.0f);
  CHECK(params.num_channels >= 1);
  CHECK(params.band_low_hz >= 0.0f);
  CHECK(params.band_low_hz <= params.band_high_hz);
  CHECK(params.protect_width_hz >= 0.0f);
  CHECK(IsPowerOfTwo(analysis_size_));
  CHECK(analysis_size_ >= 64);
  CHECK(params.analysis_interval_s > 0.0f);
  CHECK(params.threshold_db > 0.0f);
  CHECK(params.confirmations >= 1);
  CHECK(params.release >= 1);
  CHECK(params.max_notches >= 0);
  CHECK(params.notch_bandwidth_hz > 0.0f);
  const int n = analysis_size_;
  interval_frames_ = std::max<int64_t>(
      n, static_cast<int64_t>(std::llround(params.analysis_interval_s * params.sample_rate)));
  window_.resize(n);
  for (int i = 0; i < n; ++i) {
    window_[i] = static_cast<float>(0.5 - 0.5 * std::cos(2.0 * kPi * i / n));  // Periodic Hann.
  }
  block_.resize(n);
  spectrum_.resize(fft_.GetTransformedSize());
  power_.resize(spectrum_.size());
  prefix_.resize(spectrum_.size() + 1);
  const double bin_hz = static_cast<double>(params.sample_rate) / n;
  first_bin_ = std::max(kFar, static_cast<int>(std::ceil(params.band_low_hz / bin_hz)));
  last_bin_ =
      std::min(n / 2 - kFar - 1, static_cast<int>(std::floor(params.band_high_hz / bin_hz)));
  found_.reserve(n / 4 + 1);
  side_.resize(kFar - kNear + 1);
  lines_.resize(params.max_notches + kSpareLines);
  notches_.resize(params.max_notches);
  notch_used_.assign(params.max_notches, false);
  state_.assign(static_cast<size_t>(2) * params.max_notches * params.num_channels, 0.0);
}

NarrowbandExcision::~NarrowbandExcision() = default;

void NarrowbandExcision::Reset() {
  collected_ = 0;
  wait_frames_ = 0;
  for (Line& line : lines_) line = Line();
  notch_used_.assign(notch_used_.size(), false);
  num_notches_ = 0;
  std::fill(state_.begin(), state_.end(), 0.0);
}

void NarrowbandExcision::Analyze(const float* samples, int count) {
  const int channels = params_.num_channels;
  const int frames = count / channels;
  int i = 0;
  while (i < frames) {
    if (wait_frames_ > 0) {
      const int skip = static_cast<int>(std::min<int64_t>(wait_frames_, frames - i));
      wait_frames_ -= skip;
      i += skip;
      continue;
    }
    const int take = std::min(analysis_size_ - collected_, frames - i);
    for (int j = 0; j < take; ++j) block_[collected_ + j] = samples[(i + j) * channels];
    collected_ += take;
    i += take;
    if (collected_ == analysis_size_) {
      RunAnalysis();
      collected_ = 0;
      wait_frames_ = interval_frames_ - analysis_size_;
    }
  }
}

void NarrowbandExcision::RunAnalysis() {
  for (int i = 0; i < analysis_size_; ++i) block_[i] *= window_[i];
  fft_.Forward(block_.data(), spectrum_.data());
  prefix_[0] = 0.0;
  for (size_t k = 0; k < spectrum_.size(); ++k) {
    power_[k] = std::norm(std::complex<double>(spectrum_[k]));
    prefix_[k + 1] = prefix_[k] + power_[k];
  }
  FindLines();
  UpdateLines();
}

double NarrowbandExcision::SideMedian(int first) {
  const int side = kFar - kNear + 1;
  std::copy(power_.begin() + first, power_.begin() + first + side, side_.begin());
  std::nth_element(side_.begin(), side_.begin() + side / 2, side_.end());
  return side_[side / 2];
}

void NarrowbandExcision::FindLines() {
  found_.clear();
  const double bin_hz = static_cast<double>(params_.sample_rate) / analysis_size_;
  const int side = kFar - kNear + 1;
  for (int k = first_bin_; k <= last_bin_; ++k) {
    const double p = power_[k];
    if (!(p >= power_[k - 1] && p > power_[k + 1])) continue;
    // Quick test on the quieter side's mean, then the full one: over the
    // median of each side, robust to another line among the neighbours, so
    // that a line must stand out on both sides (the last line of a comb at
    // the edge of a spectrum stands out on one side only).
    const double left = prefix_[k - kNear + 1] - prefix_[k - kFar];
    const double right = prefix_[k + kFar + 1] - prefix_[k + kNear];
    if (!(p > threshold_ * std::min(left, right) / side)) continue;
    if (!(p > threshold_ * std::max(SideMedian(k - kFar), SideMedian(k + kNear)))) continue;
    found_.push_back({k, p});
  }
  // The sidelobes of a strong line are peaks too: strongest first, a peak
  // near a stronger line must stand clear of its sidelobes.
  std::sort(found_.begin(), found_.end(),
            [](const Peak& a, const Peak& b) { return a.power > b.power; });
  size_t kept = 0;
  for (size_t i = 0; i < found_.size(); ++i) {
    bool sidelobe = false;
    for (size_t j = 0; j < kept && !sidelobe; ++j) {
      const int distance = std::abs(found_[i].bin - found_[j].bin);
      sidelobe = distance <= kSidelobeReach &&
                 found_[i].power < kSidelobeMargin * found_[j].power * HannSidelobe(distance);
    }
    if (!sidelobe) found_[kept++] = found_[i];
  }
  found_.resize(kept);
  for (Peak& peak : found_) {
    // Under the Hann window a sinusoid delta bins above bin k gives
    // neighbour-to-peak magnitude ratio (1 + delta) / (2 - delta).
    const int k = peak.bin;
    const bool above = power_[k + 1] >= power_[k - 1];
    const double ratio = std::sqrt((above ? power_[k + 1] : power_[k - 1]) / power_[k]);
    const double delta = std::min(0.5, std::max(-0.5, (2.0 * ratio - 1.0) / (1.0 + ratio)));
    peak.frequency_hz = (k + (above ? delta : -delta)) * bin_hz;
  }
}

bool NarrowbandExcision::IsProtected(double frequency_hz) const {
  for (const float hz : params_.protected_hz) {
    if (std::abs(frequency_hz - hz) < params_.protect_width_hz) return true;
  }
  return false;
}

void NarrowbandExcision::UpdateLines() {
  const double match_hz = 1.5 * params_.sample_rate / analysis_size_;
  for (Line& line : lines_) line.matched = false;
  for (const Peak& peak : found_) {
    const double frequency = peak.frequency_hz;
    if (IsProtected(frequency)) continue;
    Line* nearest = nullptr;
    for (Line& line : lines_) {
      if (line.used && !line.matched && std::abs(line.frequency_hz - frequency) <= match_hz &&
          (nearest == nullptr ||
           std::abs(line.frequency_hz - frequency) < std::abs(nearest->frequency_hz - frequency))) {
        nearest = &line;
      }
    }
    if (nearest == nullptr) {
      for (Line& line : lines_) {
        if (line.used) continue;
        line = Line();
        line.used = true;
        line.frequency_hz = frequency;
        nearest = &line;
        break;
      }
      if (nearest == nullptr) continue;  // Every slot watches a line already.
    } else {
      nearest->frequency_hz +=
          (frequency - nearest->frequency_hz) / std::min(nearest->seen + 1, kAveraged);
    }
    nearest->matched = true;
    nearest->power = peak.power;
    ++nearest->seen;
    nearest->missing = 0;
    if (nearest->notch >= 0) SetNotch(nearest->notch, nearest->frequency_hz);
  }
  for (Line& line : lines_) {
    if (!line.used || line.matched) continue;
    if (line.notch >= 0 && ++line.missing < params_.release) continue;
    if (line.notch >= 0) {
      notch_used_[line.notch] = false;
      --num_notches_;
    }
    line = Line();
  }
  // Steady lines get the free notches, the strongest first.
  while (num_notches_ < params_.max_notches) {
    Line* strongest = nullptr;
    for (Line& line : lines_) {
      if (line.used && line.notch < 0 && line.seen >= params_.confirmations &&
          (strongest == nullptr || line.power > strongest->power)) {
        strongest = &line;
      }
    }
    if (strongest == nullptr) break;
    const int slot = static_cast<int>(std::find(notch_used_.begin(), notch_used_.end(), false) -
                                      notch_used_.begin());
    notch_used_[slot] = true;
    ++num_notches_;
    strongest->notch = slot;
    SetNotch(slot, strongest->frequency_hz);
    std::fill(state_.begin() + 2 * slot * params_.num_channels,
              state_.begin() + 2 * (slot + 1) * params_.num_channels, 0.0);
  }
}

void NarrowbandExcision::SetNotch(int index, double frequency_hz) {
  // H(z) = g (1 - 2 c z^-1 + z^-2) / (1 - 2 c g z^-1 + a z^-2), g = (1 + a) / 2:
  // zeros on the unit circle at the line, unity gain at 0 and the Nyquist
  // frequency, -3 dB points notch_bandwidth_hz apart (bilinear design).
  const double t = std::tan(kPi * params_.notch_bandwidth_hz / params_.sample_rate);
  const double a = (1.0 - t) / (1.0 + t);
  const double c = std::cos(2.0 * kPi * frequency_hz / params_.sample_rate);
  Notch& notch = notches_[index];
  notch.gain = (1.0 + a) / 2.0;
  notch.a1 = -(1.0 + a) * c;
  notch.a2 = a;
}

void NarrowbandExcision::Filter(float* samples, int count) {
  if (num_notches_ == 0) return;
  const int channels = params_.num_channels;
  const int frames = count / channels;
  for (int slot = 0; slot < params_.max_notches; ++slot) {
    if (!notch_used_[slot]) continue;
    const Notch& n = notches_[slot];
    for (int c = 0; c < channels; ++c) {
      double* state = &state_[2 * (slot * channels + c)];
      double s1 = state[0], s2 = state[1];
      float* x = samples + c;
      float* const end = x + static_cast<ptrdiff_t>(frames) * channels;
      // Transposed direct form II. The numerator's taps are (gain, a1,
      // gain): one product serves both outer taps, and the middle tap,
      // equal to the denominator's a1, multiplies the difference of input
      // and output. Three products per sample instead of five.
      for (; x != end; x += channels) {
        const double in = *x;
        const double scaled = n.gain * in;
        const double out = scaled + s1;
        s1 = n.a1 * (in - out) + s2;
        s2 = scaled - n.a2 * out;
        *x = static_cast<float>(out);
      }
      state[0] = s1;
      state[1] = s2;
    }
  }
}

std::vector<float> NarrowbandExcision::NotchFrequencies() const {
  std::vector<float> frequencies;
  for (const Line& line : lines_) {
    if (line.used && line.notch >= 0) frequencies.push_back(static_cast<float>(line.frequency_hz));
  }
  std::sort(frequencies.begin(), frequencies.end());
  return frequencies;
}

}  // namespace audio_dsp
