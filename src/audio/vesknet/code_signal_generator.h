// Pseudo-noise spreading codes of the DSSS modem: maximal-length sequences of
// a linear feedback shift register, as chips of +1.0 or -1.0.

#ifndef AUDIO_VESKNET_CODE_SIGNAL_GENERATOR_H_
#define AUDIO_VESKNET_CODE_SIGNAL_GENERATOR_H_

#include <cstdint>
#include <vector>

namespace audio_vesknet {

constexpr int32_t kMinTaps = 5;
constexpr int32_t kMaxTaps = 11;

// Replaces *code_signal with one period (2^number_of_taps - 1 chips) of code
// `code_number` of the register of `number_of_taps` stages. number_of_taps is
// 5 to 11; code_number is 0 to 2 for 5 or 6 taps and 0 to 3 above. Bit b of
// the register sequence becomes the chip 2b - 1.
void GenerateCodeSignal(int32_t number_of_taps, int32_t code_number,
                        std::vector<float>* code_signal);

}  // namespace audio_vesknet

#endif  // AUDIO_VESKNET_CODE_SIGNAL_GENERATOR_H_
