// Messages as the tools show and accept them: bytes in hexadecimal.

#ifndef TOOLS_COMMON_HEX_BYTES_H_
#define TOOLS_COMMON_HEX_BYTES_H_

#include <cstdint>
#include <string>
#include <vector>

namespace vesk_tool {

// Parses hexadecimal text ("0a1B2c", optionally with "0x" and spaces, colons
// or dashes between bytes) into bytes. False for odd digit counts or non-hex.
bool ParseHexBytes(const std::string& text, std::vector<uint8_t>* bytes);

// Lower-case hexadecimal, two digits per byte, no separators.
std::string ToHex(const std::vector<uint8_t>& bytes);

}  // namespace vesk_tool

#endif  // TOOLS_COMMON_HEX_BYTES_H_
