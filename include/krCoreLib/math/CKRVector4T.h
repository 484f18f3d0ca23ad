// CKRVector4T: the 4-D (homogeneous) vector (x, y, z, w) in one precision
// pair.
//
// Adds names and the cross product of the x, y, z parts to the generic
// CKRVectorT<4>. Constants ZERO, UNIT_X, UNIT_Y, UNIT_Z and UNIT_W are
// initialised at compile time. Plain values, as the generic class.
#pragma once

#include <krCoreLib/math/CKRVectorT.h>

template <class Real, class Other>
class CKRVector4T : public CKRVectorT<4, Real, Other> {
  using Base = CKRVectorT<4, Real, Other>;

public:
  using typename Base::Math;

  static const CKRVector4T ZERO;    // (0, 0, 0, 0)
  static const CKRVector4T UNIT_X;  // (1, 0, 0, 0)
  static const CKRVector4T UNIT_Y;  // (0, 1, 0, 0)
  static const CKRVector4T UNIT_Z;  // (0, 0, 1, 0)
  static const CKRVector4T UNIT_W;  // (0, 0, 0, 1)

  // Leaves the components uninitialised.
  CKRVector4T() noexcept {}
  constexpr CKRVector4T(const CKRVector4T& v) noexcept = default;
  constexpr CKRVector4T(const Base& v) noexcept : Base(v) {}
  // Copies 4 values; a null pointer gives the zero vector.
  explicit CKRVector4T(const Real* tuple) noexcept : Base(tuple) {}
  explicit CKRVector4T(const CKRPointT<4, Real, Other>& point) noexcept : Base(point) {}
  constexpr CKRVector4T(Real x, Real y, Real z, Real w) noexcept : Base(std::in_place, x, y, z, w) {}
  CKRVector4T& operator=(const CKRVector4T& v) noexcept = default;

  using Base::Set;
  using Base::W;
  using Base::X;
  using Base::Y;
  using Base::Z;

  // The 3-D cross product of the x, y, z parts with w = 0; UnitCross
  // normalises all four components.
  CKRVector4T Cross(const CKRVector4T& v) const noexcept {
    return CKRVector4T(Y() * v.Z() - Z() * v.Y(), Z() * v.X() - X() * v.Z(), X() * v.Y() - Y() * v.X(), Real(0));
  }
  CKRVector4T UnitCross(const CKRVector4T& v) const noexcept {
    CKRVector4T cross = Cross(v);
    cross.Normalize();
    return cross;
  }
};

template <class Real, class Other>
constexpr CKRVector4T<Real, Other> CKRVector4T<Real, Other>::ZERO{Real(0), Real(0), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRVector4T<Real, Other> CKRVector4T<Real, Other>::UNIT_X{Real(1), Real(0), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRVector4T<Real, Other> CKRVector4T<Real, Other>::UNIT_Y{Real(0), Real(1), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRVector4T<Real, Other> CKRVector4T<Real, Other>::UNIT_Z{Real(0), Real(0), Real(1), Real(0)};
template <class Real, class Other>
constexpr CKRVector4T<Real, Other> CKRVector4T<Real, Other>::UNIT_W{Real(0), Real(0), Real(0), Real(1)};

extern template class KRCORELIB_API CKRVector4T<float, double>;
extern template class KRCORELIB_API CKRVector4T<double, float>;
