// Converts DTMF tokens between bytes and symbols.
//
// A token of bytes_in_token bytes is read as one non-negative integer, first
// byte least significant, and written in base alphabet_size - 1 with a fixed
// number of digits, symbols_in_token (the digit count of the largest token,
// 256^bytes_in_token - 1). Each digit becomes a symbol; digits at or above the
// spacer are shifted up by one so that the spacer never carries data. Symbols
// are listed least significant first, which is also the order on air.
//
// With 45 symbols, spacer 44 and 5 bytes: base 44, 8 symbols per token.
//
// Immutable after construction; may be shared between threads.

#ifndef AUDIO_VESKNET_DTMF_BYTE_SYMBOL_CONVERTER_H_
#define AUDIO_VESKNET_DTMF_BYTE_SYMBOL_CONVERTER_H_

#include <cstdint>
#include <vector>

namespace audio_vesknet {

class ByteSymbolConverter {
 public:
  // alphabet_size >= 3 (fatal). The spacer is not range-checked here; the
  // DTMF parameter validation does that. bytes_in_token should be > 0 (a
  // non-positive count gives a converter for the empty token, one symbol).
  ByteSymbolConverter(int alphabet_size, int spacer_symbol, int bytes_in_token);

  // The symbols_in_token symbols of `bytes`, which must hold exactly
  // bytes_in_token bytes (fatal otherwise).
  std::vector<int32_t> BytesToSymbols(const std::vector<uint8_t>& bytes) const;

  // The bytes of exactly symbols_in_token symbols, each in [0, alphabet_size)
  // and not the spacer (fatal otherwise). At least bytes_in_token bytes, and
  // more when the symbols spell a number of 256^bytes_in_token or above (the
  // symbol space is larger than the byte space): callers compare the length.
  std::vector<uint8_t> SymbolsToBytes(const std::vector<int32_t>& symbols) const;

  int alphabet_size() const { return alphabet_size_; }
  int spacer_symbol() const { return spacer_symbol_; }
  int bytes_in_token() const { return bytes_in_token_; }
  int symbols_in_token() const { return symbols_in_token_; }

 private:
  int32_t alphabet_size_;
  int32_t spacer_symbol_;
  int32_t bytes_in_token_;
  int32_t symbols_in_token_;
  int32_t digit_base_;  // alphabet_size_ - 1.
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_DTMF_BYTE_SYMBOL_CONVERTER_H_
