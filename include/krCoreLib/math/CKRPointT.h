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
// Equality compares the stored bits (0.0 and -0.0 differ; two NaNs with the
// same bits are equal); <, <=, >, >= compare the byte images of the
// components as unsigned bytes in memory order: a total order for sorted
// containers, not a numeric one. Indexes are not checked: the caller keeps
// them in 0..N-1.
//
// Plain values: distinct objects may be used from different threads. All
// operations are inline, unrolled per dimension and never allocate.
#pragma once

#include <krCoreLib/math/CKRVectorT.h>

#include <cstring>
#include <utility>

template <int N, class Real, class Other>
class CKRPointT {
  static_assert(N >= 2 && N <= 4, "points have 2, 3 or 4 components");

public:
  using Math = CKRMathT<Real, Other>;
  using Vector = CKRVectorT<N, Real, Other>;

  // Leaves the components uninitialised.
  CKRPointT() noexcept = default;
  constexpr CKRPointT(const CKRPointT& p) noexcept = default;
  // Copies N values; a null pointer gives the zero point.
  explicit CKRPointT(const Real* tuple) noexcept {
    ForEach([&](int i) { m_Tuple[i] = tuple != nullptr ? tuple[i] : Real(0); });
  }
  CKRPointT& operator=(const CKRPointT& p) noexcept = default;

  // All components 0 (also for 4-D points); component i 1 and the others 0
  // (the zero point for an index outside 0..N-1).
  static CKRPointT ZERO() noexcept {
    return Build([](int) { return Real(0); });
  }
  static CKRPointT UNIT(int i) noexcept {
    CKRPointT p = ZERO();
    if (i >= 0 && i < N)
      p.m_Tuple[i] = Real(1);
    return p;
  }

  // ---- raw access ----
  Real& operator[](int i) noexcept { return m_Tuple[i]; }
  Real operator[](int i) const noexcept { return m_Tuple[i]; }
  operator Real*() noexcept { return m_Tuple; }
  operator const Real*() const noexcept { return m_Tuple; }
  Real* GetTuple() noexcept { return m_Tuple; }
  const Real* GetTuple() const noexcept { return m_Tuple; }
  static constexpr int GetN() noexcept { return N; }

  // ---- comparison ----
  bool operator==(const CKRPointT& p) const noexcept { return std::memcmp(m_Tuple, p.m_Tuple, sizeof m_Tuple) == 0; }
  bool operator!=(const CKRPointT& p) const noexcept { return !(*this == p); }
  bool operator<(const CKRPointT& p) const noexcept { return CompareArrays(p) < 0; }
  bool operator<=(const CKRPointT& p) const noexcept { return CompareArrays(p) <= 0; }
  bool operator>(const CKRPointT& p) const noexcept { return CompareArrays(p) > 0; }
  bool operator>=(const CKRPointT& p) const noexcept { return CompareArrays(p) >= 0; }
  // True when every component pair is equal after rounding to `decimals`
  // decimal places (CKRMathT::Approx_Equal).
  bool Approx_Equal(const CKRPointT& p, int decimals) const {
    for (int i = 0; i < N; ++i)
      if (!Math::Approx_Equal(m_Tuple[i], p.m_Tuple[i], decimals))
        return false;
    return true;
  }

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
  constexpr CKRPointT(std::in_place_t, Values... values) noexcept : m_Tuple{Real(values)...} {}

  // -1, 0 or 1: the byte images of the components compared as unsigned
  // bytes in memory order.
  int CompareArrays(const CKRPointT& p) const noexcept {
    const int order = std::memcmp(m_Tuple, p.m_Tuple, sizeof m_Tuple);
    return (order > 0) - (order < 0);
  }

  // Calls function(i) for i = 0..N-1, unrolled.
  template <class Function>
  static constexpr void ForEach(Function&& function) {
    [&]<int... I>(std::integer_sequence<int, I...>) { (function(I), ...); }(std::make_integer_sequence<int, N>{});
  }
  template <class Function>
  static CKRPointT Build(Function&& function) {
    CKRPointT p;
    ForEach([&](int i) { p.m_Tuple[i] = function(i); });
    return p;
  }

  Real m_Tuple[N];
};

extern template class KRCORELIB_API CKRPointT<2, float, double>;
extern template class KRCORELIB_API CKRPointT<3, float, double>;
extern template class KRCORELIB_API CKRPointT<4, float, double>;
extern template class KRCORELIB_API CKRPointT<2, double, float>;
extern template class KRCORELIB_API CKRPointT<3, double, float>;
extern template class KRCORELIB_API CKRPointT<4, double, float>;
