// A small dense matrix stored column by column, for float and complex float.
//
// Only what the modems need: element access, whole columns as contiguous
// memory, products with vectors, column sums, sums and maxima. Not a linear
// algebra library.

#ifndef AUDIO_DSP_MATRIX_H_
#define AUDIO_DSP_MATRIX_H_

#include <algorithm>
#include <complex>
#include <cstdint>
#include <vector>

#include "base/logging.h"

namespace audio_dsp {

template <typename T>
class Matrix {
 public:
  Matrix() = default;
  // A rows x cols matrix of zeros.
  Matrix(int rows, int cols) { resize(rows, cols); }

  int rows() const { return rows_; }
  int cols() const { return cols_; }
  int size() const { return rows_ * cols_; }

  // Reshapes to rows x cols and sets every element to zero.
  void resize(int rows, int cols) {
    CHECK(rows >= 0 && cols >= 0);
    CHECK(static_cast<int64_t>(rows) * cols <= INT32_MAX)
        << "matrix of " << rows << " x " << cols << " is too large";
    rows_ = rows;
    cols_ = cols;
    data_.assign(static_cast<size_t>(rows) * cols, T());
  }
  void setZero() { std::fill(data_.begin(), data_.end(), T()); }

  T& operator()(int row, int col) { return data_[static_cast<size_t>(col) * rows_ + row]; }
  const T& operator()(int row, int col) const {
    return data_[static_cast<size_t>(col) * rows_ + row];
  }

  // Column `col` as rows() contiguous values.
  T* col(int col) { return data_.data() + static_cast<size_t>(col) * rows_; }
  const T* col(int col) const { return data_.data() + static_cast<size_t>(col) * rows_; }

  T* data() { return data_.data(); }
  const T* data() const { return data_.data(); }

  T Sum() const {
    T total = T();
    for (const T& value : data_) total += value;
    return total;
  }

  T ColumnSum(int col) const {
    T total = T();
    const T* values = this->col(col);
    for (int r = 0; r < rows_; ++r) total += values[r];
    return total;
  }

  // Largest element; the matrix must not be empty.
  T MaxCoeff() const {
    CHECK(!data_.empty());
    return *std::max_element(data_.begin(), data_.end());
  }

  bool operator==(const Matrix& other) const {
    return rows_ == other.rows_ && cols_ == other.cols_ && data_ == other.data_;
  }

 private:
  int rows_ = 0;
  int cols_ = 0;
  std::vector<T> data_;
};

using MatrixXf = Matrix<float>;
using MatrixXcf = Matrix<std::complex<float>>;

// result = matrix × vector; `vector` has matrix.cols() entries and `result`
// gets matrix.rows() entries. `result` must not alias `vector`. Each entry is
// accumulated column by column, starting from zero.
template <typename M, typename V, typename R>
void MultiplyMatrixVector(const Matrix<M>& matrix, const V* vector, std::vector<R>* result) {
  CHECK(result);
  result->assign(matrix.rows(), R());
  R* out = result->data();
  for (int c = 0; c < matrix.cols(); ++c) {
    const M* column = matrix.col(c);
    const V x = vector[c];
    for (int r = 0; r < matrix.rows(); ++r) out[r] += column[r] * x;
  }
}

// The same for float and complex float, four floats of rows at a time: every
// entry sees exactly the operations of the template above, in its order.
void MultiplyMatrixVector(const Matrix<float>& matrix, const float* vector,
                          std::vector<float>* result);
void MultiplyMatrixVector(const Matrix<std::complex<float>>& matrix,
                          const std::complex<float>* vector,
                          std::vector<std::complex<float>>* result);

}  // namespace audio_dsp

#endif  // AUDIO_DSP_MATRIX_H_
