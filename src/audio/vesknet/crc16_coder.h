// CRC-16 check bytes of a token.
//
// A token is `num_message_bytes` message bytes followed by two check bytes.
// The CRC is the reflected CCITT polynomial (register shifted right, XORed
// with 0x8408) with initial value 0 and no final XOR; its value over the nine
// ASCII bytes "123456789" is 0x2189. The check bytes are stored high byte
// first (0x21, 0x89 for that value): both the encoder and the decoder use
// this order, which differs from the low-byte-first order often used with
// this CRC, and must keep it.
//
// Immutable after construction; may be copied and shared freely.

#ifndef AUDIO_VESKNET_CRC16_CODER_H_
#define AUDIO_VESKNET_CRC16_CODER_H_

#include <cstdint>
#include <vector>

namespace audio_vesknet {

struct Crc16CoderParams {
  int32_t num_message_bytes = 0;  // Message bytes per token, > 0.
};

class Crc16Coder {
 public:
  explicit Crc16Coder(const Crc16CoderParams& params);

  // Message bytes plus the two check bytes.
  int BytesInToken() const { return params_.num_message_bytes + 2; }

  // CRC of the first `num_message_bytes` bytes; further bytes are ignored, so
  // a whole token may be passed.
  uint16_t ComputeCrc(const std::vector<uint8_t>& bytes) const;

  // Appends the check bytes, high byte first, to a vector that holds exactly
  // the message.
  void AppendCrc(std::vector<uint8_t>* message) const;

  // Whether the token's last two bytes, read high byte first, are the CRC of
  // its message bytes. The token must have BytesInToken() bytes.
  bool CheckCrc(const std::vector<uint8_t>& token) const;

  const Crc16CoderParams& params() const { return params_; }

 private:
  Crc16CoderParams params_;
};

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_CRC16_CODER_H_
