#include "social/tandry/audio/zintar_detector.h"

#include <math.h>
#include <stdlib.h>
#include <string.h>

#include "audio/dsp/simd.h"

namespace {

constexpr int32_t kMaxBlockSize = 2048;
constexpr int32_t kMaxHistoryBlocks = 64;
constexpr int32_t kMaxPeaksPerBlock = 64;
constexpr int32_t kMaxFftSize = 65536;

// Mixer sine table: 4096 steps per turn, plus a quarter turn so that the
// cosine of index i is entry i + 1024. The phase accumulator's top 12 bits
// index it.
constexpr int32_t kSineTableSteps = 4096;
constexpr int32_t kSineTableSize = kSineTableSteps + kSineTableSteps / 4;
constexpr int32_t kCosineOffset = kSineTableSteps / 4;
constexpr int kPhaseShift = 20;

// Input is mixed in chunks of at most this many samples, which bounds every
// stage buffer to the kernel's leftover plus one chunk.
constexpr int32_t kMixerChunk = 64;
constexpr int32_t kKernelTaps = 7;
// Room for the leftover, one chunk, and the slack that the kernel's and the
// leftover copy's fixed-size reads run over (complex samples).
constexpr int32_t kStageCapacity = 2 * kKernelTaps + kMixerChunk;

// 7-tap decimation kernel with zero taps at offsets 1 and 5. It is left
// unnormalised (gain 2.018949632): only ratios of powers matter downstream.
constexpr float kKernelNear = 0.573159168f;  // Taps at offsets 2 and 4.
constexpr float kKernelFar = 0.063684352f;   // Subtracted at offsets 0 and 6.

// Keeps the mean power of an all-zero block away from zero.
constexpr float kMeanPowerGuard = 1e-12f;

constexpr double kPi = 3.14159265358979323846;

}  // namespace

struct ZintarFftPlan {
  int32_t size;
  int32_t odd_log2;  // Nonzero when log2(size) is odd: one radix-2 pass is needed.
  float* twiddles;   // max(3 size / 4 - 2, 1) complex (cos, sin) of 2 pi k / size.
};

struct ZintarDetector {
  int32_t block_size;
  int32_t history_blocks;
  int32_t peaks_per_block;
  int32_t peak_spread;
  uint32_t phase_increment;
  int32_t num_half_band_stages;
  int32_t stage0_modulus;
  int32_t stage0_step;
  float* sine_table;          // kSineTableSize floats.
  float* window;              // block_size floats.
  float* reference_spectrum;  // block_size complex, interleaved.
  ZintarFftPlan* fft;
};

struct ZintarState {
  int32_t block_size;
  int32_t history_blocks;
  int32_t peaks_per_block;
  int32_t peak_spread;
  int32_t num_stages;  // Stage 0 plus the half-band stages.
  uint32_t phase;
  int32_t stage0_accumulator;
  // Input buffer of every stage (kStageCapacity complex each), followed by
  // one more buffer that receives the last stage's output.
  float* stage_buffers;
  int32_t* stage_counts;  // Complex samples held by each stage buffer (the tail's stays 0).
  uint16_t* peak_lags;    // Ring of history_blocks slots of peaks_per_block entries.
  float* peak_values;
  int32_t ring_position;
  float* accumulator;   // block_size floats: sum of retained peak values per lag.
  float* block;         // block_size complex, interleaved.
  int32_t block_free;   // Free places in the block.
  uint16_t* heap_lags;  // Scratch min-heap of the block's strongest lags.
  float* heap_powers;
};

const float kZintarReferencePattern[256] = {
    -1.0f,       -1.768657f,   -1.017805f,  -0.2694321f, -0.9618571f,  -1.877193f,  -1.080469f,
    0.7009237f,  1.050923f,    -0.2832174f, -1.022471f,  -0.03288541f, 0.9831747f,  0.3516709f,
    -0.921309f,  -0.7759197f,  0.79612f,    1.839236f,   1.192664f,    -0.2196237f, -0.9711322f,
    -0.9367304f, -0.9546752f,  -1.267019f,  -1.132833f,  -0.1136622f,  0.9179275f,  0.6976468f,
    -0.6838236f, -1.705586f,   -1.277307f,  0.01290985f, 0.9057294f,   1.060178f,   0.9999464f,
    1.022547f,   1.0107f,      1.002743f,   1.041214f,   0.6460534f,   -0.5559663f, -1.717449f,
    -1.447328f,  0.116079f,    1.085167f,   0.3262233f,  -0.8715105f,  -0.6526985f, 0.6545176f,
    1.015709f,   -0.3219407f,  -1.748632f,  -1.543098f,  -0.0639491f,  0.9760111f,  0.6496391f,
    -0.5084315f, -1.429602f,   -1.384213f,  -0.3419521f, 0.8086515f,   0.7991548f,  -0.4405982f,
    -1.188251f,  -0.02436324f, 1.841292f,   1.890488f,   -0.03487855f, -1.291929f,  -0.3271406f,
    1.018018f,   0.5384223f,   -0.8182988f, -0.6977931f, 0.640614f,    0.8367173f,  -0.458919f,
    -0.9751052f, 0.2427089f,   1.143386f,   0.09500232f, -1.477631f,   -1.570084f,  -0.7103991f,
    -0.6022022f, -1.197044f,   -1.280842f,  -0.881837f,  -0.8833712f,  -0.9531822f, -0.05018709f,
    1.366942f,   1.694746f,    0.6317299f,  -0.5544119f, -1.081948f,   -1.197238f,  -0.8448248f,
    0.2328605f,  1.086319f,    0.352635f,   -1.322749f,  -1.798907f,   -0.7640206f, -0.2646381f,
    -1.221257f,  -1.841768f,   -0.7265646f, 0.7633348f,  0.9484523f,   0.5939066f,  1.116426f,
    1.717542f,   0.8141122f,   -0.7984278f, -0.9167654f, 0.4308014f,   0.971612f,   -0.1205335f,
    -1.01194f,   -0.2682459f,  1.055184f,   1.39284f,    0.985417f,    0.9031869f,  0.9961058f,
    0.3154936f,  -1.009714f,   -1.685698f,  -1.009374f,  0.2588474f,   0.9928608f,  1.027118f,
    0.9956697f,  1.171237f,    1.02961f,    0.1447342f,  -0.9423892f,  -1.327563f,  -1.030116f,
    -0.8739236f, -1.003914f,   -0.533214f,  0.8296251f,  1.813456f,    1.191116f,   -0.3486767f,
    -1.032935f,  -0.2901069f,  0.8566809f,  1.375116f,   1.113837f,    0.2875277f,  -0.8051058f,
    -1.503973f,  -1.191417f,   -0.1180513f, 0.8549668f,  1.259492f,    1.119109f,   0.3994001f,
    -0.7324582f, -1.453759f,   -1.180312f,  -0.6281875f, -0.8200936f,  -1.377548f,  -1.206009f,
    -0.5713727f, -0.7372342f,  -1.556178f,  -1.408152f,  0.05028223f,  1.052804f,   0.4172709f,
    -0.7568172f, -1.099087f,   -0.966365f,  -1.168867f,  -1.226403f,   -0.3986152f, 0.7209884f,
    1.132246f,   1.015933f,    1.054441f,   1.096817f,   0.8267328f,   0.7895697f,  1.321631f,
    1.419663f,   0.2759461f,   -0.9398183f, -0.6170887f, 0.6595802f,   0.9000154f,  -0.2980209f,
    -1.409206f,  -1.38167f,    -0.5898176f, 0.4251254f,  1.37885f,     1.531823f,   0.3879063f,
    -0.9057314f, -0.6961247f,  0.5920267f,  0.9151687f,  -0.2428662f,  -1.258971f,  -1.19395f,
    -0.97643f,   -1.143127f,   -0.7306409f, 0.5021171f,  0.9625328f,   -0.1675363f, -1.139048f,
    -0.2361286f, 1.423756f,    1.683203f,   0.7141918f,  0.4303066f,   1.254481f,   1.634882f,
    0.6564942f,  -0.6654944f,  -0.9362435f, 0.00851415f, 1.231911f,    1.619469f,   0.7371051f,
    -0.6012779f, -0.9461251f,  0.05039415f, 1.127333f,   1.249863f,    0.9753686f,  1.065925f,
    0.9250364f,  -0.1266318f,  -1.045104f,  -0.3970487f, 1.14912f,     1.659868f,   0.9179195f,
    0.5143844f,  1.053971f,    1.400542f,   0.9635928f,  0.6584744f,   1.023088f,   1.279826f,
    0.9884859f,  0.8413263f,   0.9999022f,  0.4437927f,
};

namespace {

bool IsPowerOfTwo(int32_t n) { return n > 0 && (n & (n - 1)) == 0; }

bool IsValidConfig(const ZintarConfig* config) {
  if (config == nullptr || config->reference_pattern == nullptr) return false;
  if (config->sample_rate < 1) return false;
  const float max_center = static_cast<float>(config->sample_rate / 2);
  // Written so that a NaN centre fails too.
  if (!(config->center_frequency >= 0.0f && config->center_frequency <= max_center)) return false;
  if (config->scaled_baseband_rate <= 0) return false;
  if (config->scaled_baseband_rate > config->scaled_input_rate) return false;
  if (config->history_blocks < 1 || config->history_blocks > kMaxHistoryBlocks) return false;
  if (config->peaks_per_block < 1 || config->peaks_per_block > kMaxPeaksPerBlock) return false;
  const int32_t n = config->block_size;
  if (n < 1 || n - 1 > kMaxBlockSize - 1 || !IsPowerOfTwo(n)) return false;
  if (config->peak_spread < 0 || config->peak_spread >= n / 2) return false;
  return true;
}

using audio_dsp::Float4;
using audio_dsp::Load4;
using audio_dsp::Store4;

// One 7-tap kernel output for the complex samples x[0 ... 6] (interleaved),
// applied to re and im separately. The low half of each load holds the tap's
// (re, im); the high half computes the kernel one sample later, which is
// dropped. Reads one complex sample past x[6].
inline void ApplyKernel(const float* x, float* out) {
  const Float4 y = kKernelNear * (Load4(x + 4) + Load4(x + 8)) + Load4(x + 6) -
                   kKernelFar * (Load4(x) + Load4(x + 12));
  memcpy(out, &y, 2 * sizeof(float));
}

// Moves the complex samples from `from` on to the front of `buffer`. Fewer
// than kKernelTaps remain after a stage has run, and the buffers have room
// for a fixed-size copy of that many.
inline void KeepTail(float* buffer, int32_t from) {
  static_assert(kKernelTaps - 1 == 6, "the copy below moves 6 complex samples");
  const float* src = buffer + 2 * from;
  const Float4 a = Load4(src), b = Load4(src + 4), c = Load4(src + 8);
  memcpy(buffer, &a, sizeof(a));
  memcpy(buffer + 4, &b, sizeof(b));
  memcpy(buffer + 8, &c, sizeof(c));
}

// Fractional decimator by (modulus + step) / modulus. Consumes the held input
// while 7 samples remain, writes the outputs to `out` and returns their count.
inline int32_t RunFractionalStage(float* buffer, int32_t* held, int32_t* accumulator,
                                  int32_t modulus, int32_t step, float* __restrict out) {
  const int32_t n = *held;
  int32_t a = *accumulator;
  int32_t q = 0;
  float* o = out;
  for (const int32_t last = n - kKernelTaps; q <= last; o += 2) {
    ApplyKernel(buffer + 2 * q, o);
    a += step;
    // Branch-free: the read position advances by 2 once the accumulator
    // reaches the modulus, which it does on most outputs.
    const int32_t wrap = a >= modulus ? 1 : 0;
    q += 1 + wrap;
    a -= modulus & -wrap;
  }
  *accumulator = a;
  KeepTail(buffer, q);
  *held = n - q;
  return static_cast<int32_t>((o - out) / 2);
}

// Half-band decimator by 2, otherwise like RunFractionalStage.
inline int32_t RunHalfBandStage(float* buffer, int32_t* held, float* __restrict out) {
  const int32_t n = *held;
  int32_t q = 0;
  float* o = out;
  for (const int32_t last = n - kKernelTaps; q <= last; q += 2, o += 2)
    ApplyKernel(buffer + 2 * q, o);
  KeepTail(buffer, q);
  *held = n - q;
  return static_cast<int32_t>((o - out) / 2);
}

// Mixes `count` samples to complex baseband: out = s * exp(i phase), phase in
// 2^-32 turns, the top 12 bits indexing the sine table. Returns the phase
// after the last sample.
inline uint32_t Mix(const float* __restrict sine, uint32_t phase, uint32_t increment,
                    const int16_t* __restrict in, int32_t count, float* __restrict out) {
  for (int32_t i = 0; i < count; ++i, out += 2) {
    const uint32_t p = phase >> kPhaseShift;
    phase += increment;
    const float s = in[i];
    out[0] = s * sine[p + kCosineOffset];
    out[1] = s * sine[p];
  }
  return phase;
}

// The FFT's forward half is a decimation in frequency, which takes natural
// order to bit-reversed order, and its inverse half a decimation in time,
// which takes bit-reversed order back to natural order. A block's correlation
// with the pattern multiplies the two spectra bin by bin, so it needs no
// permutation at all; only the public transforms permute. Both use radix-4
// passes plus one radix-2 pass when log2(size) is odd. In bit-reversed order
// the four quarters of a span of 4L values carry the phases 0, 2, 1 and 3
// modulo 4, hence quarters 1 and 2 trade places in the butterflies below.

// Swaps every value with the one at the bit-reversed index.
void BitReverse(int32_t n, float* data) {
  for (int32_t i = 0, j = 0; i < n; ++i) {
    if (i < j) {
      const float re = data[2 * i];
      const float im = data[2 * i + 1];
      data[2 * i] = data[2 * j];
      data[2 * i + 1] = data[2 * j + 1];
      data[2 * j] = re;
      data[2 * j + 1] = im;
    }
    int32_t m = n >> 1;
    while (j & m) {
      j ^= m;
      m >>= 1;
    }
    j |= m;
  }
}

// Pairs of length-1 transforms, the radix-2 pass of odd log2 sizes; the same
// for both directions and both orders.
void Radix2Pass(int32_t n, float* data) {
  for (int32_t i = 0; i < 2 * n; i += 4) {
    const float re = data[i];
    const float im = data[i + 1];
    data[i] = re + data[i + 2];
    data[i + 1] = im + data[i + 3];
    data[i + 2] = re - data[i + 2];
    data[i + 3] = im - data[i + 3];
  }
}

// (re0, im0, re1, im1) -> (im0, re0, im1, re1).
inline Float4 SwapPairs(Float4 v) { return Float4{v[1], v[0], v[3], v[2]}; }

// Multiplies two complex values by w[0] and w[`offset`] of the twiddle table,
// conjugated when `sin_sign` is -1.
inline Float4 RotatePair(Float4 v, const float* w, int32_t offset, float sin_sign) {
  const float s0 = sin_sign * w[1], s1 = sin_sign * w[offset + 1];
  const Float4 c = {w[0], w[0], w[offset], w[offset]};
  const Float4 s = {-s0, s0, -s1, s1};
  return v * c + SwapPairs(v) * s;
}

// Forward transform, exp(-i theta): natural order in, bit-reversed order out.
// Spans of 4L values hold quarters q0 ... q3 of L values each; value k of the
// quarters feeds one butterfly. Two butterflies run side by side in Float4
// registers, except in the pass with L = 1, which needs no twiddles.
void ForwardToBitReversed(const ZintarFftPlan* plan, float* data) {
  const int32_t n = plan->size;
  const float* tw = plan->twiddles;
  const Float4 minus_i = {1.0f, -1.0f, 1.0f, -1.0f};  // SwapPairs(v) * minus_i = -i v.
  int32_t len = n / 4;
  for (; len >= 2; len /= 4) {
    const int32_t stride = n / (4 * len);  // Table entries per value of k.
    for (int32_t base = 0; base < n; base += 4 * len) {
      float* q0 = data + 2 * base;
      float* q1 = q0 + 2 * len;
      float* q2 = q1 + 2 * len;
      float* q3 = q2 + 2 * len;
      for (int32_t k = 0; k < 2 * len; k += 4) {  // k counts floats: values k / 2, k / 2 + 1.
        const Float4 a0 = Load4(q0 + k), a1 = Load4(q1 + k);
        const Float4 a2 = Load4(q2 + k), a3 = Load4(q3 + k);
        const Float4 s02 = a0 + a2, d02 = a0 - a2, s13 = a1 + a3;
        const Float4 rot = SwapPairs(a1 - a3) * minus_i;
        const int32_t w = k * stride;  // Float offset of entry (k / 2) * stride.
        Store4(q0 + k, s02 + s13);
        Store4(q1 + k, RotatePair(s02 - s13, tw + 2 * w, 4 * stride, -1.0f));  // Phase 2.
        Store4(q2 + k, RotatePair(d02 + rot, tw + w, 2 * stride, -1.0f));      // Phase 1.
        Store4(q3 + k, RotatePair(d02 - rot, tw + 3 * w, 6 * stride, -1.0f));  // Phase 3.
      }
    }
  }
  if (len == 1) {
    for (float* q = data; q < data + 2 * n; q += 8) {
      const float s02r = q[0] + q[4], s02i = q[1] + q[5];
      const float d02r = q[0] - q[4], d02i = q[1] - q[5];
      const float s13r = q[2] + q[6], s13i = q[3] + q[7];
      const float d13r = q[2] - q[6], d13i = q[3] - q[7];
      q[0] = s02r + s13r;
      q[1] = s02i + s13i;
      q[2] = s02r - s13r;
      q[3] = s02i - s13i;
      q[4] = d02r + d13i;  // d02 - i d13.
      q[5] = d02i - d13r;
      q[6] = d02r - d13i;  // d02 + i d13.
      q[7] = d02i + d13r;
    }
  }
  if (plan->odd_log2) Radix2Pass(n, data);
}

// Inverse transform, exp(+i theta): bit-reversed order in, natural order out.
void InverseFromBitReversed(const ZintarFftPlan* plan, float* data) {
  const int32_t n = plan->size;
  const float* tw = plan->twiddles;
  const Float4 plus_i = {-1.0f, 1.0f, -1.0f, 1.0f};  // SwapPairs(v) * plus_i = i v.
  int32_t len = 1;                                   // Length of the transforms already built.
  if (plan->odd_log2) {
    Radix2Pass(n, data);
    len = 2;
  } else if (n >= 4) {
    for (float* q = data; q < data + 2 * n; q += 8) {
      const float s02r = q[0] + q[2], s02i = q[1] + q[3];
      const float d02r = q[0] - q[2], d02i = q[1] - q[3];
      const float s13r = q[4] + q[6], s13i = q[5] + q[7];
      const float d13r = q[4] - q[6], d13i = q[5] - q[7];
      q[0] = s02r + s13r;
      q[1] = s02i + s13i;
      q[4] = s02r - s13r;
      q[5] = s02i - s13i;
      q[2] = d02r - d13i;  // d02 + i d13.
      q[3] = d02i + d13r;
      q[6] = d02r + d13i;  // d02 - i d13.
      q[7] = d02i - d13r;
    }
    len = 4;
  }
  for (; len < n; len *= 4) {
    const int32_t stride = n / (4 * len);
    for (int32_t base = 0; base < n; base += 4 * len) {
      float* q0 = data + 2 * base;
      float* q1 = q0 + 2 * len;
      float* q2 = q1 + 2 * len;
      float* q3 = q2 + 2 * len;
      for (int32_t k = 0; k < 2 * len; k += 4) {
        const int32_t w = k * stride;
        const Float4 t1 = RotatePair(Load4(q2 + k), tw + w, 2 * stride, 1.0f);  // Phase 1.
        const Float4 t2 = RotatePair(Load4(q1 + k), tw + 2 * w, 4 * stride, 1.0f);
        const Float4 t3 = RotatePair(Load4(q3 + k), tw + 3 * w, 6 * stride, 1.0f);
        const Float4 a0 = Load4(q0 + k);
        const Float4 s02 = a0 + t2, d02 = a0 - t2, s13 = t1 + t3;
        const Float4 rot = SwapPairs(t1 - t3) * plus_i;
        Store4(q0 + k, s02 + s13);
        Store4(q2 + k, s02 - s13);
        Store4(q1 + k, d02 + rot);
        Store4(q3 + k, d02 - rot);
      }
    }
  }
}

// Adds `value` to the accumulator at `lag` and at lag +- 1 ... spread, modulo
// the block size (a power of two).
inline void SpreadPeak(float* accumulator, int32_t mask, int32_t spread, int32_t lag, float value) {
  accumulator[lag] += value;
  for (int32_t d = 1; d <= spread; ++d) {
    accumulator[(lag + d) & mask] += value;
    accumulator[(lag - d) & mask] += value;
  }
}

// Restores the min-heap order after the root of `powers` was replaced.
inline void SiftDown(uint16_t* lags, float* powers, int32_t size) {
  int32_t i = 0;
  for (;;) {
    int32_t child = 2 * i + 1;
    if (child >= size) return;
    if (child + 1 < size && powers[child + 1] < powers[child]) ++child;
    if (!(powers[child] < powers[i])) return;
    const float p = powers[i];
    powers[i] = powers[child];
    powers[child] = p;
    const uint16_t l = lags[i];
    lags[i] = lags[child];
    lags[child] = l;
    i = child;
  }
}

// Scores the full block held by `state` and empties it.
float ScoreBlock(const ZintarDetector* detector, ZintarState* state) {
  const int32_t n = state->block_size;
  const int32_t mask = n - 1;
  const int32_t k_peaks = state->peaks_per_block;
  const int32_t spread = state->peak_spread;
  float* block = state->block;
  float* accumulator = state->accumulator;

  // Circular cross-correlation of the windowed block with the pattern.
  const float* window = detector->window;
  for (int32_t k = 0; k < n; ++k) {
    block[2 * k] *= window[k];
    block[2 * k + 1] *= window[k];
  }
  ForwardToBitReversed(detector->fft, block);
  const float* ref = detector->reference_spectrum;  // Bit-reversed order, as the block.
  for (int32_t k = 0; k < 2 * n; k += 2) {
    const float a = block[k], b = block[k + 1];
    const float c = ref[k], d = ref[k + 1];
    block[k] = a * c + b * d;
    block[k + 1] = b * c - a * d;
  }
  InverseFromBitReversed(detector->fft, block);

  // Retire the oldest block's peaks.
  uint16_t* slot_lags = state->peak_lags + state->ring_position * k_peaks;
  float* slot_values = state->peak_values + state->ring_position * k_peaks;
  for (int32_t j = 0; j < k_peaks; ++j) {
    SpreadPeak(accumulator, mask, spread, slot_lags[j], -slot_values[j]);
    slot_lags[j] = 0;
    slot_values[j] = 0.0f;
  }

  // The K strongest lags; a power must beat the weakest kept one strictly.
  uint16_t* heap_lags = state->heap_lags;
  float* heap_powers = state->heap_powers;
  for (int32_t j = 0; j < k_peaks; ++j) {
    heap_lags[j] = 0;
    heap_powers[j] = 0.0f;
  }
  float sum = 0.0f;
  for (int32_t l = 0; l < n; ++l) {
    const float power = block[2 * l] * block[2 * l] + block[2 * l + 1] * block[2 * l + 1];
    sum += power;
    if (power > heap_powers[0]) {
      heap_powers[0] = power;
      heap_lags[0] = static_cast<uint16_t>(l);
      SiftDown(heap_lags, heap_powers, k_peaks);
    }
  }
  const float mean = sum / static_cast<float>(n) + kMeanPowerGuard;
  for (int32_t j = 0; j < k_peaks; ++j) {
    const float value = heap_powers[j] / mean;
    SpreadPeak(accumulator, mask, spread, heap_lags[j], value);
    slot_lags[j] = heap_lags[j];
    slot_values[j] = value;
  }

  float best = accumulator[0];
  for (int32_t l = 1; l < n; ++l) {
    if (accumulator[l] > best) best = accumulator[l];
  }
  state->ring_position = (state->ring_position + 1) % state->history_blocks;
  state->block_free = n;
  return best / static_cast<float>(state->history_blocks);
}

}  // namespace

void SetStandardZintarConfig(int32_t sample_rate, ZintarConfig* config) {
  const int64_t scaled = static_cast<int64_t>(sample_rate) * 2032;
  config->sample_rate = sample_rate;
  config->center_frequency = 18496.0625f;
  config->scaled_input_rate =
      (scaled > INT32_MAX || scaled < INT32_MIN) ? 0 : static_cast<int32_t>(scaled);
  config->scaled_baseband_rate = 12288000;
  config->history_blocks = 1;
  config->peaks_per_block = 1;
  config->peak_spread = 0;
  config->block_size = 256;
  config->reference_pattern = kZintarReferencePattern;
}

ZintarFftPlan* CreateZintarFftPlan(int32_t size) {
  if (!IsPowerOfTwo(size) || size > kMaxFftSize) return nullptr;
  ZintarFftPlan* plan = static_cast<ZintarFftPlan*>(calloc(1, sizeof(ZintarFftPlan)));
  if (plan == nullptr) return nullptr;
  plan->size = size;
  plan->odd_log2 = (static_cast<uint32_t>(size) & 0xAAAAAAAAu) != 0 ? 1 : 0;
  // A radix-4 pass over spans of 4L reads entries 0 ... 3 (L - 1) N / (4 L);
  // the last pass (L = N / 4) reads the most.
  const int32_t num_twiddles = size >= 4 ? 3 * size / 4 - 2 : 1;
  plan->twiddles = static_cast<float*>(malloc(2 * sizeof(float) * num_twiddles));
  if (plan->twiddles == nullptr) {
    FreeZintarFftPlan(plan);
    return nullptr;
  }
  // Repeated rotation in double precision from exactly (1, 0).
  const double step_cos = cos(2.0 * kPi / size);
  const double step_sin = sin(2.0 * kPi / size);
  double re = 1.0, im = 0.0;
  for (int32_t k = 0; k < num_twiddles; ++k) {
    plan->twiddles[2 * k] = static_cast<float>(re);
    plan->twiddles[2 * k + 1] = static_cast<float>(im);
    const double next_re = re * step_cos - im * step_sin;
    im = re * step_sin + im * step_cos;
    re = next_re;
  }
  return plan;
}

void FreeZintarFftPlan(ZintarFftPlan* plan) {
  if (plan == nullptr) return;
  free(plan->twiddles);
  free(plan);
}

void ZintarFftForward(const ZintarFftPlan* plan, float* data) {
  ForwardToBitReversed(plan, data);
  BitReverse(plan->size, data);
}

void ZintarFftInverse(const ZintarFftPlan* plan, float* data) {
  BitReverse(plan->size, data);
  InverseFromBitReversed(plan, data);
}

ZintarDetector* CreateZintarDetector(const ZintarConfig* config) {
  if (!IsValidConfig(config)) return nullptr;
  ZintarDetector* detector = static_cast<ZintarDetector*>(calloc(1, sizeof(ZintarDetector)));
  if (detector == nullptr) return nullptr;
  const int32_t n = config->block_size;
  detector->block_size = n;
  detector->history_blocks = config->history_blocks;
  detector->peaks_per_block = config->peaks_per_block;
  detector->peak_spread = config->peak_spread;

  // The mixer turns by -f / r cycles per sample.
  const double cycles = -static_cast<double>(config->center_frequency) / config->sample_rate;
  const double increment = (cycles - floor(cycles)) * 4294967296.0;
  detector->phase_increment = increment >= 4294967296.0 ? 0u : static_cast<uint32_t>(increment);

  // Double the rate from B until it reaches D: stage 0 brings D down to
  // u = B * 2^S, then S half-band stages bring u down to B.
  const int64_t input_rate = config->scaled_input_rate;
  int64_t v = config->scaled_baseband_rate;
  int64_t u = v;
  int32_t doublings = 0;
  do {
    u = v;
    v *= 2;
    ++doublings;
  } while (v < input_rate);
  detector->num_half_band_stages = doublings - 1;
  detector->stage0_modulus = static_cast<int32_t>(u);
  detector->stage0_step = static_cast<int32_t>(input_rate - u);

  detector->sine_table = static_cast<float*>(malloc(sizeof(float) * kSineTableSize));
  detector->window = static_cast<float*>(malloc(sizeof(float) * n));
  detector->reference_spectrum = static_cast<float*>(malloc(2 * sizeof(float) * n));
  detector->fft = CreateZintarFftPlan(n);
  if (detector->sine_table == nullptr || detector->window == nullptr ||
      detector->reference_spectrum == nullptr || detector->fft == nullptr) {
    FreeZintarDetector(detector);
    return nullptr;
  }
  for (int32_t j = 0; j < kSineTableSize; ++j) {
    detector->sine_table[j] = static_cast<float>(sin(2.0 * kPi * j / kSineTableSteps));
  }
  for (int32_t k = 0; k < n; ++k) {
    detector->window[k] = static_cast<float>(sin(kPi * (k + 1) / (n + 1)));
    detector->reference_spectrum[2 * k] = config->reference_pattern[k] / static_cast<float>(n);
    detector->reference_spectrum[2 * k + 1] = 0.0f;
  }
  // Kept in the bit-reversed order in which blocks are multiplied with it.
  ForwardToBitReversed(detector->fft, detector->reference_spectrum);
  return detector;
}

void FreeZintarDetector(ZintarDetector* detector) {
  if (detector == nullptr) return;
  FreeZintarFftPlan(detector->fft);
  free(detector->reference_spectrum);
  free(detector->window);
  free(detector->sine_table);
  free(detector);
}

ZintarState* CreateZintarState(const ZintarConfig* config, const ZintarDetector* detector) {
  if (detector == nullptr || !IsValidConfig(config)) return nullptr;
  if (config->block_size != detector->block_size ||
      config->history_blocks != detector->history_blocks ||
      config->peaks_per_block != detector->peaks_per_block ||
      config->peak_spread != detector->peak_spread) {
    return nullptr;
  }
  ZintarState* state = static_cast<ZintarState*>(calloc(1, sizeof(ZintarState)));
  if (state == nullptr) return nullptr;
  const int32_t n = config->block_size;
  const int32_t entries = config->history_blocks * config->peaks_per_block;
  state->block_size = n;
  state->history_blocks = config->history_blocks;
  state->peaks_per_block = config->peaks_per_block;
  state->peak_spread = config->peak_spread;
  state->num_stages = detector->num_half_band_stages + 1;
  state->block_free = n;

  state->stage_buffers = static_cast<float*>(
      calloc(static_cast<size_t>(state->num_stages + 1) * 2 * kStageCapacity, sizeof(float)));
  state->stage_counts = static_cast<int32_t*>(calloc(state->num_stages + 1, sizeof(int32_t)));
  state->peak_lags = static_cast<uint16_t*>(calloc(entries, sizeof(uint16_t)));
  state->peak_values = static_cast<float*>(calloc(entries, sizeof(float)));
  state->accumulator = static_cast<float*>(calloc(n, sizeof(float)));
  state->block = static_cast<float*>(calloc(2 * n, sizeof(float)));
  state->heap_lags = static_cast<uint16_t*>(calloc(config->peaks_per_block, sizeof(uint16_t)));
  state->heap_powers = static_cast<float*>(calloc(config->peaks_per_block, sizeof(float)));
  if (state->stage_buffers == nullptr || state->stage_counts == nullptr ||
      state->peak_lags == nullptr || state->peak_values == nullptr ||
      state->accumulator == nullptr || state->block == nullptr || state->heap_lags == nullptr ||
      state->heap_powers == nullptr) {
    FreeZintarState(state);
    return nullptr;
  }
  return state;
}

void FreeZintarState(ZintarState* state) {
  if (state == nullptr) return;
  free(state->heap_powers);
  free(state->heap_lags);
  free(state->block);
  free(state->accumulator);
  free(state->peak_values);
  free(state->peak_lags);
  free(state->stage_counts);
  free(state->stage_buffers);
  free(state);
}

void ZintarProcess(const ZintarDetector* detector, ZintarState* state, const int16_t* samples,
                   int32_t count, float* score) {
  const int32_t n = state->block_size;
  const int32_t num_stages = state->num_stages;
  const float* sine = detector->sine_table;
  const uint32_t increment = detector->phase_increment;
  float* const tail = state->stage_buffers + 2 * kStageCapacity * num_stages;
  bool any_block = false;
  float best = 0.0f;

  for (int32_t done = 0; done < count;) {
    const int32_t chunk = count - done < kMixerChunk ? count - done : kMixerChunk;

    state->phase = Mix(sine, state->phase, increment, samples + done, chunk,
                       state->stage_buffers + 2 * state->stage_counts[0]);
    state->stage_counts[0] += chunk;
    done += chunk;

    // Decimation: each stage appends its outputs to the next stage's buffer,
    // the last one to the tail buffer, whose count stays 0.
    int32_t* counts = state->stage_counts;
    float* buffer = state->stage_buffers;
    int32_t produced =
        RunFractionalStage(buffer, &counts[0], &state->stage0_accumulator, detector->stage0_modulus,
                           detector->stage0_step, buffer + 2 * kStageCapacity + 2 * counts[1]);
    for (int32_t s = 1; s < num_stages; ++s) {
      counts[s] += produced;
      buffer += 2 * kStageCapacity;
      produced =
          RunHalfBandStage(buffer, &counts[s], buffer + 2 * kStageCapacity + 2 * counts[s + 1]);
    }

    // Fill blocks from the tail buffer, scoring each one as it completes.
    for (int32_t i = 0; i < produced;) {
      const int32_t take = produced - i < state->block_free ? produced - i : state->block_free;
      memcpy(state->block + 2 * (n - state->block_free), tail + 2 * i, 2 * sizeof(float) * take);
      state->block_free -= take;
      i += take;
      if (state->block_free == 0) {
        const float block_score = ScoreBlock(detector, state);
        if (!any_block || block_score > best) best = block_score;
        any_block = true;
      }
    }
  }
  *score = best;
}

void GetZintarDetectorInfo(const ZintarDetector* detector, ZintarDetectorInfo* info) {
  info->block_size = detector->block_size;
  info->num_half_band_stages = detector->num_half_band_stages;
  info->stage0_modulus = detector->stage0_modulus;
  info->stage0_step = detector->stage0_step;
  info->mixer_phase_increment = detector->phase_increment;
}
