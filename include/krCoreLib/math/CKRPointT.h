// CKRPointT: the generic fixed-size point of dimension N = 2, 3 or 4.
//
// A position with affine operations only: point + vector and point - vector
// give points, point - point gives a vector, AffineSum interpolates. The
// dimension classes CKRPoint2T, CKRPoint3T and CKRPoint4T derive from it and
// add names, setters and text forms.
//
// Layout: exactly N Reals (x, y, z, w) and nothing else, so an array of
// points is a packed array of coordinates that the polygon helpers and the
// triangulators read directly. Default construction leaves the components
// uninitialised.
//
// Raw access, ZERO(), UNIT(), the comparisons (bits and byte images) and
// Approx_Equal come from CKRTupleT.
//
// Plain values: distinct objects may be used from different threads. All
// operations are inline, unrolled per dimension and never allocate.
#pragma once

#include <krCoreLib/math/CKRTupleT.h>
#include <krCoreLib/math/CKRVectorT.h>

template <int N, class Real, class Other>
class CKRPointT : public CKRTupleT<CKRPointT<N, Real, Other>, Real, Other, N> {
  using Tuple = CKRTupleT<CKRPointT, Real, Other, N>;

public:
  using typename Tuple::Math;
  using Vector = CKRVectorT<N, Real, Other>;

  // Leaves the components uninitialised.
  CKRPointT() noexcept = default;
  constexpr CKRPointT(const CKRPointT& p) noexcept = default;
  // Copies N values; a null pointer gives the zero point.
  explicit CKRPointT(const Real* tuple) noexcept : Tuple(tuple) {}
  CKRPointT& operator=(const CKRPointT& p) noexcept = default;

  // ---- affine arithmetic ----
  CKRPointT operator+(const Vector& v) const noexcept {
    return Build([&](int i) { return m_Tuple[i] + v[i]; });
  }
  CKRPointT operator-(const Vector& v) const noexcept {
    return Build([&](int i) { return m_Tuple[i] - v[i]; });
  }
  Vector operator-(const CKRPointT& p) const noexcept {
    Vector v;
    ForEach([&](int i) { v[i] = m_Tuple[i] - p.m_Tuple[i]; });
    return v;
  }
  CKRPointT operator-() const noexcept {
    return Build([&](int i) { return -m_Tuple[i]; });
  }
  // this + t (q - this), componentwise: this for t = 0, q for t = 1.
  CKRPointT AffineSum(Real t, const CKRPointT& q) const noexcept {
    return Build([&](int i) { return m_Tuple[i] + t * (q.m_Tuple[i] - m_Tuple[i]); });
  }

protected:
  // Components in order; for the dimension classes' constants (constexpr).
  template <class... Values>
    requires(sizeof...(Values) == N)
  constexpr CKRPointT(std::in_place_t, Values... values) noexcept : Tuple(std::in_place, values...) {}

  using Tuple::Build;
  using Tuple::ForEach;
  using Tuple::m_Tuple;
};

extern template class KRCORELIB_API CKRTupleT<CKRPointT<2, float, double>, float, double, 2>;
extern template class KRCORELIB_API CKRTupleT<CKRPointT<3, float, double>, float, double, 3>;
extern template class KRCORELIB_API CKRTupleT<CKRPointT<4, float, double>, float, double, 4>;
extern template class KRCORELIB_API CKRTupleT<CKRPointT<2, double, float>, double, float, 2>;
extern template class KRCORELIB_API CKRTupleT<CKRPointT<3, double, float>, double, float, 3>;
extern template class KRCORELIB_API CKRTupleT<CKRPointT<4, double, float>, double, float, 4>;

extern template class KRCORELIB_API CKRPointT<2, float, double>;
extern template class KRCORELIB_API CKRPointT<3, float, double>;
extern template class KRCORELIB_API CKRPointT<4, float, double>;
extern template class KRCORELIB_API CKRPointT<2, double, float>;
extern template class KRCORELIB_API CKRPointT<3, double, float>;
extern template class KRCORELIB_API CKRPointT<4, double, float>;
