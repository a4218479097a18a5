// Waveform geometry of the DSSS modem, shared by the transmitter and the
// receiver.
//
// From one pseudo-noise code the coder derives, once at construction: the
// frame size (passband samples per symbol), a carrier snapped to a whole
// number of cycles per frame (so every frame starts at the same carrier
// phase), the passband waveform of every symbol, and the baseband templates
// (code and symbol tones at the baseband rate) that the decoder correlates
// against. Symbol s is the code times the carrier, whose envelope carries a
// tone of min_cycles_per_frame + s cycles per frame on top of a constant
// pedestal. The alphabet has 2^bits_per_symbol data symbols plus the sync
// symbol (the last one), which opens every token.
//
// Read-only after construction; may be shared by an encoder and a decoder.

#ifndef AUDIO_VESKNET_SYMBOL_WAVE_CODER_H_
#define AUDIO_VESKNET_SYMBOL_WAVE_CODER_H_

#include <vector>

#include "audio/dsp/matrix.h"

namespace audio_vesknet {

// The code that SymbolWaveCoderParams uses unless told otherwise: 7 taps,
// code 0 (127 chips).
std::vector<float> DefaultCodeSignal();

struct SymbolWaveCoderParams {
  std::vector<float> code_signal = DefaultCodeSignal();  // Chips of one code period, not empty.
  float sample_rate = 44100.0f;                          // Passband rate, Hz, > 0.
  int upsampling_factor = 15;                            // Samples per chip, > 0.
  float desired_carrier_frequency = 18500.0f;            // Hz, (0, sample_rate / 2].
  int bits_per_symbol = 4;                               // Data bits per symbol, > 0.
  int min_cycles_per_frame = 4;         // Symbol-tone cycles per frame of symbol 0, >= 0.
  int baseband_decimation_factor = 3;   // Passband / baseband rate; divides upsampling_factor.
  bool use_quadrature_carrier = false;  // Symbol tone on the cosine carrier.
  float pedestal_amplitude = 1.0f;      // Constant added to the symbol tone, > 0.
};

class SymbolWaveCoder {
 public:
  // Aborts on an invalid record. desired_carrier_frequency 0 gives all-zero
  // waves (and a division by zero in the normalisation): do not use it.
  explicit SymbolWaveCoder(const SymbolWaveCoderParams& params);
  virtual ~SymbolWaveCoder() = default;

  // Passband waveform of `symbol`, frame_size() samples, 0 <= symbol <
  // alphabet_size().
  const std::vector<float>& GetSymbolWave(int symbol) const;
  // Waveform of the sync symbol, the alphabet's last.
  const std::vector<float>& GetSyncSymbolWave() const;

  const SymbolWaveCoderParams& params() const { return params_; }
  // Code length x upsampling_factor: passband samples per symbol.
  int frame_size() const { return frame_size_; }
  int carrier_cycles_per_frame() const { return carrier_cycles_per_frame_; }
  // What carrier_cycles_per_frame() is for a coder of `frame_size` samples at
  // `sample_rate` asked for `desired_carrier_frequency`, without building it.
  static int CarrierCyclesPerFrame(int frame_size, float sample_rate,
                                   float desired_carrier_frequency);
  // Carrier actually used, Hz: carrier_cycles_per_frame x sample_rate / frame_size.
  float carrier_frequency() const;
  // 2^bits_per_symbol + 1.
  int alphabet_size() const { return alphabet_size_; }
  // The code at the baseband rate: frame_size / baseband_decimation_factor samples.
  const std::vector<float>& baseband_code() const { return baseband_code_; }
  // alphabet_size() rows x baseband frame columns; row s is
  // sin(2 pi (min_cycles_per_frame + s) n / B).
  const audio_dsp::MatrixXf& baseband_tones() const { return baseband_tones_; }

 private:
  SymbolWaveCoderParams params_;
  int frame_size_;
  int carrier_cycles_per_frame_;
  int alphabet_size_;
  std::vector<float> baseband_code_;
  audio_dsp::MatrixXf baseband_tones_;
  std::vector<std::vector<float>> symbol_waves_;
};

// Band-limited interpolation of a real periodic signal by an integer factor
// k >= 1: zero-pads its spectrum to x.size() x k samples. With k = 1 the
// result equals the input up to rounding.
std::vector<float> FourierUpsample(const std::vector<float>& x, int k);

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_SYMBOL_WAVE_CODER_H_
