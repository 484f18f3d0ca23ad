// CKRMathT: angles, lines and circles in the x-y plane, and the helpers of
// the arc and polygon functions (CKRMathTArcs.h, CKRMathTPolygons.h).
//
// Member definitions, included once by CKRMathT.cpp, which compiles both
// precision pairs. The decimal tolerances below are compared in double
// precision in both instantiations (a float operand is widened exactly), so
// that single precision does not round 1.00000001 to 1 and change which
// side of a bound a value falls on.
#pragma once

#include <krCoreLib/math/CKRMathT.h>
#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint4T.h>

#include <limits>

namespace {

// |a| beyond this is not reduced by NormalizeAngle (it gives 0).
constexpr double kAngleLimit = 1e6;
// Angles within this of 0 or 2 pi snap to 0.
constexpr double kAngleSnap = 1e-6;
// Determinants of two line directions below this count as parallel.
constexpr double kParallelLimit = 1e-10;
// Parameters of an intersection within [kSegmentLow, kSegmentHigh] lie on
// the segment.
constexpr double kSegmentLow = -1e-8;
constexpr double kSegmentHigh = 1.00000001;
// Length of the perpendicular bisectors whose intersection is a circle's
// centre (only their directions matter).
constexpr double kBisectorLength = 100.0;
// Arcs turning less than this (radians) count as straight.
constexpr double kArcLimit = 0.001;
// Three points are collinear when the sine of the angle at the first is
// within this many units in the last place of 0 (the rounding of the
// products that form it).
constexpr int kCollinearUlps = 16;

template <class Real>
void Write(Real* target, Real value) {
  if (target != nullptr)
    *target = value;
}

// Sets x and y of a point, keeps its z and sets w to 1.
template <class Point, class Real>
void WritePoint(Point* point, Real x, Real y) {
  if (point != nullptr) {
    (*point)[0] = x;
    (*point)[1] = y;
    (*point)[3] = Real(1);
  }
}

template <class Real>
Real PlaneDistance(Real x1, Real y1, Real x2, Real y2) {
  return std::sqrt((x2 - x1) * (x2 - x1) + (y2 - y1) * (y2 - y1));
}

}  // namespace

// ---- angles ----

template <class Real, class Other>
Real CKRMathT<Real, Other>::NormalizeAngle(Real a) {
  // Reducing 1e6 takes 160,000 steps and leaves mostly rounding error; a NaN
  // has no direction. Both give 0.
  if (!(a >= Real(-kAngleLimit) && a <= Real(kAngleLimit)))
    return Real(0);
  while (a < Real(0))
    a += TWO_PI;
  while (a > TWO_PI)
    a -= TWO_PI;
  if (double(a) < kAngleSnap || double(a) > double(TWO_PI) - kAngleSnap)
    return Real(0);
  return a;
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetAngle(Real x1, Real y1, Real x2, Real y2) {
  const Real dx = x2 - x1;
  const Real dy = y2 - y1;
  if (dx == Real(0))
    return dy >= Real(0) ? HALF_PI : TWO_PI - HALF_PI;
  Real a = ATan(dy / dx);
  if (dx < Real(0))
    a += dy >= Real(0) ? PI : -PI;
  if (a < Real(0))
    a += TWO_PI;
  return a;
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetAngle(const Point4& p1, const Point4& p2) {
  return GetAngle(p1[0], p1[1], p2[0], p2[1]);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetRightAngle(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3) {
  Real a = GetAngle(x2, y2, x3, y3) - GetAngle(x2, y2, x1, y1);
  if (a < Real(0))
    a += TWO_PI;
  return a;
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetRightAngle(const Point4& p1, const Point4& p2, const Point4& p3) {
  return GetRightAngle(p1[0], p1[1], p2[0], p2[1], p3[0], p3[1]);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetLeftAngle(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3) {
  // The angle on the left of 1-2-3 is the one on the right of 3-2-1.
  return GetRightAngle(x3, y3, x2, y2, x1, y1);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetLeftAngle(const Point4& p1, const Point4& p2, const Point4& p3) {
  return GetLeftAngle(p1[0], p1[1], p2[0], p2[1], p3[0], p3[1]);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetTurnAngle(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3) {
  return PI - GetLeftAngle(x1, y1, x2, y2, x3, y3);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetTurnAngle(const Point4& p1, const Point4& p2, const Point4& p3) {
  return GetTurnAngle(p1[0], p1[1], p2[0], p2[1], p3[0], p3[1]);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetIncludedAngle(Real a1, Real a2) {
  return a2 > a1 ? a2 - a1 : a2 + TWO_PI - a1;
}

// The arc's bulge point lies on the perpendicular bisector of the chord, on
// the right of the chord for a positive factor; the heading at point 2 is
// the tangent of the circle through point 1, the bulge point and point 2.
template <class Real, class Other>
Real CKRMathT<Real, Other>::GetDirectionAngle(Real x1, Real y1, Real factor, Real x2, Real y2) {
  const Real chord = GetAngle(x1, y1, x2, y2);
  Real heading = chord;
  if (factor != Real(0)) {
    const Real offset = PlaneDistance(x1, y1, x2, y2) / Real(2) * factor;
    const Real bx = (x1 + x2) / Real(2) + offset * Cos(chord - HALF_PI);
    const Real by = (y1 + y2) / Real(2) + offset * Sin(chord - HALF_PI);
    Real cx = 0;
    Real cy = 0;
    if (GetCircleCenter(x1, y1, bx, by, x2, y2, &cx, &cy)) {
      const Real radial = GetAngle(cx, cy, x2, y2);
      heading = NormalizeAngle(factor > Real(0) ? radial + HALF_PI : radial - HALF_PI);
    }
  }
  if (heading > PI)
    heading -= TWO_PI;
  return heading;
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetDirectionAngle(const Point4& p1, Real factor, const Point4& p2) {
  return GetDirectionAngle(p1[0], p1[1], factor, p2[0], p2[1]);
}

// ---- points and lines ----

template <class Real, class Other>
int CKRMathT<Real, Other>::ClassifyPointToLine(const Real& px, const Real& py, const Real& ax, const Real& ay,
                                               const Real& bx, const Real& by) {
  const Real s = (py - ay) * (bx - ax) - (px - ax) * (by - ay);
  if (s > Real(0))
    return 0;
  if (s < Real(0))
    return 1;
  if ((px - ax) * (bx - ax) < Real(0) || (py - ay) * (by - ay) < Real(0))
    return 3;
  if (PlaneDistance(ax, ay, px, py) > PlaneDistance(ax, ay, bx, by))
    return 2;
  if (px == ax && py == ay)
    return 5;
  if (px == bx && py == by)
    return 6;
  return 4;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ClassifyInfiniteLineToInfiniteLine(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3,
                                                              Real x4, Real y4, Real* t) {
  const Real d = (x2 - x1) * (y4 - y3) - (y2 - y1) * (x4 - x3);
  // Every coordinate enters d, so a NaN or infinite one makes it non-finite.
  if (!std::isfinite(d))
    return 1;
  if (double(d) > -kParallelLimit && double(d) < kParallelLimit) {
    const int side = ClassifyPointToLine(x1, y1, x3, y3, x4, y4);
    return side == 0 || side == 1 ? 1 : 0;
  }
  const Real parameter = -((x3 - x4) * (y1 - y3) + (y4 - y3) * (x1 - x3)) / d;
  if (!std::isfinite(parameter))
    return 1;
  Write(t, parameter);
  return 2;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ClassifyLineToLine(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3, Real x4,
                                              Real y4, Real* x, Real* y) {
  Real t = Real(0);
  const int lines = ClassifyInfiniteLineToInfiniteLine(x3, y3, x4, y4, x1, y1, x2, y2, &t);
  if (lines == 1)
    return 1;
  if (lines == 0) {
    const bool q1IsP1 = x3 == x1 && y3 == y1;
    const bool q2IsP1 = x4 == x1 && y4 == y1;
    const bool q1IsP2 = x3 == x2 && y3 == y2;
    const bool q2IsP2 = x4 == x2 && y4 == y2;
    if (q1IsP1 && q2IsP2)
      return 0;
    if (q1IsP1 || q2IsP1) {
      Write(x, x1);
      Write(y, y1);
      return 3;
    }
    if (q1IsP2 || q2IsP2) {
      Write(x, x2);
      Write(y, y2);
      return 3;
    }
    return 0;
  }
  Write(x, x3 + t * (x4 - x3));
  Write(y, y3 + t * (y4 - y3));
  if (double(t) < kSegmentLow || double(t) > kSegmentHigh)
    return 4;
  Real u = Real(0);
  if (ClassifyInfiniteLineToInfiniteLine(x1, y1, x2, y2, x3, y3, x4, y4, &u) != 2)
    return 4;
  if (double(u) < kSegmentLow || double(u) >= kSegmentHigh)
    return 4;
  return 3;
}

// ---- circles ----

template <class Real, class Other>
int CKRMathT<Real, Other>::GetCircleCenter(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3, Real* cx,
                                           Real* cy) {
  // Coincident points give no circle (the bisector of a point with itself
  // has no direction), and neither do collinear ones: their bisectors are
  // parallel, but the single-precision pi in the bisector directions turns
  // them by about 1e-7, far more than the parallel test tolerates, so the
  // collinearity is tested on the points themselves.
  if ((x1 == x2 && y1 == y2) || (x2 == x3 && y2 == y3) || (x1 == x3 && y1 == y3))
    return 0;
  const Real cross = (x2 - x1) * (y3 - y1) - (y2 - y1) * (x3 - x1);
  if (FAbs(cross) <= Real(kCollinearUlps) * std::numeric_limits<Real>::epsilon() *
                         PlaneDistance(x1, y1, x2, y2) * PlaneDistance(x1, y1, x3, y3))
    return 0;
  const Real length = Real(kBisectorLength);
  const Real mx1 = (x1 + x2) / Real(2);
  const Real my1 = (y1 + y2) / Real(2);
  const Real a1 = GetAngle(x1, y1, x2, y2) + HALF_PI;
  const Real mx2 = (x2 + x3) / Real(2);
  const Real my2 = (y2 + y3) / Real(2);
  const Real a2 = GetAngle(x3, y3, x2, y2) + HALF_PI;
  Real x = Real(0);
  Real y = Real(0);
  const int code = ClassifyLineToLine(mx1, my1, mx1 + length * Cos(a1), my1 + length * Sin(a1), mx2, my2,
                                      mx2 + length * Cos(a2), my2 + length * Sin(a2), &x, &y);
  if (code != 3 && code != 4)
    return 0;
  Write(cx, x);
  Write(cy, y);
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::GetCircleCenter(const Point4& p1, const Point4& p2, const Point4& p3, Point4* center) {
  Real x = 0;
  Real y = 0;
  if (!GetCircleCenter(p1[0], p1[1], p2[0], p2[1], p3[0], p3[1], &x, &y))
    return 0;
  WritePoint(center, x, y);
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::Circle3Pts_to_CenterRadius(Real x1, Real y1, Real x2, Real y2, Real x3, Real y3, Real* cx,
                                                      Real* cy, Real* r) {
  Real x = 0;
  Real y = 0;
  if (!GetCircleCenter(x1, y1, x2, y2, x3, y3, &x, &y))
    return 0;
  Write(cx, x);
  Write(cy, y);
  Write(r, PlaneDistance(x, y, x2, y2));
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::Circle3Pts_to_CenterRadius(const Point4& p1, const Point4& p2, const Point4& p3,
                                                      Point4* center, Real* r) {
  Real x = 0;
  Real y = 0;
  if (!Circle3Pts_to_CenterRadius(p1[0], p1[1], p2[0], p2[1], p3[0], p3[1], &x, &y, r))
    return 0;
  WritePoint(center, x, y);
  return 1;
}
