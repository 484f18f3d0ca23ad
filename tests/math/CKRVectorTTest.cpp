// CKRVectorT and CKRVector2T, CKRVector3T, CKRVector4T in both precision
// pairs: normalisation, comparison, cross products, angles and
// orthonormal bases.
#include "KRMathTestTypes.h"

template <class Pair>
class CKRVectorTTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  static CKRVector3T<TReal, typename Pair::Other> Random3(std::mt19937& random, double range = 10) {
    std::uniform_real_distribution<double> value(-range, range);
    return CKRVector3T<TReal, typename Pair::Other>(TReal(value(random)), TReal(value(random)), TReal(value(random)));
  }
};
TYPED_TEST_SUITE(CKRVectorTTest, KRPrecisionPairs, KRPrecisionPairNames);

// Normalize returns the length it divided by and leaves a unit vector; the
// angle between two vectors runs counter-clockwise, in [0, 2 pi).
TYPED_TEST(CKRVectorTTest, NormalizeAndAngleBetween) {
  KR_MATH_TEST_TYPES;
  std::mt19937 random(KRTestSeed());
  for (int i = 0; i < 1000; ++i) {
    const V3 a = TestFixture::Random3(random);
    const V3 b = TestFixture::Random3(random);
    V3 unit = a * Real(100);
    ASSERT_EQ(unit.Normalize(), (a * Real(100)).Length());
    ASSERT_NEAR(unit.Length(), 1.0, KRByPrecision<Real>(1e-6, 1e-15));
    const V2 a2(a.X(), a.Y()), b2(b.X(), b.Y());
    const double angle = a2.AngleBetween(b2), expected = std::atan2(double(a2.Kross(b2)), double(a2.Dot(b2)));
    ASSERT_TRUE(angle >= 0 && angle < 2 * std::numbers::pi) << angle;
    ASSERT_LE(std::fabs(std::remainder(angle - expected, 2 * std::numbers::pi)), KRByPrecision<Real>(2e-3, 1e-6));
  }
  EXPECT_EQ(V2(Real(1), Real(0)).AngleBetween(V2::ZERO), Real(0));
  EXPECT_EQ(V2::ZERO.AngleBetween(V2(Real(1), Real(0))), Real(0));
}

// Out-of-range units, null arrays, vectors too short or invalid to
// normalise, and division by zero.
TYPED_TEST(CKRVectorTTest, DegenerateInputGivesDefinedResults) {
  KR_MATH_TEST_TYPES;
  using Generic = CKRVectorT<3, Real, Other>;
  EXPECT_EQ(V3(Generic::UNIT(3)), V3::ZERO);
  EXPECT_EQ(V3(Generic::UNIT(-1)), V3::ZERO);
  EXPECT_EQ(V3(static_cast<const Real*>(nullptr)), V3::ZERO);
  for (V3 bad : {V3(Real(1e-8), Real(0), Real(0)), V3(std::numeric_limits<Real>::quiet_NaN(), Real(1), Real(1))}) {
    EXPECT_EQ(bad.Normalize(), Real(0));
    EXPECT_EQ(bad, V3::ZERO);
  }
  const V3 kept(Real(0), Real(0), Real(-2));
  EXPECT_EQ(kept.GetNormalized(), V3(Real(0), Real(0), Real(-1)));
  EXPECT_EQ(kept.Z(), Real(-2));
  // Division by zero fills every component with the single-precision maximum.
  V3 v(Real(-1), Real(0), Real(2));
  const Real huge = Real(3.4028234663852886e+38);
  EXPECT_EQ(v / Real(0), V3(huge, huge, huge));
  EXPECT_EQ(v /= Real(0), V3(huge, huge, huge));
}

TYPED_TEST(CKRVectorTTest, EqualityIsBitwiseAndOrderIsByBytes) {
  KR_MATH_TEST_TYPES;
  EXPECT_NE(V2(Real(0.0), Real(1)), V2(Real(-0.0), Real(1)));
  const Real nan = std::numeric_limits<Real>::quiet_NaN();
  EXPECT_EQ(V2(nan, Real(1)), V2(nan, Real(1)));
  // By bytes (least significant first), 2 comes before 1.
  const V2 one(Real(1), Real(0)), two(Real(2), Real(0));
  EXPECT_TRUE(two < one && one > two && two <= one && one >= two && one <= one && !(one < one));
  EXPECT_TRUE(V2(Real(1.2344), Real(5)).Approx_Equal(V2(Real(1.2341), Real(5.0001)), 3));
  EXPECT_FALSE(V2(Real(1.2344), Real(5)).Approx_Equal(V2(Real(1.2356), Real(5)), 3));
}

TYPED_TEST(CKRVectorTTest, CrossProductsInEveryDimension) {
  KR_MATH_TEST_TYPES;
  const V3 a(Real(1), Real(2), Real(3));
  const V3 b(Real(-2), Real(0.5), Real(4));
  EXPECT_EQ(a.Cross(b), V3(Real(6.5), Real(-10), Real(4.5)));
  EXPECT_EQ(a.Dot(b), Real(11));
  EXPECT_NEAR(a.UnitCross(b).Length(), 1.0, 1e-6);
  // The 4-D form is the 3-D one with w = 0; the 2-D one the perpendicular.
  EXPECT_EQ(V4(Real(1), Real(2), Real(3), Real(7)).Cross(V4(Real(-2), Real(0.5), Real(4), Real(9))),
            V4(Real(6.5), Real(-10), Real(4.5), Real(0)));
  const V2 d(Real(3), Real(4));
  EXPECT_EQ(d.Cross(V2::ZERO), V2(Real(4), Real(-3)));
  EXPECT_TRUE(d.UnitCross(V2::ZERO).Approx_Equal(V2(Real(0.8), Real(-0.6)), 6));
  EXPECT_EQ(d.Kross(V2(Real(1), Real(2))), Real(2));
  // Through the generic class the virtual forms give the same results: the
  // cross product of differences (generic vectors) is not lost.
  const CKRVectorT<3, Real, Other>& generic = a;
  EXPECT_EQ(V3(generic.Cross(b)), a.Cross(b));
  EXPECT_EQ(V3(generic.UnitCross(b)), a.UnitCross(b));
  EXPECT_EQ(V3((a - b).Cross(a + b)), V3(a - b).Cross(V3(a + b)));
}

TYPED_TEST(CKRVectorTTest, OrthonormalBasesAndExtremes) {
  KR_MATH_TEST_TYPES;
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
    V3 u, v, w = TestFixture::Random3(random);
    V3::GenerateOrthonormalBasis(u, v, w, false);
    ASSERT_NEAR(u.Dot(w), 0.0, tolerance);
    // Right-handed and unit: u x v = w.
    ASSERT_NEAR(u.Cross(v).Dot(w), 1.0, tolerance);
  }
  V3 u, v, w = V3::ZERO;
  V3::GenerateOrthonormalBasis(u, v, w, false);
  EXPECT_EQ(u.Length() + v.Length(), Real(0));
  V3::Orthonormalize(static_cast<V3*>(nullptr));
  // Extremes of none leave the bounds as they are.
  const V2 points[] = {V2(Real(1), Real(5)), V2(Real(-2), Real(7)), V2(Real(4), Real(-1))};
  V2 low = V2::UNIT_X, high = V2::UNIT_X;
  V2::ComputeExtremes(0, points, low, high);
  EXPECT_EQ(low, V2::UNIT_X);
  V2::ComputeExtremes(3, points, low, high);
  EXPECT_EQ(low, V2(Real(-2), Real(-1)));
  EXPECT_EQ(high, V2(Real(4), Real(7)));
}
