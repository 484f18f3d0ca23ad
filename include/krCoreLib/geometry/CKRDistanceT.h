// CKRDistanceT: distances from a point to a segment, a ray or a line of
// dimension N = 2, 3 or 4 (static functions only).
//
// Each SqrDistance returns the squared distance and, when `t` is not null,
// writes the parameter of the nearest point origin + t direction: clamped
// to [0, 1] for a segment and to t >= 0 for a ray, unclamped for a line.
// Distance is the square root of the matching SqrDistance.
//
// A piece with a zero direction (built from two equal points) measures to
// its origin with t = 0, for lines too (their parameter would be 0 / 0).
// NaN coordinates give NaN distances. Pure functions: callable from any
// thread.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/geometry/CKRLineT.h>

template <int N, class Real, class Other>
class CKRDistanceT {
public:
  using Math = CKRMathT<Real, Other>;
  using Point = CKRPointT<N, Real, Other>;
  using Vector = CKRVectorT<N, Real, Other>;
  using Line = CKRLineT<N, Real, Other>;
  using Ray = CKRRayT<N, Real, Other>;
  using Segment = CKRSegmentT<N, Real, Other>;

  static Real SqrDistance(const Point& p, const Segment& segment, Real* t = nullptr) noexcept {
    Vector d = p - segment.Origin();
    const Vector& direction = segment.Direction();
    const Real s = d.Dot(direction);
    const Real length2 = direction.SquaredLength();
    Real parameter = Real(0);
    if (s <= Real(0)) {
      parameter = Real(0);
    } else if (s >= length2) {
      parameter = Real(1);
      d -= direction;
    } else {
      parameter = s / length2;
      d -= direction * parameter;
    }
    if (t != nullptr)
      *t = parameter;
    return d.SquaredLength();
  }
  static Real SqrDistance(const Point& p, const Ray& ray, Real* t = nullptr) noexcept {
    Vector d = p - ray.Origin();
    const Real s = d.Dot(ray.Direction());
    Real parameter = Real(0);
    // s > 0 implies a direction that is not zero.
    if (s > Real(0)) {
      parameter = s / ray.Direction().SquaredLength();
      d -= ray.Direction() * parameter;
    }
    if (t != nullptr)
      *t = parameter;
    return d.SquaredLength();
  }
  static Real SqrDistance(const Point& p, const Line& line, Real* t = nullptr) noexcept {
    Vector d = p - line.Origin();
    const Real length2 = line.Direction().SquaredLength();
    Real parameter = Real(0);
    if (length2 > Real(0)) {
      parameter = d.Dot(line.Direction()) / length2;
      d -= line.Direction() * parameter;
    }
    if (t != nullptr)
      *t = parameter;
    return d.SquaredLength();
  }

  static Real Distance(const Point& p, const Segment& segment, Real* t = nullptr) noexcept {
    return Math::Sqrt(SqrDistance(p, segment, t));
  }
  static Real Distance(const Point& p, const Ray& ray, Real* t = nullptr) noexcept {
    return Math::Sqrt(SqrDistance(p, ray, t));
  }
  static Real Distance(const Point& p, const Line& line, Real* t = nullptr) noexcept {
    return Math::Sqrt(SqrDistance(p, line, t));
  }
};

extern template class KRCORELIB_API CKRDistanceT<2, float, double>;
extern template class KRCORELIB_API CKRDistanceT<3, float, double>;
extern template class KRCORELIB_API CKRDistanceT<4, float, double>;
extern template class KRCORELIB_API CKRDistanceT<2, double, float>;
extern template class KRCORELIB_API CKRDistanceT<3, double, float>;
extern template class KRCORELIB_API CKRDistanceT<4, double, float>;
