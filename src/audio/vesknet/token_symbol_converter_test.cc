#include "audio/vesknet/token_symbol_converter.h"

#include <vector>

#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

TEST(TokenSymbolConverterTest, MostSignificantSymbolFirst) {
  std::vector<int32_t> symbols;
  TokenSymbolConverter(2).BytesToSymbols({0xB4}, &symbols);
  EXPECT_EQ(symbols, (std::vector<int32_t>{2, 3, 1, 0}));
  TokenSymbolConverter(1).BytesToSymbols({0x80}, &symbols);
  EXPECT_EQ(symbols, (std::vector<int32_t>{1, 0, 0, 0, 0, 0, 0, 0}));
  TokenSymbolConverter(4).BytesToSymbols({0x12, 0xEF}, &symbols);
  EXPECT_EQ(symbols, (std::vector<int32_t>{1, 2, 14, 15}));
  TokenSymbolConverter(8).BytesToSymbols({0x00, 0xFF}, &symbols);
  EXPECT_EQ(symbols, (std::vector<int32_t>{0, 255}));
}

TEST(TokenSymbolConverterTest, RoundTripsEveryByteForEveryWidth) {
  std::vector<uint8_t> all_bytes;
  for (int b = 0; b < 256; ++b) all_bytes.push_back(static_cast<uint8_t>(b));
  for (int bits : {1, 2, 4, 8}) {
    const TokenSymbolConverter converter(bits);
    std::vector<int32_t> symbols;
    std::vector<uint8_t> bytes = {0x55};  // Outputs are cleared first.
    converter.BytesToSymbols(all_bytes, &symbols);
    EXPECT_EQ(symbols.size(), all_bytes.size() * (8 / bits));
    for (int32_t s : symbols) EXPECT_LT(s, 1 << bits);
    converter.SymbolsToBytes(symbols, &bytes);
    EXPECT_EQ(bytes, all_bytes) << bits << " bits per symbol";
  }
}

TEST(TokenSymbolConverterTest, JoiningIsPermissive) {
  const TokenSymbolConverter converter(4);
  std::vector<uint8_t> bytes;
  // Seven symbols: the incomplete last group is dropped.
  converter.SymbolsToBytes({1, 2, 3, 4, 5, 6, 7}, &bytes);
  EXPECT_EQ(bytes, (std::vector<uint8_t>{0x12, 0x34, 0x56}));
  // Out-of-alphabet values are cut to eight bits: (16 * 16 + 17) & 0xFF.
  converter.SymbolsToBytes({16, 17}, &bytes);
  EXPECT_EQ(bytes, (std::vector<uint8_t>{0x11}));
  converter.SymbolsToBytes({}, &bytes);
  EXPECT_TRUE(bytes.empty());
}

TEST(TokenSymbolConverterDeathTest, RejectsWidthsThatDoNotDivideEight) {
  for (int bits : {0, 3, 5, 6, 7, 9}) {
    EXPECT_DEATH(TokenSymbolConverter{bits}, "Check failed: BitsPerSymbolOk\\(bits_per_symbol\\)");
  }
}

}  // namespace
}  // namespace audio_vesknet
