// CKRMathT: angles, points and lines, circles, arcs, polygons and nearest
// points in the x-y plane, in both precision pairs.
#include <krCoreLib/math/CKRMathT.h>
#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint4T.h>

#include "KRMathTestTypes.h"
#include "KRTestSeed.h"

#include <cmath>
#include <limits>
#include <numbers>
#include <random>
#include <vector>

template <class Pair>
class CKRMathTPlaneTest : public ::testing::Test {
protected:
  using TReal = typename Pair::Real;
  using TM = CKRMathT<TReal, typename Pair::Other>;
  using TP4 = CKRPoint4T<TReal, typename Pair::Other>;
  using TP2 = CKRPoint2T<TReal, typename Pair::Other>;

  static TP4 Pt(double x, double y, double z = 0) { return TP4(TReal(x), TReal(y), TReal(z), TReal(1)); }
  static constexpr TReal kNaN = std::numeric_limits<TReal>::quiet_NaN();
  static constexpr TReal kInf = std::numeric_limits<TReal>::infinity();
  // Outputs that must stay unwritten start with this value.
  static constexpr TReal kUnwritten = TReal(42);
  // Distance between two angles around the circle.
  static double AngleGap(double a, double b) {
    const double gap = std::remainder(a - b, 2 * std::numbers::pi);
    return std::fabs(gap);
  }
};
TYPED_TEST_SUITE(CKRMathTPlaneTest, KRPrecisionPairs, KRPrecisionPairNames);

TYPED_TEST(CKRMathTPlaneTest, NormalizeAngleReducesSnapsAndEnds) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  const struct {
    Real m_Angle;
    Real m_Expected;
  } rows[] = {
      {Real(-0.5e-6), Real(0)},   {M::TWO_PI, Real(0)},         {Real(2e6), Real(0)},
      {Real(-2e6), Real(0)},      {TestFixture::kNaN, Real(0)}, {TestFixture::kInf, Real(0)},
      {-TestFixture::kInf, Real(0)}, {Real(0.5), Real(0.5)}, {-M::HALF_PI, M::TWO_PI - M::HALF_PI},
      {std::numeric_limits<Real>::max(), Real(0)},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.m_Angle);
    EXPECT_EQ(M::NormalizeAngle(row.m_Angle), row.m_Expected);
  }
  // The longest reduction still ends.
  EXPECT_GE(M::NormalizeAngle(Real(-999999)), Real(0));

  std::mt19937 random(KRTestSeed());
  const double range = KRByPrecision<Real>(100, 1e4);
  const double tolerance = KRByPrecision<Real>(2e-4, 1e-8);
  std::uniform_real_distribution<double> angles(-range, range);
  for (int i = 0; i < 2000; ++i) {
    const Real a = Real(angles(random));
    SCOPED_TRACE(a);
    const Real reduced = M::NormalizeAngle(a);
    ASSERT_GE(reduced, Real(0));
    ASSERT_LT(reduced, M::TWO_PI);
    // Congruent modulo the (single-precision) TWO_PI, up to the snapping.
    const double gap = std::remainder(double(a) - double(reduced), double(M::TWO_PI));
    ASSERT_LE(std::fabs(gap), tolerance + 1e-6);
  }
}

TYPED_TEST(CKRMathTPlaneTest, GetAngleCoversTheFullCircle) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  EXPECT_EQ(M::GetAngle(Real(3), Real(4), Real(3), Real(4)), M::HALF_PI);
  EXPECT_EQ(M::GetAngle(Real(0), Real(0), Real(1), Real(0)), Real(0));
  EXPECT_EQ(M::GetAngle(Real(0), Real(0), Real(-1), Real(0)), M::PI);
  EXPECT_EQ(M::GetAngle(Real(0), Real(0), Real(0), Real(-2)), M::TWO_PI - M::HALF_PI);

  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> coordinate(-100, 100);
  for (int i = 0; i < 2000; ++i) {
    const auto p1 = TestFixture::Pt(coordinate(random), coordinate(random));
    const auto p2 = TestFixture::Pt(coordinate(random), coordinate(random));
    const Real angle = M::GetAngle(p1, p2);
    ASSERT_EQ(angle, M::GetAngle(p1.X(), p1.Y(), p2.X(), p2.Y()));
    ASSERT_GE(angle, Real(0));
    ASSERT_LE(angle, M::TWO_PI);
    const double expected = std::atan2(double(p2.Y()) - p1.Y(), double(p2.X()) - p1.X());
    ASSERT_LE(TestFixture::AngleGap(angle, expected), KRByPrecision<Real>(2e-6, 2e-7));
  }
}

TYPED_TEST(CKRMathTPlaneTest, AnglesBetweenThreePoints) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  const auto east = TestFixture::Pt(1, 0);
  const auto origin = TestFixture::Pt(0, 0);
  const auto north = TestFixture::Pt(0, 1);
  const auto far = TestFixture::Pt(-1, 0);
  EXPECT_EQ(M::GetRightAngle(east, origin, north), M::HALF_PI);
  EXPECT_EQ(M::GetLeftAngle(east, origin, north), M::TWO_PI - M::HALF_PI);
  // West then north is a right (clockwise) turn; straight on is none.
  EXPECT_NEAR(M::GetTurnAngle(east, origin, north), -M::HALF_PI, 1e-6);
  EXPECT_EQ(M::GetTurnAngle(north, origin, east), M::HALF_PI);
  EXPECT_EQ(M::GetTurnAngle(east, origin, far), Real(0));
  EXPECT_EQ(M::GetTurnAngle(Real(1), Real(0), Real(0), Real(0), Real(0), Real(1)), M::GetTurnAngle(east, origin, north));

  EXPECT_EQ(M::GetIncludedAngle(Real(1), Real(2)), Real(1));
  EXPECT_EQ(M::GetIncludedAngle(Real(2), Real(1)), Real(1) + M::TWO_PI - Real(2));
  EXPECT_EQ(M::GetIncludedAngle(Real(1), Real(1)), M::TWO_PI);

  // Straight segments head along the chord; arcs along their tangent at the
  // end point, in (-pi, pi].
  const double tolerance = KRByPrecision<Real>(1e-5, 1e-7);
  EXPECT_EQ(M::GetDirectionAngle(Real(0), Real(0), Real(0), Real(1), Real(1)), M::GetAngle(origin, TestFixture::Pt(1, 1)));
  EXPECT_NEAR(M::GetDirectionAngle(Real(0), Real(0), Real(0), Real(-1), Real(-1)), -0.75 * std::numbers::pi, tolerance);
  EXPECT_NEAR(M::GetDirectionAngle(origin, Real(1), TestFixture::Pt(2, 0)), std::numbers::pi / 2, tolerance);
  EXPECT_NEAR(M::GetDirectionAngle(origin, Real(-1), TestFixture::Pt(2, 0)), -std::numbers::pi / 2, tolerance);
  EXPECT_NEAR(M::GetDirectionAngle(origin, Real(0.5), TestFixture::Pt(2, 0)),
              2 * std::atan(0.5), tolerance);  // the tangent-chord angle of a bulge b is 2 atan(b)
  EXPECT_EQ(M::GetDirectionAngle(north, Real(0.5), north), M::HALF_PI);
}

TYPED_TEST(CKRMathTPlaneTest, ClassifyPointToLine) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  const struct {
    double m_X;
    double m_Y;
    int m_Code;
  } rows[] = {{1, 1, 0}, {1, -1, 1}, {-1, 0, 3}, {3, 0, 2}, {0, 0, 5}, {2, 0, 6}, {1, 0, 4}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.m_Code);
    const Real px = Real(row.m_X);
    const Real py = Real(row.m_Y);
    EXPECT_EQ(M::ClassifyPointToLine(px, py, Real(0), Real(0), Real(2), Real(0)), row.m_Code);
  }
}

TYPED_TEST(CKRMathTPlaneTest, ClassifyInfiniteLines) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  Real t = TestFixture::kUnwritten;
  EXPECT_EQ(M::ClassifyInfiniteLineToInfiniteLine(Real(0), Real(0), Real(2), Real(0), Real(1), Real(-1), Real(1),
                                                  Real(1), &t), 2);
  EXPECT_EQ(t, Real(0.5));
  t = TestFixture::kUnwritten;
  EXPECT_EQ(M::ClassifyInfiniteLineToInfiniteLine(Real(0), Real(0), Real(1), Real(0), Real(0), Real(1), Real(1),
                                                  Real(1), &t), 1);
  EXPECT_EQ(M::ClassifyInfiniteLineToInfiniteLine(Real(0), Real(0), Real(1), Real(0), Real(2), Real(0), Real(3),
                                                  Real(0), &t), 0);
  // Non-finite coordinates give no intersection and write nothing.
  EXPECT_EQ(M::ClassifyInfiniteLineToInfiniteLine(TestFixture::kNaN, Real(0), Real(1), Real(1), Real(0), Real(1),
                                                  Real(1), Real(0), &t), 1);
  EXPECT_EQ(M::ClassifyInfiniteLineToInfiniteLine(Real(0), Real(0), Real(1), Real(1), Real(0), TestFixture::kInf,
                                                  Real(1), Real(0), &t), 1);
  EXPECT_EQ(M::ClassifyInfiniteLineToInfiniteLine(Real(0), Real(0), Real(1), Real(1), Real(0), Real(1), Real(1),
                                                  Real(0), nullptr), 2);
  EXPECT_EQ(t, TestFixture::kUnwritten);
}

TYPED_TEST(CKRMathTPlaneTest, ClassifySegments) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  const struct {
    const char* m_pCase;
    double m_P[4];
    double m_Q[4];
    int m_Code;
    bool m_Written;
    double m_X;
    double m_Y;
  } rows[] = {
      {"crossing", {0, 0, 2, 2}, {0, 2, 2, 0}, 3, true, 1, 1},
      {"lines meet beyond P", {0, 0, 1, 1}, {3, 0, 3, 5}, 4, true, 3, 3},
      {"lines meet beyond Q", {0, 0, 4, 4}, {1, 0, 1, -5}, 4, true, 1, 1},
      {"parallel", {0, 0, 1, 0}, {0, 1, 1, 1}, 1, false, 0, 0},
      {"collinear overlap", {0, 0, 2, 0}, {1, 0, 3, 0}, 0, false, 0, 0},
      {"collinear apart", {0, 0, 1, 0}, {2, 0, 3, 0}, 0, false, 0, 0},
      {"identical", {0, 0, 1, 0}, {0, 0, 1, 0}, 0, false, 0, 0},
      {"collinear touching at P2", {0, 0, 1, 0}, {1, 0, 2, 0}, 3, true, 1, 0},
      {"collinear touching at P1", {0, 0, 1, 0}, {-1, 0, 0, 0}, 3, true, 0, 0},
      {"corner at P2", {0, 0, 1, 0}, {1, 0, 1, 1}, 3, true, 1, 0},
      {"corner at P1", {0, 0, 1, 0}, {0, 0, 0, 1}, 3, true, 0, 0},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.m_pCase);
    Real x = TestFixture::kUnwritten;
    Real y = TestFixture::kUnwritten;
    EXPECT_EQ(M::ClassifyLineToLine(Real(row.m_P[0]), Real(row.m_P[1]), Real(row.m_P[2]), Real(row.m_P[3]),
                                    Real(row.m_Q[0]), Real(row.m_Q[1]), Real(row.m_Q[2]), Real(row.m_Q[3]), &x, &y),
              row.m_Code);
    EXPECT_NEAR(x, row.m_Written ? row.m_X : double(TestFixture::kUnwritten), 1e-6);
    EXPECT_NEAR(y, row.m_Written ? row.m_Y : double(TestFixture::kUnwritten), 1e-6);
  }
}

TYPED_TEST(CKRMathTPlaneTest, CircleThroughThreePoints) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> coordinate(-50, 50);
  std::uniform_real_distribution<double> radius(0.5, 20);
  std::uniform_real_distribution<double> angle(0, 2 * std::numbers::pi);
  for (int i = 0; i < 500; ++i) {
    const double cx = coordinate(random);
    const double cy = coordinate(random);
    const double r = radius(random);
    double a[3];
    for (double& value : a)
      value = angle(random);
    if (TestFixture::AngleGap(a[0], a[1]) < 0.3 || TestFixture::AngleGap(a[1], a[2]) < 0.3 ||
        TestFixture::AngleGap(a[0], a[2]) < 0.3)
      continue;
    auto on = [&](int k) { return TestFixture::Pt(cx + r * std::cos(a[k]), cy + r * std::sin(a[k]), 7); };
    auto center = TestFixture::Pt(0, 0, 5);
    Real found = 0;
    ASSERT_EQ(M::Circle3Pts_to_CenterRadius(on(0), on(1), on(2), &center, &found), 1);
    // The single-precision pi in the bisector directions costs about 1e-7
    // of the radius even in double precision.
    const double tolerance = KRByPrecision<Real>(2e-3, 1e-6) * (r + std::fabs(cx) + std::fabs(cy));
    ASSERT_NEAR(center.X(), cx, tolerance);
    ASSERT_NEAR(center.Y(), cy, tolerance);
    ASSERT_NEAR(found, r, tolerance);
    ASSERT_EQ(center.Z(), Real(5));
    ASSERT_EQ(center.W(), Real(1));
  }
  // Collinear, coincident and non-finite points have no circle; nothing is
  // written.
  const Real inf = TestFixture::kInf;
  const Real rows[][6] = {{0, 0, 1, 1, 2, 2}, {0, 0, 0, 0, 1, 0}, {0, 0, 1, 0, 0, 0}, {0, 0, 1, 0, 1, 0},
                          {0, 0, 1, 5, -3, inf}, {inf, 0, 1, 5, -3, 2}};
  for (const auto& row : rows) {
    Real cx = TestFixture::kUnwritten;
    Real cy = TestFixture::kUnwritten;
    Real r = TestFixture::kUnwritten;
    EXPECT_EQ(M::Circle3Pts_to_CenterRadius(row[0], row[1], row[2], row[3], row[4], row[5], &cx, &cy, &r), 0);
    EXPECT_EQ(cx, TestFixture::kUnwritten);
    EXPECT_EQ(r, TestFixture::kUnwritten);
  }
  // Collinear points anywhere on the plane (a grid of 1/64 keeps them
  // exactly collinear in single precision as well).
  std::uniform_int_distribution<int> grid(-4000, 4000);
  std::uniform_int_distribution<int> step(-200, 200);
  std::uniform_int_distribution<int> multiple(1, 8);
  for (int i = 0; i < 500; ++i) {
    const double x = grid(random) / 64.0;
    const double y = grid(random) / 64.0;
    const double dx = step(random) / 64.0;
    const double dy = (step(random) | 1) / 64.0;
    const int s = multiple(random);
    const int t = -multiple(random);
    ASSERT_EQ(M::GetCircleCenter(TestFixture::Pt(x, y), TestFixture::Pt(x + s * dx, y + s * dy),
                                 TestFixture::Pt(x + t * dx, y + t * dy), nullptr), 0);
    ASSERT_EQ(M::GetCircleCenter(TestFixture::Pt(x + t * dx, y + t * dy), TestFixture::Pt(x, y),
                                 TestFixture::Pt(x + s * dx, y + s * dy), nullptr), 0);
  }
  Real cx = TestFixture::kUnwritten;
  EXPECT_EQ(M::GetCircleCenter(TestFixture::kNaN, Real(0), Real(1), Real(0), Real(0), Real(1), &cx, nullptr), 0);
  EXPECT_EQ(cx, TestFixture::kUnwritten);
}

// An arc from centre, radius, start and sweep to its three points and back,
// counter-clockwise and clockwise.
TYPED_TEST(CKRMathTPlaneTest, ArcConversionsRoundTrip) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  using P4 = typename TestFixture::TP4;
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> coordinate(-20, 20);
  std::uniform_real_distribution<double> radius(1, 10);
  std::uniform_real_distribution<double> angle(0, 2 * std::numbers::pi);
  std::uniform_real_distribution<double> sweep(0.2, 6);
  const double tolerance = KRByPrecision<Real>(2e-3, 1e-6);
  for (int i = 0; i < 500; ++i) {
    const double r = radius(random);
    const double start = angle(random);
    const double arc = (i % 2 ? 1 : -1) * sweep(random);
    const P4 center = TestFixture::Pt(coordinate(random), coordinate(random), 3);
    P4 s = P4::ZERO;
    P4 m = P4::ZERO;
    P4 e = P4::ZERO;
    ASSERT_EQ(M::ArcCenterRadiusStartAngleArcAngle_to_StartMiddleEnd(center, Real(r), Real(start), Real(arc), &s, &m,
                                                                     &e), 1);
    ASSERT_NEAR(s.X(), center.X() + r * std::cos(start), 1e-4);
    ASSERT_NEAR(e.Y(), center.Y() + r * std::sin(start + arc), 1e-4);

    P4 found = P4::ZERO;
    Real foundRadius = 0;
    Real foundStart = 0;
    Real foundSweep = 0;
    ASSERT_EQ(M::ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(s, m, e, &found, &foundRadius, &foundStart,
                                                                     &foundSweep), 1);
    const double scale = r + 20;
    ASSERT_NEAR(found.X(), center.X(), tolerance * scale);
    ASSERT_NEAR(foundRadius, r, tolerance * scale);
    ASSERT_LE(TestFixture::AngleGap(foundStart, start), tolerance * scale);
    ASSERT_NEAR(foundSweep, arc, tolerance * scale);

    Real from = 0;
    Real to = 0;
    ASSERT_EQ(M::ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(s, m, e, &found, &foundRadius, &from, &to),
              1);
    // Always counter-clockwise from `from` to `to`.
    ASSERT_LE(TestFixture::AngleGap(from, arc > 0 ? start : start + arc), tolerance * scale);
    ASSERT_LE(TestFixture::AngleGap(to, arc > 0 ? start + arc : start), tolerance * scale);
  }

  // Straight, nearly straight and coincident points make no arc.
  const double rows[][6] = {{0, 0, 1, 0, 2, 0}, {0, 0, 1, 0.005, 2, 0}, {0, 0, 0, 0, 1, 1}, {0, 0, 1, 1, 0, 0}};
  for (const auto& row : rows) {
    Real r = TestFixture::kUnwritten;
    EXPECT_EQ(M::ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(Real(row[0]), Real(row[1]), Real(row[2]),
                                                                     Real(row[3]), Real(row[4]), Real(row[5]), nullptr,
                                                                     nullptr, &r, nullptr, nullptr), 0);
    EXPECT_EQ(M::ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(Real(row[0]), Real(row[1]), Real(row[2]),
                                                                           Real(row[3]), Real(row[4]), Real(row[5]),
                                                                           nullptr, nullptr, &r, nullptr, nullptr), 0);
    EXPECT_EQ(r, TestFixture::kUnwritten);
  }
}

TYPED_TEST(CKRMathTPlaneTest, ArcFromStartDirectionAndEnd) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  using P4 = typename TestFixture::TP4;
  // Angles carry the single-precision pi (8.7e-8 off) in both precisions.
  const double tolerance = KRByPrecision<Real>(1e-5, 1e-6);
  // Heading east from the origin to (1, 1): a left quarter circle about (0, 1).
  P4 center = TestFixture::Pt(0, 0, 9);
  Real r = 0;
  Real start = 0;
  Real sweep = 0;
  ASSERT_EQ(M::ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(TestFixture::Pt(0, 0), Real(0),
                                                                      TestFixture::Pt(1, 1), &center, &r, &start,
                                                                      &sweep), 1);
  EXPECT_NEAR(center.X(), 0, tolerance);
  EXPECT_NEAR(center.Y(), 1, tolerance);
  EXPECT_EQ(center.Z(), Real(9));
  EXPECT_NEAR(r, 1, tolerance);
  EXPECT_NEAR(start, 1.5 * std::numbers::pi, tolerance);
  EXPECT_NEAR(sweep, std::numbers::pi / 2, tolerance);
  // To (1, -1): the right turn about (0, -1), clockwise.
  Real cx = 0;
  Real cy = 0;
  ASSERT_EQ(M::ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(Real(0), Real(0), Real(0), Real(1), Real(-1),
                                                                      &cx, &cy, &r, &start, &sweep), 1);
  EXPECT_NEAR(cy, -1, tolerance);
  EXPECT_NEAR(start, std::numbers::pi / 2, tolerance);
  EXPECT_NEAR(sweep, -std::numbers::pi / 2, tolerance);

  // Straight on, (nearly) back and coincident ends make no arc.
  const double rows[][3] = {{1, 1, std::numbers::pi / 4}, {-1, 0.0001, 0}, {0, 0, 1}};
  for (const auto& row : rows) {
    Real x = TestFixture::kUnwritten;
    EXPECT_EQ(M::ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(Real(0), Real(0), Real(row[2]), Real(row[0]),
                                                                        Real(row[1]), &x, nullptr, nullptr, nullptr,
                                                                        nullptr), 0);
    EXPECT_EQ(x, TestFixture::kUnwritten);
  }
}

TYPED_TEST(CKRMathTPlaneTest, PolygonAreaAndContainment) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  using P2 = typename TestFixture::TP2;
  using P4 = typename TestFixture::TP4;
  const P4 square[] = {TestFixture::Pt(0, 0), TestFixture::Pt(2, 0), TestFixture::Pt(2, 2), TestFixture::Pt(0, 2)};
  const P4 clockwise[] = {square[3], square[2], square[1], square[0]};
  EXPECT_EQ(M::GetPolygonArea(square, 4), Real(4));
  EXPECT_EQ(M::GetPolygonArea(clockwise, 4), Real(4));
  EXPECT_EQ(M::GetPolygonArea(square, 3), Real(2));
  EXPECT_EQ(M::GetPolygonArea(square, 2), Real(0));
  EXPECT_EQ(M::GetPolygonArea(nullptr, 4), Real(0));

  const P2 flat[] = {P2(Real(0), Real(0)), P2(Real(2), Real(0)), P2(Real(2), Real(2)), P2(Real(0), Real(2))};
  const struct {
    double m_X;
    double m_Y;
    int m_Expected;  // 1 inside, 0 outside, -1 on a vertical edge (the flag)
  } rows[] = {{1, 1, 1}, {3, 1, 0}, {-1, 1, 0}, {1, 3, 0}, {1.999, 0.5, 1}, {2, 1, -1}, {0, 1, -1}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.m_X);
    for (bool boundary : {false, true}) {
      const bool expected = row.m_Expected < 0 ? boundary : row.m_Expected == 1;
      EXPECT_EQ(M::PolygonContainsPoint(flat, 4, P2(Real(row.m_X), Real(row.m_Y)), boundary), expected);
      EXPECT_EQ(M::PolygonContainsPoint(square, 4, TestFixture::Pt(row.m_X, row.m_Y), boundary), expected);
    }
  }
  EXPECT_FALSE(M::PolygonContainsPoint(flat, 2, P2(Real(1), Real(0)), true));
  EXPECT_FALSE(M::PolygonContainsPoint(static_cast<const P2*>(nullptr), 4, P2(Real(1), Real(1)), true));

  // A regular polygon against the half-plane test of its edges.
  std::vector<P4> polygon;
  for (int i = 0; i < 7; ++i)
    polygon.push_back(TestFixture::Pt(5 * std::cos(i * 2 * std::numbers::pi / 7), 5 * std::sin(i * 2 * std::numbers::pi / 7)));
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> coordinate(-6, 6);
  for (int i = 0; i < 2000; ++i) {
    const P4 p = TestFixture::Pt(coordinate(random), coordinate(random));
    double nearest = 1e9;
    bool inside = true;
    for (int k = 0; k < 7; ++k) {
      const P4& a = polygon[k];
      const P4& b = polygon[(k + 1) % 7];
      const double side = (double(b.X()) - a.X()) * (double(p.Y()) - a.Y()) - (double(b.Y()) - a.Y()) * (double(p.X()) - a.X());
      inside = inside && side > 0;
      nearest = std::min(nearest, std::fabs(side));
    }
    if (nearest < 1e-3)
      continue;
    ASSERT_EQ(M::PolygonContainsPoint(polygon.data(), 7, p, false), inside);
  }
}

TYPED_TEST(CKRMathTPlaneTest, NearestPointsOnSegmentsAndPolylines) {
  using Real = typename TestFixture::TReal;
  using M = typename TestFixture::TM;
  using P4 = typename TestFixture::TP4;
  const P4 a = TestFixture::Pt(0, 0, 5);
  const P4 b = TestFixture::Pt(4, 0, 6);
  // Directions carry the single-precision pi (8.7e-8 off) in both precisions.
  const double tolerance = KRByPrecision<Real>(1e-5, 1e-6);
  P4 out = P4::ZERO;
  EXPECT_NEAR(M::GetNearestPointOnLine(a, b, TestFixture::Pt(2, 3), &out), 3, tolerance);
  EXPECT_NEAR(out.X(), 2, tolerance);
  EXPECT_EQ(out.Z(), Real(0));
  EXPECT_EQ(out.W(), Real(1));
  EXPECT_NEAR(M::GetNearestPointOnLine(a, b, TestFixture::Pt(-1, 1), &out), std::sqrt(2.0), tolerance);
  EXPECT_EQ(out, a);
  EXPECT_NEAR(M::GetNearestPointOnLine(a, b, TestFixture::Pt(6, 0), nullptr), 2, tolerance);

  Real dist = 0;
  EXPECT_EQ(M::GetNearestPoint(a, b, TestFixture::Pt(-1, 1), &out, &dist), -1);
  EXPECT_EQ(out, a);
  EXPECT_NEAR(dist, std::sqrt(2.0), tolerance);
  EXPECT_EQ(M::GetNearestPoint(a, b, TestFixture::Pt(5, 1), &out, &dist), 1);
  EXPECT_EQ(out, b);
  EXPECT_EQ(M::GetNearestPoint(a, b, TestFixture::Pt(1, 2), &out, &dist), 0);
  EXPECT_EQ(out, TestFixture::Pt(1, 0));
  EXPECT_EQ(dist, Real(2));
  // A segment of length 0 projects everything onto its point.
  EXPECT_EQ(M::GetNearestPoint(b, b, TestFixture::Pt(4, 3), &out, &dist), 0);
  EXPECT_EQ(out, TestFixture::Pt(4, 0));
  EXPECT_EQ(dist, Real(3));

  const P4 line[] = {TestFixture::Pt(0, 0), TestFixture::Pt(3, 0), TestFixture::Pt(3, 4)};
  EXPECT_EQ(M::GetPolylineLength(line, 3), Real(7));
  EXPECT_EQ(M::GetPolylineLength(line, 1), Real(0));
  Real along = 0;
  EXPECT_NEAR(M::GetNearestPointOnPolyline(line, 3, TestFixture::Pt(4, 2), &out, &along), 1, tolerance);
  EXPECT_NEAR(out.Y(), 2, tolerance);
  EXPECT_NEAR(along, 5, tolerance);
  EXPECT_NEAR(M::GetNearestPointOnPolyline(line, 3, TestFixture::Pt(1, -1), &out, &along), 1, tolerance);
  EXPECT_NEAR(along, 1, tolerance);
  // A tie keeps the first segment.
  EXPECT_NEAR(M::GetNearestPointOnPolyline(line, 3, TestFixture::Pt(4, -1), &out, &along), std::sqrt(2.0), tolerance);
  EXPECT_NEAR(along, 3, tolerance);
  out = TestFixture::Pt(8, 8, 8);
  along = TestFixture::kUnwritten;
  EXPECT_EQ(M::GetNearestPointOnPolyline(line, 1, TestFixture::Pt(4, -1), &out, &along), Real(0));
  EXPECT_EQ(out, P4::ZERO);
  EXPECT_EQ(along, Real(0));
}
