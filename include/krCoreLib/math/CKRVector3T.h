// CKRVector3T: the 3-D vector (x, y, z) in one precision pair.
//
// Adds names, the cross product, orthonormal bases and the text form
// "%f,%f,%f" to the generic CKRVectorT<3>. Constants ZERO, UNIT_X, UNIT_Y and
// UNIT_Z are initialised at compile time. Values of the other precision are
// accepted by a constructor and Set and converted to Real. Plain values, as
// the generic class; FromString may be called from several threads at once.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/math/CKRVectorT.h>

template <class Real, class Other>
class CKRVector3T : public CKRVectorT<3, Real, Other> {
  using Base = CKRVectorT<3, Real, Other>;

public:
  using typename Base::Math;

  static const CKRVector3T ZERO;    // (0, 0, 0)
  static const CKRVector3T UNIT_X;  // (1, 0, 0)
  static const CKRVector3T UNIT_Y;  // (0, 1, 0)
  static const CKRVector3T UNIT_Z;  // (0, 0, 1)

  // Leaves the components uninitialised.
  CKRVector3T() noexcept {}
  constexpr CKRVector3T(const CKRVector3T& v) noexcept = default;
  constexpr CKRVector3T(const Base& v) noexcept : Base(v) {}
  // Copies 3 values; a null pointer gives the zero vector.
  explicit CKRVector3T(const Real* tuple) noexcept : Base(tuple) {}
  explicit CKRVector3T(const CKRPointT<3, Real, Other>& point) noexcept : Base(point) {}
  constexpr CKRVector3T(Real x, Real y, Real z) noexcept : Base(std::in_place, x, y, z) {}
  constexpr CKRVector3T(Other x, Other y, Other z) noexcept : Base(std::in_place, Real(x), Real(y), Real(z)) {}
  // Integers (literals) use Real: they are equally close to both precisions.
  template <class... Ints>
    requires KRIntegerArguments<3, Ints...>
  constexpr CKRVector3T(Ints... values) noexcept : Base(std::in_place, Real(values)...) {}
  CKRVector3T& operator=(const CKRVector3T& v) noexcept = default;

  using Base::Set;
  void Set(Other x, Other y, Other z) noexcept { Set(Real(x), Real(y), Real(z)); }
  template <class... Ints>
    requires KRIntegerArguments<3, Ints...>
  void Set(Ints... values) noexcept {
    Set(Real(values)...);
  }
  using Base::X;
  using Base::Y;
  using Base::Z;

  // (y v.z - z v.y, z v.x - x v.z, x v.y - y v.x); UnitCross normalises it.
  CKRVector3T Cross(const CKRVector3T& v) const noexcept {
    return CKRVector3T(Y() * v.Z() - Z() * v.Y(), Z() * v.X() - X() * v.Z(), X() * v.Y() - Y() * v.X());
  }
  CKRVector3T UnitCross(const CKRVector3T& v) const noexcept {
    CKRVector3T cross = Cross(v);
    cross.Normalize();
    return cross;
  }

  // Gram-Schmidt: normalise u; v -= (u . v) u, normalise v; w -= (u . w) u +
  // (v . w) v, normalise w. The array form takes u, v, w in order (a null
  // array is left alone).
  static void Orthonormalize(CKRVector3T& u, CKRVector3T& v, CKRVector3T& w);
  static void Orthonormalize(CKRVector3T* vectors);
  // u and v completing w to a right-handed orthonormal basis (w normalised
  // first unless wIsUnit). A zero w gives zero u and v.
  static void GenerateOrthonormalBasis(CKRVector3T& u, CKRVector3T& v, CKRVector3T& w, bool wIsUnit);

  // "%f,%f,%f": six decimals, no exponent, independent of the locale.
  using Base::ToString;
  // Removes every space, splits at "," and reads up to three numbers in
  // order (C-locale decimal syntax; a piece that is not a number gives 0).
  // Components without a piece keep their values; further pieces are
  // ignored; a null or empty text changes nothing.
  using Base::FromString;
};

template <class Real, class Other>
constexpr CKRVector3T<Real, Other> CKRVector3T<Real, Other>::ZERO{Real(0), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRVector3T<Real, Other> CKRVector3T<Real, Other>::UNIT_X{Real(1), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRVector3T<Real, Other> CKRVector3T<Real, Other>::UNIT_Y{Real(0), Real(1), Real(0)};
template <class Real, class Other>
constexpr CKRVector3T<Real, Other> CKRVector3T<Real, Other>::UNIT_Z{Real(0), Real(0), Real(1)};

extern template class KRCORELIB_API CKRVector3T<float, double>;
extern template class KRCORELIB_API CKRVector3T<double, float>;
