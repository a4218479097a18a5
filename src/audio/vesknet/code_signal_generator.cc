#include "audio/vesknet/code_signal_generator.h"

#include <algorithm>

#include "base/logging.h"

namespace audio_vesknet {
namespace {

struct TapSet {
  int count;
  int taps[4];
};

// Feedback taps per register length (rows: 5 to 11 stages) and code number.
// Every set yields a sequence of the full period 2^stages - 1. Rows of 5 and 6
// stages have three codes; the fourth entry is unused there.
constexpr TapSet kTapTable[kMaxTaps - kMinTaps + 1][4] = {
    {{2, {2, 4}}, {4, {1, 2, 3, 4}}, {4, {0, 2, 3, 4}}, {0, {}}},
    {{2, {4, 5}}, {4, {0, 3, 4, 5}}, {4, {1, 2, 4, 5}}, {0, {}}},
    {{4, {3, 4, 5, 6}}, {4, {1, 4, 5, 6}}, {4, {1, 3, 5, 6}}, {4, {0, 3, 5, 6}}},
    {{4, {0, 5, 6, 7}}, {4, {2, 4, 6, 7}}, {4, {1, 2, 6, 7}}, {4, {3, 4, 5, 7}}},
    {{4, {1, 6, 7, 8}}, {4, {4, 5, 7, 8}}, {4, {3, 4, 7, 8}}, {4, {0, 4, 7, 8}}},
    {{4, {5, 6, 8, 9}}, {4, {0, 5, 8, 9}}, {4, {1, 4, 8, 9}}, {4, {1, 3, 8, 9}}},
    {{4, {1, 6, 9, 10}}, {4, {3, 6, 8, 10}}, {4, {1, 6, 8, 10}}, {4, {3, 5, 7, 10}}},
};

}  // namespace

void GenerateCodeSignal(int32_t number_of_taps, int32_t code_number,
                        std::vector<float>* code_signal) {
  CHECK(code_signal != nullptr);
  CHECK(number_of_taps >= kMinTaps);
  CHECK(number_of_taps <= 11);
  CHECK(code_number >= 0);
  // Registers of 5 and 6 stages offer codes 0 to 2, longer ones 0 to 3. The
  // check text is the one this condition has always been reported with.
  const int max_code_number = number_of_taps <= 6 ? 2 : 3;
  if (code_number > max_code_number) {
    LOG(FATAL) << "Check failed: code_number <= number_of_taps <= 6 ? 2 : 3";
  }

  const TapSet& tap_set = kTapTable[number_of_taps - kMinTaps][code_number];
  int length = 0;  // The register spans the largest tap position.
  for (int i = 0; i < tap_set.count; ++i) length = std::max(length, tap_set.taps[i] + 1);
  std::vector<uint8_t> reg(length, 1);
  int position = 0;

  const int num_chips = (1 << number_of_taps) - 1;
  code_signal->clear();
  code_signal->reserve(num_chips);
  for (int n = 0; n < num_chips; ++n) {
    uint8_t bit = 0;
    for (int i = 0; i < tap_set.count; ++i) bit ^= reg[(position + tap_set.taps[i]) % length];
    if (position == 0) position = length;
    --position;
    reg[position] = bit;
    code_signal->push_back(bit ? 1.0f : -1.0f);
  }
}

}  // namespace audio_vesknet
