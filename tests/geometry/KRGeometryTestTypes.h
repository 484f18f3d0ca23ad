// The two precision pairs every geometry test runs through and the classes
// of a pair by their short names.
#pragma once

#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint3T.h>
#include <krCoreLib/math/CKRPoint4T.h>
#include <krCoreLib/math/CKRVector2T.h>
#include <krCoreLib/math/CKRVector3T.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <string>
#include <type_traits>

template <class TReal, class TOther>
struct KRGeometryPair {
  using Real = TReal;
  using Other = TOther;
};

using KRGeometryPairs = ::testing::Types<KRGeometryPair<float, double>, KRGeometryPair<double, float>>;

struct KRGeometryPairNames {
  template <class Pair>
  static std::string GetName(int) {
    return std::is_same_v<typename Pair::Real, float> ? "float" : "double";
  }
};

#define KR_GEOMETRY_TEST_TYPES                              \
  using Real [[maybe_unused]] = typename TypeParam::Real;   \
  using Other [[maybe_unused]] = typename TypeParam::Other; \
  using P2 [[maybe_unused]] = CKRPoint2T<Real, Other>;      \
  using P3 [[maybe_unused]] = CKRPoint3T<Real, Other>;      \
  using V2 [[maybe_unused]] = CKRVector2T<Real, Other>;     \
  using V3 [[maybe_unused]] = CKRVector3T<Real, Other>
