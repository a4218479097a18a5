// Splits token bytes into DSSS symbols of a fixed number of bits and joins
// symbols back into bytes.
//
// Each byte becomes 8 / bits_per_symbol symbols, most significant first; with
// 2 bits per symbol the byte 0xB4 becomes 2, 3, 1, 0. Symbol values are not
// range-checked when joining: a value outside the alphabet enters the
// arithmetic and is cut to eight bits, which the decoder relies on.
//
// Immutable after construction.

#ifndef AUDIO_VESKNET_TOKEN_SYMBOL_CONVERTER_H_
#define AUDIO_VESKNET_TOKEN_SYMBOL_CONVERTER_H_

#include <cstdint>
#include <vector>

namespace audio_vesknet {

class TokenSymbolConverter {
 public:
  // bits_per_symbol must be 1, 2, 4 or 8.
  explicit TokenSymbolConverter(int bits_per_symbol);
  virtual ~TokenSymbolConverter() = default;

  // Whether bits_per_symbol lies in 1 to 8 and divides 8.
  static bool BitsPerSymbolOk(int bits_per_symbol);

  // Clears `symbols` and appends the symbols of every byte, in order.
  void BytesToSymbols(const std::vector<uint8_t>& bytes, std::vector<int32_t>* symbols) const;

  // Clears `bytes` and appends one byte per complete group of symbols; a
  // trailing incomplete group is dropped.
  void SymbolsToBytes(const std::vector<int32_t>& symbols, std::vector<uint8_t>* bytes) const;

  int symbols_per_byte() const { return symbols_per_byte_; }

 private:
  int32_t symbols_per_byte_;
  int32_t alphabet_size_;  // 2^bits_per_symbol.
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_TOKEN_SYMBOL_CONVERTER_H_
