// CKRVector2T: the 2-D vector (x, y) in one precision pair.
//
// Adds names, the perpendicular, the scalar cross product ("Kross"), the
// angle between two vectors and the static orthonormalisation helpers to the
// generic CKRVectorT<2>. Constants ZERO, UNIT_X and UNIT_Y are initialised at
// compile time. Plain values, as the generic class.
#pragma once

#include <krCoreLib/math/CKRVectorT.h>

template <class Real, class Other>
class CKRVector2T : public CKRVectorT<2, Real, Other> {
  using Base = CKRVectorT<2, Real, Other>;

public:
  using typename Base::Math;

  static const CKRVector2T ZERO;    // (0, 0)
  static const CKRVector2T UNIT_X;  // (1, 0)
  static const CKRVector2T UNIT_Y;  // (0, 1)

  // Leaves the components uninitialised.
  CKRVector2T() noexcept {}
  constexpr CKRVector2T(const CKRVector2T& v) noexcept = default;
  constexpr CKRVector2T(const Base& v) noexcept : Base(v) {}
  // Copies 2 values; a null pointer gives the zero vector.
  explicit CKRVector2T(const Real* tuple) noexcept : Base(tuple) {}
  explicit CKRVector2T(const CKRPointT<2, Real, Other>& point) noexcept : Base(point) {}
  constexpr CKRVector2T(Real x, Real y) noexcept : Base(std::in_place, x, y) {}
  CKRVector2T& operator=(const CKRVector2T& v) noexcept = default;

  using Base::Set;
  using Base::X;
  using Base::Y;

  // (y, -x): this vector turned clockwise by a right angle; UnitPerp
  // normalises it.
  CKRVector2T Perp() const noexcept { return CKRVector2T(Y(), -X()); }
  CKRVector2T UnitPerp() const noexcept {
    CKRVector2T perp = Perp();
    perp.Normalize();
    return perp;
  }
  // The scalar cross product x * v.y - y * v.x.
  Real Kross(const CKRVector2T& v) const noexcept { return X() * v.Y() - Y() * v.X(); }
  // Perp() and UnitPerp(); the argument is not used.
  CKRVector2T Cross(const CKRVector2T&) const noexcept { return Perp(); }
  CKRVector2T UnitCross(const CKRVector2T&) const noexcept { return UnitPerp(); }

  // Counter-clockwise angle from this vector to v, in [0, 2 pi); 0 when
  // either has length 0.
  Real AngleBetween(const CKRVector2T& v) const;

  // Gram-Schmidt: normalise u; v -= (u . v) u; normalise v.
  static void Orthonormalize(CKRVector2T& u, CKRVector2T& v);
  // Normalises v unless vIsUnit; u = v.Perp().
  static void GenerateOrthonormalBasis(CKRVector2T& u, CKRVector2T& v, bool vIsUnit);
  // Componentwise minimum and maximum of n vectors; both start as the first.
  // Nothing is written for n < 1 or a null array.
  static void ComputeExtremes(int n, const CKRVector2T* points, CKRVector2T& min, CKRVector2T& max);
};

template <class Real, class Other>
constexpr CKRVector2T<Real, Other> CKRVector2T<Real, Other>::ZERO{Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRVector2T<Real, Other> CKRVector2T<Real, Other>::UNIT_X{Real(1), Real(0)};
template <class Real, class Other>
constexpr CKRVector2T<Real, Other> CKRVector2T<Real, Other>::UNIT_Y{Real(0), Real(1)};

extern template class KRCORELIB_API CKRVector2T<float, double>;
extern template class KRCORELIB_API CKRVector2T<double, float>;
