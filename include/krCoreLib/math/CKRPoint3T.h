// CKRPoint3T: the 3-D point (x, y, z) in one precision pair.
//
// Adds names, setters and the text form "%f,%f,%f" to the generic
// CKRPointT<3>. Exactly three Reals: arrays of points are packed
// coordinates. ZERO is the origin, initialised at compile time. Values of the
// other precision are accepted by a constructor and Set and converted to
// Real. Plain values, as the generic class; FromString may be called from
// several threads at once.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/math/CKRPointT.h>

template <class Real, class Other>
class CKRPoint3T : public CKRPointT<3, Real, Other> {
  using Base = CKRPointT<3, Real, Other>;

public:
  using typename Base::Math;

  static const CKRPoint3T ZERO;  // (0, 0, 0)

  // Leaves the components uninitialised.
  CKRPoint3T() noexcept = default;
  constexpr CKRPoint3T(const CKRPoint3T& p) noexcept = default;
  constexpr CKRPoint3T(const Base& p) noexcept : Base(p) {}
  // Copies 3 values; a null pointer gives the origin.
  explicit CKRPoint3T(const Real* tuple) noexcept : Base(tuple) {}
  constexpr CKRPoint3T(Real x, Real y, Real z) noexcept : Base(std::in_place, x, y, z) {}
  constexpr CKRPoint3T(Other x, Other y, Other z) noexcept : Base(std::in_place, Real(x), Real(y), Real(z)) {}
  // Integers (literals) use Real: they are equally close to both precisions.
  template <class... Ints>
    requires KRIntegerArguments<3, Ints...>
  constexpr CKRPoint3T(Ints... values) noexcept : Base(std::in_place, Real(values)...) {}
  CKRPoint3T& operator=(const CKRPoint3T& p) noexcept = default;

  using Base::Set;
  void Set(Other x, Other y, Other z) noexcept { Set(Real(x), Real(y), Real(z)); }
  template <class... Ints>
    requires KRIntegerArguments<3, Ints...>
  void Set(Ints... values) noexcept {
    Set(Real(values)...);
  }
  using Base::SetX;
  using Base::SetY;
  using Base::SetZ;
  using Base::X;
  using Base::Y;
  using Base::Z;

  // "%f,%f,%f": six decimals, no exponent, independent of the locale.
  using Base::ToString;
  // Removes every space, splits at "," and reads up to three numbers in
  // order (C-locale decimal syntax; a piece that is not a number gives 0).
  // Components without a piece keep their values; further pieces are
  // ignored; a null or empty text changes nothing.
  using Base::FromString;
};

template <class Real, class Other>
constexpr CKRPoint3T<Real, Other> CKRPoint3T<Real, Other>::ZERO{Real(0), Real(0), Real(0)};

extern template class KRCORELIB_API CKRPoint3T<float, double>;
extern template class KRCORELIB_API CKRPoint3T<double, float>;

static_assert(sizeof(CKRPoint3T<float, double>) == 3 * sizeof(float), "a point is its coordinates");
static_assert(sizeof(CKRPoint3T<double, float>) == 3 * sizeof(double), "a point is its coordinates");
