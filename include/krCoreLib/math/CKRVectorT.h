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
// Equality compares the stored bits (0.0 and -0.0 differ; two NaNs with the
// same bits are equal); <, <=, >, >= compare the byte images of the
// components as unsigned bytes in memory order: a total order for sorted
// containers, not a numeric one. Indexes are not checked: the caller keeps
// them in 0..N-1. Dividing by 0 gives MAX_REAL in every component; a vector
// not longer than EPSILON normalises to the zero vector.
//
// Plain values: distinct objects may be used from different threads. The
// hot operations are inline, unrolled per dimension and never allocate.
#pragma once

#include <krCoreLib/math/CKRMathT.h>

#include <cstring>
#include <utility>

template <int N, class Real, class Other>
class CKRPointT;

template <int N, class Real, class Other>
class CKRVectorT {
  static_assert(N >= 2 && N <= 4, "vectors have 2, 3 or 4 components");

public:
  using Math = CKRMathT<Real, Other>;

  // Leaves the components uninitialised.
  CKRVectorT() noexcept {}
  // Component by component, which lets the compiler keep temporaries in
  // registers (an aggregate array copy goes through memory).
  constexpr CKRVectorT(const CKRVectorT& v) noexcept {
    ForEach([&](int i) { m_Tuple[i] = v.m_Tuple[i]; });
  }
  // Copies N values; a null pointer gives the zero vector.
  explicit CKRVectorT(const Real* tuple) noexcept {
    ForEach([&](int i) { m_Tuple[i] = tuple != nullptr ? tuple[i] : Real(0); });
  }
  // The components of a point of the same dimension.
  explicit CKRVectorT(const CKRPointT<N, Real, Other>& point) noexcept {
    ForEach([&](int i) { m_Tuple[i] = point[i]; });
  }
  constexpr CKRVectorT& operator=(const CKRVectorT& v) noexcept {
    ForEach([&](int i) { m_Tuple[i] = v.m_Tuple[i]; });
    return *this;
  }

  // All components 0; component i 1 and the others 0 (the zero vector for an
  // index outside 0..N-1).
  static CKRVectorT ZERO() noexcept {
    return Build([](int) { return Real(0); });
  }
  static CKRVectorT UNIT(int i) noexcept {
    CKRVectorT v = ZERO();
    if (i >= 0 && i < N)
      v.m_Tuple[i] = Real(1);
    return v;
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
  bool operator==(const CKRVectorT& v) const noexcept { return std::memcmp(m_Tuple, v.m_Tuple, sizeof m_Tuple) == 0; }
  bool operator!=(const CKRVectorT& v) const noexcept { return !(*this == v); }
  bool operator<(const CKRVectorT& v) const noexcept { return CompareArrays(v) < 0; }
  bool operator<=(const CKRVectorT& v) const noexcept { return CompareArrays(v) <= 0; }
  bool operator>(const CKRVectorT& v) const noexcept { return CompareArrays(v) > 0; }
  bool operator>=(const CKRVectorT& v) const noexcept { return CompareArrays(v) >= 0; }
  // True when every component pair is equal after rounding to `decimals`
  // decimal places (CKRMathT::Approx_Equal).
  bool Approx_Equal(const CKRVectorT& v, int decimals) const {
    for (int i = 0; i < N; ++i)
      if (!Math::Approx_Equal(m_Tuple[i], v.m_Tuple[i], decimals))
        return false;
    return true;
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
  constexpr CKRVectorT(std::in_place_t, Values... values) noexcept : m_Tuple{Real(values)...} {}

  // -1, 0 or 1: the byte images of the components compared as unsigned
  // bytes in memory order.
  int CompareArrays(const CKRVectorT& v) const noexcept {
    const int order = std::memcmp(m_Tuple, v.m_Tuple, sizeof m_Tuple);
    return (order > 0) - (order < 0);
  }

  // Calls function(i) for i = 0..N-1, unrolled.
  template <class Function>
  static constexpr void ForEach(Function&& function) {
    [&]<int... I>(std::integer_sequence<int, I...>) { (function(I), ...); }(std::make_integer_sequence<int, N>{});
  }
  // function(0) + function(1) + ..., left to right.
  template <class Function>
  static constexpr Real Sum(Function&& function) {
    return [&]<int... I>(std::integer_sequence<int, I...>) { return (... + function(I)); }(
        std::make_integer_sequence<int, N>{});
  }
  template <class Function>
  static CKRVectorT Build(Function&& function) {
    CKRVectorT v;
    ForEach([&](int i) { v.m_Tuple[i] = function(i); });
    return v;
  }

  Real m_Tuple[N];
};

extern template class KRCORELIB_API CKRVectorT<2, float, double>;
extern template class KRCORELIB_API CKRVectorT<3, float, double>;
extern template class KRCORELIB_API CKRVectorT<4, float, double>;
extern template class KRCORELIB_API CKRVectorT<2, double, float>;
extern template class KRCORELIB_API CKRVectorT<3, double, float>;
extern template class KRCORELIB_API CKRVectorT<4, double, float>;
