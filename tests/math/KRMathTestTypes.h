// The two precision pairs every math test runs through, the classes of a
// pair, and tolerances that depend on the precision.
#pragma once

#include <krCoreLib/math/CKRMathT.h>
#include <krCoreLib/math/CKRMatrix2T.h>
#include <krCoreLib/math/CKRMatrix3T.h>
#include <krCoreLib/math/CKRMatrix4T.h>
#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint3T.h>
#include <krCoreLib/math/CKRPoint4T.h>
#include <krCoreLib/math/CKRQuaternionT.h>
#include <krCoreLib/math/CKRVector2T.h>
#include <krCoreLib/math/CKRVector3T.h>
#include <krCoreLib/math/CKRVector4T.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <iomanip>
#include <limits>
#include <numbers>
#include <ostream>
#include <random>
#include <string>
#include <type_traits>
#include <utility>

template <class TReal, class TOther>
struct KRPrecisionPair {
  using Real = TReal;
  using Other = TOther;
};

// The classes of the pair under test, by their short names, in a typed test.
#define KR_MATH_TEST_TYPES                                   \
  using Real [[maybe_unused]] = typename TypeParam::Real;    \
  using Other [[maybe_unused]] = typename TypeParam::Other;  \
  using M [[maybe_unused]] = CKRMathT<Real, Other>;          \
  using V2 [[maybe_unused]] = CKRVector2T<Real, Other>;      \
  using V3 [[maybe_unused]] = CKRVector3T<Real, Other>;      \
  using V4 [[maybe_unused]] = CKRVector4T<Real, Other>;      \
  using P2 [[maybe_unused]] = CKRPoint2T<Real, Other>;       \
  using P3 [[maybe_unused]] = CKRPoint3T<Real, Other>;       \
  using P4 [[maybe_unused]] = CKRPoint4T<Real, Other>;       \
  using Mat2 [[maybe_unused]] = CKRMatrix2T<Real, Other>;    \
  using Mat3 [[maybe_unused]] = CKRMatrix3T<Real, Other>;    \
  using Mat4 [[maybe_unused]] = CKRMatrix4T<Real, Other>;    \
  using Quat [[maybe_unused]] = CKRQuaternionT<Real, Other>

using KRPrecisionPairs = ::testing::Types<KRPrecisionPair<float, double>, KRPrecisionPair<double, float>>;

struct KRPrecisionPairNames {
  template <class Pair>
  static std::string GetName(int) {
    return std::is_same_v<typename Pair::Real, float> ? "float" : "double";
  }
};

// `single` in the float instantiation, `twice` in the double one.
template <class Real>
constexpr double KRByPrecision(double single, double twice) {
  return std::is_same_v<Real, float> ? single : twice;
}

// Failure messages show the components (the classes also convert to
// pointers, which GoogleTest would print otherwise).
template <template <int, class, class> class Tuple, int N, class Real, class Other>
void PrintTo(const Tuple<N, Real, Other>& tuple, std::ostream* out) {
  *out << "(";
  for (int i = 0; i < N; ++i)
    *out << (i > 0 ? ", " : "") << tuple[i];
  *out << ")";
}
template <int N, class Real, class Other>
void PrintTo(const CKRMatrixT<N, Real, Other>& m, std::ostream* out) {
  *out << std::setprecision(std::numeric_limits<Real>::max_digits10) << "(";
  for (int i = 0; i < N * N; ++i)
    *out << (i == 0 ? "" : i % N == 0 ? "; " : ", ") << m(i / N, i % N);
  *out << ")";
}
template <class Real, class Other>
void PrintTo(const CKRMatrix2T<Real, Other>& m, std::ostream* out) {
  PrintTo(static_cast<const CKRMatrixT<2, Real, Other>&>(m), out);
}
template <class Real, class Other>
void PrintTo(const CKRMatrix3T<Real, Other>& m, std::ostream* out) {
  PrintTo(static_cast<const CKRMatrixT<3, Real, Other>&>(m), out);
}
template <class Real, class Other>
void PrintTo(const CKRMatrix4T<Real, Other>& m, std::ostream* out) {
  PrintTo(static_cast<const CKRMatrixT<4, Real, Other>&>(m), out);
}
template <class Real, class Other>
void PrintTo(const CKRQuaternionT<Real, Other>& q, std::ostream* out) {
  *out << "(" << q.W() << ", " << q.X() << ", " << q.Y() << ", " << q.Z() << ")";
}

// ---- matrices ----

// The largest magnitude of an entry of a - b, or of a (NaN counts as
// infinite), computed in double.
template <int N, class Real, class Other>
double KRMaxDifference(const CKRMatrixT<N, Real, Other>& a, const CKRMatrixT<N, Real, Other>& b) {
  double largest = 0;
  for (int i = 0; i < N * N; ++i) {
    const double difference = std::fabs(double(a(i / N, i % N)) - double(b(i / N, i % N)));
    largest = std::isnan(difference) ? INFINITY : std::max(largest, difference);
  }
  return largest;
}
template <int N, class Real, class Other>
double KRMaxEntry(const CKRMatrixT<N, Real, Other>& a) {
  return KRMaxDifference(a, CKRMatrixT<N, Real, Other>(true));
}
// How far transpose(m) * m is from the identity.
template <int N, class Real, class Other>
double KROrthogonalityError(const CKRMatrixT<N, Real, Other>& m) {
  return KRMaxDifference(m.TransposeTimes(m), CKRMatrixT<N, Real, Other>(false));
}
// A matrix with entries uniform in [-range, range].
template <class Matrix>
Matrix KRRandomMatrix(std::mt19937& random, double range = 1) {
  using Real = std::remove_cvref_t<decltype(std::declval<Matrix&>()(0, 0))>;
  std::uniform_real_distribution<double> value(-range, range);
  Matrix m;
  for (int r = 0; r < Matrix::Vector::GetN(); ++r)
    for (int c = 0; c < Matrix::Vector::GetN(); ++c)
      m(r, c) = Real(value(random));
  return m;
}
// A unit quaternion uniform over the rotations.
template <class Quaternion>
Quaternion KRRandomRotation(std::mt19937& random) {
  std::normal_distribution<double> value;
  const double w = value(random), x = value(random), y = value(random), z = value(random);
  const double length = std::sqrt(w * w + x * x + y * y + z * z);
  using Real = std::remove_cvref_t<decltype(Quaternion::IDENTITY.W())>;
  return Quaternion(Real(w / length), Real(x / length), Real(y / length), Real(z / length));
}
