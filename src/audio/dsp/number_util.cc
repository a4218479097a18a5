#include "audio/dsp/number_util.h"

#include <cmath>
#include <utility>
#include <vector>

#include "base/logging.h"

namespace audio_dsp {

std::pair<int, int> RationalApproximation(double value, int max_denominator) {
  using std::isfinite;
  CHECK(isfinite(value));
  CHECK(max_denominator > 0);

  constexpr int kMaxTerms = 18;
  constexpr double kRemainderTolerance = 1e-9;

  int a = static_cast<int>(std::floor(value));
  // Current and previous convergents; the previous one starts as 1/0.
  int numerator = a;
  int denominator = 1;
  int previous_numerator = 1;
  int previous_denominator = 0;
  double x = value;

  for (int term = 0; term < kMaxTerms; ++term) {
    const double remainder = x - a;
    if (std::fabs(remainder) < kRemainderTolerance) break;
    x = 1.0 / remainder;
    a = static_cast<int>(std::floor(x));
    // Largest multiplier of the current convergent that keeps the
    // denominator within the limit.
    const int m = (max_denominator - previous_denominator) / denominator;
    if (m < a) {
      // The full next term does not fit: the best remaining candidate is the
      // semiconvergent with multiplier m, better than the convergent only when
      // m > a / 2, and for m == a / 2 (a even) only when actually closer.
      if (m < (a + 1) / 2) break;
      const int candidate_numerator = m * numerator + previous_numerator;
      const int candidate_denominator = m * denominator + previous_denominator;
      bool take = true;
      if (a % 2 == 0 && m == a / 2) {
        const double candidate_error =
            std::fabs(static_cast<double>(candidate_numerator) / candidate_denominator - value);
        const double convergent_error =
            std::fabs(static_cast<double>(numerator) / denominator - value);
        take = candidate_error < convergent_error;
      }
      if (take) {
        numerator = candidate_numerator;
        denominator = candidate_denominator;
      }
      break;
    }
    const int next_numerator = a * numerator + previous_numerator;
    const int next_denominator = a * denominator + previous_denominator;
    previous_numerator = numerator;
    previous_denominator = denominator;
    numerator = next_numerator;
    denominator = next_denominator;
  }
  return {numerator, denominator};
}

int PositiveModulo(int a, int b) {
  // -(a + 1) rather than -a - 1 so that a = INT_MIN does not overflow.
  return a >= 0 ? a % b : b - (-(a + 1)) % b - 1;
}

int RoundUpToMultiple(int value, int multiple) {
  if (value >= 1) return value + multiple - 1 - (value - 1) % multiple;
  return value + (-value) % multiple;
}

int CeilLog2(unsigned n) {
  if (n == 0) return -1;
  int highest_bit = 0;
  while ((n >> highest_bit) > 1u) ++highest_bit;
  const bool power_of_two = (n & (n - 1)) == 0;
  return power_of_two ? highest_bit : highest_bit + 1;
}

unsigned NextPowerOfTwo(unsigned n) {
  const int exponent = CeilLog2(n);
  if (exponent < 0) return 1u;
  if (exponent >= 32) return 0u;
  return 1u << exponent;
}

CombinationIterator::CombinationIterator(int n, int k)
    : n_(n), k_(k), combination_(), done_(k > n) {
  CHECK(k >= 0);
  combination_.resize(k);
  for (int i = 0; i < k; ++i) combination_[i] = i;
}

void CombinationIterator::Next() {
  if (done_) {
    LOG(ERROR) << "Next() called when already done.";
    return;
  }
  // Find the last position that can still be increased; position i may hold
  // at most n - k + i so that the positions after it still fit.
  int i = k_ - 1;
  for (; i >= 0; --i) {
    if (++combination_[i] <= n_ - k_ + i) break;
  }
  if (i < 0) {
    done_ = true;
    return;
  }
  for (int j = i + 1; j < k_; ++j) combination_[j] = combination_[j - 1] + 1;
}

MixedRadixCounter::MixedRadixCounter(std::vector<int> radices)
    : radices_(std::move(radices)), digits_(radices_.size(), 0), done_(radices_.empty()) {
  for (int radix : radices_) {
    if (radix <= 0) done_ = true;
  }
}

void MixedRadixCounter::Next() {
  if (done_) return;
  for (size_t i = 0; i < digits_.size(); ++i) {
    if (++digits_[i] < radices_[i]) return;
    digits_[i] = 0;
  }
  done_ = true;
}

bool MixedRadixCounter::operator==(const MixedRadixCounter& other) const {
  if (done_ || other.done_) return done_ && other.done_;
  return radices_ == other.radices_ && digits_ == other.digits_;
}

}  // namespace audio_dsp
