#include "audio/vesknet/token_symbol_converter.h"

#include "base/logging.h"

namespace audio_vesknet {

TokenSymbolConverter::TokenSymbolConverter(int bits_per_symbol) {
  CHECK(BitsPerSymbolOk(bits_per_symbol));
  symbols_per_byte_ = 8 / bits_per_symbol;
  alphabet_size_ = 1 << bits_per_symbol;
}

bool TokenSymbolConverter::BitsPerSymbolOk(int bits_per_symbol) {
  return bits_per_symbol >= 1 && bits_per_symbol <= 8 && 8 % bits_per_symbol == 0;
}

void TokenSymbolConverter::BytesToSymbols(const std::vector<uint8_t>& bytes,
                                          std::vector<int32_t>* symbols) const {
  CHECK(symbols);
  symbols->clear();
  symbols->reserve(bytes.size() * symbols_per_byte_);
  for (const uint8_t byte : bytes) {
    int value = byte;
    int32_t digits[8];
    for (int i = 0; i < symbols_per_byte_; ++i) {
      digits[i] = value % alphabet_size_;
      value /= alphabet_size_;
    }
    for (int i = symbols_per_byte_ - 1; i >= 0; --i) symbols->push_back(digits[i]);
  }
}

void TokenSymbolConverter::SymbolsToBytes(const std::vector<int32_t>& symbols,
                                          std::vector<uint8_t>* bytes) const {
  CHECK(bytes);
  bytes->clear();
  bytes->reserve(symbols.size() / symbols_per_byte_);
  uint32_t accumulator = 0;
  int count = 0;
  for (const int32_t symbol : symbols) {
    accumulator = (accumulator * alphabet_size_ + static_cast<uint32_t>(symbol)) & 0xFF;
    if (++count == symbols_per_byte_) {
      bytes->push_back(static_cast<uint8_t>(accumulator));
      accumulator = 0;
      count = 0;
    }
  }
}

}  // namespace audio_vesknet
