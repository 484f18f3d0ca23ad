// CKRMathT: angles, points and lines, circles, arcs, polygons and nearest
// points in the x-y plane, in both precision pairs.
#include "KRMathTestTypes.h"

template <class Pair>
class CKRMathTPlaneTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  static CKRPoint4T<TReal, typename Pair::Other> Pt(double x, double y, double z = 0) {
    return CKRPoint4T<TReal, typename Pair::Other>(TReal(x), TReal(y), TReal(z), TReal(1));
  }
  static constexpr TReal kNaN = std::numeric_limits<TReal>::quiet_NaN();
  static constexpr TReal kInf = std::numeric_limits<TReal>::infinity();
  // Outputs that must stay unwritten start with this value.
  static constexpr TReal kUnwritten = TReal(42);
  // Distance between two angles around the circle.
  static double AngleGap(double a, double b) { return std::fabs(std::remainder(a - b, 2 * std::numbers::pi)); }
};
TYPED_TEST_SUITE(CKRMathTPlaneTest, KRPrecisionPairs, KRPrecisionPairNames);

TYPED_TEST(CKRMathTPlaneTest, NormalizeAngleReducesSnapsAndEnds) {
  KR_MATH_TEST_TYPES;
  const Real inf = TestFixture::kInf;
  const Real rows[][2] = {{Real(-0.5e-6), 0}, {M::TWO_PI, 0}, {Real(2e6), 0}, {Real(-2e6), 0},
                          {std::numeric_limits<Real>::max(), 0}, {TestFixture::kNaN, 0}, {inf, 0}, {-inf, 0},
                          {Real(0.5), Real(0.5)}, {-M::HALF_PI, M::TWO_PI - M::HALF_PI}};
  for (const auto& row : rows)
    EXPECT_EQ(M::NormalizeAngle(row[0]), row[1]) << row[0];
  // The longest reduction still ends.
  EXPECT_GE(M::NormalizeAngle(Real(-999999)), Real(0));
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> angles(-KRByPrecision<Real>(100, 1e4), KRByPrecision<Real>(100, 1e4));
  for (int i = 0; i < 2000; ++i) {
    const Real a = Real(angles(random));
    const Real reduced = M::NormalizeAngle(a);
    ASSERT_GE(reduced, Real(0)) << a;
    ASSERT_LT(reduced, M::TWO_PI) << a;
    // Congruent modulo the (single-precision) TWO_PI, up to the snapping.
    const double gap = std::remainder(double(a) - double(reduced), double(M::TWO_PI));
    ASSERT_LE(std::fabs(gap), KRByPrecision<Real>(2e-4, 1e-8) + 1e-6) << a;
  }
}

TYPED_TEST(CKRMathTPlaneTest, AnglesOfPointsAndTurns) {
  KR_MATH_TEST_TYPES;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> coordinate(-100, 100);
  for (int i = 0; i < 2000; ++i) {
    const P4 p1 = TestFixture::Pt(coordinate(random), coordinate(random));
    const P4 p2 = TestFixture::Pt(coordinate(random), coordinate(random));
    const Real angle = M::GetAngle(p1, p2);
    ASSERT_EQ(angle, M::GetAngle(p1.X(), p1.Y(), p2.X(), p2.Y()));
    ASSERT_GE(angle, Real(0));
    ASSERT_LE(angle, M::TWO_PI);
    const double expected = std::atan2(double(p2.Y()) - p1.Y(), double(p2.X()) - p1.X());
    ASSERT_LE(TestFixture::AngleGap(angle, expected), KRByPrecision<Real>(2e-6, 2e-7));
  }
  // Coincident points give a quarter turn.
  EXPECT_EQ(M::GetAngle(Real(3), Real(4), Real(3), Real(4)), M::HALF_PI);
  const P4 east = TestFixture::Pt(1, 0);
  const P4 origin = TestFixture::Pt(0, 0);
  const P4 north = TestFixture::Pt(0, 1);
  EXPECT_EQ(M::GetRightAngle(east, origin, north), M::HALF_PI);
  // West then north is a right (clockwise) turn; straight on is none.
  EXPECT_NEAR(M::GetTurnAngle(east, origin, north), -M::HALF_PI, 1e-6);
  EXPECT_EQ(M::GetTurnAngle(north, origin, east), M::HALF_PI);
  EXPECT_EQ(M::GetTurnAngle(east, origin, TestFixture::Pt(-1, 0)), Real(0));
  EXPECT_EQ(M::GetIncludedAngle(Real(2), Real(1)), Real(1) + M::TWO_PI - Real(2));
  // Straight segments head along the chord; arcs along their tangent at the
  // end point (2 atan(bulge) off the chord), in (-pi, pi].
  const double tolerance = KRByPrecision<Real>(1e-5, 1e-7);
  EXPECT_NEAR(M::GetDirectionAngle(Real(0), Real(0), Real(0), Real(-1), Real(-1)), -0.75 * std::numbers::pi, tolerance);
  EXPECT_NEAR(M::GetDirectionAngle(origin, Real(-0.5), TestFixture::Pt(2, 0)), -2 * std::atan(0.5), tolerance);
  EXPECT_EQ(M::GetDirectionAngle(north, Real(0.5), north), M::HALF_PI);
}

TYPED_TEST(CKRMathTPlaneTest, ClassifyPointsAndLines) {
  KR_MATH_TEST_TYPES;
  const int pointCodes[][3] = {{1, 1, 0}, {1, -1, 1}, {-1, 0, 3}, {3, 0, 2}, {0, 0, 5}, {2, 0, 6}, {1, 0, 4}};
  for (const auto& row : pointCodes)
    EXPECT_EQ(M::ClassifyPointToLine(Real(row[0]), Real(row[1]), Real(0), Real(0), Real(2), Real(0)), row[2]);

  // Infinite lines: 2 and the parameter on the first if they cross, else 1
  // (parallel or not finite) or 0 (the same line), writing nothing.
  const Real nan = TestFixture::kNaN;
  const Real lines[][9] = {{0, 0, 2, 0, 1, -1, 1, 1, 2},   {0, 0, 1, 0, 0, 1, 1, 1, 1}, {0, 0, 1, 0, 2, 0, 3, 0, 0},
                           {nan, 0, 1, 1, 0, 1, 1, 0, 1}, {0, 0, 1, 1, 0, TestFixture::kInf, 1, 0, 1}};
  for (const auto& row : lines) {
    Real t = TestFixture::kUnwritten;
    EXPECT_EQ(M::ClassifyInfiniteLineToInfiniteLine(row[0], row[1], row[2], row[3], row[4], row[5], row[6], row[7], &t),
              int(row[8]));
    EXPECT_EQ(t, row[8] == 2 ? Real(0.5) : TestFixture::kUnwritten);
  }
  EXPECT_EQ(M::ClassifyInfiniteLineToInfiniteLine(Real(0), Real(0), Real(1), Real(1), Real(0), Real(1), Real(1),
                                                  Real(0), nullptr), 2);

  // Segments: 3 meeting (the point written), 4 only the lines meet, 1
  // parallel, 0 collinear (nothing written unless they touch end to end).
  const double segments[][11] = {
      {0, 0, 2, 2, 0, 2, 2, 0, 3, 1, 1},  {0, 0, 1, 1, 3, 0, 3, 5, 4, 3, 3},   {0, 0, 4, 4, 1, 0, 1, -5, 4, 1, 1},
      {0, 0, 1, 0, 0, 1, 1, 1, 1, 42, 42}, {0, 0, 2, 0, 1, 0, 3, 0, 0, 42, 42}, {0, 0, 1, 0, 2, 0, 3, 0, 0, 42, 42},
      {0, 0, 1, 0, 0, 0, 1, 0, 0, 42, 42}, {0, 0, 1, 0, 1, 0, 2, 0, 3, 1, 0},   {0, 0, 1, 0, -1, 0, 0, 0, 3, 0, 0},
      {0, 0, 1, 0, 1, 0, 1, 1, 3, 1, 0},   {0, 0, 1, 0, 0, 0, 0, 1, 3, 0, 0},
  };
  for (const auto& row : segments) {
    SCOPED_TRACE(testing::Message() << row[4] << "," << row[5] << " " << row[6] << "," << row[7]);
    Real x = TestFixture::kUnwritten;
    Real y = TestFixture::kUnwritten;
    EXPECT_EQ(M::ClassifyLineToLine(Real(row[0]), Real(row[1]), Real(row[2]), Real(row[3]), Real(row[4]), Real(row[5]),
                                    Real(row[6]), Real(row[7]), &x, &y), int(row[8]));
    EXPECT_NEAR(x, row[9], 1e-6);
    EXPECT_NEAR(y, row[10], 1e-6);
  }
}

TYPED_TEST(CKRMathTPlaneTest, CircleThroughThreePoints) {
  KR_MATH_TEST_TYPES;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> unit(0, 1);
  for (int i = 0; i < 500; ++i) {
    const double cx = 100 * unit(random) - 50;
    const double cy = 100 * unit(random) - 50;
    const double r = 0.5 + 19.5 * unit(random);
    // Three points at least 1 radian apart on the circle.
    const double base = 2 * std::numbers::pi * unit(random);
    auto on = [&](int k) {
      const double a = base + k * 2.1 + 0.5 * unit(random);
      return TestFixture::Pt(cx + r * std::cos(a), cy + r * std::sin(a), 7);
    };
    P4 center = TestFixture::Pt(0, 0, 5);
    Real found = 0;
    ASSERT_EQ(M::Circle3Pts_to_CenterRadius(on(0), on(1), on(2), &center, &found), 1);
    // The single-precision pi in the bisector directions costs about 1e-7
    // of the radius even in double precision.
    const double tolerance = KRByPrecision<Real>(2e-3, 1e-6) * (r + std::fabs(cx) + std::fabs(cy));
    ASSERT_NEAR(center.X(), cx, tolerance);
    ASSERT_NEAR(center.Y(), cy, tolerance);
    ASSERT_NEAR(found, r, tolerance);
    ASSERT_EQ(center, TestFixture::Pt(center.X(), center.Y(), 5));
  }
  // Collinear, coincident and non-finite points have no circle; nothing is
  // written.
  const Real inf = TestFixture::kInf;
  const Real rows[][6] = {{0, 0, 1, 1, 2, 2}, {0, 0, 0, 0, 1, 0}, {0, 0, 1, 0, 0, 0}, {0, 0, 1, 0, 1, 0},
                          {0, 0, 1, 5, -3, inf}, {inf, 0, 1, 5, -3, 2}, {TestFixture::kNaN, 0, 1, 0, 0, 1}};
  for (const auto& row : rows) {
    Real cx = TestFixture::kUnwritten;
    Real r = TestFixture::kUnwritten;
    EXPECT_EQ(M::Circle3Pts_to_CenterRadius(row[0], row[1], row[2], row[3], row[4], row[5], &cx, nullptr, &r), 0);
    EXPECT_EQ(M::GetCircleCenter(row[0], row[1], row[2], row[3], row[4], row[5], &cx, nullptr), 0);
    EXPECT_EQ(cx + r, 2 * TestFixture::kUnwritten);
  }
  // Collinear points anywhere on the plane, in any order (a grid of 1/64
  // keeps them exactly collinear in single precision as well).
  std::uniform_int_distribution<int> grid(-4000, 4000);
  for (int i = 0; i < 500; ++i) {
    const double x = grid(random) / 64.0;
    const double y = grid(random) / 64.0;
    const double dx = (grid(random) / 20) / 64.0;
    const double dy = ((grid(random) / 20) | 1) / 64.0;
    const P4 p[3] = {TestFixture::Pt(x, y), TestFixture::Pt(x + (1 + i % 8) * dx, y + (1 + i % 8) * dy),
                     TestFixture::Pt(x - (1 + i / 8 % 8) * dx, y - (1 + i / 8 % 8) * dy)};
    ASSERT_EQ(M::GetCircleCenter(p[0], p[1], p[2], nullptr), 0);
    ASSERT_EQ(M::GetCircleCenter(p[2], p[0], p[1], nullptr), 0);
  }
}

// An arc from centre, radius, start and sweep to its three points and back,
// counter-clockwise and clockwise, and from its start, heading and end.
TYPED_TEST(CKRMathTPlaneTest, ArcConversionsRoundTrip) {
  KR_MATH_TEST_TYPES;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> unit(0, 1);
  for (int i = 0; i < 500; ++i) {
    const double r = 1 + 9 * unit(random);
    const double start = 2 * std::numbers::pi * unit(random);
    const double arc = (i % 2 ? 1 : -1) * (0.2 + 5.8 * unit(random));
    const P4 center = TestFixture::Pt(40 * unit(random) - 20, 40 * unit(random) - 20, 3);
    P4 s, m, e, found;
    ASSERT_EQ(M::ArcCenterRadiusStartAngleArcAngle_to_StartMiddleEnd(center, Real(r), Real(start), Real(arc), &s, &m,
                                                                     &e), 1);
    ASSERT_NEAR(s.X(), center.X() + r * std::cos(start), 1e-4);
    ASSERT_NEAR(e.Y(), center.Y() + r * std::sin(start + arc), 1e-4);
    Real foundRadius = 0, foundStart = 0, foundSweep = 0, to = 0;
    ASSERT_EQ(M::ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(s, m, e, &found, &foundRadius, &foundStart,
                                                                     &foundSweep), 1);
    const double tolerance = KRByPrecision<Real>(2e-3, 1e-6) * (r + 20);
    ASSERT_NEAR(found.X(), center.X(), tolerance);
    ASSERT_NEAR(foundRadius, r, tolerance);
    ASSERT_LE(TestFixture::AngleGap(foundStart, start), tolerance);
    ASSERT_NEAR(foundSweep, arc, tolerance);
    // Always counter-clockwise from the start to the end angle.
    ASSERT_EQ(M::ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(s, m, e, &found, &foundRadius, &foundStart,
                                                                           &to), 1);
    ASSERT_LE(TestFixture::AngleGap(foundStart, arc > 0 ? start : start + arc), tolerance);
    ASSERT_LE(TestFixture::AngleGap(to, arc > 0 ? start + arc : start), tolerance);
    // From the start heading along the tangent, below a half circle.
    if (std::fabs(arc) > 3)
      continue;
    found = TestFixture::Pt(0, 0, 9);
    const Real heading = Real(start + (arc > 0 ? 1 : -1) * std::numbers::pi / 2);
    ASSERT_EQ(M::ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(s, heading, e, &found, &foundRadius,
                                                                        &foundStart, &foundSweep), 1);
    ASSERT_NEAR(found.Y(), center.Y(), tolerance);
    ASSERT_EQ(found.Z(), Real(9));
    ASSERT_NEAR(foundRadius, r, tolerance);
    ASSERT_LE(TestFixture::AngleGap(foundStart, start), tolerance);
    ASSERT_NEAR(foundSweep, arc, tolerance);
  }
  // Straight, nearly straight and coincident points make no arc.
  const Real rows[][6] = {{0, 0, 1, 0, 2, 0}, {0, 0, 1, Real(0.005), 2, 0}, {0, 0, 0, 0, 1, 1}, {0, 0, 1, 1, 0, 0}};
  for (const auto& row : rows) {
    Real r = TestFixture::kUnwritten;
    EXPECT_EQ(M::ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(row[0], row[1], row[2], row[3], row[4], row[5],
                                                                     nullptr, nullptr, &r, nullptr, nullptr), 0);
    EXPECT_EQ(M::ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(row[0], row[1], row[2], row[3], row[4],
                                                                           row[5], nullptr, nullptr, &r, nullptr,
                                                                           nullptr), 0);
    EXPECT_EQ(r, TestFixture::kUnwritten);
  }
  // Nor do straight on, (nearly) back and coincident ends from a heading.
  const double headings[][3] = {{1, 1, std::numbers::pi / 4}, {-1, 0.0001, 0}, {0, 0, 1}};
  for (const auto& row : headings) {
    Real x = TestFixture::kUnwritten;
    EXPECT_EQ(M::ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(Real(0), Real(0), Real(row[2]), Real(row[0]),
                                                                        Real(row[1]), &x, nullptr, nullptr, nullptr,
                                                                        nullptr), 0);
    EXPECT_EQ(x, TestFixture::kUnwritten);
  }
}

TYPED_TEST(CKRMathTPlaneTest, PolygonAreaAndContainment) {
  KR_MATH_TEST_TYPES;
  const P4 square[] = {TestFixture::Pt(0, 0), TestFixture::Pt(2, 0), TestFixture::Pt(2, 2), TestFixture::Pt(0, 2)};
  const P4 clockwise[] = {square[3], square[2], square[1], square[0]};
  EXPECT_EQ(M::GetPolygonArea(clockwise, 4), Real(4));
  EXPECT_EQ(M::GetPolygonArea(square, 3), Real(2));
  EXPECT_EQ(M::GetPolygonArea(square, 2), Real(0));
  EXPECT_EQ(M::GetPolygonArea(nullptr, 4), Real(0));
  const P2 flat[] = {P2(Real(0), Real(0)), P2(Real(2), Real(0)), P2(Real(2), Real(2)), P2(Real(0), Real(2))};
  // 1 inside, 0 outside, -1 on a vertical edge (inside with the flag).
  const double rows[][3] = {{1, 1, 1}, {3, 1, 0}, {-1, 1, 0}, {1, 3, 0}, {1.999, 0.5, 1}, {2, 1, -1}, {0, 1, -1}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row[0]);
    for (bool boundary : {false, true}) {
      const bool expected = row[2] < 0 ? boundary : row[2] == 1;
      EXPECT_EQ(M::PolygonContainsPoint(flat, 4, P2(Real(row[0]), Real(row[1])), boundary), expected);
      EXPECT_EQ(M::PolygonContainsPoint(square, 4, TestFixture::Pt(row[0], row[1]), boundary), expected);
    }
  }
  EXPECT_FALSE(M::PolygonContainsPoint(flat, 2, P2(Real(1), Real(0)), true));
  EXPECT_FALSE(M::PolygonContainsPoint(static_cast<const P2*>(nullptr), 4, P2(Real(1), Real(1)), true));
  // A regular heptagon of radius 5 (steps of 2 pi / 7) and its inscribed
  // circle (radius 4.5048).
  P4 heptagon[7];
  for (int i = 0; i < 7; ++i)
    heptagon[i] = TestFixture::Pt(5 * std::cos(i * 0.8975979010256552), 5 * std::sin(i * 0.8975979010256552));
  for (double r : {1.0, 2.5, 4.45, 5.05, 6.5})
    for (double a = 0; a < 6.28; a += 0.1)
      ASSERT_EQ(M::PolygonContainsPoint(heptagon, 7, TestFixture::Pt(r * std::cos(a), r * std::sin(a)), false), r < 4.5)
          << r << " at " << a;
}

TYPED_TEST(CKRMathTPlaneTest, NearestPointsOnSegmentsAndPolylines) {
  KR_MATH_TEST_TYPES;
  const P4 a = TestFixture::Pt(0, 0, 5);
  const P4 b = TestFixture::Pt(4, 0, 6);
  // Directions carry the single-precision pi (8.7e-8 off) in both precisions.
  const double tolerance = KRByPrecision<Real>(1e-5, 1e-6);
  P4 out = P4::ZERO;
  EXPECT_NEAR(M::GetNearestPointOnLine(a, b, TestFixture::Pt(2, 3), &out), 3, tolerance);
  EXPECT_TRUE(out.Approx_Equal(TestFixture::Pt(2, 0), 4));
  EXPECT_NEAR(M::GetNearestPointOnLine(a, b, TestFixture::Pt(-1, 1), &out), std::sqrt(2.0), tolerance);
  EXPECT_EQ(out, a);
  // -1 before the start, 1 past the end, else 0; a segment of length 0
  // projects everything onto its point.
  // The end points are returned as they are (z = 5), others with z = 0.
  const double rows[][8] = {{0, 4, -1, 1, -1, 0, 5, std::sqrt(2.0)}, {0, 4, 5, 1, 1, 4, 5, std::sqrt(2.0)},
                            {0, 4, 1, 2, 0, 1, 0, 2}, {4, 4, 4, 3, 0, 4, 0, 3}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row[2]);
    Real dist = 0;
    EXPECT_EQ(M::GetNearestPoint(TestFixture::Pt(row[0], 0, 5), TestFixture::Pt(row[1], 0, 5),
                                 TestFixture::Pt(row[2], row[3]), &out, &dist), int(row[4]));
    EXPECT_EQ(out, TestFixture::Pt(row[5], 0, row[6]));
    EXPECT_NEAR(dist, row[7], tolerance);
  }
  const P4 line[] = {TestFixture::Pt(0, 0), TestFixture::Pt(3, 0), TestFixture::Pt(3, 4)};
  EXPECT_EQ(M::GetPolylineLength(line, 3), Real(7));
  // Distance and length along; a tie keeps the first segment; a single
  // point is no polyline (all zero).
  const double polyRows[][5] = {{4, 2, 1, 5, 3}, {1, -1, 1, 1, 3}, {4, -1, std::sqrt(2.0), 3, 3}, {4, -1, 0, 0, 1}};
  for (const auto& row : polyRows) {
    Real along = TestFixture::kUnwritten;
    EXPECT_NEAR(M::GetNearestPointOnPolyline(line, int(row[4]), TestFixture::Pt(row[0], row[1]), &out, &along), row[2],
                tolerance);
    EXPECT_NEAR(along, row[3], tolerance);
  }
  EXPECT_EQ(out, P4::ZERO);
  EXPECT_EQ(M::GetPolylineLength(line, 1), Real(0));
}
