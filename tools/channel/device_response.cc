#include "tools/channel/device_response.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstring>

#include "audio/dsp/kiss_fft.h"
#include "audio/dsp/resampling_kernel.h"
#include "base/logging.h"
#include "tools/channel/channel_constants.h"
#include "tools/channel/convolution.h"

namespace vesk_channel {
namespace {

struct Anchor {
  double hz;
  double db;
};

// The curves of the header, anchor by anchor.
constexpr Anchor kBudgetSpeaker[] = {
    {100, -30},   {200, -20},   {400, -9},    {700, -3},     {1000, 0},   {3000, 2},
    {6000, 0},    {10000, -1},  {14000, -3},  {16000, -4.5}, {17000, -6}, {18000, -10},
    {19000, -15}, {20000, -30}, {21000, -42}, {22000, -50},  {24000, -55}};
constexpr Anchor kFlagshipSpeaker[] = {
    {100, -18},  {200, -10},  {400, -4},   {700, -1},   {1000, 0},    {15000, 0},   {16000, -1},
    {17000, -2}, {18000, -3}, {19000, -5}, {20000, -9}, {21000, -15}, {22000, -20}, {24000, -30}};
constexpr Anchor kBudgetMicrophone[] = {{200, 0},     {12000, 0},   {14000, -1}, {16000, -2},
                                        {17000, -3},  {18000, -5},  {19000, -9}, {20000, -16},
                                        {21000, -25}, {22000, -35}, {24000, -45}};
constexpr Anchor kFlagshipMicrophone[] = {{200, 0},    {17000, 0},  {18000, -1},  {19000, -2},
                                          {20000, -4}, {21000, -7}, {22000, -12}, {24000, -20}};

// The phone microphones' high-pass, Hz.
constexpr double kHighPassHz = 100.0;
// Kaiser window of the FIR design: sidelobes near -80 dB, so the curve's
// deepest parts (-55 dB) come out as designed.
constexpr double kWindowBeta = 8.0;

template <size_t N>
std::vector<Anchor> Curve(const Anchor (&anchors)[N]) {
  return std::vector<Anchor>(anchors, anchors + N);
}

std::vector<Anchor> AnchorsOf(DeviceRole role, DeviceProfile profile) {
  if (profile == DeviceProfile::kBudgetPhone) {
    return role == DeviceRole::kSpeaker ? Curve(kBudgetSpeaker) : Curve(kBudgetMicrophone);
  }
  if (profile == DeviceProfile::kFlagshipPhone) {
    return role == DeviceRole::kSpeaker ? Curve(kFlagshipSpeaker) : Curve(kFlagshipMicrophone);
  }
  return {};
}

// Monotone cubic (Fritsch-Carlson) interpolation of the anchors' dB in log
// frequency: smooth, and never overshooting between anchors. Constant beyond
// the first and last anchor.
double InterpolateDb(const std::vector<Anchor>& anchors, double hz) {
  if (anchors.empty()) return 0.0;
  if (hz <= anchors.front().hz) return anchors.front().db;
  if (hz >= anchors.back().hz) return anchors.back().db;
  const size_t n = anchors.size();
  std::vector<double> x(n), y(n), slope(n - 1), tangent(n);
  for (size_t k = 0; k < n; ++k) {
    x[k] = std::log(anchors[k].hz);
    y[k] = anchors[k].db;
  }
  for (size_t k = 0; k + 1 < n; ++k) slope[k] = (y[k + 1] - y[k]) / (x[k + 1] - x[k]);
  tangent[0] = slope[0];
  tangent[n - 1] = slope[n - 2];
  for (size_t k = 1; k + 1 < n; ++k) {
    if (slope[k - 1] * slope[k] <= 0.0) {
      tangent[k] = 0.0;
      continue;
    }
    const double h0 = x[k] - x[k - 1], h1 = x[k + 1] - x[k];
    const double w0 = 2 * h1 + h0, w1 = h1 + 2 * h0;
    tangent[k] = (w0 + w1) / (w0 / slope[k - 1] + w1 / slope[k]);
  }
  const double lx = std::log(hz);
  size_t k = 0;
  while (x[k + 1] < lx) ++k;
  const double h = x[k + 1] - x[k];
  const double t = (lx - x[k]) / h;
  const double t2 = t * t, t3 = t2 * t;
  return (2 * t3 - 3 * t2 + 1) * y[k] + (t3 - 2 * t2 + t) * h * tangent[k] +
         (-2 * t3 + 3 * t2) * y[k + 1] + (t3 - t2) * h * tangent[k + 1];
}

bool HasHighPass(DeviceRole role, DeviceProfile profile) {
  return role == DeviceRole::kMicrophone && profile != DeviceProfile::kFlat;
}

// The zero-phase FIR of the curve: its magnitude sampled on a fine grid,
// transformed to an impulse response centred on tap `half`, and tapered by a
// Kaiser window.
std::vector<float> DesignFir(const std::vector<Anchor>& anchors, int rate, int half) {
  const int size = 4 * half;
  const audio_dsp::RealFFTTransformer fft(size, /*scale_inverse=*/true);
  std::vector<std::complex<float>> spectrum(fft.GetTransformedSize());
  for (size_t k = 0; k < spectrum.size(); ++k) {
    const double hz = std::max(1.0, static_cast<double>(k) * rate / size);
    spectrum[k] = static_cast<float>(std::pow(10.0, InterpolateDb(anchors, hz) / 20.0));
  }
  std::vector<float> impulse(size);
  fft.Inverse(spectrum.data(), impulse.data());
  const double i0_beta = audio_dsp::BesselI0(kWindowBeta);
  std::vector<float> taps(2 * half + 1);
  for (int n = -half; n <= half; ++n) {
    const double q = static_cast<double>(n) / (half + 1);
    const double window = audio_dsp::BesselI0(kWindowBeta * std::sqrt(1.0 - q * q)) / i0_beta;
    taps[n + half] = static_cast<float>(impulse[(n + size) % size] * window);
  }
  return taps;
}

// Second-order Butterworth high-pass by the bilinear transform (cut-off
// pre-warped), run in double precision.
void HighPass(int rate, std::vector<float>* samples) {
  const double k = std::tan(kPi * kHighPassHz / rate);
  const double norm = 1.0 / (1.0 + std::sqrt(2.0) * k + k * k);
  const double b0 = norm, b1 = -2.0 * norm, b2 = norm;
  const double a1 = 2.0 * (k * k - 1.0) * norm, a2 = (1.0 - std::sqrt(2.0) * k + k * k) * norm;
  double s1 = 0.0, s2 = 0.0;  // Transposed direct form II.
  for (float& sample : *samples) {
    const double x = sample;
    const double y = b0 * x + s1;
    s1 = b1 * x - a1 * y + s2;
    s2 = b2 * x - a2 * y;
    sample = static_cast<float>(y);
  }
}

}  // namespace

bool ParseDeviceProfile(const std::string& name, DeviceProfile* profile) {
  if (name == "flat") {
    *profile = DeviceProfile::kFlat;
  } else if (name == "budget") {
    *profile = DeviceProfile::kBudgetPhone;
  } else if (name == "flagship") {
    *profile = DeviceProfile::kFlagshipPhone;
  } else {
    return false;
  }
  return true;
}

const char* DeviceProfileName(DeviceProfile profile) {
  switch (profile) {
    case DeviceProfile::kBudgetPhone:
      return "budget";
    case DeviceProfile::kFlagshipPhone:
      return "flagship";
    default:
      return "flat";
  }
}

double DeviceGainDb(DeviceRole role, DeviceProfile profile, double frequency_hz) {
  CHECK(frequency_hz > 0.0);
  double db = InterpolateDb(AnchorsOf(role, profile), frequency_hz);
  if (HasHighPass(role, profile)) {
    const double r4 = std::pow(frequency_hz / kHighPassHz, 4.0);
    db += 10.0 * std::log10(r4 / (1.0 + r4));
  }
  return db;
}

std::vector<float> ApplyDeviceResponse(DeviceRole role, DeviceProfile profile, int rate,
                                       const std::vector<float>& samples) {
  CHECK(rate >= 8000);
  if (profile == DeviceProfile::kFlat) return samples;
  // 2^k + 1 taps spanning at least 1/12 s: a resolution near 25 Hz after
  // the window, fine for curves that change over hundreds of hertz.
  int half = 1;
  while (2 * half < rate / 12) half *= 2;
  std::vector<float> output =
      Convolve(samples, DesignFir(AnchorsOf(role, profile), rate, half), half);
  if (HasHighPass(role, profile)) HighPass(rate, &output);
  return output;
}

}  // namespace vesk_channel
