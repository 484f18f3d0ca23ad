// CKRLineT, CKRRayT, CKRSegmentT and CKRDistanceT in both precision pairs:
// construction from two points, comparison, and point distances with their
// parameters, including degenerate pieces.
#include <krCoreLib/geometry/CKRDistanceT.h>

#include "KRGeometryTestTypes.h"

#include <cmath>

template <class Pair>
class CKRDistanceTTest : public ::testing::Test {};
TYPED_TEST_SUITE(CKRDistanceTTest, KRGeometryPairs, KRGeometryPairNames);

TYPED_TEST(CKRDistanceTTest, PiecesCompareByOriginAndDirection) {
  KR_GEOMETRY_TEST_TYPES;
  using Line = CKRLineT<3, Real, Other>;
  const Line s(P3(1, 2, 3), P3(4, 6, 3));
  Line t = s;
  t.Direction()[2] = Real(1e-5);
  EXPECT_TRUE(t != s && t.Approx_Equal(s, 3) && !t.Approx_Equal(s, 6));
  // < needs both the origin and the direction less (by byte images, in
  // which all-zero components come first).
  const Line low(P3(0, 0, 0), P3(0, 0, 0)), high(P3(1, 1, 1), P3(2, 2, 2));
  EXPECT_TRUE(low < high);
  EXPECT_FALSE(high < low);
  EXPECT_FALSE(low < Line(P3(1, 1, 1), P3(1, 1, 1)));  // same direction
}

TYPED_TEST(CKRDistanceTTest, DistancesClampByKind) {
  KR_GEOMETRY_TEST_TYPES;
  using D = CKRDistanceT<3, Real, Other>;
  const P3 o(0, 0, 0), x(1, 0, 0);
  const CKRSegmentT<3, Real, Other> segment(o, x);
  const CKRRayT<3, Real, Other> ray(o, x);
  const CKRLineT<3, Real, Other> line(o, x);
  struct Case {
    P3 p;
    double segment, segmentT, ray, rayT, line, lineT;
  };
  const Case cases[] = {
      {P3(2, 1, 0), 2, 1, 1, 2, 1, 2},
      {P3(-3, 4, 0), 25, 0, 25, 0, 16, -3},  // behind the origin
      {P3(0.5, 0, 2), 4, 0.5, 4, 0.5, 4, 0.5},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << c.p[0] << "," << c.p[1] << "," << c.p[2]);
    Real t = -1;
    EXPECT_EQ(D::SqrDistance(c.p, segment, &t), Real(c.segment));
    EXPECT_EQ(t, Real(c.segmentT));
    EXPECT_EQ(D::SqrDistance(c.p, ray, &t), Real(c.ray));
    EXPECT_EQ(t, Real(c.rayT));
    EXPECT_EQ(D::SqrDistance(c.p, line, &t), Real(c.line));
    EXPECT_EQ(t, Real(c.lineT));
    EXPECT_EQ(D::Distance(c.p, line), std::sqrt(Real(c.line)));
  }
  // A piece from two equal points measures to its origin with t = 0.
  const P3 p(3, 4, 0);
  for (Real t = -1; const Real d : {D::Distance(p, CKRSegmentT<3, Real, Other>(o, o), &t),
                                    D::Distance(p, CKRRayT<3, Real, Other>(o, o), &t),
                                    D::Distance(p, CKRLineT<3, Real, Other>(o, o), &t)}) {
    EXPECT_EQ(d, Real(5));
    EXPECT_EQ(t, Real(0));
  }
}
