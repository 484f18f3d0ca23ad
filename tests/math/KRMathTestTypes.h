// The two precision pairs every math test runs through, the classes of a
// pair, and tolerances that depend on the precision.
#pragma once

#include <krCoreLib/math/CKRMathT.h>
#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint3T.h>
#include <krCoreLib/math/CKRPoint4T.h>
#include <krCoreLib/math/CKRVector2T.h>
#include <krCoreLib/math/CKRVector3T.h>
#include <krCoreLib/math/CKRVector4T.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>
#include <ostream>
#include <random>
#include <string>
#include <type_traits>

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
  using P4 [[maybe_unused]] = CKRPoint4T<Real, Other>

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
