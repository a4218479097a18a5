#include "tools/channel/channel_simulator.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <utility>
#include <vector>

#include "audio/dsp/resampling_kernel.h"
#include "base/logging.h"
#include "tools/channel/babble.h"

namespace vesk_channel {
namespace {

constexpr double kPi = 3.14159265358979323846;

// Independent random streams of one seed.
constexpr uint64_t kLeadInStream = 1;
constexpr uint64_t kBabbleStream = 2;
constexpr uint64_t kRoomStream = 16;   // + channel
constexpr uint64_t kNoiseStream = 32;  // + channel

// Resampling kernel: reach of 64 samples of the lower rate on each side and
// Kaiser beta 8 give a transition band of about 0.04 × the lower rate and a
// stopband near -80 dB; the cut-off at 0.965 × the lower Nyquist frequency
// keeps a 44.1 kHz microphone's band flat up to about 20.5 kHz.
constexpr double kKernelReach = 64.0;
constexpr double kKaiserBeta = 8.0;
constexpr double kCutoffFraction = 0.965;
// Kernel rows per input sample; linear interpolation between rows keeps the
// table error near -100 dB.
constexpr int kPhases = 512;
// Partial sums of the dot product (taps are padded to a multiple).
constexpr int kLanes = 16;
// Four floats operated on lane by lane (GCC and Clang vector extension).
typedef float Float4 __attribute__((vector_size(16)));

inline Float4 Load(const float* p) {
  Float4 v;
  std::memcpy(&v, p, sizeof(v));
  return v;
}

// A windowed-sinc interpolator tabulated for one step (input samples per
// output sample). Row r holds the taps for an output instant r / kPhases of
// an input sample after the last input sample at or before it.
class SincResampler {
 public:
  explicit SincResampler(double step) : step_(step) {
    const double scale = std::min(1.0, 1.0 / step);
    const double cutoff = 0.5 * kCutoffFraction * scale;  // cycles per input sample
    radius_ = kKernelReach / scale;                       // input samples
    half_ = static_cast<int>(std::ceil(radius_));
    taps_ = (2 * half_ + kLanes - 1) / kLanes * kLanes;
    // Every tap lies on the grid of 1 / kPhases input samples: tap t of row
    // r sits at (t - half_ + 1) - r / kPhases. The kernel is even, so one
    // side of the grid serves all rows.
    const double i0_beta = audio_dsp::BesselI0(kKaiserBeta);
    const int grid_size = half_ * kPhases + 1;
    std::vector<double> kernel(grid_size, 0.0);
    for (int m = 0; m < grid_size; ++m) {
      const double x = static_cast<double>(m) / kPhases;
      const double q = x / radius_;
      if (q >= 1.0) continue;
      const double arg = kPi * 2.0 * cutoff * x;
      const double sinc = m == 0 ? 1.0 : std::sin(arg) / arg;
      kernel[m] = sinc * audio_dsp::BesselI0(kKaiserBeta * std::sqrt(1.0 - q * q)) / i0_beta;
    }
    table_.assign(static_cast<size_t>(kPhases + 1) * taps_, 0.0f);
    for (int r = 0; r <= kPhases; ++r) {
      double sum = 0.0;
      for (int t = 0; t < 2 * half_; ++t) sum += kernel[std::abs((t - half_ + 1) * kPhases - r)];
      // Unit gain at DC for every phase.
      for (int t = 0; t < 2 * half_; ++t) {
        table_[static_cast<size_t>(r) * taps_ + t] =
            static_cast<float>(kernel[std::abs((t - half_ + 1) * kPhases - r)] / sum);
      }
    }
  }

  // output[k] = gain × (band-limited input at input position first + k ×
  // step) for k < count; the input is zero outside its samples.
  void Process(const std::vector<float>& input, double first, float gain, int64_t count,
               float* output) const {
    const int64_t n = static_cast<int64_t>(input.size());
    const int64_t pad = taps_;  // >= every reach of the taps beyond the input
    std::vector<float> padded(static_cast<size_t>(n + 2 * pad), 0.0f);
    std::copy(input.begin(), input.end(), padded.begin() + pad);
    for (int64_t k = 0; k < count; ++k) {
      const double p = first + static_cast<double>(k) * step_;
      if (p <= -radius_ || p >= static_cast<double>(n - 1) + radius_) {
        output[k] = 0.0f;
        continue;
      }
      const double base = std::floor(p);
      const double phase = (p - base) * kPhases;
      int r = static_cast<int>(phase);
      float w = static_cast<float>(phase - r);
      if (r >= kPhases) {
        r = kPhases - 1;
        w = 1.0f;
      }
      const float* x = padded.data() + (static_cast<int64_t>(base) - half_ + 1 + pad);
      const float* ra = table_.data() + static_cast<size_t>(r) * taps_;
      const float* rb = ra + taps_;
      // Four vectors of partial sums per row, added up in a fixed order:
      // enough independent chains to keep the vector units busy, and the
      // same result on every build.
      Float4 a0 = {}, a1 = {}, a2 = {}, a3 = {}, b0 = {}, b1 = {}, b2 = {}, b3 = {};
      for (int t = 0; t < taps_; t += kLanes) {
        const Float4 x0 = Load(x + t), x1 = Load(x + t + 4), x2 = Load(x + t + 8),
                     x3 = Load(x + t + 12);
        a0 += Load(ra + t) * x0;
        a1 += Load(ra + t + 4) * x1;
        a2 += Load(ra + t + 8) * x2;
        a3 += Load(ra + t + 12) * x3;
        b0 += Load(rb + t) * x0;
        b1 += Load(rb + t + 4) * x1;
        b2 += Load(rb + t + 8) * x2;
        b3 += Load(rb + t + 12) * x3;
      }
      const Float4 va = (a0 + a1) + (a2 + a3);
      const Float4 vb = (b0 + b1) + (b2 + b3);
      const float sa = (va[0] + va[1]) + (va[2] + va[3]);
      const float sb = (vb[0] + vb[1]) + (vb[2] + vb[3]);
      output[k] = gain * (sa + w * (sb - sa));
    }
  }

 private:
  double step_;
  double radius_;  // input samples
  int half_;
  int taps_;
  std::vector<float> table_;
};

// Values per cache-resident block in the FFT's early stages (32 KiB of
// real and imaginary parts).
constexpr int kFftBlock = 2048;

// Radix-2 complex FFT in double precision (size a power of two, >= 4) for
// convolution: the forward transform leaves the spectrum in bit-reversed
// order and the inverse takes it in that order, so no permutation is ever
// done (spectra are only multiplied bin by bin). Own code so that results
// are the same on every build; unnormalised.
class Fft {
 public:
  explicit Fft(int size) : size_(size), twiddle_re_(size), twiddle_im_(size) {
    // The stage of span h uses entries h ... 2h - 1: e^(-iπk/h).
    for (int h = 1; h < size; h *= 2) {
      for (int k = 0; k < h; ++k) {
        twiddle_re_[h + k] = std::cos(kPi * k / h);
        twiddle_im_[h + k] = -std::sin(kPi * k / h);
      }
    }
  }

  // Natural-order input, bit-reversed spectrum, e^(-i...) kernel; in place.
  // A stage of span h works within aligned groups of 2h values, so the
  // stages below span kFftBlock run block by block while the block is in
  // cache.
  void Forward(double* re, double* im) const {
    const int block = std::min(size_, kFftBlock);
    for (int h = size_ / 2; h >= block; h /= 2) ForwardStage(re, im, size_, h);
    for (int start = 0; start < size_; start += block) {
      for (int h = block / 2; h >= 4; h /= 2) ForwardStage(re + start, im + start, block, h);
    }
    // Spans 2 (twiddles 1 and -i) and 1 as one radix-4 pass.
    for (int i = 0; i < size_; i += 4) {
      const double s02r = re[i] + re[i + 2], s02i = im[i] + im[i + 2];
      const double d02r = re[i] - re[i + 2], d02i = im[i] - im[i + 2];
      const double s13r = re[i + 1] + re[i + 3], s13i = im[i + 1] + im[i + 3];
      const double d13r = im[i + 1] - im[i + 3], d13i = re[i + 3] - re[i + 1];  // × -i
      re[i] = s02r + s13r;
      im[i] = s02i + s13i;
      re[i + 1] = s02r - s13r;
      im[i + 1] = s02i - s13i;
      re[i + 2] = d02r + d13r;
      im[i + 2] = d02i + d13i;
      re[i + 3] = d02r - d13r;
      im[i + 3] = d02i - d13i;
    }
  }

  // Bit-reversed spectrum in, natural-order signal out, e^(+i...) kernel.
  void Inverse(double* re, double* im) const {
    // Spans 1 and 2 (twiddles 1 and +i) as one radix-4 pass.
    for (int i = 0; i < size_; i += 4) {
      const double s01r = re[i] + re[i + 1], s01i = im[i] + im[i + 1];
      const double d01r = re[i] - re[i + 1], d01i = im[i] - im[i + 1];
      const double s23r = re[i + 2] + re[i + 3], s23i = im[i + 2] + im[i + 3];
      const double t23r = im[i + 3] - im[i + 2], t23i = re[i + 2] - re[i + 3];  // × +i
      re[i] = s01r + s23r;
      im[i] = s01i + s23i;
      re[i + 2] = s01r - s23r;
      im[i + 2] = s01i - s23i;
      re[i + 1] = d01r + t23r;
      im[i + 1] = d01i + t23i;
      re[i + 3] = d01r - t23r;
      im[i + 3] = d01i - t23i;
    }
    const int block = std::min(size_, kFftBlock);
    for (int start = 0; start < size_; start += block) {
      for (int h = 4; h < block; h *= 2) InverseStage(re + start, im + start, block, h);
    }
    for (int h = block; h < size_; h *= 2) InverseStage(re, im, size_, h);
  }

 private:
  // Decimation in frequency: (a, b) -> (a + b, (a - b) w).
  void ForwardStage(double* re, double* im, int length, int h) const {
    const double* wr = twiddle_re_.data() + h;
    const double* wi = twiddle_im_.data() + h;
    for (int i = 0; i < length; i += 2 * h) {
      double* ar = re + i;
      double* ai = im + i;
      double* br = ar + h;
      double* bi = ai + h;
      for (int k = 0; k < h; ++k) {
        const double dr = ar[k] - br[k], di = ai[k] - bi[k];
        ar[k] += br[k];
        ai[k] += bi[k];
        br[k] = dr * wr[k] - di * wi[k];
        bi[k] = dr * wi[k] + di * wr[k];
      }
    }
  }

  // Decimation in time: (a, b) -> (a + b conj(w), a - b conj(w)).
  void InverseStage(double* re, double* im, int length, int h) const {
    const double* wr = twiddle_re_.data() + h;
    const double* wi = twiddle_im_.data() + h;
    for (int i = 0; i < length; i += 2 * h) {
      double* ar = re + i;
      double* ai = im + i;
      double* br = ar + h;
      double* bi = ai + h;
      for (int k = 0; k < h; ++k) {
        const double tr = br[k] * wr[k] + bi[k] * wi[k];
        const double ti = bi[k] * wr[k] - br[k] * wi[k];
        br[k] = ar[k] - tr;
        bi[k] = ai[k] - ti;
        ar[k] += tr;
        ai[k] += ti;
      }
    }
  }

  int size_;
  std::vector<double> twiddle_re_;
  std::vector<double> twiddle_im_;
};

// outputs[c] = (x * filters[c]) truncated to x.size() samples, for one or
// two filters, by overlap-add. Two real convolutions share every complex
// transform: two filters as the real and imaginary parts of one spectrum, or
// (one filter) two consecutive input blocks as one complex block.
void Convolve(const std::vector<float>& x, const std::vector<std::vector<float>>& filters,
              std::vector<std::vector<float>>* outputs) {
  const bool two_filters = filters.size() == 2;
  size_t filter_length = 1;
  for (const auto& h : filters) filter_length = std::max(filter_length, h.size());
  int size = 64;
  while (size < static_cast<int>(2 * filter_length)) size *= 2;
  const Fft fft(size);
  const int64_t block = size - static_cast<int64_t>(filter_length) + 1;
  const int64_t length = static_cast<int64_t>(x.size());

  std::vector<double> h_re(size, 0.0), h_im(size, 0.0);
  for (size_t i = 0; i < filters[0].size(); ++i) h_re[i] = filters[0][i];
  if (two_filters) {
    for (size_t i = 0; i < filters[1].size(); ++i) h_im[i] = filters[1][i];
  }
  fft.Forward(h_re.data(), h_im.data());
  for (int i = 0; i < size; ++i) {  // fold in the inverse's 1 / size
    h_re[i] /= size;
    h_im[i] /= size;
  }

  outputs->assign(filters.size(), std::vector<float>(x.size(), 0.0f));
  std::vector<double> re(size), im(size);
  const int64_t advance = two_filters ? block : 2 * block;
  for (int64_t offset = 0; offset < length; offset += advance) {
    std::fill(re.begin(), re.end(), 0.0);
    std::fill(im.begin(), im.end(), 0.0);
    const int64_t second = two_filters ? offset : offset + block;  // imaginary part's home
    for (int64_t i = 0; i < block && offset + i < length; ++i) re[i] = x[offset + i];
    if (!two_filters) {
      for (int64_t i = 0; i < block && second + i < length; ++i) im[i] = x[second + i];
    }
    fft.Forward(re.data(), im.data());
    for (int i = 0; i < size; ++i) {
      const double r = re[i] * h_re[i] - im[i] * h_im[i];
      im[i] = re[i] * h_im[i] + im[i] * h_re[i];
      re[i] = r;
    }
    fft.Inverse(re.data(), im.data());
    std::vector<float>& first_out = (*outputs)[0];
    std::vector<float>& second_out = (*outputs)[two_filters ? 1 : 0];
    for (int64_t i = 0; i < size && offset + i < length; ++i) {
      first_out[offset + i] += static_cast<float>(re[i]);
    }
    for (int64_t i = 0; i < size && second + i < length; ++i) {
      second_out[second + i] += static_cast<float>(im[i]);
    }
  }
}

// Nearest integer (halves away from zero), clipped; NaN gives -32768.
int16_t ToPcm16(float value) {
  const double rounded = std::round(static_cast<double>(value));
  if (rounded >= 32767.0) return 32767;
  if (rounded > -32768.0) return static_cast<int16_t>(rounded);
  return -32768;
}

double MeanSquare(const std::vector<float>& x, int64_t begin, int64_t end) {
  double sum = 0.0;
  for (int64_t i = begin; i < end; ++i) sum += static_cast<double>(x[i]) * x[i];
  return end > begin ? sum / static_cast<double>(end - begin) : 0.0;
}

}  // namespace

int Random::UniformInt(int n) {
  CHECK(n > 0);
  return static_cast<int>(((Next() >> 32) * static_cast<uint64_t>(n)) >> 32);
}

double Random::Gaussian() {
  if (has_spare_) {
    has_spare_ = false;
    return spare_;
  }
  // Marsaglia's polar form: a point uniform in the unit disc, no
  // trigonometric functions.
  double u, v, s;
  do {
    u = 2.0 * Uniform() - 1.0;
    v = 2.0 * Uniform() - 1.0;
    s = u * u + v * v;
  } while (s >= 1.0 || s == 0.0);
  const double factor = std::sqrt(-2.0 * std::log(s) / s);
  spare_ = v * factor;
  has_spare_ = true;
  return u * factor;
}

uint64_t DeriveSeed(uint64_t seed, uint64_t stream) {
  Random mixer(seed ^ Random(stream).Next());
  return mixer.Next();
}

std::vector<float> MakeRoomImpulseResponse(int rate, double rt60_s, double direct_to_reverb_db,
                                           bool early_reflections, uint64_t seed) {
  CHECK(rate > 0);
  CHECK(rt60_s > 0.0);
  const int length = std::max(2, static_cast<int>(std::ceil(rt60_s * rate)));
  // Amplitude decay per sample: the energy falls by 60 dB (amplitude by
  // 10^-3) in rt60_s.
  const double decay = 3.0 * std::log(10.0) / (rt60_s * rate);
  const int onset = std::max(1, static_cast<int>(std::lround(0.001 * rate)));
  const double ramp = std::max(1.0, 0.005 * rate);
  Random random(seed);

  std::vector<double> tail(length, 0.0), reflections(length, 0.0);
  for (int i = onset; i < length; ++i) {
    const double rise = std::min(1.0, (i - onset + 1) / ramp);
    tail[i] = rise * std::exp(-decay * i) * random.Gaussian();
  }
  if (early_reflections) {
    const int count = 3 + random.UniformInt(4);
    for (int k = 0; k < count; ++k) {
      const int delay = std::min(
          length - 1,
          std::max(1, static_cast<int>(std::lround((0.001 + 0.014 * random.Uniform()) * rate))));
      const double amplitude = 0.5 + 0.5 * random.Uniform();
      const double sign = random.Uniform() < 0.5 ? -1.0 : 1.0;
      reflections[delay] += sign * amplitude * std::exp(-decay * delay);
    }
  }
  double tail_energy = 0.0, reflection_energy = 0.0;
  for (int i = 1; i < length; ++i) {
    tail_energy += tail[i] * tail[i];
    reflection_energy += reflections[i] * reflections[i];
  }
  const double reverb_energy = std::pow(10.0, -direct_to_reverb_db / 10.0);
  const double reflection_share = reflection_energy > 0.0 ? 0.3 : 0.0;
  const double tail_scale =
      tail_energy > 0.0 ? std::sqrt((1.0 - reflection_share) / tail_energy) : 0.0;
  const double reflection_scale =
      reflection_energy > 0.0 ? std::sqrt(reflection_share / reflection_energy) : 0.0;
  std::vector<double> reverb(length, 0.0);
  double energy = 0.0;
  for (int i = 1; i < length; ++i) {
    reverb[i] = tail_scale * tail[i] + reflection_scale * reflections[i];
    energy += reverb[i] * reverb[i];
  }
  // Exact energy after the direct path, whatever the overlap of tail and
  // reflections.
  const double scale = energy > 0.0 ? std::sqrt(reverb_energy / energy) : 0.0;
  std::vector<float> response(length, 0.0f);
  response[0] = 1.0f;
  for (int i = 1; i < length; ++i) response[i] = static_cast<float>(scale * reverb[i]);
  return response;
}

std::vector<int16_t> MakeNoise(double seconds, int rate, double rms, uint64_t seed, int channels) {
  CHECK(seconds >= 0.0);
  CHECK(rate > 0);
  CHECK(rms >= 0.0);
  CHECK(channels > 0);
  const int64_t count = std::llround(seconds * rate) * channels;
  Random random(seed);
  std::vector<int16_t> samples(static_cast<size_t>(count));
  for (auto& sample : samples) sample = ToPcm16(static_cast<float>(rms * random.Gaussian()));
  return samples;
}

ChannelOutput PlayThroughChannel(const std::vector<float>& source, double source_rate,
                                 const ChannelParams& params) {
  CHECK(!source.empty());
  CHECK(source_rate > 0.0);
  CHECK(params.mic_rate > 0);
  CHECK(params.channels == 1 || params.channels == 2);
  CHECK(params.speed > 0.0);
  CHECK(params.gain >= 0.0);
  CHECK(params.snr_db > -INFINITY);
  CHECK(params.rt60_s > 0.0);
  CHECK(params.lead_in_s >= 0.0);
  CHECK(params.max_random_lead_in_s >= 0.0);
  CHECK(params.tail_s >= 0.0);
  CHECK(params.babble_sir_db > -INFINITY);
  CHECK(params.babble_talkers > 0);

  const double rate = params.mic_rate;
  double lead_in = std::round(params.lead_in_s * rate);
  if (params.max_random_lead_in_s > 0.0) {
    Random random(DeriveSeed(params.seed, kLeadInStream));
    lead_in += random.Uniform() * params.max_random_lead_in_s * rate;
  }
  const double step = params.speed * source_rate / rate;  // source samples per frame
  const int64_t start = static_cast<int64_t>(std::ceil(lead_in));
  const int64_t end =
      static_cast<int64_t>(std::ceil(lead_in + static_cast<double>(source.size()) / step));
  const int64_t frames = end + std::llround(params.tail_s * rate);

  std::vector<float> dry(static_cast<size_t>(frames));
  SincResampler(step).Process(source, -lead_in * step, static_cast<float>(32768.0 * params.gain),
                              frames, dry.data());

  std::vector<std::vector<float>> wet;
  if (params.reverb) {
    std::vector<std::vector<float>> rooms;
    for (int c = 0; c < params.channels; ++c) {
      rooms.push_back(MakeRoomImpulseResponse(params.mic_rate, params.rt60_s,
                                              params.direct_to_reverb_db, params.early_reflections,
                                              DeriveSeed(params.seed, kRoomStream + c)));
    }
    Convolve(dry, rooms, &wet);
  } else {
    wet.assign(params.channels - 1, dry);
    wet.push_back(std::move(dry));
  }

  std::vector<double> signal_power(params.channels);
  for (int c = 0; c < params.channels; ++c) signal_power[c] = MeanSquare(wet[c], start, end);

  if (std::isfinite(params.babble_sir_db)) {
    const std::vector<float> babble = MakeBabbleSamples(
        frames, params.mic_rate, params.babble_talkers, DeriveSeed(params.seed, kBabbleStream));
    for (int c = 0; c < params.channels; ++c) {
      const float level = static_cast<float>(
          std::sqrt(signal_power[c] / std::pow(10.0, params.babble_sir_db / 10)));
      for (int64_t i = 0; i < frames; ++i) wet[c][i] += level * babble[i];
    }
  }
  if (std::isfinite(params.snr_db)) {
    for (int c = 0; c < params.channels; ++c) {
      const double sigma = std::sqrt(signal_power[c] / std::pow(10.0, params.snr_db / 10.0));
      if (sigma == 0.0) continue;
      Random random(DeriveSeed(params.seed, kNoiseStream + c));
      for (auto& sample : wet[c]) sample += static_cast<float>(sigma * random.Gaussian());
    }
  }

  ChannelOutput output;
  output.rate = params.mic_rate;
  output.channels = params.channels;
  output.signal_start = start;
  output.signal_length = end - start;
  output.signal_start_exact = lead_in;
  output.samples.resize(static_cast<size_t>(frames * params.channels));
  for (int64_t i = 0; i < frames; ++i) {
    for (int c = 0; c < params.channels; ++c) {
      output.samples[i * params.channels + c] = ToPcm16(wet[c][i]);
    }
  }
  return output;
}

}  // namespace vesk_channel
