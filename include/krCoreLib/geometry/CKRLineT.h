// CKRLineT, CKRRayT and CKRSegmentT: straight pieces of dimension N = 2, 3
// or 4, each an origin and a direction.
//
// Built from two points p1, p2 they hold origin = p1 and direction = p2 - p1,
// not normalised: a segment covers origin + t direction for t in [0, 1], a
// ray t >= 0, a line every t. A piece from two equal points has a zero
// direction; CKRDistanceT measures to its origin then.
//
// Comparison: == and != compare origin and direction bit by bit; < holds
// only when the origin is less and the direction is less, each by the
// byte-image order of the tuples (a strict weak order only on pieces that
// differ in both). A line never compares with a ray or a segment.
// CKRRay2T, CKRRay3T and CKRRay4T add nothing but constructors and
// assignment. Plain values; everything is inline and never allocates.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/math/CKRPointT.h>
#include <krCoreLib/math/CKRVectorT.h>

// What lines, rays and segments share; Derived is the piece itself, so that
// the comparisons take only pieces of the same kind.
template <class Derived, int N, class Real, class Other>
class CKRDirectedPieceT {
public:
  using Math = CKRMathT<Real, Other>;
  using Point = CKRPointT<N, Real, Other>;
  using Vector = CKRVectorT<N, Real, Other>;

  // Origin and direction at zero.
  CKRDirectedPieceT() noexcept : m_Origin(Point::ZERO()), m_Direction(Vector::ZERO()) {}
  CKRDirectedPieceT(const Point& p1, const Point& p2) noexcept : m_Origin(p1), m_Direction(p2 - p1) {}
  CKRDirectedPieceT(const CKRDirectedPieceT&) noexcept = default;
  CKRDirectedPieceT& operator=(const CKRDirectedPieceT&) noexcept = default;

  // As the constructor: origin = p1, direction = p2 - p1.
  void Set(const Point& p1, const Point& p2) noexcept {
    m_Origin = p1;
    m_Direction = p2 - p1;
  }
  const Point& Origin() const noexcept { return m_Origin; }
  Point& Origin() noexcept { return m_Origin; }
  const Vector& Direction() const noexcept { return m_Direction; }
  Vector& Direction() noexcept { return m_Direction; }

  bool operator==(const Derived& o) const noexcept {
    return m_Origin == o.m_Origin && m_Direction == o.m_Direction;
  }
  bool operator!=(const Derived& o) const noexcept { return !(*this == o); }
  bool operator<(const Derived& o) const noexcept { return m_Origin < o.m_Origin && m_Direction < o.m_Direction; }
  // Origin and direction equal after rounding to `decimals` places.
  bool Approx_Equal(const Derived& o, int decimals) const {
    return m_Origin.Approx_Equal(o.m_Origin, decimals) && m_Direction.Approx_Equal(o.m_Direction, decimals);
  }

protected:
  ~CKRDirectedPieceT() = default;

  Point m_Origin;
  Vector m_Direction;
};

// Every point origin + t direction.
template <int N, class Real, class Other>
class CKRLineT : public CKRDirectedPieceT<CKRLineT<N, Real, Other>, N, Real, Other> {
  using Base = CKRDirectedPieceT<CKRLineT, N, Real, Other>;

public:
  using typename Base::Point;
  using Base::Base;
  CKRLineT() noexcept = default;
};

// The points origin + t direction with t >= 0.
template <int N, class Real, class Other>
class CKRRayT : public CKRDirectedPieceT<CKRRayT<N, Real, Other>, N, Real, Other> {
  using Base = CKRDirectedPieceT<CKRRayT, N, Real, Other>;

public:
  using typename Base::Point;
  using Base::Base;
  CKRRayT() noexcept = default;
};

// The points origin + t direction with t in [0, 1].
template <int N, class Real, class Other>
class CKRSegmentT : public CKRDirectedPieceT<CKRSegmentT<N, Real, Other>, N, Real, Other> {
  using Base = CKRDirectedPieceT<CKRSegmentT, N, Real, Other>;

public:
  using typename Base::Point;
  using Base::Base;
  CKRSegmentT() noexcept = default;

  // The two end points: origin, and origin + direction.
  Point Point1() const noexcept { return this->m_Origin; }
  Point Point2() const noexcept { return this->m_Origin + this->m_Direction; }
};

#define KR_NAMED_RAY(Name, Dimension)                                               \
  template <class Real, class Other>                                                \
  class Name : public CKRRayT<Dimension, Real, Other> {                             \
    using Base = CKRRayT<Dimension, Real, Other>;                                   \
                                                                                    \
  public:                                                                           \
    using typename Base::Point;                                                     \
    Name() noexcept = default;                                                      \
    Name(const Base& r) noexcept : Base(r) {}                                       \
    Name(const Point& p1, const Point& p2) noexcept : Base(p1, p2) {}               \
    Name& operator=(const Base& r) noexcept {                                       \
      Base::operator=(r);                                                           \
      return *this;                                                                 \
    }                                                                               \
  }
KR_NAMED_RAY(CKRRay2T, 2);
KR_NAMED_RAY(CKRRay3T, 3);
KR_NAMED_RAY(CKRRay4T, 4);
#undef KR_NAMED_RAY

#define KR_LINE_INSTANCES(Pair)                                                 \
  extern template class KRCORELIB_API CKRLineT<2, Pair>;                        \
  extern template class KRCORELIB_API CKRLineT<3, Pair>;                        \
  extern template class KRCORELIB_API CKRLineT<4, Pair>;                        \
  extern template class KRCORELIB_API CKRRayT<2, Pair>;                         \
  extern template class KRCORELIB_API CKRRayT<3, Pair>;                         \
  extern template class KRCORELIB_API CKRRayT<4, Pair>;                         \
  extern template class KRCORELIB_API CKRSegmentT<2, Pair>;                     \
  extern template class KRCORELIB_API CKRSegmentT<3, Pair>;                     \
  extern template class KRCORELIB_API CKRSegmentT<4, Pair>;                     \
  extern template class KRCORELIB_API CKRRay2T<Pair>;                           \
  extern template class KRCORELIB_API CKRRay3T<Pair>;                           \
  extern template class KRCORELIB_API CKRRay4T<Pair>
#define KR_PAIR_FLOAT float, double
#define KR_PAIR_DOUBLE double, float
KR_LINE_INSTANCES(KR_PAIR_FLOAT);
KR_LINE_INSTANCES(KR_PAIR_DOUBLE);
#undef KR_PAIR_FLOAT
#undef KR_PAIR_DOUBLE
#undef KR_LINE_INSTANCES
