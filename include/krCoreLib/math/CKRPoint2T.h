// CKRPoint2T: the 2-D point (x, y) in one precision pair.
//
// Adds names, setters and the text form "%f,%f" to the generic CKRPointT<2>.
// Exactly two Reals: arrays of points are packed coordinates. ZERO is the
// origin, initialised at compile time. Values of the other precision are
// accepted by a constructor and Set and converted to Real. Plain values, as
// the generic class; FromString may be called from several threads at once.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/math/CKRPointT.h>

template <class Real, class Other>
class CKRPoint2T : public CKRPointT<2, Real, Other> {
  using Base = CKRPointT<2, Real, Other>;

public:
  using typename Base::Math;

  static const CKRPoint2T ZERO;  // (0, 0)

  // Leaves the components uninitialised.
  CKRPoint2T() noexcept = default;
  constexpr CKRPoint2T(const CKRPoint2T& p) noexcept = default;
  constexpr CKRPoint2T(const Base& p) noexcept : Base(p) {}
  // Copies 2 values; a null pointer gives the origin.
  explicit CKRPoint2T(const Real* tuple) noexcept : Base(tuple) {}
  constexpr CKRPoint2T(Real x, Real y) noexcept : Base(std::in_place, x, y) {}
  constexpr CKRPoint2T(Other x, Other y) noexcept : Base(std::in_place, Real(x), Real(y)) {}
  // Integers (literals) use Real: they are equally close to both precisions.
  template <class... Ints>
    requires KRIntegerArguments<2, Ints...>
  constexpr CKRPoint2T(Ints... values) noexcept : Base(std::in_place, Real(values)...) {}
  CKRPoint2T& operator=(const CKRPoint2T& p) noexcept = default;

  using Base::Set;
  void Set(Other x, Other y) noexcept { Set(Real(x), Real(y)); }
  template <class... Ints>
    requires KRIntegerArguments<2, Ints...>
  void Set(Ints... values) noexcept {
    Set(Real(values)...);
  }
  using Base::SetX;
  using Base::SetY;
  using Base::X;
  using Base::Y;

  // "%f,%f": six decimals, no exponent, independent of the locale.
  using Base::ToString;
  // Removes every space, splits at "," and reads up to two numbers in order
  // (C-locale decimal syntax; a piece that is not a number gives 0).
  // Components without a piece keep their values; further pieces are
  // ignored; a null or empty text changes nothing.
  using Base::FromString;
};

template <class Real, class Other>
constexpr CKRPoint2T<Real, Other> CKRPoint2T<Real, Other>::ZERO{Real(0), Real(0)};

extern template class KRCORELIB_API CKRPoint2T<float, double>;
extern template class KRCORELIB_API CKRPoint2T<double, float>;

static_assert(sizeof(CKRPoint2T<float, double>) == 2 * sizeof(float), "a point is its coordinates");
static_assert(sizeof(CKRPoint2T<double, float>) == 2 * sizeof(double), "a point is its coordinates");
