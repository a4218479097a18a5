// The DTMF transmitter: token bytes in, multi-tone audio out.
//
// A token on air is a spacer symbol, the token's symbols (least significant
// first, see ByteSymbolConverter) and, optionally, a checksum symbol. Each
// symbol is one frame of frame_size samples in which the symbol's tones,
// each starting at phase zero, sound together under the envelope window. The
// whole token is then scaled so that its loudest sample is max_amplitude.
//
// Immutable after construction; every call works on its own output, so one
// encoder may serve several threads.

#ifndef AUDIO_VESKNET_DTMF_DTMF_ENCODER_H_
#define AUDIO_VESKNET_DTMF_DTMF_ENCODER_H_

#include <cstdint>
#include <vector>

#include "audio/vesknet/dtmf/byte_symbol_converter.h"
#include "audio/vesknet/dtmf/dtmf_encoder_params.h"

namespace audio_vesknet {

class DtmfEncoder {
 public:
  // Copies and validates `params` (fatal on an invalid record; an alphabet of
  // fewer than 3 symbols is refused by the converter first). An empty window
  // is replaced by the half-sine of SetDefaultWindow.
  explicit DtmfEncoder(const DtmfEncoderParams& params);

  // True when `symbols` is a token's worth of data symbols that this encoder
  // can send: symbols_in_token of them, each in the alphabet and not the
  // spacer, spelling a number that fits in bytes_in_token bytes.
  bool IsValidSymbolSequence(const std::vector<int32_t>& symbols) const;

  // Replaces *audio_samples with the token audio of `token_message_symbols`
  // (which must pass IsValidSymbolSequence; fatal otherwise): (spacer +
  // symbols + optional checksum) x frame_size samples, peak max_amplitude. A
  // token that is silent (peak below float epsilon, as with an all-zero
  // window) is left unscaled.
  void EncodeSymbols(const std::vector<int32_t>& token_message_symbols,
                     std::vector<float>* audio_samples) const;

  // BytesToSymbols (fatal unless bytes holds bytes_in_token bytes), then
  // EncodeSymbols.
  void EncodeToken(const std::vector<uint8_t>& bytes, std::vector<float>* audio_samples) const;

  // Replaces *result with the frame_size unscaled samples of `symbol`: the sum
  // of its tones, sin(i x 2 pi f / sample_rate), times the window.
  void SynthesizeSymbol(int32_t symbol, std::vector<float>* result) const;

  const DtmfEncoderParams& params() const { return params_; }
  const ByteSymbolConverter& converter() const { return converter_; }
  int alphabet_size() const { return alphabet_size_; }
  int frame_size() const { return frame_size_; }

 private:
  DtmfEncoderParams params_;
  int32_t alphabet_size_;
  ByteSymbolConverter converter_;
  int32_t frame_size_;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_DTMF_DTMF_ENCODER_H_
