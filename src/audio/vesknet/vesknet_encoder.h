// The DSSS transmitter: token bytes in, audio at the broadcast rate out.
//
// A token on air is the sync symbol, the data symbols and, optionally, a
// checksum symbol, one coder frame each. The encoder synthesises them from
// the coder's symbol waves, optionally keeps only the upper sideband,
// resamples the whole token to the broadcast rate and scales it to
// peak_amplitude. It also makes the short fade-in that the host plays before
// the token.
//
// Immutable after construction; every call works on its own output. The
// resampling to the broadcast rate (and the sideband filter) is planned at
// construction for the token's length (see audio_dsp::FftResampler): an
// encoder of a coder whose rate is not the broadcast rate holds about 2 MB
// of transform tables, and encodes a token in a few milliseconds.

#ifndef AUDIO_VESKNET_VESKNET_ENCODER_H_
#define AUDIO_VESKNET_VESKNET_ENCODER_H_

#include <cstdint>
#include <memory>
#include <vector>

#include "audio/dsp/kiss_fft_util.h"
#include "audio/vesknet/symbol_wave_coder.h"
#include "audio/vesknet/token_selector.h"
#include "audio/vesknet/token_symbol_converter.h"

namespace audio_vesknet {

struct VesknetEncoderParams {
  int symbols_per_token = 16;           // Data symbols, without sync and checksum.
  bool append_checksum_symbol = false;  // One checksum symbol after the data.
  bool single_sideband = false;         // Remove everything below the carrier.
  float peak_amplitude = 0.5f;          // Largest |sample| of the output.
  float transition_duration = 0.005f;   // Start transition, seconds, >= 0.
  float broadcast_sample_rate = 0.0f;   // Output rate, Hz; must be set > 0.
};

class VesknetEncoder {
 public:
  // Takes ownership of the coder.
  VesknetEncoder(std::unique_ptr<SymbolWaveCoder> symbol_wave_coder,
                 const VesknetEncoderParams& params);

  // Bytes to symbols (most significant first), then EncodeSymbols.
  bool EncodeToken(const std::vector<uint8_t>& bytes, std::vector<float>* output) const;

  // Replaces *output with the token audio at the broadcast rate. Returns false,
  // logging why and leaving *output untouched, when symbols.size() differs
  // from symbols_per_token or output is null. A symbol outside the alphabet
  // aborts.
  bool EncodeSymbols(const std::vector<int32_t>& symbols, std::vector<float>* output) const;

  // The fade-in to play before `input` (an encoded token): round(transition
  // seconds x broadcast rate) samples that read `input` as a periodic signal
  // under a linear ramp, ending on input's last sample so that playback
  // continues into input[0] without a jump. False (logged) for an empty input
  // or a null output.
  bool MakeStartTransition(const std::vector<float>& input, std::vector<float>* output) const;

  const SymbolWaveCoder& symbol_wave_coder() const { return *symbol_wave_coder_; }
  const VesknetEncoderParams& params() const { return params_; }

 private:
  std::unique_ptr<SymbolWaveCoder> symbol_wave_coder_;
  std::unique_ptr<TokenSymbolConverter> converter_;
  VesknetEncoderParams params_;
  // From the coder's rate to the broadcast rate for one token's length; null
  // when the token is broadcast as it is.
  std::unique_ptr<audio_dsp::FftResampler> resampler_;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_VESKNET_ENCODER_H_
