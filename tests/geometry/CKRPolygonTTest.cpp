// CKRPolygonT and CKRPlanarPolygonT in both precision pairs:
// Newell normals, planarity, the shared vertex source of copies, and the
// area, winding, convexity and simplicity of planar polygons.
#include <krCoreLib/geometry/CKRPlanarPolygonT.h>
#include <krCoreLib/math/CKRMatrix3T.h>

#include "KRGeometryTestTypes.h"

#include <cmath>
#include <initializer_list>
#include <limits>
#include <memory>

template <class Pair>
class CKRPolygonTTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  using Planar = CKRPlanarPolygonT<2, TReal, typename Pair::Other>;
  static Planar Make(std::initializer_list<std::pair<double, double>> points) {
    Planar p;
    for (const auto& [x, y] : points)
      p.GetPoints().push_back(CKRPoint2T<TReal, typename Pair::Other>(TReal(x), TReal(y)));
    return p;
  }
};
TYPED_TEST_SUITE(CKRPolygonTTest, KRGeometryPairs, KRGeometryPairNames);

TYPED_TEST(CKRPolygonTTest, NormalAndPlanarity) {
  KR_GEOMETRY_TEST_TYPES;
  CKRPolygon3T<Real, Other> square(4);
  square[0] = P3(0, 0, 0);
  square[1] = P3(1, 0, 0);
  square[2] = P3(1, 1, 0);
  square[3] = P3(0, 1, 0);
  EXPECT_EQ(V3(square.GetNormal()), V3(Real(0), Real(0), Real(1)));
  EXPECT_TRUE(square.IsPlanar(3));
  square[3][2] = Real(1e-5);
  EXPECT_TRUE(square.IsPlanar(3));
  EXPECT_FALSE(square.IsPlanar(7));
  square[3][2] = Real(0.1);
  EXPECT_FALSE(square.IsPlanar(3));

  // The plane comes from the first three vertices that are not collinear.
  CKRPolygon3T<Real, Other> bent(5);
  bent[0] = P3(0, 0, 0);
  bent[1] = P3(0, 0, 0);
  bent[2] = P3(1, 0, 0);
  bent[3] = P3(2, 0, 0);
  bent[4] = P3(2, 0, 1);
  EXPECT_TRUE(bent.IsPlanar(6));  // the x-z plane
  bent.GetSource().GetPoints().push_back(P3(2, 1, 1));
  EXPECT_FALSE(bent.IsPlanar(3));
  bent.GetSource().GetPoints().resize(4);
  EXPECT_TRUE(bent.IsPlanar(6));  // all on one line
  EXPECT_EQ(V3(bent.GetNormal()), V3::ZERO);

  using Polygon3 = CKRPolygon3T<Real, Other>;
  EXPECT_FALSE(Polygon3(2).IsPlanar(3));
  EXPECT_EQ(V3(Polygon3(2).GetNormal()), V3::ZERO);
  CKRPolygonT<2, Real, Other> flat(3);
  EXPECT_TRUE(flat.IsPlanar(3));
  EXPECT_EQ(V2(flat.GetNormal()), V2(Real(0), Real(0)));
}

// Copies share the created source; whichever goes last releases it (the
// sanitizer build reports a leak or a double release).
TYPED_TEST(CKRPolygonTTest, CopiesShareTheirSource) {
  KR_GEOMETRY_TEST_TYPES;
  auto original = std::make_unique<CKRPolygon3T<Real, Other>>(3);
  CKRPolygon3T<Real, Other> copy(*original);
  (*original)[1] = P3(1, 2, 3);
  EXPECT_EQ(P3(copy[1]), P3(1, 2, 3));
  CKRPolygon3T<Real, Other> assigned;
  assigned = copy;
  original.reset();
  copy = CKRPolygon3T<Real, Other>(5);
  EXPECT_EQ(P3(assigned[1]), P3(1, 2, 3));
  EXPECT_EQ(copy.GetLength(), 5u);

  // ReverseWinding reverses an explicit index sequence only.
  assigned.ReverseWinding();
  EXPECT_EQ(P3(assigned[1]), P3(1, 2, 3));
  assigned.GetSequence().GetIndices() = {0, 1, 2};
  assigned[0] = P3(9, 9, 9);
  assigned.ReverseWinding();
  EXPECT_EQ(P3(assigned[2]), P3(9, 9, 9));
}

TYPED_TEST(CKRPolygonTTest, PlanarMeasures) {
  KR_GEOMETRY_TEST_TYPES;
  const auto ell = TestFixture::Make({{0, 0}, {2, 0}, {2, 1}, {1, 1}, {1, 2}, {0, 2}});
  EXPECT_EQ(ell.GetArea(), Real(3));
  EXPECT_EQ(ell.GetDoubleSignedArea(), Real(6));
  EXPECT_EQ(ell.GetVertexOrientation(), KRORIENTATION_COUNTERCLOCKWISE);
  EXPECT_FALSE(ell.IsConvex());
  EXPECT_TRUE(ell.IsSimple());
  EXPECT_FALSE(ell.IsSelfIntersecting());
  const auto edges = ell.GetEdges();
  ASSERT_EQ(edges.size(), 6u);
  EXPECT_EQ(P2(edges[5].Point1()), P2(0, 2));
  EXPECT_EQ(P2(edges[5].Point2()), P2(0, 0));

  auto reversed = ell;
  reversed.ReverseWinding();
  EXPECT_EQ(reversed.GetArea(), Real(-3));
  EXPECT_EQ(reversed.GetVertexOrientation(), KRORIENTATION_CLOCKWISE);
  EXPECT_NE(reversed, ell);
  EXPECT_EQ(TestFixture::Make({{0, 0}, {1, 1}, {2, 2}}).GetVertexOrientation(), KRORIENTATION_DEGENERATE);
  EXPECT_EQ(TestFixture::Make({}).GetArea(), Real(0));
  EXPECT_EQ(TestFixture::Make({{0, 0}, {1, 1}}).GetEdges().size(), 1u);
  EXPECT_TRUE(TestFixture::Make({{0, 0}}).GetEdges().empty());
}

TYPED_TEST(CKRPolygonTTest, ConvexityAndSimplicity) {
  KR_GEOMETRY_TEST_TYPES;
  struct Case {
    const char* name;
    typename TestFixture::Planar polygon;
    bool convex, simple;
  };
  const double nan = std::numeric_limits<double>::quiet_NaN();
  const Case cases[] = {
      {"square", TestFixture::Make({{0, 0}, {1, 0}, {1, 1}, {0, 1}}), true, true},
      {"clockwise square", TestFixture::Make({{0, 0}, {0, 1}, {1, 1}, {1, 0}}), true, true},
      {"straight vertex", TestFixture::Make({{0, 0}, {1, 0}, {2, 0}, {2, 1}}), true, true},
      {"repeated vertex", TestFixture::Make({{0, 0}, {1, 0}, {1, 0}, {1, 1}, {0, 0}}), true, false},
      {"pentagram", TestFixture::Make({{0, 0}, {2, 1}, {-1, 1}, {1, 0}, {0.5, 2}}), false, false},
      {"bow tie", TestFixture::Make({{0, 0}, {1, 1}, {1, 0}, {0, 1}}), false, false},
      {"spike", TestFixture::Make({{0, 0}, {2, 0}, {1, 0}, {1, 1}}), false, false},
      {"touching", TestFixture::Make({{0, 0}, {4, 0}, {4, 4}, {2, 0}, {0, 4}}), false, false},
      {"line", TestFixture::Make({{0, 0}, {1, 1}, {2, 2}}), false, false},
      {"two points", TestFixture::Make({{0, 0}, {1, 1}}), false, false},
      {"NaN", TestFixture::Make({{0, 0}, {1, 0}, {nan, 1}}), false, false},
      // Nearly collinear but exactly convex: the exact turn decides.
      {"sliver", TestFixture::Make({{0, 0}, {1, 1e-7}, {2, 0}, {1, 1}}), false, true},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    EXPECT_EQ(c.polygon.IsConvex(), c.convex);
    EXPECT_EQ(c.polygon.IsSimple(), c.simple);
    EXPECT_EQ(c.polygon.IsSelfIntersecting(), c.polygon.GetPoints().size() >= 3 && !c.simple);
  }
}

TYPED_TEST(CKRPolygonTTest, PlanarPolygonFromASpacePolygon) {
  KR_GEOMETRY_TEST_TYPES;
  // A triangle in the x-z plane, turned into the x-y plane by the rotation
  // with rows x, z, -y.
  CKRPolygon3T<Real, Other> polygon(3);
  polygon[0] = P3(0, 0, 0);
  polygon[1] = P3(2, 0, 0);
  polygon[2] = P3(0, 0, 2);
  CKRMatrixT<3, Real, Other> turn;
  turn(0, 0) = 1;
  turn(1, 2) = 1;
  turn(2, 1) = -1;
  const CKRPlanarPolygonT<3, Real, Other> planar(polygon, turn);
  ASSERT_EQ(planar.GetPoints().size(), 3u);
  EXPECT_EQ(P3(planar.GetPoints()[2]), P3(0, 2, 0));
  EXPECT_EQ(planar.GetArea(), Real(2));
  EXPECT_TRUE(planar.GetMatrix() == turn);
  EXPECT_TRUE(planar.IsConvex());
}
