// CKRMathT: conversions between the forms of a circular arc in the x-y
// plane (centre, radius and angles; start, middle and end points; start,
// heading and end).
//
// Member definitions, included once by CKRMathT.cpp, which compiles both
// precision pairs.
#pragma once

#include "CKRMathTPlane.h"

template <class Real, class Other>
int CKRMathT<Real, Other>::ArcCenterRadiusStartAngleArcAngle_to_StartMiddleEnd(Real cx, Real cy, Real r, Real start,
                                                                               Real sweep, Real* sx, Real* sy,
                                                                               Real* mx, Real* my, Real* ex,
                                                                               Real* ey) {
  const Real middle = start + sweep / Real(2);
  const Real end = start + sweep;
  Write(sx, cx + r * Cos(start));
  Write(sy, cy + r * Sin(start));
  Write(mx, cx + r * Cos(middle));
  Write(my, cy + r * Sin(middle));
  Write(ex, cx + r * Cos(end));
  Write(ey, cy + r * Sin(end));
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ArcCenterRadiusStartAngleArcAngle_to_StartMiddleEnd(const Point4& center, Real r,
                                                                               Real start, Real sweep, Point4* s,
                                                                               Point4* m, Point4* e) {
  Real x[3] = {};
  Real y[3] = {};
  ArcCenterRadiusStartAngleArcAngle_to_StartMiddleEnd(center[0], center[1], r, start, sweep, &x[0], &y[0], &x[1],
                                                      &y[1], &x[2], &y[2]);
  WritePoint(s, x[0], y[0]);
  WritePoint(m, x[1], y[1]);
  WritePoint(e, x[2], y[2]);
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(Real sx, Real sy, Real dir,
                                                                                  Real ex, Real ey, Real* cx,
                                                                                  Real* cy, Real* r, Real* start,
                                                                                  Real* sweep) {
  if (sx == ex && sy == ey)
    return 0;
  Real chord = GetAngle(sx, sy, ex, ey);
  if (chord > PI)
    chord -= TWO_PI;
  // Half the arc's turn: the angle between the start heading and the chord.
  Real d = chord - dir;
  if (d < -PI)
    d += TWO_PI;
  if (d > PI)
    d -= TWO_PI;
  const double turn = std::fabs(double(d));
  if (!(turn > kArcLimit && turn < double(PI) - kArcLimit))
    return 0;
  const Real radius = PlaneDistance(sx, sy, ex, ey) / Real(2) / Sin(FAbs(d));
  const Real normal = d > Real(0) ? dir + HALF_PI : dir - HALF_PI;
  const Real x = sx + radius * Cos(normal);
  const Real y = sy + radius * Sin(normal);
  if (!std::isfinite(x) || !std::isfinite(y))
    return 0;
  Write(cx, x);
  Write(cy, y);
  Write(r, radius);
  Write(start, GetAngle(x, y, sx, sy));
  Write(sweep, Real(2) * d);
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(const Point4& s, Real dir,
                                                                                  const Point4& e, Point4* center,
                                                                                  Real* r, Real* start,
                                                                                  Real* sweep) {
  Real x = 0;
  Real y = 0;
  if (!ArcStartDirectionEnd_to_CenterRadiusStartAngleArcAngle(s[0], s[1], dir, e[0], e[1], &x, &y, r, start, sweep))
    return 0;
  WritePoint(center, x, y);
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(Real sx, Real sy, Real mx,
                                                                                     Real my, Real ex, Real ey,
                                                                                     Real* cx, Real* cy, Real* r,
                                                                                     Real* start, Real* end) {
  const Real a = GetLeftAngle(sx, sy, mx, my, ex, ey);
  if (a > PI - ONE_DEGREE && a < PI + ONE_DEGREE)
    return 0;
  if (double(a) < kArcLimit || double(a) > double(TWO_PI) - kArcLimit)
    return 0;
  Real x = 0;
  Real y = 0;
  if (!GetCircleCenter(sx, sy, mx, my, ex, ey, &x, &y))
    return 0;
  Real startAngle = GetAngle(x, y, sx, sy);
  Real endAngle = GetAngle(x, y, ex, ey);
  if (startAngle < Real(0))
    startAngle += TWO_PI;
  if (endAngle < Real(0))
    endAngle += TWO_PI;
  // S, M, E clockwise: exchange, so that the arc runs counter-clockwise.
  if ((mx - sx) * (ey - sy) - (ex - sx) * (my - sy) < Real(0))
    Swap(startAngle, endAngle);
  Write(cx, x);
  Write(cy, y);
  Write(r, PlaneDistance(x, y, mx, my));
  Write(start, startAngle);
  Write(end, endAngle);
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(const Point4& s,
                                                                                     const Point4& m,
                                                                                     const Point4& e,
                                                                                     Point4* center, Real* r,
                                                                                     Real* start, Real* end) {
  Real x = 0;
  Real y = 0;
  if (!ArcStartMiddleEnd_to_CenterRadiusStartArcAngleEndArcAngle(s[0], s[1], m[0], m[1], e[0], e[1], &x, &y, r,
                                                                 start, end))
    return 0;
  WritePoint(center, x, y);
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(Real sx, Real sy, Real mx, Real my,
                                                                               Real ex, Real ey, Real* cx, Real* cy,
                                                                               Real* r, Real* start, Real* sweep) {
  const Real a = GetLeftAngle(sx, sy, mx, my, ex, ey);
  if (a > PI - ONE_DEGREE && a < PI + ONE_DEGREE)
    return 0;
  if (a < ONE_DEGREE || a > TWO_PI - ONE_DEGREE)
    return 0;
  Real x = 0;
  Real y = 0;
  if (!GetCircleCenter(sx, sy, mx, my, ex, ey, &x, &y))
    return 0;
  Real arc = GetRightAngle(sx, sy, x, y, ex, ey);
  if ((mx - sx) * (ey - sy) - (ex - sx) * (my - sy) < Real(0))
    arc = -(TWO_PI - arc);
  Write(cx, x);
  Write(cy, y);
  Write(r, PlaneDistance(x, y, mx, my));
  Write(start, GetAngle(x, y, sx, sy));
  Write(sweep, arc);
  return 1;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(const Point4& s, const Point4& m,
                                                                               const Point4& e, Point4* center,
                                                                               Real* r, Real* start, Real* sweep) {
  Real x = 0;
  Real y = 0;
  if (!ArcStartMiddleEnd_to_CenterRadiusStartAngleArcAngle(s[0], s[1], m[0], m[1], e[0], e[1], &x, &y, r, start,
                                                           sweep))
    return 0;
  WritePoint(center, x, y);
  return 1;
}
