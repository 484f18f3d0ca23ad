// CKRQuaternionT: the quaternion w + x i + y j + z k in one precision pair,
// for rotations.
//
// Stored as w, x, y, z in this order (w is the scalar part) and nothing else.
// A unit quaternion q is the rotation by angle a about the unit axis u with
// q = (cos(a/2), u sin(a/2)); q and -q are the same rotation. Rotations
// compose as the matrices do: (q * p) * v turns v by p first. The
// conversions to and from CKRMatrix3T and CKRMatrix4T use the same
// conventions (row-major, column vectors, right-hand rule).
//
// Default construction leaves the components uninitialised. Equality
// compares the stored bits; <, <=, >, >= compare the byte images (a total
// order for sorted containers, not a numeric one). Nothing throws. The angle
// constants of CKRMathT are single-precision values in both pairs (see
// CKRMatrix3T for what a quarter turn by HALF_PI gives in double).
//
// Plain values: distinct objects may be used from different threads.
#pragma once

#include <krCoreLib/math/CKRMatrix3T.h>
#include <krCoreLib/math/CKRMatrix4T.h>
#include <krCoreLib/math/CKRVector3T.h>
#include <krCoreLib/math/CKRVector4T.h>

#include <cstring>

template <class Real, class Other>
class CKRQuaternionT {
public:
  using Math = CKRMathT<Real, Other>;
  using Vector3 = CKRVector3T<Real, Other>;
  using Vector4 = CKRVector4T<Real, Other>;
  using Matrix3 = CKRMatrix3T<Real, Other>;
  using Matrix4 = CKRMatrix4T<Real, Other>;

  static const CKRQuaternionT ZERO;      // (0, 0, 0, 0)
  static const CKRQuaternionT IDENTITY;  // (1, 0, 0, 0)

  // Leaves the components uninitialised.
  CKRQuaternionT() noexcept {}
  constexpr CKRQuaternionT(Real w, Real x, Real y, Real z) noexcept : m_Tuple{w, x, y, z} {}
  constexpr CKRQuaternionT(const CKRQuaternionT&) noexcept = default;
  // FromRotationMatrix.
  explicit CKRQuaternionT(const Matrix3& rotation) noexcept { FromRotationMatrix(rotation); }
  explicit CKRQuaternionT(const Matrix4& rotation) noexcept { FromRotationMatrix(rotation); }
  // FromRotationMatrix of three column vectors (x, y, z of 4-D ones).
  explicit CKRQuaternionT(const Vector3* columns) noexcept { FromRotationMatrix(columns); }
  explicit CKRQuaternionT(const Vector4* columns) noexcept { FromRotationMatrix(columns); }
  // FromAxisAngle (x, y, z of a 4-D axis).
  CKRQuaternionT(const Vector3& axis, Real angle) noexcept { FromAxisAngle(axis, angle); }
  CKRQuaternionT(const Vector4& axis, Real angle) noexcept { FromAxisAngle(axis, angle); }
  CKRQuaternionT& operator=(const CKRQuaternionT&) noexcept = default;

  // ---- raw access: w, x, y, z ----
  Real& operator[](int i) noexcept { return m_Tuple[i]; }
  Real operator[](int i) const noexcept { return m_Tuple[i]; }
  operator Real*() noexcept { return m_Tuple; }
  operator const Real*() const noexcept { return m_Tuple; }
  Real W() const noexcept { return m_Tuple[0]; }
  Real& W() noexcept { return m_Tuple[0]; }
  Real X() const noexcept { return m_Tuple[1]; }
  Real& X() noexcept { return m_Tuple[1]; }
  Real Y() const noexcept { return m_Tuple[2]; }
  Real& Y() noexcept { return m_Tuple[2]; }
  Real Z() const noexcept { return m_Tuple[3]; }
  Real& Z() noexcept { return m_Tuple[3]; }

  // ---- comparison ----
  bool operator==(const CKRQuaternionT& q) const noexcept { return std::memcmp(m_Tuple, q.m_Tuple, sizeof m_Tuple) == 0; }
  bool operator!=(const CKRQuaternionT& q) const noexcept { return !(*this == q); }
  bool operator<(const CKRQuaternionT& q) const noexcept { return CompareArrays(q) < 0; }
  bool operator<=(const CKRQuaternionT& q) const noexcept { return CompareArrays(q) <= 0; }
  bool operator>(const CKRQuaternionT& q) const noexcept { return CompareArrays(q) > 0; }
  bool operator>=(const CKRQuaternionT& q) const noexcept { return CompareArrays(q) >= 0; }

  // ---- componentwise arithmetic ----
  CKRQuaternionT operator+(const CKRQuaternionT& q) const noexcept {
    return CKRQuaternionT(W() + q.W(), X() + q.X(), Y() + q.Y(), Z() + q.Z());
  }
  CKRQuaternionT operator-(const CKRQuaternionT& q) const noexcept {
    return CKRQuaternionT(W() - q.W(), X() - q.X(), Y() - q.Y(), Z() - q.Z());
  }
  CKRQuaternionT operator-() const noexcept { return CKRQuaternionT(-W(), -X(), -Y(), -Z()); }
  CKRQuaternionT operator*(Real s) const noexcept { return CKRQuaternionT(W() * s, X() * s, Y() * s, Z() * s); }
  friend CKRQuaternionT operator*(Real s, const CKRQuaternionT& q) noexcept { return q * s; }
  // Every component MAX_REAL when s is 0; otherwise the components times 1 / s.
  CKRQuaternionT operator/(Real s) const noexcept {
    return s == Real(0) ? CKRQuaternionT(Math::MAX_REAL, Math::MAX_REAL, Math::MAX_REAL, Math::MAX_REAL)
                        : *this * (Real(1) / s);
  }
  CKRQuaternionT& operator+=(const CKRQuaternionT& q) noexcept { return *this = *this + q; }
  CKRQuaternionT& operator-=(const CKRQuaternionT& q) noexcept { return *this = *this - q; }
  CKRQuaternionT& operator*=(Real s) noexcept { return *this = *this * s; }
  CKRQuaternionT& operator/=(Real s) noexcept { return *this = *this / s; }

  // ---- rotation ----
  // The Hamilton product: the rotation p followed by this one.
  CKRQuaternionT operator*(const CKRQuaternionT& p) const noexcept {
    return CKRQuaternionT(W() * p.W() - X() * p.X() - Y() * p.Y() - Z() * p.Z(),
                          W() * p.X() + X() * p.W() + Y() * p.Z() - Z() * p.Y(),
                          W() * p.Y() + Y() * p.W() + Z() * p.X() - X() * p.Z(),
                          W() * p.Z() + Z() * p.W() + X() * p.Y() - Y() * p.X());
  }
  // v turned by this rotation (through ToRotationMatrix); a 4-D vector keeps w.
  Vector3 operator*(const Vector3& v) const noexcept;
  Vector4 operator*(const Vector4& v) const noexcept;

  // w = cos(a/2), (x, y, z) = axis * sin(a/2); the axis is used as given
  // (unit length expected).
  void FromAxisAngle(const Vector3& axis, Real angle) noexcept;
  void FromAxisAngle(const Vector4& axis, Real angle) noexcept;
  // angle = 2 acos(w) in [0, 2 pi] (computed as 2 atan2(|v|, w), accurate
  // also near w = +-1), axis = (x, y, z) normalised. When x^2 + y^2 + z^2 <=
  // EPSILON (rotations by less than about 6.9e-4) the angle is 0 and the
  // axis (1, 0, 0); so also for NaN components. A 4-D axis receives w = 0.
  void ToAxisAngle(Vector3& axis, Real& angle) const noexcept;
  void ToAxisAngle(Vector4& axis, Real& angle) const noexcept;
  // The rotation matrix of a unit quaternion: rows (1 - 2(y^2 + z^2), 2xy -
  // 2wz, 2xz + 2wy), (2xy + 2wz, 1 - 2(x^2 + z^2), 2yz - 2wx), (2xz - 2wy,
  // 2yz + 2wx, 1 - 2(x^2 + y^2)); the 4 x 4 form has last row and column
  // (0, 0, 0, 1); the array form writes its three columns.
  void ToRotationMatrix(Matrix3& rotation) const noexcept;
  void ToRotationMatrix(Matrix4& rotation) const noexcept;
  void ToRotationMatrix(Vector3* columns) const noexcept;
  // The unit quaternion of a rotation matrix (of its upper left 3 x 3 part,
  // or of three columns), with w >= 0 where the trace is positive. A null
  // array gives IDENTITY.
  void FromRotationMatrix(const Matrix3& rotation) noexcept;
  void FromRotationMatrix(const Matrix4& rotation) noexcept;
  void FromRotationMatrix(const Vector3* columns) noexcept;
  void FromRotationMatrix(const Vector4* columns) noexcept;

  // ---- algebra ----
  Real Dot(const CKRQuaternionT& q) const noexcept { return W() * q.W() + X() * q.X() + Y() * q.Y() + Z() * q.Z(); }
  CKRQuaternionT Conjugate() const noexcept { return CKRQuaternionT(W(), -X(), -Y(), -Z()); }
  // Conjugate() / (w^2 + x^2 + y^2 + z^2); ZERO when that is not positive.
  CKRQuaternionT Inverse() const noexcept;
  // The exponential of (0, v), with a = length of v: (cos a, v sin(a) / a);
  // v unchanged for a below EPSILON. The scalar part w is not read.
  CKRQuaternionT Exp() const noexcept;
  // The logarithm of a unit quaternion (cos a, u sin a): (0, u a), with a in
  // [0, pi] found as atan2(|v|, w) (the arc cosine of w, accurate also near
  // w = +-1); (0, 0) for v = 0. For any other quaternion, the logarithm of
  // its direction.
  CKRQuaternionT Log() const noexcept;

  // ---- interpolation ----
  // The spherical interpolation from p (t = 0) to q (t = 1) along the great
  // circle through both, with the angle a = ACos(p . q): (sin((1 - t) a) p +
  // sin(t a) q) / sin(a); p when they are equal or a is below EPSILON. No
  // sign flip is made for p . q < 0: the interpolation then takes the long
  // way. For q = -p (1 + p . q within four units of rounding of 0), where
  // every great circle through p reaches q, it takes the one through
  // (0, 1, 0, 0) * p = (-x, w, -z, y) (p followed by a full turn about the x
  // axis), and the results stay unit quaternions.
  static CKRQuaternionT Slerp(Real t, const CKRQuaternionT& p, const CKRQuaternionT& q) noexcept;
  // As Slerp with `spins` extra half turns of the quaternion (full turns of
  // the rotation) on the way: the phase spins * pi * t, with pi at the full
  // precision of Real (not the single-precision PI), so that t = 1 gives
  // +-q within rounding.
  static CKRQuaternionT SlerpExtraSpins(Real t, const CKRQuaternionT& p, const CKRQuaternionT& q, int spins) noexcept;
  // The inner control point at q1 for Squad: q1 * Exp(-0.25 (Log(conj(q1)
  // q2) + Log(conj(q1) q0))).
  static CKRQuaternionT GetIntermediate(const CKRQuaternionT& q0, const CKRQuaternionT& q1,
                                        const CKRQuaternionT& q2) noexcept;
  // Spherical quadrangle interpolation: Slerp(2t(1 - t), Slerp(t, q0, q1),
  // Slerp(t, a0, a1)).
  static CKRQuaternionT Squad(Real t, const CKRQuaternionT& q0, const CKRQuaternionT& a0, const CKRQuaternionT& a1,
                              const CKRQuaternionT& q1) noexcept;

  // ---- alignment and twist ----
  // The shortest rotation taking the unit vector `from` to the unit vector
  // `to` (x, y, z of 4-D vectors): with b = normalised(from + to), w = from .
  // b and (x, y, z) = from x b. For opposite vectors it is the half turn
  // about `from` turned by a right angle in the coordinate plane of its z
  // and the larger of its x and y (the u of
  // CKRVector3T::GenerateOrthonormalBasis): (-z, 0, x) / sqrt(x^2 + z^2)
  // when abs(x) >= abs(y), else (0, z, -y) / sqrt(y^2 + z^2); vectors count
  // as opposite when from + to is not longer than EPSILON. A zero (or NaN)
  // `from` or `to` gives IDENTITY.
  static CKRQuaternionT Align(const Vector3& from, const Vector3& to) noexcept;
  static CKRQuaternionT Align(const Vector4& from, const Vector4& to) noexcept;
  // this = twist * noTwist with noTwist = Align(axis, this * axis), which
  // turns the unit axis without twisting about it, and twist = this *
  // conj(noTwist), a rotation about this * axis.
  void DecomposeTwistTimesNoTwist(const Vector3& axis, CKRQuaternionT& twist, CKRQuaternionT& noTwist) const noexcept;
  // this = noTwist * twist with noTwist = Align(axis, this * axis) and twist =
  // conj(noTwist) * this, a rotation about the axis.
  void DecomposeNoTwistTimesTwist(const Vector3& axis, CKRQuaternionT& twist, CKRQuaternionT& noTwist) const noexcept;

protected:
  // The cyclic successor of a component of (x, y, z), for FromRotationMatrix.
  static constexpr int ms_iNext[3] = {1, 2, 0};

  int CompareArrays(const CKRQuaternionT& q) const noexcept {
    const int order = std::memcmp(m_Tuple, q.m_Tuple, sizeof m_Tuple);
    return (order > 0) - (order < 0);
  }

  Real m_Tuple[4];
};

template <class Real, class Other>
constexpr CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::ZERO{Real(0), Real(0), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::IDENTITY{Real(1), Real(0), Real(0), Real(0)};

extern template class KRCORELIB_API CKRQuaternionT<float, double>;
extern template class KRCORELIB_API CKRQuaternionT<double, float>;
