// CKRBoundT: the axis-aligned bounding box of dimension N = 2, 3 or 4.
//
// Two corners, max then min. The empty bound (what the default constructor
// makes) has max = -MAX_REAL and min = +MAX_REAL on every axis, so that the
// first Expand sets both corners to the point and Contains fails for every
// point. MAX_REAL is the single-precision maximum in both precision pairs,
// which keeps bounds of the two precisions interchangeable.
//
// Comparison: == and != compare both corners bit by bit; < orders by the
// length of the span (the empty bound has a negative span on every axis, so
// its length is the largest there is: infinite in single precision). There is
// no tolerance besides Approx_Equal.
//
// NaN coordinates never enter a bound: Expand keeps a corner unless the new
// coordinate is strictly beyond it. A point with a NaN coordinate is not
// contained.
//
// CKRBound2T, CKRBound3T and CKRBound4T add nothing but constructors and
// assignment. Plain values: distinct objects may be used from different
// threads. Everything is inline and never allocates.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/math/CKRPointT.h>
#include <krCoreLib/math/CKRVectorT.h>

template <int N, class Real, class Other>
class CKRBoundT {
public:
  using Math = CKRMathT<Real, Other>;
  using Point = CKRPointT<N, Real, Other>;
  using Vector = CKRVectorT<N, Real, Other>;

  // The empty bound.
  CKRBoundT() noexcept { MakeEmpty(); }
  // The smallest bound holding both points (in any order).
  CKRBoundT(const Point& p1, const Point& p2) noexcept {
    MakeEmpty();
    Expand(p1);
    Expand(p2);
  }
  CKRBoundT(const CKRBoundT&) noexcept = default;
  CKRBoundT& operator=(const CKRBoundT&) noexcept = default;

  // Back to the empty bound.
  void MakeEmpty() noexcept {
    for (int i = 0; i < N; ++i) {
      m_Max[i] = -Math::MAX_REAL;
      m_Min[i] = Math::MAX_REAL;
    }
  }
  // True when min > max on some axis (the default bound, or one built by
  // hand that way).
  bool IsEmpty() const noexcept {
    for (int i = 0; i < N; ++i)
      if (!(m_Min[i] <= m_Max[i]))
        return true;
    return false;
  }

  const Point& Max() const noexcept { return m_Max; }
  Point& Max() noexcept { return m_Max; }
  const Point& Min() const noexcept { return m_Min; }
  Point& Min() noexcept { return m_Min; }

  // Each max coordinate becomes the larger of itself and the point's, each
  // min coordinate the smaller.
  void Expand(const Point& p) noexcept {
    for (int i = 0; i < N; ++i) {
      if (p[i] > m_Max[i])
        m_Max[i] = p[i];
      if (p[i] < m_Min[i])
        m_Min[i] = p[i];
    }
  }
  // The same with the other bound's corners; an empty bound changes nothing.
  void Expand(const CKRBoundT& b) noexcept {
    for (int i = 0; i < N; ++i) {
      if (b.m_Max[i] > m_Max[i])
        m_Max[i] = b.m_Max[i];
      if (b.m_Min[i] < m_Min[i])
        m_Min[i] = b.m_Min[i];
    }
  }

  // min <= p <= max on every axis (inclusive); false for the empty bound.
  bool Contains(const Point& p) const noexcept {
    for (int i = 0; i < N; ++i)
      if (!(m_Min[i] <= p[i] && p[i] <= m_Max[i]))
        return false;
    return true;
  }
  // The other bound lies within this one on every axis (inclusive). The
  // empty bound, holding no point, lies within every bound.
  bool Contains(const CKRBoundT& b) const noexcept {
    for (int i = 0; i < N; ++i)
      if (!(m_Min[i] <= b.m_Min[i] && b.m_Max[i] <= m_Max[i]))
        return false;
    return true;
  }

  // max - min.
  Vector GetSpan() const noexcept { return m_Max - m_Min; }

  bool operator==(const CKRBoundT& b) const noexcept { return m_Max == b.m_Max && m_Min == b.m_Min; }
  bool operator!=(const CKRBoundT& b) const noexcept { return !(*this == b); }
  // The span of this bound is shorter than that of the other.
  bool operator<(const CKRBoundT& b) const noexcept { return GetSpan().Length() < b.GetSpan().Length(); }
  // Both corners equal after rounding to `decimals` places.
  bool Approx_Equal(const CKRBoundT& b, int decimals) const {
    return m_Max.Approx_Equal(b.m_Max, decimals) && m_Min.Approx_Equal(b.m_Min, decimals);
  }

protected:
  Point m_Max;
  Point m_Min;
};

// The named bounds: constructors and assignment only.
#define KR_NAMED_BOUND(Name, Dimension)                                   \
  template <class Real, class Other>                                      \
  class Name : public CKRBoundT<Dimension, Real, Other> {                 \
    using Base = CKRBoundT<Dimension, Real, Other>;                       \
                                                                          \
  public:                                                                 \
    using typename Base::Point;                                           \
    Name() noexcept = default;                                            \
    Name(const Base& b) noexcept : Base(b) {}                             \
    Name(const Point& p1, const Point& p2) noexcept : Base(p1, p2) {}     \
    Name& operator=(const Base& b) noexcept {                             \
      Base::operator=(b);                                                 \
      return *this;                                                       \
    }                                                                     \
  }
KR_NAMED_BOUND(CKRBound2T, 2);
KR_NAMED_BOUND(CKRBound3T, 3);
KR_NAMED_BOUND(CKRBound4T, 4);
#undef KR_NAMED_BOUND

extern template class KRCORELIB_API CKRBoundT<2, float, double>;
extern template class KRCORELIB_API CKRBoundT<3, float, double>;
extern template class KRCORELIB_API CKRBoundT<4, float, double>;
extern template class KRCORELIB_API CKRBoundT<2, double, float>;
extern template class KRCORELIB_API CKRBoundT<3, double, float>;
extern template class KRCORELIB_API CKRBoundT<4, double, float>;
extern template class KRCORELIB_API CKRBound2T<float, double>;
extern template class KRCORELIB_API CKRBound2T<double, float>;
extern template class KRCORELIB_API CKRBound3T<float, double>;
extern template class KRCORELIB_API CKRBound3T<double, float>;
extern template class KRCORELIB_API CKRBound4T<float, double>;
extern template class KRCORELIB_API CKRBound4T<double, float>;
