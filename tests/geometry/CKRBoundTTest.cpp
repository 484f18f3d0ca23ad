// CKRBoundT and the named bounds in both precision pairs: the empty bound,
// expansion, inclusion, spans and comparison.
#include <krCoreLib/geometry/CKRBoundT.h>

#include "KRGeometryTestTypes.h"

#include <cmath>
#include <limits>

template <class Pair>
class CKRBoundTTest : public ::testing::Test {};
TYPED_TEST_SUITE(CKRBoundTTest, KRGeometryPairs, KRGeometryPairNames);

TYPED_TEST(CKRBoundTTest, EmptyBoundExpandsToExactlyItsPoints) {
  KR_GEOMETRY_TEST_TYPES;
  using B3 = CKRBound3T<Real, Other>;
  B3 bound;
  EXPECT_TRUE(bound.IsEmpty());
  EXPECT_FALSE(bound.Contains(P3(0, 0, 0)));
  EXPECT_FALSE(bound.Contains(P3(Real(1e30), Real(-1e30), Real(0))));

  const P3 p(Real(1), Real(-2), Real(3));
  bound.Expand(p);
  EXPECT_FALSE(bound.IsEmpty());
  EXPECT_TRUE(bound.Contains(p));
  EXPECT_FALSE(bound.Contains(P3(Real(1), Real(-2), Real(3.5))));
  EXPECT_EQ(V3(bound.GetSpan()), V3::ZERO);

  bound.Expand(P3(Real(-1), Real(4), Real(3)));
  EXPECT_EQ(P3(bound.Min()), P3(Real(-1), Real(-2), Real(3)));
  EXPECT_EQ(P3(bound.Max()), P3(Real(1), Real(4), Real(3)));
  EXPECT_TRUE(bound.Contains(P3(Real(0), Real(4), Real(3))));  // on the boundary
  EXPECT_EQ(bound, B3(P3(Real(1), Real(4), Real(3)), P3(Real(-1), Real(-2), Real(3))));

  // A NaN coordinate enters no corner and is contained nowhere.
  const Real nan = std::numeric_limits<Real>::quiet_NaN();
  const B3 before = bound;
  bound.Expand(P3(nan, Real(0), Real(3)));
  EXPECT_EQ(bound, before);
  EXPECT_FALSE(bound.Contains(P3(nan, Real(0), Real(3))));
}

TYPED_TEST(CKRBoundTTest, BoundsCombineAndCompare) {
  KR_GEOMETRY_TEST_TYPES;
  using B2 = CKRBound2T<Real, Other>;
  const B2 small(P2(0, 0), P2(1, 1));
  const B2 large(P2(-1, -1), P2(3, 2));
  EXPECT_TRUE(large.Contains(small));
  EXPECT_FALSE(small.Contains(large));
  EXPECT_TRUE(small.Contains(small));
  EXPECT_TRUE(small.Contains(B2()));  // the empty bound holds no point
  EXPECT_FALSE(B2().Contains(small));

  B2 merged = small;
  merged.Expand(B2());
  EXPECT_EQ(merged, small);
  merged.Expand(B2(P2(2, -1), P2(3, 0)));
  EXPECT_EQ(merged, B2(P2(0, -1), P2(3, 1)));

  EXPECT_TRUE(small < large && !(large < small) && !(small < small));
  B2 nudged = small;
  nudged.Max()[0] += Real(1e-5);
  EXPECT_NE(nudged, small);
  EXPECT_TRUE(nudged.Approx_Equal(small, 3));
  EXPECT_FALSE(nudged.Approx_Equal(small, 6));
}
