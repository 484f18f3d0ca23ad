// CKRTupleT: the N components that points and vectors share, and what they
// do alike with them.
//
// The common base of CKRPointT and CKRVectorT: Derived is the generic point
// or vector class itself, so that ZERO(), UNIT() and the comparisons work on
// and return that class and a point never compares with a vector. The base
// has no virtual functions and no data besides Real components[N], so a point
// stays exactly its coordinates and a vector stays its table of virtual
// functions followed by the coordinates.
//
// The names of the components (X() .. W(), Set, SetX .. SetZ) and the text
// form "%f,%f[,%f[,%f]]" are protected here; each dimension class publishes,
// with using-declarations, those that belong to its interface.
//
// Equality compares the stored bits (0.0 and -0.0 differ; two NaNs with the
// same bits are equal); <, <=, >, >= compare the byte images of the
// components as unsigned bytes in memory order: a total order for sorted
// containers, not a numeric one. Indexes are not checked: the caller keeps
// them in 0..N-1. Plain values: distinct objects may be used from different
// threads; the text reading may be called from several threads at once.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/math/CKRMathT.h>

#include <cstring>
#include <type_traits>
#include <utility>

// N integer arguments, such as the literals of (0, 0, 1): an int converts
// equally well to float and to double, so the dimension classes that take
// both precisions add a constructor and Set for integers that use Real.
template <int N, class... Values>
concept KRIntegerArguments = sizeof...(Values) == N && (std::is_integral_v<Values> && ...);

template <class Derived, class Real, class Other, int N>
class CKRTupleT {
  static_assert(N >= 2 && N <= 4, "tuples have 2, 3 or 4 components");

public:
  using Math = CKRMathT<Real, Other>;

  // All components 0; component i 1 and the others 0 (the zero tuple for an
  // index outside 0..N-1).
  static Derived ZERO() noexcept {
    return Build([](int) { return Real(0); });
  }
  static Derived UNIT(int i) noexcept {
    Derived unit = ZERO();
    if (i >= 0 && i < N)
      unit[i] = Real(1);
    return unit;
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
  // Declared over this base, so that both operands of a dimension class
  // convert alike and a comparison never competes with its reversed form.
  // Only tuples of the same Derived share this base.
  bool operator==(const CKRTupleT& t) const noexcept { return std::memcmp(m_Tuple, t.m_Tuple, sizeof m_Tuple) == 0; }
  bool operator!=(const CKRTupleT& t) const noexcept { return !(*this == t); }
  bool operator<(const CKRTupleT& t) const noexcept { return CompareArrays(t) < 0; }
  bool operator<=(const CKRTupleT& t) const noexcept { return CompareArrays(t) <= 0; }
  bool operator>(const CKRTupleT& t) const noexcept { return CompareArrays(t) > 0; }
  bool operator>=(const CKRTupleT& t) const noexcept { return CompareArrays(t) >= 0; }
  // True when every component pair is equal after rounding to `decimals`
  // decimal places (CKRMathT::Approx_Equal).
  bool Approx_Equal(const CKRTupleT& t, int decimals) const {
    for (int i = 0; i < N; ++i)
      if (!Math::Approx_Equal(m_Tuple[i], t.m_Tuple[i], decimals))
        return false;
    return true;
  }

protected:
  // Leaves the components uninitialised.
  CKRTupleT() noexcept = default;
  constexpr CKRTupleT(const CKRTupleT&) noexcept = default;
  // Copies N values; a null pointer gives all components 0.
  explicit CKRTupleT(const Real* tuple) noexcept {
    ForEach([&](int i) { m_Tuple[i] = tuple != nullptr ? tuple[i] : Real(0); });
  }
  // Components in order; for the dimension classes' constants (constexpr).
  template <class... Values>
    requires(sizeof...(Values) == N)
  constexpr CKRTupleT(std::in_place_t, Values... values) noexcept : m_Tuple{Real(values)...} {}
  // A copy made component by component, not as the trivial array copy.
  constexpr CKRTupleT(std::in_place_t, const CKRTupleT& t) noexcept {
    ForEach([&](int i) { m_Tuple[i] = t.m_Tuple[i]; });
  }
  CKRTupleT& operator=(const CKRTupleT&) noexcept = default;
  ~CKRTupleT() = default;

  // ---- names, published by the dimension classes ----
  void Set(Real x, Real y) noexcept requires(N == 2) { SetAll(x, y); }
  void Set(Real x, Real y, Real z) noexcept requires(N == 3) { SetAll(x, y, z); }
  void Set(Real x, Real y, Real z, Real w) noexcept requires(N == 4) { SetAll(x, y, z, w); }
  Real X() const noexcept { return m_Tuple[0]; }
  Real& X() noexcept { return m_Tuple[0]; }
  Real Y() const noexcept { return m_Tuple[1]; }
  Real& Y() noexcept { return m_Tuple[1]; }
  Real Z() const noexcept requires(N >= 3) { return m_Tuple[2]; }
  Real& Z() noexcept requires(N >= 3) { return m_Tuple[2]; }
  Real W() const noexcept requires(N == 4) { return m_Tuple[3]; }
  Real& W() noexcept requires(N == 4) { return m_Tuple[3]; }
  void SetX(Real x) noexcept { m_Tuple[0] = x; }
  void SetY(Real y) noexcept { m_Tuple[1] = y; }
  void SetZ(Real z) noexcept requires(N >= 3) { m_Tuple[2] = z; }

  // ---- text form (SKRTupleText) ----
  CKRString ToString() const;
  void FromString(const wchar_t* text);
  void FromString(const CKRString& text);

  // -1, 0 or 1: the byte images of the components compared as unsigned
  // bytes in memory order.
  int CompareArrays(const CKRTupleT& t) const noexcept {
    const int order = std::memcmp(m_Tuple, t.m_Tuple, sizeof m_Tuple);
    return (order > 0) - (order < 0);
  }

  // Calls function(i) for i = 0..N-1, unrolled.
  template <class Function>
  static constexpr void ForEach(Function&& function) {
    [&]<int... I>(std::integer_sequence<int, I...>) { (function(I), ...); }(std::make_integer_sequence<int, N>{});
  }
  // The N components in order.
  template <class... Values>
  void SetAll(Values... values) noexcept {
    int i = 0;
    ((m_Tuple[i++] = values), ...);
  }
  template <class Function>
  static Derived Build(Function&& function) {
    Derived result;
    Real* tuple = result.GetTuple();
    ForEach([&](int i) { tuple[i] = function(i); });
    return result;
  }

  Real m_Tuple[N];
};
