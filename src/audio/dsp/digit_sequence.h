// A non-negative integer of any length, held as its digits in some base, and
// conversion between bases. The DTMF modem uses it to read a whole token as
// one number and rewrite it in the base of its symbol alphabet.
//
// A plain value; immutable after construction, so it may be shared between
// threads.

#ifndef AUDIO_DSP_DIGIT_SEQUENCE_H_
#define AUDIO_DSP_DIGIT_SEQUENCE_H_

#include <cstdint>
#include <vector>

namespace audio_dsp {

class DigitSequence {
 public:
  // The number whose digits are `digits`, least significant first, in `base`
  // (>= 2). Every digit must lie in [0, base). An empty list is the number 0;
  // most-significant zeros are trimmed, so zero is the single digit 0.
  DigitSequence(const std::vector<int32_t>& digits, int base);

  // `value` (>= 0) written in `base` (>= 2); zero is the single digit 0.
  DigitSequence(int value, int base);

  // The same number written in `result_base`. Requires 2 <= result_base <=
  // 2^30 / base() (integer division), which keeps every intermediate product
  // inside an int32. Cost: O(digits x result digits).
  DigitSequence ConvertBase(int result_base) const;

  // Least significant first; never empty, no most-significant zero except for
  // the number zero.
  const std::vector<int32_t>& digits() const { return digits_; }
  int base() const { return base_; }

 private:
  // Drops most-significant zero digits, keeping at least one digit.
  void TrimLeadingZeros();
  // Propagates carries so that every digit lies in [0, base_), appending
  // digits as needed. Digits must be non-negative. Does not trim.
  void Normalize();

  std::vector<int32_t> digits_;
  int32_t base_;
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_DIGIT_SEQUENCE_H_
