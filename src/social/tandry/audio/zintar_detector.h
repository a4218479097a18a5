// Zintar detector core: a cheap detector of the zintar reference signal, a
// 127-chip pseudo-noise code around 18496.0625 Hz whose period spans 2032
// samples of 48 kHz audio, on raw 16-bit mono samples.
//
// The detector mixes the input down to complex baseband with an integer phase
// accumulator and a sine table, decimates it with 7-tap kernels (one
// fractional stage, then half-band stages) to the baseband rate, cuts the
// baseband stream into consecutive blocks of N samples, correlates each block
// with a stored N-sample reference pattern through its own power-of-two FFT,
// and scores the block by how far its strongest correlation peaks stand above
// the block's mean correlation power. The caller compares the score with a
// threshold (25.0 for the standard configuration).
//
// The core is procedural on purpose, so that it can be lifted into C: plain
// records, buffers from malloc/free, creation functions that return null on
// any failure (releasing what they had already allocated), no logging, no
// checks that end the process. Every allocation happens at creation;
// ZintarProcess never allocates.
//
// Thread-safety: a ZintarDetector is read-only after creation and may be
// shared by any number of threads, each with its own ZintarState. A
// ZintarState is used by one thread at a time.

#ifndef SOCIAL_TANDRY_AUDIO_ZINTAR_DETECTOR_H_
#define SOCIAL_TANDRY_AUDIO_ZINTAR_DETECTOR_H_

#include <stdint.h>

// Configuration of a detector. Rates are integers; "scaled" rates are in units
// of 1/2032 Hz so that the 12288000 / 2032 Hz baseband rate is exact. A
// configuration breaking any stated range makes every creation function
// return null.
struct ZintarConfig {
  int32_t sample_rate;           // Input rate r, Hz, >= 1.
  float center_frequency;        // Hz, 0 <= value <= (float)(r / 2), integer r / 2.
  int32_t scaled_input_rate;     // Input rate D in 1/2032 Hz, >= scaled_baseband_rate.
  int32_t scaled_baseband_rate;  // Baseband rate B in 1/2032 Hz, > 0.
  int32_t history_blocks;        // H: blocks whose peaks are averaged, 1 ... 64.
  int32_t peaks_per_block;       // K: strongest lags kept per block, 1 ... 64.
  int32_t peak_spread;  // W: lags on each side of a peak sharing its value, 0 <= W < N / 2.
  int32_t block_size;   // N: baseband samples per block, a power of two, 1 ... 2048.
  const float* reference_pattern;  // N floats, not null; read only while the detector is
                                   // created (its spectrum is kept), not owned.
};

// The standard zintar reference pattern: the baseband image of the 127-chip
// code sampled at 256 values per code period. Its sum of squares is 256.
extern const float kZintarReferencePattern[256];

// Fills `config` with the standard configuration for an input rate in Hz:
// centre 18496.0625 Hz, scaled input rate sample_rate * 2032, scaled baseband
// rate 12288000, H = 1, K = 1, W = 0, N = 256 and kZintarReferencePattern.
// A rate whose scaled value does not fit in 32 bits gets a scaled input rate of
// 0, which the creation functions refuse. `config` must not be null.
void SetStandardZintarConfig(int32_t sample_rate, ZintarConfig* config);

struct ZintarDetector;  // Read-only tables and the decimation plan.
struct ZintarState;     // Everything that changes from sample to sample.

// Builds the read-only part of a detector: window, reference spectrum, FFT
// plan, sine table, decimation plan. Returns null when `config` is null or
// invalid, or when an allocation fails. Release with FreeZintarDetector.
ZintarDetector* CreateZintarDetector(const ZintarConfig* config);

// Builds a fresh state (mixer phase 0, empty stage buffers, empty block, empty
// peak history) for `detector`, which must have been created from an
// equivalent `config`. Returns null when either is null, when `config` is
// invalid or its block size differs from the detector's, or when an
// allocation fails. Release with FreeZintarState before the detector.
ZintarState* CreateZintarState(const ZintarConfig* config, const ZintarDetector* detector);

// Feeds `count` 16-bit mono samples (count <= 0 feeds nothing) and stores in
// `*score` the largest score of the blocks completed during this call, or 0 if
// none was completed. Samples that do not complete a block stay in the state
// for the next call, so splitting the input into calls changes nothing but
// which blocks each call reports. Scores lie in 0 ... N (up to rounding). `detector`,
// `state` and `score` must not be null; `samples` may be null when count is 0.
void ZintarProcess(const ZintarDetector* detector, ZintarState* state, const int16_t* samples,
                   int32_t count, float* score);

// Release functions; null is accepted and ignored.
void FreeZintarState(ZintarState* state);
void FreeZintarDetector(ZintarDetector* detector);

// Read-only description of a detector's front end, for diagnostics and tests.
struct ZintarDetectorInfo {
  int32_t block_size;              // N.
  int32_t num_half_band_stages;    // S: decimate-by-2 stages after stage 0.
  int32_t stage0_modulus;          // u = B * 2^S; stage 0 decimates by D / u.
  int32_t stage0_step;             // D - u.
  uint32_t mixer_phase_increment;  // frac(-f / r) * 2^32, truncated.
};

// Fills `info` from `detector`; neither may be null.
void GetZintarDetectorInfo(const ZintarDetector* detector, ZintarDetectorInfo* info);

// The detector's own FFT: unnormalised, in place, on `size` complex values
// stored as interleaved (re, im) floats. Forward uses exp(-2 pi i j k / size),
// inverse exp(+2 pi i j k / size); inverse(forward(x)) = size * x. Radix-4
// passes, plus one radix-2 pass when log2(size) is odd.
struct ZintarFftPlan;

// Returns null unless `size` is a power of two in 1 ... 65536, or when an
// allocation fails. Release with FreeZintarFftPlan (null is ignored).
ZintarFftPlan* CreateZintarFftPlan(int32_t size);
void FreeZintarFftPlan(ZintarFftPlan* plan);

// Transform `data` (2 * size floats) in place; `plan` and `data` not null.
void ZintarFftForward(const ZintarFftPlan* plan, float* data);
void ZintarFftInverse(const ZintarFftPlan* plan, float* data);

#endif  // SOCIAL_TANDRY_AUDIO_ZINTAR_DETECTOR_H_
