// CKRQuaternionT: rotations, conversions, the exponential and logarithm,
// interpolation and alignment. Both precision pairs are compiled here.
#include <krCoreLib/math/CKRQuaternionT.h>

#include <limits>
#include <numbers>

// ---- rotation ----

template <class Real, class Other>
auto CKRQuaternionT<Real, Other>::operator*(const Vector3& v) const noexcept -> Vector3 {
  Matrix3 rotation;
  ToRotationMatrix(rotation);
  return rotation * v;
}

template <class Real, class Other>
auto CKRQuaternionT<Real, Other>::operator*(const Vector4& v) const noexcept -> Vector4 {
  Matrix4 rotation;
  ToRotationMatrix(rotation);
  return rotation * v;
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::FromAxisAngle(const Vector3& axis, Real angle) noexcept {
  const Real half = Real(0.5) * angle;
  const Real sine = Math::Sin(half);
  *this = CKRQuaternionT(Math::Cos(half), axis.X() * sine, axis.Y() * sine, axis.Z() * sine);
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::FromAxisAngle(const Vector4& axis, Real angle) noexcept {
  FromAxisAngle(Vector3(axis.X(), axis.Y(), axis.Z()), angle);
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::ToAxisAngle(Vector3& axis, Real& angle) const noexcept {
  const Real squared = X() * X() + Y() * Y() + Z() * Z();
  if (!(squared > Math::EPSILON)) {
    angle = Real(0);
    axis = Vector3::UNIT_X;
    return;
  }
  // 2 acos(w) for a unit quaternion, accurate also near w = +-1.
  const Real length = Math::Sqrt(squared);
  angle = Real(2) * Math::ATan2(length, W());
  const Real inverse = Real(1) / length;
  axis.Set(X() * inverse, Y() * inverse, Z() * inverse);
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::ToAxisAngle(Vector4& axis, Real& angle) const noexcept {
  Vector3 direction;
  ToAxisAngle(direction, angle);
  axis.Set(direction.X(), direction.Y(), direction.Z(), Real(0));
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::ToRotationMatrix(Matrix3& rotation) const noexcept {
  const Real tx = Real(2) * X(), ty = Real(2) * Y(), tz = Real(2) * Z();
  const Real twx = tx * W(), twy = ty * W(), twz = tz * W();
  const Real txx = tx * X(), txy = ty * X(), txz = tz * X();
  const Real tyy = ty * Y(), tyz = tz * Y(), tzz = tz * Z();
  rotation = Matrix3(Real(1) - (tyy + tzz), txy - twz, txz + twy, txy + twz, Real(1) - (txx + tzz), tyz - twx,
                     txz - twy, tyz + twx, Real(1) - (txx + tyy));
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::ToRotationMatrix(Matrix4& rotation) const noexcept {
  Matrix3 part;
  ToRotationMatrix(part);
  rotation = Matrix4::IDENTITY;
  for (int r = 0; r < 3; ++r)
    for (int c = 0; c < 3; ++c)
      rotation(r, c) = part(r, c);
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::ToRotationMatrix(Vector3* columns) const noexcept {
  if (columns == nullptr)
    return;
  Matrix3 rotation;
  ToRotationMatrix(rotation);
  for (int i = 0; i < 3; ++i)
    columns[i] = rotation.GetColumn(i);
}

// Where the trace is positive, w is the largest component and is taken from
// the trace; otherwise the largest of x, y, z is taken from its diagonal
// entry, and the others from the sums and differences of the off-diagonal
// pairs divided by it, which keeps every division well away from 0.
template <class Real, class Other>
void CKRQuaternionT<Real, Other>::FromRotationMatrix(const Matrix3& m) noexcept {
  const Real trace = m(0, 0) + m(1, 1) + m(2, 2);
  if (trace > Real(0)) {
    const Real root = Math::Sqrt(trace + Real(1));
    const Real s = Real(0.5) / root;
    *this = CKRQuaternionT(Real(0.5) * root, (m(2, 1) - m(1, 2)) * s, (m(0, 2) - m(2, 0)) * s,
                           (m(1, 0) - m(0, 1)) * s);
    return;
  }
  int i = 0;
  if (m(1, 1) > m(0, 0))
    i = 1;
  if (m(2, 2) > m(i, i))
    i = 2;
  const int j = ms_iNext[i];
  const int k = ms_iNext[j];
  const Real root = Math::Sqrt(m(i, i) - m(j, j) - m(k, k) + Real(1));
  const Real s = Real(0.5) / root;
  Real* vector = m_Tuple + 1;
  vector[i] = Real(0.5) * root;
  W() = (m(k, j) - m(j, k)) * s;
  vector[j] = (m(j, i) + m(i, j)) * s;
  vector[k] = (m(k, i) + m(i, k)) * s;
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::FromRotationMatrix(const Matrix4& m) noexcept {
  FromRotationMatrix(Matrix3(m(0, 0), m(0, 1), m(0, 2), m(1, 0), m(1, 1), m(1, 2), m(2, 0), m(2, 1), m(2, 2)));
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::FromRotationMatrix(const Vector3* columns) noexcept {
  if (columns == nullptr)
    *this = IDENTITY;
  else
    FromRotationMatrix(Matrix3(columns, true));
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::FromRotationMatrix(const Vector4* columns) noexcept {
  if (columns == nullptr) {
    *this = IDENTITY;
    return;
  }
  Vector3 parts[3];
  for (int i = 0; i < 3; ++i)
    parts[i].Set(columns[i].X(), columns[i].Y(), columns[i].Z());
  FromRotationMatrix(parts);
}

// ---- algebra ----

template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::Inverse() const noexcept {
  const Real norm = Dot(*this);
  if (!(norm > Real(0)))
    return ZERO;
  return Conjugate() / norm;
}

// sin(a) / a tends to 1 for a small vector; it is 0 (not 1) for a = pi,
// where sin(a) vanishes as well, so the vector is kept only for a small a.
template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::Exp() const noexcept {
  const Real angle = Math::Sqrt(X() * X() + Y() * Y() + Z() * Z());
  const Real factor = angle >= Math::EPSILON ? Math::Sin(angle) / angle : Real(1);
  return CKRQuaternionT(Math::Cos(angle), X() * factor, Y() * factor, Z() * factor);
}

// For a unit quaternion sin(a) is the length of v, and atan2(|v|, w) is its
// angle a = acos(w) without the loss of an arc cosine near w = +-1 (where
// sin(acos(w)) may even fall below EPSILON while v still gives the axis).
template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::Log() const noexcept {
  const Real length = Math::Sqrt(X() * X() + Y() * Y() + Z() * Z());
  const Real factor = length > Real(0) ? Math::ATan2(length, W()) / length : Real(1);
  return CKRQuaternionT(Real(0), X() * factor, Y() * factor, Z() * factor);
}

// ---- interpolation ----

namespace {

// (sin((1 - t) a - f) p + sin(t a + f) q) / sin(a) with a the angle between
// p and q: p turned by t a + f towards q on their great circle. For q = -p
// (within rounding) sin(a) vanishes and the circle is not defined by p and
// q: the one through (0, 1, 0, 0) * p is taken, with a = pi.
template <class Real, class Other>
CKRQuaternionT<Real, Other> Interpolate(Real t, const CKRQuaternionT<Real, Other>& p,
                                        const CKRQuaternionT<Real, Other>& q, Real phase) {
  using Math = CKRMathT<Real, Other>;
  const Real cosine = p.Dot(q);
  const Real angle = Math::ACos(cosine);
  // Equal ends (their dot product may round below 1) and (nearly) equal ones.
  if (p == q || Math::FAbs(angle) < Math::EPSILON)
    return p;
  // 1 + cosine within a few units of rounding of 0.
  if (Real(1) + cosine <= Real(4) * std::numeric_limits<Real>::epsilon()) {
    const Real turn = t * std::numbers::pi_v<Real> + phase;
    const CKRQuaternionT<Real, Other> across(-p.X(), p.W(), -p.Z(), p.Y());
    return p * Math::Cos(turn) + across * Math::Sin(turn);
  }
  const Real inverse = Real(1) / Math::Sin(angle);
  return p * (Math::Sin((Real(1) - t) * angle - phase) * inverse) + q * (Math::Sin(t * angle + phase) * inverse);
}

}  // namespace

template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::Slerp(Real t, const CKRQuaternionT& p,
                                                               const CKRQuaternionT& q) noexcept {
  return Interpolate(t, p, q, Real(0));
}

template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::SlerpExtraSpins(Real t, const CKRQuaternionT& p,
                                                                         const CKRQuaternionT& q,
                                                                         int spins) noexcept {
  return Interpolate(t, p, q, Real(spins) * std::numbers::pi_v<Real> * t);
}

template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::GetIntermediate(const CKRQuaternionT& q0,
                                                                         const CKRQuaternionT& q1,
                                                                         const CKRQuaternionT& q2) noexcept {
  const CKRQuaternionT inverse = q1.Conjugate();
  const CKRQuaternionT sum = (inverse * q2).Log() + (inverse * q0).Log();
  return q1 * (sum * Real(-0.25)).Exp();
}

template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::Squad(Real t, const CKRQuaternionT& q0,
                                                               const CKRQuaternionT& a0, const CKRQuaternionT& a1,
                                                               const CKRQuaternionT& q1) noexcept {
  return Slerp(Real(2) * t * (Real(1) - t), Slerp(t, q0, q1), Slerp(t, a0, a1));
}

// ---- alignment and twist ----

template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::Align(const Vector3& from, const Vector3& to) noexcept {
  if (!(from.SquaredLength() > Real(0)) || !(to.SquaredLength() > Real(0)))
    return IDENTITY;
  Vector3 bisector = from + to;
  if (bisector.Normalize() > Real(0)) {
    const Vector3 axis = from.Cross(bisector);
    return CKRQuaternionT(from.Dot(bisector), axis.X(), axis.Y(), axis.Z());
  }
  // Opposite vectors: a half turn about a unit vector perpendicular to from.
  Vector3 perpendicular;
  Vector3 unused;
  Vector3 direction = from;
  Vector3::GenerateOrthonormalBasis(perpendicular, unused, direction, false);
  if (perpendicular.Normalize() == Real(0))
    return IDENTITY;
  // + 0 turns the -0 of a negated zero component into 0.
  return CKRQuaternionT(Real(0), perpendicular.X() + Real(0), perpendicular.Y() + Real(0),
                        perpendicular.Z() + Real(0));
}

template <class Real, class Other>
CKRQuaternionT<Real, Other> CKRQuaternionT<Real, Other>::Align(const Vector4& from, const Vector4& to) noexcept {
  return Align(Vector3(from.X(), from.Y(), from.Z()), Vector3(to.X(), to.Y(), to.Z()));
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::DecomposeTwistTimesNoTwist(const Vector3& axis, CKRQuaternionT& twist,
                                                             CKRQuaternionT& noTwist) const noexcept {
  noTwist = Align(axis, *this * axis);
  twist = *this * noTwist.Conjugate();
}

template <class Real, class Other>
void CKRQuaternionT<Real, Other>::DecomposeNoTwistTimesTwist(const Vector3& axis, CKRQuaternionT& twist,
                                                             CKRQuaternionT& noTwist) const noexcept {
  noTwist = Align(axis, *this * axis);
  twist = noTwist.Conjugate() * *this;
}

template class CKRQuaternionT<float, double>;
template class CKRQuaternionT<double, float>;
