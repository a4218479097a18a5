#include "audio/dsp/matrix.h"

#include <complex>
#include <random>
#include <vector>

#include "gtest/gtest.h"

namespace audio_dsp {
namespace {

TEST(MatrixTest, StoresColumnByColumn) {
  MatrixXf m(2, 3);
  for (int c = 0; c < 3; ++c) {
    for (int r = 0; r < 2; ++r) m(r, c) = 10.0f * r + c;
  }
  // Column c occupies data()[2c], data()[2c + 1].
  const std::vector<float> expected = {0, 10, 1, 11, 2, 12};
  EXPECT_EQ(std::vector<float>(m.data(), m.data() + m.size()), expected);
  EXPECT_EQ(m.col(2)[1], 12.0f);
  EXPECT_FLOAT_EQ(m.ColumnSum(1), 12.0f);
  EXPECT_FLOAT_EQ(m.Sum(), 36.0f);
  EXPECT_FLOAT_EQ(m.MaxCoeff(), 12.0f);
  m.resize(1, 1);
  EXPECT_EQ(m(0, 0), 0.0f);  // Reshaping clears.
}

TEST(MatrixTest, ComplexMatrixTimesVector) {
  MatrixXcf m(2, 2);
  m(0, 0) = {1, 1};
  m(0, 1) = {0, 2};
  m(1, 0) = {3, 0};
  m(1, 1) = {1, -1};
  const std::vector<std::complex<float>> x = {{1, 0}, {0, 1}};
  std::vector<std::complex<float>> y;
  MultiplyMatrixVector(m, x.data(), &y);
  ASSERT_EQ(y.size(), 2u);
  EXPECT_EQ(y[0], std::complex<float>(-1, 1));  // (1+i) + 2i·i
  EXPECT_EQ(y[1], std::complex<float>(4, 1));   // 3 + (1-i)·i
}

TEST(MatrixTest, RealMatrixTimesComplexVector) {
  MatrixXf m(1, 2);
  m(0, 0) = 2;
  m(0, 1) = -1;
  const std::vector<std::complex<float>> x = {{1, 2}, {3, 4}};
  std::vector<std::complex<float>> y;
  MultiplyMatrixVector(m, x.data(), &y);
  ASSERT_EQ(y.size(), 1u);
  EXPECT_EQ(y[0], std::complex<float>(-1, 0));
}

// The float and complex products, four floats of rows at a time, give the
// bits of the plain column-by-column template for every shape: rows that
// fill whole vectors, passes of several vectors, and leftover rows.
TEST(MatrixTest, VectorisedProductsEqualThePlainOnesBitForBit) {
  std::mt19937 rng(3);
  std::uniform_real_distribution<float> value(-10.0f, 10.0f);
  for (int rows : {1, 2, 3, 4, 5, 8, 13, 16, 17, 29, 40}) {
    for (int cols : {1, 3, 127}) {
      MatrixXf real(rows, cols);
      MatrixXcf complex(rows, cols);
      std::vector<float> x(cols);
      std::vector<std::complex<float>> z(cols);
      for (int c = 0; c < cols; ++c) {
        x[c] = value(rng);
        z[c] = {value(rng), value(rng)};
        for (int r = 0; r < rows; ++r) {
          real(r, c) = value(rng);
          complex(r, c) = {value(rng), value(rng)};
        }
      }
      std::vector<float> fast, plain;
      MultiplyMatrixVector(real, x.data(), &fast);
      MultiplyMatrixVector<float, float, float>(real, x.data(), &plain);
      EXPECT_EQ(fast, plain) << rows << " x " << cols;
      std::vector<std::complex<float>> fast_z, plain_z;
      MultiplyMatrixVector(complex, z.data(), &fast_z);
      MultiplyMatrixVector<std::complex<float>, std::complex<float>, std::complex<float>>(
          complex, z.data(), &plain_z);
      EXPECT_EQ(fast_z, plain_z) << rows << " x " << cols;
    }
  }
}

}  // namespace
}  // namespace audio_dsp
