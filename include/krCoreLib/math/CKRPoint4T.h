// CKRPoint4T: the 4-D (homogeneous) point (x, y, z, w) in one precision pair.
//
// Adds names, setters, PolarBy, ToVector and the text form "%f,%f,%f,%f" to
// the generic CKRPointT<4>. Exactly four Reals: arrays of points are packed
// coordinates, as the plane helpers of CKRMathT read them. ZERO is the
// homogeneous origin (0, 0, 0, 1), initialised at compile time (the generic
// ZERO() gives w = 0). Values of the other precision are accepted by a
// constructor and Set and converted to Real. Plain values, as the generic
// class; FromString may be called from several threads at once.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/math/CKRPointT.h>
#include <krCoreLib/math/CKRVector4T.h>

template <class Real, class Other>
class CKRPoint4T : public CKRPointT<4, Real, Other> {
  using Base = CKRPointT<4, Real, Other>;

public:
  using typename Base::Math;

  static const CKRPoint4T ZERO;  // (0, 0, 0, 1)

  // Leaves the components uninitialised.
  CKRPoint4T() noexcept = default;
  constexpr CKRPoint4T(const CKRPoint4T& p) noexcept = default;
  constexpr CKRPoint4T(const Base& p) noexcept : Base(p) {}
  // Copies 4 values; a null pointer gives (0, 0, 0, 0).
  explicit CKRPoint4T(const Real* tuple) noexcept : Base(tuple) {}
  constexpr CKRPoint4T(Real x, Real y, Real z, Real w) noexcept : Base(std::in_place, x, y, z, w) {}
  constexpr CKRPoint4T(Other x, Other y, Other z, Other w) noexcept
      : Base(std::in_place, Real(x), Real(y), Real(z), Real(w)) {}
  // Integers (literals) use Real: they are equally close to both precisions.
  template <class... Ints>
    requires KRIntegerArguments<4, Ints...>
  constexpr CKRPoint4T(Ints... values) noexcept : Base(std::in_place, Real(values)...) {}
  CKRPoint4T& operator=(const CKRPoint4T& p) noexcept = default;

  using Base::Set;
  void Set(Other x, Other y, Other z, Other w) noexcept { Set(Real(x), Real(y), Real(z), Real(w)); }
  template <class... Ints>
    requires KRIntegerArguments<4, Ints...>
  void Set(Ints... values) noexcept {
    Set(Real(values)...);
  }
  using Base::SetX;
  using Base::SetY;
  using Base::SetZ;
  using Base::W;
  using Base::X;
  using Base::Y;
  using Base::Z;

  // (x + distance cos(angle), y + distance sin(angle), z, 1): moved in the
  // x-y plane; w of the result is always 1.
  CKRPoint4T PolarBy(Real angle, Real distance) const noexcept {
    return CKRPoint4T(X() + distance * Math::Cos(angle), Y() + distance * Math::Sin(angle), Z(), Real(1));
  }
  // The vector with the same four components.
  CKRVector4T<Real, Other> ToVector() const noexcept { return CKRVector4T<Real, Other>(X(), Y(), Z(), W()); }

  // "%f,%f,%f,%f": six decimals, no exponent, independent of the locale.
  using Base::ToString;
  // Removes every space, splits at "," and reads up to four numbers in order
  // (C-locale decimal syntax; a piece that is not a number gives 0).
  // Components without a piece keep their values; further pieces are
  // ignored; a null or empty text changes nothing.
  using Base::FromString;
};

template <class Real, class Other>
constexpr CKRPoint4T<Real, Other> CKRPoint4T<Real, Other>::ZERO{Real(0), Real(0), Real(0), Real(1)};

extern template class KRCORELIB_API CKRPoint4T<float, double>;
extern template class KRCORELIB_API CKRPoint4T<double, float>;

static_assert(sizeof(CKRPoint4T<float, double>) == 4 * sizeof(float), "a point is its coordinates");
static_assert(sizeof(CKRPoint4T<double, float>) == 4 * sizeof(double), "a point is its coordinates");
