// CKRMatrixT and CKRMatrix2T, CKRMatrix4T in both precision pairs (the 3 x 3
// operations of their own are in CKRMatrix3TTest.cpp): layout and access,
// products, inverses against their error bound, 2-D rotations and eigen
// decomposition, the 4 x 4 builders.
#include "KRMathTestTypes.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <utility>

template <class Pair>
class CKRMatrixTTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  static constexpr double kEpsilon = std::numeric_limits<TReal>::epsilon();

  // Calls test(matrix type) for the 2 x 2, 3 x 3 and 4 x 4 matrices.
  template <class Test>
  static void ForEachSize(Test&& test) {
    using Other = typename Pair::Other;
    test(CKRMatrix2T<TReal, Other>());
    test(CKRMatrix3T<TReal, Other>());
    test(CKRMatrix4T<TReal, Other>());
  }
  // The error scale of the adjoint and the determinant: the largest entry
  // of |m| P, where P holds the cofactors of |m| taken without signs
  // (permanents of the minors), and the exact determinant. Every cofactor,
  // the determinant and the products with m are sums of products of
  // entries; each evaluates with an error below (terms + factors) u times
  // the same sum of magnitudes (the classical bound of recursive summation),
  // so m * Adjoint() - det I stays below c_N eps times the scale and
  // m * Inverse() - I below c_N eps times the scale over |det|, with c_N =
  // N! + N covering the 2 x 2 blocks of the 4 x 4 path (about 22 u) and the
  // cofactors of the 3 x 3 one (about 10 u).
  template <int N, class Other>
  static std::pair<double, double> CramerScale(const CKRMatrixT<N, TReal, Other>& m) {
    long double a[N][N];
    for (int r = 0; r < N; ++r)
      for (int c = 0; c < N; ++c)
        a[r][c] = m(r, c);
    const auto expand = [&](auto&& self, unsigned rows, unsigned columns, bool signs) -> long double {
      // Laplace expansion along the first row left in `rows` (bit masks).
      if (rows == 0)
        return 1;
      const int r = std::countr_zero(rows);
      long double sum = 0;
      int sign = 1;
      for (int c = 0; c < N; ++c) {
        if (!(columns >> c & 1))
          continue;
        const long double entry = signs ? a[r][c] : std::fabs(a[r][c]);
        sum += (signs ? sign : 1) * entry * self(self, rows & ~(1u << r), columns & ~(1u << c), signs);
        sign = -sign;
      }
      return sum;
    };
    const unsigned all = (1u << N) - 1;
    long double largest = 0;
    for (int i = 0; i < N; ++i)
      for (int j = 0; j < N; ++j) {
        long double sum = 0;
        for (int k = 0; k < N; ++k)
          sum += std::fabs(a[i][k]) * expand(expand, all & ~(1u << j), all & ~(1u << k), false);
        largest = std::max(largest, sum);
      }
    return {double(largest), double(std::fabs(expand(expand, all, all, true)))};
  }
};
TYPED_TEST_SUITE(CKRMatrixTTest, KRPrecisionPairs, KRPrecisionPairNames);

TYPED_TEST(CKRMatrixTTest, ConstructionAndAccessShareTheRowMajorLayout) {
  KR_MATH_TEST_TYPES;
  EXPECT_EQ(Mat3(false), Mat3::IDENTITY);
  const Real entries[16] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16};
  const Mat3 rows(entries);
  const Mat3 columns(entries, false);
  EXPECT_EQ(rows(1, 2), Real(6));
  EXPECT_EQ(rows[2][0], Real(7));
  EXPECT_EQ(columns, Mat3(rows.Transpose()));
  Real columnMajor[16];
  Mat4(entries).GetColumnMajor(columnMajor);
  EXPECT_EQ(Mat4(columnMajor, false), Mat4(entries));
  EXPECT_EQ(Mat4(static_cast<const Real*>(nullptr)), Mat4::ZERO);
  // Vectors as rows or columns, one by one or in an array.
  const V3 vectors[3] = {rows.GetRow(0), rows.GetRow(1), rows.GetRow(2)};
  EXPECT_EQ(Mat3(vectors, false), rows);
  EXPECT_EQ(Mat3(vectors, true), columns);
  EXPECT_EQ(Mat3(vectors[0], vectors[1], vectors[2], true), columns);
  const V2 pair[2] = {V2(Real(1), Real(2)), V2(Real(3), Real(4))};
  EXPECT_EQ(Mat2(pair, true), Mat2(Real(1), Real(3), Real(2), Real(4)));
  EXPECT_EQ(Mat2(pair[0], pair[1], false), Mat2(Real(1), Real(2), Real(3), Real(4)));
  // Diagonal and tensor product: (u v^T) w = u (v . w).
  EXPECT_EQ(V3(Mat3(Real(2), Real(3), Real(4)) * V3(1, 1, 1)), V3(2, 3, 4));
  Mat3 diagonal;
  diagonal.MakeDiagonal(entries);
  EXPECT_EQ(diagonal, Mat3(Real(1), Real(2), Real(3)));
  const V3 u(1, 2, 3), v(-1, 0, 2), w(4, 1, -2);
  EXPECT_EQ(V3(Mat3(u, v) * w), u * v.Dot(w));
  EXPECT_EQ(V2(Mat2(pair[0], pair[1]) * pair[1]), pair[0] * pair[1].Dot(pair[1]));
}

// Division by zero fills with MAX_REAL; equality is bitwise and the order
// that of the byte images.
TYPED_TEST(CKRMatrixTTest, DivisionByZeroAndComparison) {
  KR_MATH_TEST_TYPES;
  // By bytes (least significant first), 2 comes before 1.
  EXPECT_TRUE(Mat2(Real(2), Real(0), Real(0), Real(0)) < Mat2(Real(1), Real(0), Real(0), Real(0)));
  EXPECT_TRUE(Mat4::IDENTITY >= Mat4::IDENTITY && !(Mat4::IDENTITY < Mat4::IDENTITY));
  Mat2 m(Real(1), Real(-2), Real(0), Real(3));
  const Real huge = Real(3.4028234663852886e+38);
  EXPECT_EQ(m / Real(0), Mat2(huge, huge, huge, huge));
  EXPECT_EQ(m /= Real(0), Mat2(huge, huge, huge, huge));
  EXPECT_NE(Mat2(Real(0.0), Real(1), Real(1), Real(1)), Mat2(Real(-0.0), Real(1), Real(1), Real(1)));
}

// Products of random matrices: associative within rounding, the transposed
// forms bit for bit the products with the transposed factors, points and
// vectors multiplied alike.
TYPED_TEST(CKRMatrixTTest, ProductsAreConsistent) {
  std::mt19937 random(KRTestSeed());
  TestFixture::ForEachSize([&](auto size) {
    using Matrix = decltype(size);
    using Vector = typename Matrix::Vector;
    using Point = typename Matrix::Point;
    using Real = typename TestFixture::TReal;
    constexpr int N = Vector::GetN();
    SCOPED_TRACE(N);
    for (int i = 0; i < 200; ++i) {
      const Matrix a = KRRandomMatrix<Matrix>(random), b = KRRandomMatrix<Matrix>(random);
      const Matrix column = KRRandomMatrix<Matrix>(random);
      const Vector v = column.GetColumn(0), u = column.GetColumn(1);
      const Matrix ab = a * b;
      const Vector left = ab * v, right = a * (b * v);
      for (int k = 0; k < N; ++k)
        ASSERT_NEAR(left[k], right[k], 8 * N * TestFixture::kEpsilon);
      ASSERT_EQ(Matrix(ab.Transpose()), Matrix(b.Transpose() * a.Transpose()));
      ASSERT_EQ(a.TransposeTimes(b), a.Transpose() * b);
      ASSERT_EQ(a.TimesTranspose(b), a * b.Transpose());
      ASSERT_EQ(a.QForm(u, v), u.Dot(a * v));
      const Point moved = a * Point(v.GetTuple());
      ASSERT_EQ(0, std::memcmp(moved.GetTuple(), Vector(a * v).GetTuple(), N * sizeof(Real)));
      Matrix product = a;
      ASSERT_EQ(product *= b, ab);
    }
  });
}

// M * Inverse(M) is the identity within a bound proportional to the
// condition number; the adjoint is the inverse times the determinant; a
// determinant not above EPSILON or not finite gives ZERO.
TYPED_TEST(CKRMatrixTTest, InverseIsExactUpToTheAdjointErrorBound) {
  std::mt19937 random(KRTestSeed());
  TestFixture::ForEachSize([&](auto size) {
    using Matrix = decltype(size);
    using Real = typename TestFixture::TReal;
    constexpr int N = Matrix::Vector::GetN();
    SCOPED_TRACE(N);
    const Matrix identity(false);
    int inverted = 0;
    for (int i = 0; i < 500; ++i) {
      Matrix m = KRRandomMatrix<Matrix>(random, 4);
      // Every tenth matrix nearly singular: one row close to the sum of two.
      if (i % 10 == 0)
        for (int c = 0; c < N; ++c)
          m(N - 1, c) = m(0, c) + m(1, c) + Real(1e-3) * m(N - 1, c);
      const Matrix inverse = m.Inverse();
      if (inverse == Matrix::ZERO) {
        ASSERT_LE(std::fabs(m.Determinant()), 1.1920928955078125e-07);
        continue;
      }
      ++inverted;
      // Cramer's rule is not backward stable: its residual follows the
      // factor of the absolute cofactors, not the condition number.
      constexpr int factorial = N == 2 ? 2 : N == 3 ? 6 : 24;
      const auto [scale, determinant] = TestFixture::CramerScale(m);
      const double bound = (factorial + N) * TestFixture::kEpsilon * scale;
      ASSERT_LE(KRMaxDifference(Matrix(m * inverse), identity), bound / determinant) << ::testing::PrintToString(m);
      const Matrix scaledIdentity = m * m.Adjoint();
      ASSERT_LE(KRMaxDifference(scaledIdentity, Matrix(identity * m.Determinant())), bound)
          << ::testing::PrintToString(m);
    }
    EXPECT_GT(inverted, 400);
    // Singular by the absolute threshold, singular exactly, and non-finite.
    Matrix small(false);
    small *= Real(N == 2 ? 1e-4 : 1e-3);
    EXPECT_EQ(small.Inverse(), Matrix::ZERO);
    Matrix invalid(false);
    invalid(0, 0) = std::numeric_limits<Real>::quiet_NaN();
    EXPECT_EQ(invalid.Inverse(), Matrix::ZERO);
    invalid(0, 0) = std::numeric_limits<Real>::infinity();
    EXPECT_EQ(invalid.Inverse(), Matrix::ZERO);
    // Small integers: the determinant is exactly 0.
    Matrix dependent = KRRandomMatrix<Matrix>(random, 9);
    for (int e = 0; e < N * N; ++e)
      dependent(e / N, e % N) = std::round(dependent(e / N, e % N));
    dependent.SetRow(1, dependent.GetRow(0) * Real(2));
    EXPECT_EQ(dependent.Inverse(), Matrix::ZERO);
  });
}

TYPED_TEST(CKRMatrixTTest, Matrix2RotationsAndEigenDecomposition) {
  KR_MATH_TEST_TYPES;
  for (double a = -3.14159; a <= 3.14159; a += 0.01) {
    Real angle;
    Mat2(Real(a)).ToAngle(angle);
    ASSERT_NEAR(angle, a, 4 * TestFixture::kEpsilon);
  }
  // A quarter turn maps x to y within rounding of pi / 2 in Real; HALF_PI,
  // pi / 2 rounded to single precision, leaves cos = -4.37e-8 in x also in
  // the double pair.
  const V2 turned = Mat2(Real(std::numbers::pi / 2)) * V2(Real(1), Real(0));
  EXPECT_NEAR(turned.X(), 0.0, TestFixture::kEpsilon);
  EXPECT_EQ(turned.Y(), Real(1));
  EXPECT_NEAR(V2(Mat2(M::HALF_PI) * V2(Real(1), Real(0))).X(), -4.371139e-8, 1e-14);

  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> exponent(-20, 20);
  for (int i = 0; i < 500; ++i) {
    // Symmetric, at scales from 1e-9 to 1e9; some with a double eigenvalue.
    Mat2 m = KRRandomMatrix<Mat2>(random) * Real(std::pow(10.0, exponent(random) / 2.2));
    m(1, 0) = m(0, 1);
    if (i % 20 == 0)
      m = Mat2(m(0, 0), m(0, 0));
    Mat2 rot, diag;
    m.EigenDecomposition(rot, diag);
    ASSERT_LE(diag(0, 0), diag(1, 1));
    ASSERT_LE(KROrthogonalityError(rot), 4 * TestFixture::kEpsilon);
    ASSERT_NEAR(rot.Determinant(), 1.0, 4 * TestFixture::kEpsilon);
    ASSERT_LE(KRMaxDifference(Mat2(rot * diag.TimesTranspose(rot)), m), 8 * TestFixture::kEpsilon * KRMaxEntry(m))
        << ::testing::PrintToString(m);
  }
  Mat2 rot, diag;
  Mat2(std::numeric_limits<Real>::quiet_NaN(), Real(1), Real(1), Real(0)).EigenDecomposition(rot, diag);
  EXPECT_EQ(rot, Mat2::IDENTITY);
  EXPECT_TRUE(std::isnan(diag(0, 0)));

  // Gram-Schmidt: orthonormal columns; a dependent column becomes zero.
  Mat2 columns(Real(0.8), Real(-1), Real(0.3), Real(0.9));
  columns.Orthonormalize();
  EXPECT_LE(KROrthogonalityError(columns), 4 * TestFixture::kEpsilon);
  Mat2 dependent(Real(1), Real(2), Real(0), Real(0));
  dependent.Orthonormalize();
  EXPECT_EQ(V2(dependent.GetColumn(1)), V2::ZERO);
}

TYPED_TEST(CKRMatrixTTest, Matrix4Builders) {
  KR_MATH_TEST_TYPES;
  const Mat4 translation = Mat4::BuildTranslationMatrix(V4(Real(1), Real(2), Real(3), Real(0)));
  EXPECT_EQ(P4(translation * P4::ZERO), P4(1, 2, 3, 1));
  const V4 direction(Real(-1), Real(5), Real(2), Real(0));
  EXPECT_EQ(V4(translation * direction), direction);
  EXPECT_EQ(V4(Mat4::BuildScalingMatrix(V4(Real(2), Real(3), Real(4), Real(9))) * V4(1, 1, 1, 1)),
            V4(2, 3, 4, 1));
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> angle(-3, 3);
  for (int i = 0; i < 100; ++i) {
    // The rotation of the normalised x, y, z (w ignored), as the 3 x 3 one.
    const Mat3 column = KRRandomMatrix<Mat3>(random);
    const V3 axis = column.GetColumn(0);
    const Real a = Real(angle(random));
    const Mat4 rotation = Mat4::BuildRotationMatrix(a, V4(axis.X(), axis.Y(), axis.Z(), Real(7)));
    const Mat3 expected(axis.GetNormalized(), a);
    for (int e = 0; e < 16; ++e) {
      const int r = e / 4, c = e % 4;
      ASSERT_NEAR(rotation(r, c), r < 3 && c < 3 ? expected(r, c) : Real(r == c), 8 * TestFixture::kEpsilon);
    }
    // A rigid motion inverts to the transposed rotation after the way back.
    const Mat4 motion = translation * rotation;
    const Mat4 back = rotation.Transpose() * Mat4::BuildTranslationMatrix(V4(Real(-1), Real(-2), Real(-3), 0));
    ASSERT_LE(KRMaxDifference(motion.Inverse(), back), 64 * TestFixture::kEpsilon);
  }
  EXPECT_EQ(Mat4::BuildRotationMatrix(Real(1), V4::ZERO), Mat4::IDENTITY);
}
