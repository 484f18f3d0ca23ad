// CKRVectorT and CKRVector2T, CKRVector3T, CKRVector4T in both precision
// pairs: layout, constants, arithmetic, normalisation, comparison, cross
// products, angles and orthonormal bases.
#include <krCoreLib/math/CKRPointT.h>
#include <krCoreLib/math/CKRVector2T.h>
#include <krCoreLib/math/CKRVector3T.h>
#include <krCoreLib/math/CKRVector4T.h>

#include "KRMathTestTypes.h"
#include "KRTestSeed.h"

#include <cmath>
#include <cstring>
#include <limits>
#include <numbers>
#include <random>
#include <set>

template <class Pair>
class CKRVectorTTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  using TOther = typename Pair::Other;
  using TM = CKRMathT<TReal, TOther>;
  using TV2 = CKRVector2T<TReal, TOther>;
  using TV3 = CKRVector3T<TReal, TOther>;
  using TV4 = CKRVector4T<TReal, TOther>;

  static TV3 Random3(std::mt19937& random, double range = 10) {
    std::uniform_real_distribution<double> value(-range, range);
    return TV3(TReal(value(random)), TReal(value(random)), TReal(value(random)));
  }
};
TYPED_TEST_SUITE(CKRVectorTTest, KRPrecisionPairs, KRPrecisionPairNames);

TYPED_TEST(CKRVectorTTest, LayoutIsTheVirtualTableThenTheComponents) {
  using Real = typename TestFixture::TReal;
  using V3 = typename TestFixture::TV3;
  V3 v(Real(1), Real(2), Real(3));
  const auto* bytes = reinterpret_cast<const unsigned char*>(&v);
  EXPECT_EQ(reinterpret_cast<const unsigned char*>(v.GetTuple()) - bytes, static_cast<std::ptrdiff_t>(sizeof(void*)));
  EXPECT_TRUE(std::is_polymorphic_v<V3>);
  EXPECT_EQ(V3::GetN(), 3);
  EXPECT_EQ(static_cast<const Real*>(v), v.GetTuple());
  v[2] = Real(9);
  EXPECT_EQ(v.Z(), Real(9));
  v.Y() = Real(8);
  EXPECT_EQ(v[1], Real(8));
}

TYPED_TEST(CKRVectorTTest, ConstantsAndUnitVectors) {
  using Real = typename TestFixture::TReal;
  using V2 = typename TestFixture::TV2;
  using V3 = typename TestFixture::TV3;
  using V4 = typename TestFixture::TV4;
  EXPECT_EQ(V2::ZERO, V2(Real(0), Real(0)));
  EXPECT_EQ(V2::UNIT_Y, V2(Real(0), Real(1)));
  EXPECT_EQ(V3::UNIT_Z, V3(Real(0), Real(0), Real(1)));
  EXPECT_EQ(V4::UNIT_W, V4(Real(0), Real(0), Real(0), Real(1)));
  EXPECT_EQ(V4::ZERO, V4(Real(0), Real(0), Real(0), Real(0)));
  EXPECT_EQ(V3(CKRVectorT<3, Real, typename TestFixture::TOther>::UNIT(1)), V3::UNIT_Y);
  EXPECT_EQ(V3(CKRVectorT<3, Real, typename TestFixture::TOther>::UNIT(3)), V3::ZERO);
  EXPECT_EQ(V3(CKRVectorT<3, Real, typename TestFixture::TOther>::UNIT(-1)), V3::ZERO);
  EXPECT_EQ(V4(CKRVectorT<4, Real, typename TestFixture::TOther>::ZERO()), V4::ZERO);
  // From the other precision, from arrays and from points.
  const typename TestFixture::TOther half = 0.5;
  EXPECT_EQ(V3(half, half, half), V3(Real(0.5), Real(0.5), Real(0.5)));
  const Real values[] = {Real(1), Real(2), Real(3)};
  EXPECT_EQ(V3(values), V3(Real(1), Real(2), Real(3)));
  EXPECT_EQ(V3(static_cast<const Real*>(nullptr)), V3::ZERO);
  EXPECT_EQ(V3(CKRPointT<3, Real, typename TestFixture::TOther>(values)), V3(values));
}

// The operators against the same formulas over plain arrays, bit for bit.
TYPED_TEST(CKRVectorTTest, ArithmeticMatchesComponentFormulas) {
  using Real = typename TestFixture::TReal;
  using V3 = typename TestFixture::TV3;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> scalar(-5, 5);
  for (int i = 0; i < 1000; ++i) {
    const V3 a = TestFixture::Random3(random);
    const V3 b = TestFixture::Random3(random);
    const Real s = Real(scalar(random));
    const V3 sum = a + b;
    const V3 difference = a - b;
    const V3 scaled = a * s;
    const V3 left = s * a;
    const V3 negated = -a;
    V3 accumulated = a;
    accumulated += b;
    accumulated -= a;
    accumulated *= s;
    for (int k = 0; k < 3; ++k) {
      ASSERT_EQ(sum[k], Real(a[k] + b[k]));
      ASSERT_EQ(difference[k], Real(a[k] - b[k]));
      ASSERT_EQ(scaled[k], Real(a[k] * s));
      ASSERT_EQ(left[k], scaled[k]);
      ASSERT_EQ(negated[k], -a[k]);
      ASSERT_EQ(accumulated[k], Real(Real(Real(a[k] + b[k]) - a[k]) * s));
    }
    ASSERT_EQ(a.Dot(b), Real(Real(a[0] * b[0] + a[1] * b[1]) + a[2] * b[2]));
    ASSERT_EQ(a.SquaredLength(), a.Dot(a));
    ASSERT_EQ(a.Length(), std::sqrt(a.Dot(a)));
    if (s != Real(0)) {
      const V3 divided = a / s;
      ASSERT_EQ(divided[0], a[0] * (Real(1) / s));
    }
  }
  // Division by zero fills every component with the single-precision maximum.
  V3 v(Real(-1), Real(0), Real(2));
  const V3 divided = v / Real(0);
  v /= Real(0);
  for (int k = 0; k < 3; ++k) {
    EXPECT_EQ(double(divided[k]), 3.4028234663852886e+38);
    EXPECT_EQ(v[k], divided[k]);
  }
}

TYPED_TEST(CKRVectorTTest, NormalizeScalesOrZeroes) {
  using Real = typename TestFixture::TReal;
  using V2 = typename TestFixture::TV2;
  using V3 = typename TestFixture::TV3;
  V3 tiny(Real(1e-8), Real(0), Real(0));
  EXPECT_EQ(tiny.Normalize(), Real(0));
  EXPECT_EQ(tiny, V3::ZERO);
  V2 v(Real(3), Real(4));
  EXPECT_EQ(v.Normalize(), Real(5));
  EXPECT_NEAR(v.X(), 0.6, 1e-7);
  EXPECT_NEAR(v.Y(), 0.8, 1e-7);
  V3 invalid(std::numeric_limits<Real>::quiet_NaN(), Real(1), Real(1));
  EXPECT_EQ(invalid.Normalize(), Real(0));
  EXPECT_EQ(invalid, V3::ZERO);
  const V3 kept(Real(0), Real(0), Real(-2));
  EXPECT_EQ(kept.GetNormalized(), V3(Real(0), Real(0), Real(-1)));
  EXPECT_EQ(kept.Z(), Real(-2));

  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 1000; ++i) {
    V3 w = TestFixture::Random3(random, 1000);
    const Real length = w.Length();
    ASSERT_EQ(w.Normalize(), length);
    ASSERT_NEAR(w.Length(), 1.0, KRByPrecision<Real>(1e-6, 1e-15));
  }
}

TYPED_TEST(CKRVectorTTest, EqualityIsBitwiseAndOrderIsByBytes) {
  using Real = typename TestFixture::TReal;
  using V2 = typename TestFixture::TV2;
  EXPECT_FALSE(V2(Real(0.0), Real(1)) == V2(Real(-0.0), Real(1)));
  EXPECT_TRUE(V2(Real(0.0), Real(1)) != V2(Real(-0.0), Real(1)));
  const Real nan = std::numeric_limits<Real>::quiet_NaN();
  EXPECT_TRUE(V2(nan, Real(1)) == V2(nan, Real(1)));

  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> value(-3, 3);
  std::set<V2> sorted;
  for (int i = 0; i < 500; ++i) {
    const V2 a(Real(value(random)), Real(value(random)));
    const V2 b(Real(value(random)), Real(value(random)));
    const int bytes = std::memcmp(a.GetTuple(), b.GetTuple(), 2 * sizeof(Real));
    ASSERT_EQ(a < b, bytes < 0);
    ASSERT_EQ(a > b, bytes > 0);
    ASSERT_EQ(a <= b, bytes <= 0);
    ASSERT_EQ(a >= b, bytes >= 0);
    ASSERT_EQ(a < b, b > a);
    sorted.insert(a);
    sorted.insert(a);
  }
  EXPECT_LE(sorted.size(), 500u);

  EXPECT_TRUE(V2(Real(1.2344), Real(5)).Approx_Equal(V2(Real(1.2341), Real(5.0001)), 3));
  EXPECT_FALSE(V2(Real(1.2344), Real(5)).Approx_Equal(V2(Real(1.2356), Real(5)), 3));
}

TYPED_TEST(CKRVectorTTest, CrossProductsInEveryDimension) {
  using Real = typename TestFixture::TReal;
  using Other = typename TestFixture::TOther;
  using V2 = typename TestFixture::TV2;
  using V3 = typename TestFixture::TV3;
  using V4 = typename TestFixture::TV4;
  const V3 x = V3::UNIT_X;
  EXPECT_EQ(x.Cross(V3::UNIT_Y), V3::UNIT_Z);
  EXPECT_EQ(V3::UNIT_Y.Cross(x), V3(Real(0), Real(0), Real(-1)));
  const V3 a(Real(1), Real(2), Real(3));
  const V3 b(Real(-2), Real(0.5), Real(4));
  EXPECT_EQ(a.Cross(b), V3(Real(2 * 4 - 3 * 0.5), Real(3 * -2 - 1 * 4), Real(1 * 0.5 - 2 * -2)));
  EXPECT_NEAR(a.UnitCross(b).Length(), 1.0, 1e-6);
  EXPECT_NEAR(a.Cross(b).Dot(a), 0.0, 1e-5);
  EXPECT_EQ(V4(Real(1), Real(2), Real(3), Real(7)).Cross(V4(Real(-2), Real(0.5), Real(4), Real(9))),
            V4(Real(6.5), Real(-10), Real(4.5), Real(0)));
  EXPECT_EQ(V2(Real(3), Real(4)).Cross(V2::ZERO), V2(Real(4), Real(-3)));
  EXPECT_TRUE(V2(Real(3), Real(4)).UnitCross(V2::ZERO).Approx_Equal(V2(Real(0.8), Real(-0.6)), 6));
  EXPECT_EQ(V2(Real(3), Real(4)).Kross(V2(Real(1), Real(2))), Real(2));

  // Through the generic class the virtual forms give the same results: the
  // cross product of differences (generic vectors) is not lost.
  const CKRVectorT<3, Real, Other>& generic = a;
  EXPECT_EQ(V3(generic.Cross(b)), a.Cross(b));
  EXPECT_EQ(V3(generic.UnitCross(b)), a.UnitCross(b));
  EXPECT_EQ(V3((a - b).Cross(a + b)), V3(a - b).Cross(V3(a + b)));
  const V4 c(Real(1), Real(2), Real(3), Real(7));
  const CKRVectorT<4, Real, Other>& generic4 = c;
  EXPECT_EQ(V4(generic4.Cross(V4::UNIT_X)), c.Cross(V4::UNIT_X));
  const V2 d(Real(3), Real(4));
  const CKRVectorT<2, Real, Other>& generic2 = d;
  EXPECT_EQ(V2(generic2.Cross(d)), d.Cross(d));
}

TYPED_TEST(CKRVectorTTest, AngleBetweenIsCounterClockwise) {
  using Real = typename TestFixture::TReal;
  using V2 = typename TestFixture::TV2;
  EXPECT_NEAR(V2(Real(1), Real(0)).AngleBetween(V2(Real(0), Real(-1))), 1.5 * std::numbers::pi, 1e-6);
  EXPECT_EQ(V2(Real(1), Real(0)).AngleBetween(V2::ZERO), Real(0));
  EXPECT_EQ(V2::ZERO.AngleBetween(V2(Real(1), Real(0))), Real(0));

  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> value(-10, 10);
  for (int i = 0; i < 1000; ++i) {
    const V2 a(Real(value(random)), Real(value(random)));
    const V2 b(Real(value(random)), Real(value(random)));
    const Real angle = a.AngleBetween(b);
    ASSERT_GE(angle, Real(0));
    ASSERT_LT(angle, Real(2 * std::numbers::pi));
    const double expected = std::atan2(double(a.Kross(b)), double(a.Dot(b)));
    const double gap = std::fabs(std::remainder(angle - expected, 2 * std::numbers::pi));
    ASSERT_LE(gap, KRByPrecision<Real>(2e-3, 1e-6));
  }
}

TYPED_TEST(CKRVectorTTest, OrthonormalBases) {
  using Real = typename TestFixture::TReal;
  using V2 = typename TestFixture::TV2;
  using V3 = typename TestFixture::TV3;
  const double tolerance = KRByPrecision<Real>(1e-5, 1e-12);
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 500; ++i) {
    V3 vectors[3] = {TestFixture::Random3(random), TestFixture::Random3(random), TestFixture::Random3(random)};
    if (std::fabs(double(vectors[0].Dot(vectors[1].Cross(vectors[2])))) < 1)
      continue;
    V3::Orthonormalize(vectors);
    for (int j = 0; j < 3; ++j) {
      ASSERT_NEAR(vectors[j].Length(), 1.0, tolerance);
      ASSERT_NEAR(vectors[j].Dot(vectors[(j + 1) % 3]), 0.0, 100 * tolerance);
    }
    V3 u;
    V3 v;
    V3 w = TestFixture::Random3(random);
    V3::GenerateOrthonormalBasis(u, v, w, false);
    ASSERT_NEAR(u.Length(), 1.0, tolerance);
    ASSERT_NEAR(v.Length(), 1.0, tolerance);
    ASSERT_NEAR(u.Dot(w), 0.0, tolerance);
    ASSERT_NEAR(v.Dot(w), 0.0, tolerance);
    // Right-handed: u x v = w.
    ASSERT_NEAR(u.Cross(v).Dot(w), 1.0, tolerance);
  }
  V3 u;
  V3 v;
  V3 w = V3::ZERO;
  V3::GenerateOrthonormalBasis(u, v, w, false);
  EXPECT_EQ(u.Length(), Real(0));
  EXPECT_EQ(v.Length(), Real(0));
  V3::Orthonormalize(static_cast<V3*>(nullptr));

  V2 a(Real(2), Real(0.5));
  V2 b(Real(1), Real(1));
  V2::Orthonormalize(a, b);
  EXPECT_NEAR(a.Length(), 1.0, tolerance);
  EXPECT_NEAR(b.Length(), 1.0, tolerance);
  EXPECT_NEAR(a.Dot(b), 0.0, tolerance);
  V2 perp;
  V2 unit(Real(0), Real(2));
  V2::GenerateOrthonormalBasis(perp, unit, false);
  EXPECT_EQ(unit, V2::UNIT_Y);
  EXPECT_EQ(perp, V2(Real(1), -Real(0)));  // (y, -x): the zero keeps its sign

  const V2 points[] = {V2(Real(1), Real(5)), V2(Real(-2), Real(7)), V2(Real(4), Real(-1))};
  V2 low = V2::UNIT_X;
  V2 high = V2::UNIT_X;
  V2::ComputeExtremes(3, points, low, high);
  EXPECT_EQ(low, V2(Real(-2), Real(-1)));
  EXPECT_EQ(high, V2(Real(4), Real(7)));
  V2::ComputeExtremes(1, points, low, high);
  EXPECT_EQ(low, points[0]);
  EXPECT_EQ(high, points[0]);
  low = V2::UNIT_X;
  V2::ComputeExtremes(0, points, low, high);
  EXPECT_EQ(low, V2::UNIT_X);
}
