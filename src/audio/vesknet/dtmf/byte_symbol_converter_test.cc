#include "audio/vesknet/dtmf/byte_symbol_converter.h"

#include <cstdint>
#include <random>
#include <vector>

#include "gtest/gtest.h"

namespace audio_vesknet {
namespace {

using Bytes = std::vector<uint8_t>;
using Symbols = std::vector<int32_t>;

TEST(ByteSymbolConverterTest, KnownValues) {
  const ByteSymbolConverter converter(45, 44, 5);
  EXPECT_EQ(converter.symbols_in_token(), 8);
  EXPECT_EQ(converter.BytesToSymbols(Bytes(5, 0)), Symbols(8, 0));
  // 256^5 - 1 in base 44, least significant first.
  EXPECT_EQ(converter.BytesToSymbols(Bytes(5, 0xFF)), (Symbols{11, 35, 43, 1, 4, 23, 19, 3}));
  // 44^8 - 1 does not fit in five bytes: six come back.
  EXPECT_EQ(converter.SymbolsToBytes(Symbols(8, 43)).size(), 6u);
  // Digits at or above the spacer are shifted past it: 300 = 6 x 44 + 36.
  const ByteSymbolConverter spacer_10(45, 10, 5);
  EXPECT_EQ(spacer_10.BytesToSymbols({44, 1, 0, 0, 0}), (Symbols{37, 6, 0, 0, 0, 0, 0, 0}));
  EXPECT_EQ(spacer_10.SymbolsToBytes({44, 0, 0, 0, 0, 0, 0, 0}), (Bytes{43, 0, 0, 0, 0}));
  EXPECT_EQ(ByteSymbolConverter(3, 2, 1).symbols_in_token(), 8);  // Binary digits.
}

TEST(ByteSymbolConverterTest, RoundTrips) {
  std::mt19937 random(11);
  for (const int bytes_in_token : {1, 5, 16}) {
    for (const int alphabet_size : {3, 45, 200}) {
      for (const int spacer : {0, alphabet_size / 2, alphabet_size - 1}) {
        const ByteSymbolConverter converter(alphabet_size, spacer, bytes_in_token);
        std::vector<Bytes> tokens = {Bytes(bytes_in_token, 0), Bytes(bytes_in_token, 0xFF)};
        for (int i = 0; i < 20; ++i) {
          tokens.emplace_back(bytes_in_token);
          for (uint8_t& byte : tokens.back()) byte = static_cast<uint8_t>(random());
        }
        for (const Bytes& token : tokens) {
          const Symbols symbols = converter.BytesToSymbols(token);
          ASSERT_EQ(static_cast<int>(symbols.size()), converter.symbols_in_token());
          for (const int32_t s : symbols) ASSERT_TRUE(s >= 0 && s < alphabet_size && s != spacer);
          EXPECT_EQ(converter.SymbolsToBytes(symbols), token);
        }
      }
    }
  }
}

TEST(ByteSymbolConverterDeathTest, Preconditions) {
  EXPECT_DEATH(ByteSymbolConverter(2, 1, 5), "Check failed: alphabet_size >= 3");
  const ByteSymbolConverter converter(45, 44, 5);
  EXPECT_DEATH(converter.BytesToSymbols(Bytes(4)),
               "Check failed: static_cast<int>\\(bytes.size\\(\\)\\) == bytes_in_token_");
  EXPECT_DEATH(converter.SymbolsToBytes({0, 0, 44, 0, 0, 0, 0, 0}),
               "Check failed: symbol != spacer_symbol_");
  EXPECT_DEATH(converter.SymbolsToBytes({0, 0, 0, 0, 0, 0, 0, 45}),
               "Check failed: symbol < alphabet_size_");
}

}  // namespace
}  // namespace audio_vesknet
