#include "audio/dsp/matrix.h"

#include <algorithm>

#include "audio/dsp/simd.h"

namespace audio_dsp {

void MultiplyMatrixVector(const Matrix<float>& matrix, const float* vector,
                          std::vector<float>* result) {
  CHECK(result);
  const int rows = matrix.rows();
  const int cols = matrix.cols();
  result->assign(rows, 0.0f);
  float* out = result->data();
  const float* data = matrix.data();
  // Sixteen rows per pass over the columns, in four accumulators.
  int r = 0;
  while (r + 4 <= rows) {
    const int vectors = std::min(4, (rows - r) / 4);
    Float4 sum[4] = {};
    for (int c = 0; c < cols; ++c) {
      const float* column = data + static_cast<size_t>(c) * rows + r;
      const float x = vector[c];
      for (int v = 0; v < vectors; ++v) sum[v] += Load4(column + 4 * v) * x;
    }
    for (int v = 0; v < vectors; ++v) Store4(out + r + 4 * v, sum[v]);
    r += 4 * vectors;
  }
  for (; r < rows; ++r) {
    float sum = 0.0f;
    for (int c = 0; c < cols; ++c) sum += data[static_cast<size_t>(c) * rows + r] * vector[c];
    out[r] = sum;
  }
}

void MultiplyMatrixVector(const Matrix<std::complex<float>>& matrix,
                          const std::complex<float>* vector,
                          std::vector<std::complex<float>>* result) {
  CHECK(result);
  const int rows = matrix.rows();
  const int cols = matrix.cols();
  result->assign(rows, std::complex<float>());
  // Two complex entries per vector, (re, im, re, im). With x = (a, b), the
  // product's real part is re a + (-(im b)) = re a - im b and its imaginary
  // part im a + re b, exactly as the complex product computes them. Eight
  // rows per pass over the columns.
  float* out = reinterpret_cast<float*>(result->data());
  const float* data = reinterpret_cast<const float*>(matrix.data());
  const Float4 signs = {-1.0f, 1.0f, -1.0f, 1.0f};
  int r = 0;
  while (r + 2 <= rows) {
    const int vectors = std::min(4, (rows - r) / 2);
    Float4 sum[4] = {};
    for (int c = 0; c < cols; ++c) {
      const float* column = data + 2 * (static_cast<size_t>(c) * rows + r);
      const float a = vector[c].real();
      const Float4 b = vector[c].imag() * signs;
      for (int v = 0; v < vectors; ++v) {
        const Float4 m = Load4(column + 4 * v);
        sum[v] += m * a + __builtin_shufflevector(m, m, 1, 0, 3, 2) * b;
      }
    }
    for (int v = 0; v < vectors; ++v) Store4(out + 2 * r + 4 * v, sum[v]);
    r += 2 * vectors;
  }
  for (; r < rows; ++r) {
    std::complex<float> sum = 0.0f;
    for (int c = 0; c < cols; ++c) sum += matrix(r, c) * vector[c];
    (*result)[r] = sum;
  }
}

}  // namespace audio_dsp
