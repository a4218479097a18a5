#include "audio/dsp/digit_sequence.h"

#include <limits>

#include "base/logging.h"

namespace audio_dsp {

DigitSequence::DigitSequence(const std::vector<int32_t>& digits, int base)
    : digits_(digits), base_(base) {
  CHECK(base >= 2);
  if (digits_.empty()) digits_.push_back(0);
  for (const int32_t digit : digits_) {
    CHECK(digit >= 0);
    CHECK(digit < base_);
  }
  TrimLeadingZeros();
}

DigitSequence::DigitSequence(int value, int base) : digits_{value}, base_(base) {
  CHECK(value >= 0);
  CHECK(base >= 2);
  Normalize();
}

DigitSequence DigitSequence::ConvertBase(int result_base) const {
  CHECK(result_base >= 2);
  CHECK(result_base <= (std::numeric_limits<int>::max() / 2 + 1) / base_);
  // Horner's scheme: result = result x base_ + digit, from the most
  // significant source digit down. Each result digit is below result_base
  // before the multiplication, so digit x base_ + carry stays below 2^31.
  DigitSequence result(0, result_base);
  for (auto it = digits_.rbegin(); it != digits_.rend(); ++it) {
    for (int32_t& digit : result.digits_) digit *= base_;
    result.digits_[0] += *it;
    result.Normalize();
  }
  return result;
}

void DigitSequence::TrimLeadingZeros() {
  while (digits_.size() >= 2 && digits_.back() == 0) digits_.pop_back();
}

void DigitSequence::Normalize() {
  int32_t carry = 0;
  for (int32_t& digit : digits_) {
    const int32_t value = carry + digit;
    digit = value % base_;
    carry = value / base_;
  }
  while (carry > 0) {
    digits_.push_back(carry % base_);
    carry /= base_;
  }
}

}  // namespace audio_dsp
