#include "audio/vesknet/crc16_coder.h"

#include "base/logging.h"

namespace audio_vesknet {

Crc16Coder::Crc16Coder(const Crc16CoderParams& params) : params_(params) {
  CHECK(params_.num_message_bytes > 0);
}

uint16_t Crc16Coder::ComputeCrc(const std::vector<uint8_t>& bytes) const {
  CHECK(static_cast<int>(bytes.size()) >= params_.num_message_bytes);
  uint16_t crc = 0;
  for (int i = 0; i < params_.num_message_bytes; ++i) {
    crc ^= bytes[i];
    for (int bit = 0; bit < 8; ++bit) {
      crc =
          (crc & 1) ? static_cast<uint16_t>((crc >> 1) ^ 0x8408) : static_cast<uint16_t>(crc >> 1);
    }
  }
  return crc;
}

void Crc16Coder::AppendCrc(std::vector<uint8_t>* message) const {
  CHECK(message);
  CHECK(static_cast<int>(message->size()) == params_.num_message_bytes);
  const uint16_t crc = ComputeCrc(*message);
  message->push_back(static_cast<uint8_t>(crc >> 8));
  message->push_back(static_cast<uint8_t>(crc & 0xFF));
}

bool Crc16Coder::CheckCrc(const std::vector<uint8_t>& token) const {
  CHECK(static_cast<int>(token.size()) == BytesInToken());
  const int n = params_.num_message_bytes;
  const uint16_t stored = static_cast<uint16_t>((token[n] << 8) | token[n + 1]);
  return stored == ComputeCrc(token);
}

}  // namespace audio_vesknet
