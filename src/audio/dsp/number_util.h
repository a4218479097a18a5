// Small integer and rational helpers: best rational approximation under a
// denominator limit, integer rounding and power-of-two helpers, and two
// enumerators (k-element combinations, mixed-radix digit vectors).
//
// All functions are pure; the iterator classes hold only their own state and
// may be used from one thread at a time.

#ifndef AUDIO_DSP_NUMBER_UTIL_H_
#define AUDIO_DSP_NUMBER_UTIL_H_

#include <utility>
#include <vector>

namespace audio_dsp {

// Best rational approximation (numerator, denominator) of `value` with
// 1 <= denominator <= `max_denominator`, found by continued fractions
// (at most 18 expansion steps, stopping when the remainder is below 1e-9) and
// refined by the best semiconvergent. When the semiconvergent and the last
// convergent are equally close, the convergent is kept: (0.5, 1) gives 0/1.
// Fatal checks: `value` finite, `max_denominator` > 0. The arithmetic is in
// 32-bit ints and is meant for moderate values such as sample-rate ratios;
// overflow is not guarded.
std::pair<int, int> RationalApproximation(double value, int max_denominator);

// a mod b in [0, b - 1], also for negative a. Requires b > 0.
int PositiveModulo(int a, int b);

// The smallest multiple of `multiple` that is >= value (value may be
// negative or zero). Requires multiple > 0.
int RoundUpToMultiple(int value, int multiple);

// ceil(log2(n)) for n >= 1; n = 0 yields -1.
int CeilLog2(unsigned n);

// The smallest power of two >= n: 2^CeilLog2(n). n = 0 yields 1; n above
// 2^31 has no such power in an unsigned and yields 0.
unsigned NextPowerOfTwo(unsigned n);

// Enumerates the k-element subsets of {0, ..., n - 1} in lexicographic order,
// each as an increasing vector of k indices:
//
//   for (CombinationIterator it(4, 2); !it.Done(); it.Next()) {
//     Use(it.GetCombination());  // {0,1}, {0,2}, {0,3}, {1,2}, {1,3}, {2,3}
//   }
//
// k > n gives no combination (done at once); k = 0 gives one, the empty one.
class CombinationIterator {
 public:
  // Requires k >= 0.
  CombinationIterator(int n, int k);

  bool Done() const { return done_; }
  // The current combination; meaningless once Done().
  const std::vector<int>& GetCombination() const { return combination_; }
  // Moves to the next combination, or to Done(). Past the end it logs an
  // error and does nothing.
  void Next();

 private:
  int n_;
  int k_;
  std::vector<int> combination_;
  bool done_;
};

// Counts through every digit vector d with 0 <= d[i] < radices[i], least
// significant digit (index 0) first: radices (2, 3) give (0,0), (1,0), (0,1),
// (1,1), (0,2), (1,2). An empty radix vector or any radix <= 0 gives no
// vector at all (done at once).
class MixedRadixCounter {
 public:
  explicit MixedRadixCounter(std::vector<int> radices);

  bool Done() const { return done_; }
  // The current digits, same size as the radices.
  const std::vector<int>& GetDigits() const { return digits_; }
  // Advances by one; a carry out of the last digit makes the counter done
  // (its digits are then all zero). Does nothing once done.
  void Next();

  // Equal when both are done, or when neither is and their radices and
  // digits agree element by element.
  bool operator==(const MixedRadixCounter& other) const;
  bool operator!=(const MixedRadixCounter& other) const { return !(*this == other); }

 private:
  std::vector<int> radices_;
  std::vector<int> digits_;
  bool done_;
};

}  // namespace audio_dsp

#endif  // AUDIO_DSP_NUMBER_UTIL_H_
