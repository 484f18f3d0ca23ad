// CKRMathT: polygons, polylines and nearest points in the x-y plane.
//
// Member definitions, included once by CKRMathT.cpp, which compiles both
// precision pairs.
#pragma once

#include "CKRMathTPlane.h"

namespace {

template <class Real, class Point>
bool CrossingTest(const Point* points, int n, const Point& p, bool boundary) {
  if (points == nullptr || n < 3)
    return false;
  const Real px = p[0];
  const Real py = p[1];
  bool inside = false;
  for (int i = 0, j = n - 1; i < n; j = i++) {
    const Real x1 = points[j][0];
    const Real y1 = points[j][1];
    const Real x2 = points[i][0];
    const Real y2 = points[i][1];
    if (x1 < px && x2 < px)
      continue;
    // The lower endpoint counts as on the line through p, the upper does not.
    if (!((y1 <= py && y2 > py) || (y2 <= py && y1 > py)))
      continue;
    const Real x = x1 == x2 ? x1 : x1 + (py - y1) * (x2 - x1) / (y2 - y1);
    if (x == px)
      return boundary;
    if (x > px)
      inside = !inside;
  }
  return inside;
}

}  // namespace

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetPolygonArea(const Point4* points, int n) {
  if (points == nullptr || n < 3)
    return Real(0);
  Real sum = Real(0);
  for (int i = 0; i < n; ++i) {
    const Point4& previous = points[i == 0 ? n - 1 : i - 1];
    const Point4& next = points[i == n - 1 ? 0 : i + 1];
    sum += points[i][0] * (previous[1] - next[1]);
  }
  return FAbs(Real(0.5) * sum);
}

template <class Real, class Other>
bool CKRMathT<Real, Other>::PolygonContainsPoint(const Point2* points, int n, const Point2& p, bool boundary) {
  return CrossingTest<Real>(points, n, p, boundary);
}

template <class Real, class Other>
bool CKRMathT<Real, Other>::PolygonContainsPoint(const Point4* points, int n, const Point4& p, bool boundary) {
  return CrossingTest<Real>(points, n, p, boundary);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetPolylineLength(const Point4* points, int n) {
  Real length = Real(0);
  if (points == nullptr)
    return length;
  for (int i = 1; i < n; ++i)
    length += PlaneDistance(points[i - 1][0], points[i - 1][1], points[i][0], points[i][1]);
  return length;
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetNearestPointOnLine(const Point4& a, const Point4& b, const Point4& p, Point4* out) {
  const Real direction = GetAngle(a, b);
  const Real ux = Cos(direction);
  const Real uy = Sin(direction);
  const Real t = (p[0] - a[0]) * ux + (p[1] - a[1]) * uy;
  const Real length = (b[0] - a[0]) * ux + (b[1] - a[1]) * uy;
  if (t < Real(0)) {
    if (out != nullptr)
      *out = a;
    return PlaneDistance(p[0], p[1], a[0], a[1]);
  }
  if (t > length) {
    if (out != nullptr)
      *out = b;
    return PlaneDistance(p[0], p[1], b[0], b[1]);
  }
  if (out != nullptr)
    *out = Point4(a[0] + t * ux, a[1] + t * uy, Real(0), Real(1));
  return FAbs((p[1] - a[1]) * ux - (p[0] - a[0]) * uy);
}

template <class Real, class Other>
Real CKRMathT<Real, Other>::GetNearestPointOnPolyline(const Point4* points, int n, const Point4& p, Point4* out,
                                                      Real* along) {
  if (points == nullptr || n < 2) {
    if (out != nullptr)
      *out = Point4::ZERO;
    Write(along, Real(0));
    return Real(0);
  }
  Real best = Real(0);
  Point4 nearest = Point4::ZERO;
  int segment = 1;
  for (int i = 1; i < n; ++i) {
    Point4 candidate;
    const Real distance = GetNearestPointOnLine(points[i - 1], points[i], p, &candidate);
    if (i == 1 || distance < best) {
      best = distance;
      nearest = candidate;
      segment = i;
    }
  }
  if (out != nullptr)
    *out = nearest;
  if (along != nullptr) {
    Real length = GetPolylineLength(points, segment);
    length += PlaneDistance(points[segment - 1][0], points[segment - 1][1], nearest[0], nearest[1]);
    *along = length;
  }
  return best;
}

template <class Real, class Other>
int CKRMathT<Real, Other>::GetNearestPoint(const Point4& a, const Point4& b, const Point4& p, Point4* out,
                                           Real* dist) {
  const Real dx = b[0] - a[0];
  const Real dy = b[1] - a[1];
  const Real squaredLength = dx * dx + dy * dy;
  const Real t = squaredLength > Real(0) ? ((p[0] - a[0]) * dx + (p[1] - a[1]) * dy) / squaredLength : Real(0);
  Point4 nearest;
  int code = 0;
  if (t < Real(0)) {
    nearest = a;
    code = -1;
  } else if (t > Real(1)) {
    nearest = b;
    code = 1;
  } else {
    nearest = Point4(a[0] + t * dx, a[1] + t * dy, Real(0), Real(1));
  }
  if (out != nullptr)
    *out = nearest;
  Write(dist, PlaneDistance(nearest[0], nearest[1], p[0], p[1]));
  return code;
}
