// CKRVectorT: the generic fixed-size vector of dimension N = 2, 3 or 4.
//
// A direction with a length and the full linear-algebra interface. The
// dimension classes CKRVector2T, CKRVector3T and CKRVector4T derive from it
// and add names and dimension-specific operations; the operators here return
// the generic class, which converts back to the dimension class.
//
// Layout: the pointer to the table of virtual functions, then Real
// components[N] (x, y, z, w). The virtual functions, in slot order, are Cross
// and UnitCross. Default construction leaves the components uninitialised.
//
// Raw access, ZERO(), UNIT(), the comparisons (bits and byte images) and
// Approx_Equal come from CKRTupleT, which has no virtual functions: the
// table pointer stays first. Dividing by 0 gives MAX_REAL in every component;
// a vector not longer than EPSILON normalises to the zero vector.
//
// Plain values: distinct objects may be used from different threads. The
// hot operations are inline, unrolled per dimension and never allocate.
#pragma once

#include <krCoreLib/math/CKRTupleT.h>

#include <cstring>
#include <utility>

template <int N, class Real, class Other>
class CKRPointT;

template <int N, class Real, class Other>
class CKRVectorT : public CKRTupleT<CKRVectorT<N, Real, Other>, Real, Other, N> {
  using Tuple = CKRTupleT<CKRVectorT, Real, Other, N>;

public:
  using typename Tuple::Math;

  // Leaves the components uninitialised.
  CKRVectorT() noexcept {}
  // Component by component, which lets the compiler keep temporaries in
  // registers (an aggregate array copy goes through memory).
  constexpr CKRVectorT(const CKRVectorT& v) noexcept : Tuple(std::in_place, v) {}
  // Copies N values; a null pointer gives the zero vector.
  explicit CKRVectorT(const Real* tuple) noexcept : Tuple(tuple) {}
  // The components of a point of the same dimension.
  explicit CKRVectorT(const CKRPointT<N, Real, Other>& point) noexcept {
    ForEach([&](int i) { m_Tuple[i] = point[i]; });
  }
  constexpr CKRVectorT& operator=(const CKRVectorT& v) noexcept {
    ForEach([&](int i) { m_Tuple[i] = v.m_Tuple[i]; });
    return *this;
  }

  // ---- arithmetic ----
  CKRVectorT operator+(const CKRVectorT& v) const noexcept {
    return Build([&](int i) { return m_Tuple[i] + v.m_Tuple[i]; });
  }
  CKRVectorT operator-(const CKRVectorT& v) const noexcept {
    return Build([&](int i) { return m_Tuple[i] - v.m_Tuple[i]; });
  }
  CKRVectorT operator-() const noexcept {
    return Build([&](int i) { return -m_Tuple[i]; });
  }
  CKRVectorT operator*(Real s) const noexcept {
    return Build([&](int i) { return m_Tuple[i] * s; });
  }
  friend CKRVectorT operator*(Real s, const CKRVectorT& v) noexcept { return v * s; }
  CKRVectorT operator/(Real s) const noexcept {
    if (s == Real(0))
      return Build([](int) { return Math::MAX_REAL; });
    const Real inverse = Real(1) / s;
    return Build([&](int i) { return m_Tuple[i] * inverse; });
  }
  CKRVectorT& operator+=(const CKRVectorT& v) noexcept {
    ForEach([&](int i) { m_Tuple[i] += v.m_Tuple[i]; });
    return *this;
  }
  CKRVectorT& operator-=(const CKRVectorT& v) noexcept {
    ForEach([&](int i) { m_Tuple[i] -= v.m_Tuple[i]; });
    return *this;
  }
  CKRVectorT& operator*=(Real s) noexcept {
    ForEach([&](int i) { m_Tuple[i] *= s; });
    return *this;
  }
  CKRVectorT& operator/=(Real s) noexcept { return *this = *this / s; }

  // ---- geometry ----
  Real Dot(const CKRVectorT& v) const noexcept {
#if defined(__GNUC__)
    // The products of x and y in one two-lane multiplication (one load per
    // operand instead of two); the sum keeps the order x, y, z, w, so the
    // result is the same as that of the plain loop.
    typedef Real Lanes __attribute__((vector_size(2 * sizeof(Real))));
    Lanes a;
    Lanes b;
    std::memcpy(&a, m_Tuple, sizeof a);
    std::memcpy(&b, v.m_Tuple, sizeof b);
    const Lanes products = a * b;
    Real sum = products[0] + products[1];
    ForEach([&](int i) {
      if (i >= 2)
        sum += m_Tuple[i] * v.m_Tuple[i];
    });
    return sum;
#else
    return Sum([&](int i) { return m_Tuple[i] * v.m_Tuple[i]; });
#endif
  }
  Real SquaredLength() const noexcept { return Dot(*this); }
  Real Length() const noexcept { return Math::Sqrt(SquaredLength()); }
  // Scales to length 1 and returns the former length; a vector not longer
  // than EPSILON (or of NaN length) becomes the zero vector and 0 is returned.
  Real Normalize() noexcept {
    const Real length = Length();
    if (length > Math::EPSILON) {
      const Real inverse = Real(1) / length;
      ForEach([&](int i) { m_Tuple[i] *= inverse; });
      return length;
    }
    ForEach([&](int i) { m_Tuple[i] = Real(0); });
    return Real(0);
  }
  CKRVectorT GetNormalized() const noexcept {
    CKRVectorT v(*this);
    v.Normalize();
    return v;
  }

  // The dimension classes declare their own Cross and UnitCross over their
  // own type; those hide these on purpose, so that an argument of the
  // dimension class binds without conversion. The generic forms give the same
  // results, so a call through the generic class is never wrong: (y, -x) in
  // 2-D, the cross product in 3-D, the cross product of x, y, z with w = 0
  // in 4-D. UnitCross normalises the result.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Woverloaded-virtual"
  virtual CKRVectorT Cross(const CKRVectorT& v) const {
    const Real* a = m_Tuple;
    const Real* b = v.m_Tuple;
    if constexpr (N == 2)
      return CKRVectorT(std::in_place, a[1], -a[0]);
    else if constexpr (N == 3)
      return CKRVectorT(std::in_place, a[1] * b[2] - a[2] * b[1], a[2] * b[0] - a[0] * b[2], a[0] * b[1] - a[1] * b[0]);
    else
      return CKRVectorT(std::in_place, a[1] * b[2] - a[2] * b[1], a[2] * b[0] - a[0] * b[2], a[0] * b[1] - a[1] * b[0],
                        Real(0));
  }
  virtual CKRVectorT UnitCross(const CKRVectorT& v) const {
    CKRVectorT cross = CKRVectorT::Cross(v);
    cross.Normalize();
    return cross;
  }
#pragma GCC diagnostic pop

protected:
  // Components in order; for the dimension classes' constants (constexpr).
  template <class... Values>
    requires(sizeof...(Values) == N)
  constexpr CKRVectorT(std::in_place_t, Values... values) noexcept : Tuple(std::in_place, values...) {}

  // function(0) + function(1) + ..., left to right.
  template <class Function>
  static constexpr Real Sum(Function&& function) {
    return [&]<int... I>(std::integer_sequence<int, I...>) { return (... + function(I)); }(
        std::make_integer_sequence<int, N>{});
  }

  using Tuple::Build;
  using Tuple::ForEach;
  using Tuple::m_Tuple;
};

extern template class KRCORELIB_API CKRTupleT<CKRVectorT<2, float, double>, float, double, 2>;
extern template class KRCORELIB_API CKRTupleT<CKRVectorT<3, float, double>, float, double, 3>;
extern template class KRCORELIB_API CKRTupleT<CKRVectorT<4, float, double>, float, double, 4>;
extern template class KRCORELIB_API CKRTupleT<CKRVectorT<2, double, float>, double, float, 2>;
extern template class KRCORELIB_API CKRTupleT<CKRVectorT<3, double, float>, double, float, 3>;
extern template class KRCORELIB_API CKRTupleT<CKRVectorT<4, double, float>, double, float, 4>;

extern template class KRCORELIB_API CKRVectorT<2, float, double>;
extern template class KRCORELIB_API CKRVectorT<3, float, double>;
extern template class KRCORELIB_API CKRVectorT<4, float, double>;
extern template class KRCORELIB_API CKRVectorT<2, double, float>;
extern template class KRCORELIB_API CKRVectorT<3, double, float>;
extern template class KRCORELIB_API CKRVectorT<4, double, float>;
