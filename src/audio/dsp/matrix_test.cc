#include "audio/dsp/matrix.h"

#include <complex>
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

}  // namespace
}  // namespace audio_dsp
