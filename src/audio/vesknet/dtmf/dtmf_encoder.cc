#include "audio/vesknet/dtmf/dtmf_encoder.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "audio/vesknet/vesknet_encoder.h"
#include "base/logging.h"

namespace audio_vesknet {
namespace {

constexpr double kPi = 3.14159265358979323846;

// Replaces *result with sin(i x omega), i = 0 .. num_samples - 1, in single
// precision: every tone starts at phase zero.
void MakeTone(float omega, int num_samples, std::vector<float>* result) {
  CHECK(result);
  result->resize(num_samples);
  for (int i = 0; i < num_samples; ++i) {
    (*result)[i] = std::sin(static_cast<float>(i) * omega);
  }
}

}  // namespace

DtmfEncoder::DtmfEncoder(const DtmfEncoderParams& params)
    : params_(params),
      alphabet_size_(static_cast<int32_t>(params_.symbol_table.size())),
      converter_(alphabet_size_, params_.spacer_symbol, params_.bytes_in_token),
      frame_size_(0) {
  ValidateDtmfEncoderParams(params_);
  frame_size_ = GetFrameSize(params_);
  if (params_.window_samples.empty()) SetDefaultWindow(&params_);
}

bool DtmfEncoder::IsValidSymbolSequence(const std::vector<int32_t>& symbols) const {
  if (static_cast<int>(symbols.size()) != converter_.symbols_in_token()) return false;
  for (const int32_t symbol : symbols) {
    if (symbol < 0 || symbol >= alphabet_size_ || symbol == params_.spacer_symbol) return false;
  }
  // The symbol space is larger than the byte space: refuse numbers that need
  // more than bytes_in_token bytes.
  return static_cast<int>(converter_.SymbolsToBytes(symbols).size()) == params_.bytes_in_token;
}

void DtmfEncoder::EncodeSymbols(const std::vector<int32_t>& token_message_symbols,
                                std::vector<float>* audio_samples) const {
  CHECK(IsValidSymbolSequence(token_message_symbols));
  CHECK(audio_samples);

  std::vector<int32_t> symbols;
  symbols.reserve(token_message_symbols.size() + 2);
  symbols.push_back(params_.spacer_symbol);
  symbols.insert(symbols.end(), token_message_symbols.begin(), token_message_symbols.end());
  if (params_.append_checksum_symbol) {
    // The leading spacer is not part of the sum.
    symbols.push_back(ChecksumSymbol(alphabet_size_, token_message_symbols));
  }

  audio_samples->clear();
  audio_samples->reserve(symbols.size() * frame_size_);
  std::vector<float> frame;
  for (const int32_t symbol : symbols) {
    SynthesizeSymbol(symbol, &frame);
    audio_samples->insert(audio_samples->end(), frame.begin(), frame.end());
  }

  float peak = 0.0f;
  for (const float sample : *audio_samples) peak = std::max(peak, std::fabs(sample));
  if (peak >= std::numeric_limits<float>::epsilon()) {
    // The gain is applied in double so that the loudest sample comes out at
    // exactly max_amplitude.
    const double gain = static_cast<double>(params_.max_amplitude) / peak;
    for (float& sample : *audio_samples) sample = static_cast<float>(sample * gain);
  }
}

void DtmfEncoder::EncodeToken(const std::vector<uint8_t>& bytes,
                              std::vector<float>* audio_samples) const {
  EncodeSymbols(converter_.BytesToSymbols(bytes), audio_samples);
}

void DtmfEncoder::SynthesizeSymbol(int32_t symbol, std::vector<float>* result) const {
  CHECK(result);
  CHECK(symbol >= 0);
  CHECK(symbol < alphabet_size_);
  result->assign(frame_size_, 0.0f);
  std::vector<float> tone;
  for (const int32_t index : params_.symbol_table[symbol]) {
    const float frequency = params_.tone_frequencies[index];
    const float omega =
        static_cast<float>(frequency * 2.0 * kPi / static_cast<double>(params_.sample_rate));
    MakeTone(omega, frame_size_, &tone);
    for (int i = 0; i < frame_size_; ++i) (*result)[i] += tone[i];
  }
  for (int i = 0; i < frame_size_; ++i) (*result)[i] *= params_.window_samples[i];
}

}  // namespace audio_vesknet
