#include "audio/vesknet/dtmf/byte_symbol_converter.h"

#include <algorithm>

#include "audio/dsp/digit_sequence.h"
#include "base/logging.h"

namespace audio_vesknet {
namespace {

constexpr int kByteBase = 256;

}  // namespace

ByteSymbolConverter::ByteSymbolConverter(int alphabet_size, int spacer_symbol, int bytes_in_token)
    : alphabet_size_(alphabet_size),
      spacer_symbol_(spacer_symbol),
      bytes_in_token_(bytes_in_token),
      symbols_in_token_(0),
      digit_base_(0) {
  CHECK(alphabet_size >= 3);
  digit_base_ = alphabet_size_ - 1;
  const std::vector<int32_t> largest_token(std::max(bytes_in_token_, 0), kByteBase - 1);
  symbols_in_token_ = static_cast<int32_t>(
      audio_dsp::DigitSequence(largest_token, kByteBase).ConvertBase(digit_base_).digits().size());
}

std::vector<int32_t> ByteSymbolConverter::BytesToSymbols(const std::vector<uint8_t>& bytes) const {
  CHECK(static_cast<int>(bytes.size()) == bytes_in_token_);
  std::vector<int32_t> message_digits =
      audio_dsp::DigitSequence(std::vector<int32_t>(bytes.begin(), bytes.end()), kByteBase)
          .ConvertBase(digit_base_)
          .digits();
  CHECK(static_cast<int>(message_digits.size()) <= symbols_in_token_);
  // Most-significant zeros: the value is unchanged.
  message_digits.resize(symbols_in_token_, 0);
  for (int32_t& digit : message_digits) {
    if (digit >= spacer_symbol_) ++digit;
  }
  return message_digits;
}

std::vector<uint8_t> ByteSymbolConverter::SymbolsToBytes(
    const std::vector<int32_t>& symbols) const {
  CHECK(static_cast<int>(symbols.size()) == symbols_in_token_);
  std::vector<int32_t> digits;
  digits.reserve(symbols.size());
  for (const int32_t symbol : symbols) {
    CHECK(symbol >= 0);
    CHECK(symbol < alphabet_size_);
    CHECK(symbol != spacer_symbol_);
    digits.push_back(symbol > spacer_symbol_ ? symbol - 1 : symbol);
  }
  const audio_dsp::DigitSequence value =
      audio_dsp::DigitSequence(digits, digit_base_).ConvertBase(kByteBase);
  std::vector<uint8_t> bytes(value.digits().begin(), value.digits().end());
  if (static_cast<int>(bytes.size()) < bytes_in_token_) bytes.resize(bytes_in_token_, 0);
  return bytes;
}

}  // namespace audio_vesknet
