// CKRMatrix3T: construction, rotations (axis and angle, Euler angles,
// interpolation) and Gram-Schmidt; the decompositions are defined in
// CKRMatrix3TEigen.h and CKRMatrix3TSingular.h. Both precision pairs are
// compiled here.
#include <krCoreLib/math/CKRMatrix3T.h>

#include "CKRMatrix3TEigen.h"
#include "CKRMatrix3TSingular.h"

#include <cmath>
#include <numbers>

namespace {

// One order of Euler angles: the axes in the order of the name (i, j, k) and
// the sign of the order (+1 for the cyclic XYZ, YZX, ZXY, -1 for the
// others). Away from the lock, with t = M(i, k): first = atan2(-sign M(j,
// k), M(k, k)), middle = asin(sign t), last = atan2(-sign M(i, j), M(i, i)).
// At the lock the first angle is atan2(s1 M(r1, c1), s2 M(r2, c2)), with
// the entries of m_Lock[0] when t >= 1 and of m_Lock[1] when t <= -1, each
// written {s1, r1, c1, s2, r2, c2}.
struct SKREulerOrder {
  int m_I;
  int m_J;
  int m_K;
  int m_Sign;
  int m_Lock[2][6];
};

constexpr SKREulerOrder kXYZ = {0, 1, 2, 1, {{1, 1, 0, 1, 1, 1}, {-1, 1, 0, 1, 1, 1}}};
constexpr SKREulerOrder kXZY = {0, 2, 1, -1, {{-1, 2, 0, 1, 2, 2}, {1, 2, 0, 1, 2, 2}}};
constexpr SKREulerOrder kYXZ = {1, 0, 2, -1, {{-1, 0, 1, 1, 0, 0}, {1, 0, 1, 1, 0, 0}}};
constexpr SKREulerOrder kYZX = {1, 2, 0, 1, {{1, 2, 1, 1, 2, 2}, {-1, 2, 1, 1, 2, 2}}};
constexpr SKREulerOrder kZXY = {2, 0, 1, 1, {{1, 0, 2, 1, 0, 0}, {-1, 0, 2, 1, 0, 0}}};
constexpr SKREulerOrder kZYX = {2, 1, 0, -1, {{-1, 0, 1, -1, 0, 2}, {-1, 0, 1, 1, 0, 2}}};

// The rotation by `angle` about coordinate axis i (0 = x, 1 = y, 2 = z).
template <class Real, class Other>
CKRMatrix3T<Real, Other> AxisRotation(int i, Real angle) {
  using Math = CKRMathT<Real, Other>;
  const Real c = Math::Cos(angle);
  const Real s = Math::Sin(angle);
  const int j = (i + 1) % 3;
  const int k = (i + 2) % 3;
  CKRMatrix3T<Real, Other> rotation = CKRMatrix3T<Real, Other>::IDENTITY;
  rotation(j, j) = c;
  rotation(k, k) = c;
  rotation(k, j) = s;
  rotation(j, k) = -s;
  return rotation;
}

template <class Real, class Other>
void FromEuler(CKRMatrix3T<Real, Other>& m, const SKREulerOrder& order, Real first, Real middle, Real last) {
  m = AxisRotation<Real, Other>(order.m_I, first) * AxisRotation<Real, Other>(order.m_J, middle) *
      AxisRotation<Real, Other>(order.m_K, last);
}

template <class Real, class Other>
bool ToEuler(const CKRMatrix3T<Real, Other>& m, const SKREulerOrder& order, Real& first, Real& middle, Real& last) {
  using Math = CKRMathT<Real, Other>;
  const Real sign = Real(order.m_Sign);
  const Real t = m(order.m_I, order.m_K);
  if (t > Real(-1) && t < Real(1)) {
    first = Math::ATan2(-sign * m(order.m_J, order.m_K), m(order.m_K, order.m_K));
    middle = Math::ASin(sign * t);
    last = Math::ATan2(-sign * m(order.m_I, order.m_J), m(order.m_I, order.m_I));
    return true;
  }
  // Gimbal lock (also for a NaN t, which takes the t <= -1 entries).
  const int* lock = order.m_Lock[t >= Real(1) ? 0 : 1];
  first = Math::ATan2(Real(lock[0]) * m(lock[1], lock[2]), Real(lock[3]) * m(lock[4], lock[5]));
  // pi / 2 in Real, as asin gives it, not the single-precision HALF_PI: the
  // angles then rebuild the matrix in double precision too.
  constexpr Real kQuarterTurn = std::numbers::pi_v<Real> / Real(2);
  middle = sign * (t >= Real(1) ? kQuarterTurn : -kQuarterTurn);
  last = Real(0);
  return false;
}

}  // namespace

// ---- construction ----

template <class Real, class Other>
CKRMatrix3T<Real, Other>::CKRMatrix3T(const Vector3* vectors, bool columns) noexcept
    : Base(typename Base::SKRUninitialized{}) {
  this->SetVectors(vectors, columns);
}

template <class Real, class Other>
CKRMatrix3T<Real, Other>::CKRMatrix3T(const Vector3& u, const Vector3& v, const Vector3& w, bool columns) noexcept
    : Base(typename Base::SKRUninitialized{}) {
  const Vector3 vectors[3] = {u, v, w};
  this->SetVectors(vectors, columns);
}

template <class Real, class Other>
void CKRMatrix3T<Real, Other>::MakeTensorProduct(const Vector3& u, const Vector3& v) noexcept {
  for (int i = 0; i < 3; ++i)
    for (int j = 0; j < 3; ++j)
      (*this)(i, j) = u[i] * v[j];
}

// ---- axis and angle ----

template <class Real, class Other>
void CKRMatrix3T<Real, Other>::FromAxisAngle(const Vector3& axis, Real angle) noexcept {
  const Real c = Math::Cos(angle);
  const Real s = Math::Sin(angle);
  const Real t = Real(1) - c;
  const Real x = axis.X();
  const Real y = axis.Y();
  const Real z = axis.Z();
  *this = CKRMatrix3T(t * x * x + c, t * x * y - s * z, t * x * z + s * y, t * x * y + s * z, t * y * y + c,
                      t * y * z - s * x, t * x * z - s * y, t * y * z + s * x, t * z * z + c);
}

// With the unit axis u: M - transpose(M) holds 2 sin(a) u and the trace is
// 1 + 2 cos(a), so atan2 of the two gives the angle accurately everywhere
// (an arc cosine of the trace alone loses half the digits near 0 and pi).
// Up to a right angle the axis is the antisymmetric part normalised; beyond
// it that part shrinks with sin(a), and the axis comes from the symmetric
// part, M + transpose(M) = 2 (cos(a) I + (1 - cos(a)) u u^T): its largest
// component from the largest diagonal entry, the others from the
// off-diagonal sums, the sign from the antisymmetric part (either sign
// describes a half turn).
template <class Real, class Other>
void CKRMatrix3T<Real, Other>::ToAxisAngle(Vector3& axis, Real& angle) const noexcept {
  const CKRMatrix3T& m = *this;
  const Vector3 antisymmetric(m(2, 1) - m(1, 2), m(0, 2) - m(2, 0), m(1, 0) - m(0, 1));
  const Real twiceCosine = m(0, 0) + m(1, 1) + m(2, 2) - Real(1);
  const Real twiceSine = antisymmetric.Length();
  angle = Math::ATan2(twiceSine, twiceCosine);
  if (!(angle > Real(0))) {
    angle = Real(0);
    axis = Vector3::UNIT_X;
    return;
  }
  if (twiceCosine >= Real(0)) {
    // Divided, not multiplied by a reciprocal, which overflows for a
    // subnormal length.
    axis.Set(antisymmetric.X() / twiceSine, antisymmetric.Y() / twiceSine, antisymmetric.Z() / twiceSine);
    return;
  }
  int i = 2;
  if (m(0, 0) > m(1, 1) && m(2, 2) <= m(0, 0))
    i = 0;
  else if (m(1, 1) >= m(0, 0) && m(2, 2) <= m(1, 1))
    i = 1;
  const int j = (i + 1) % 3;
  const int k = (i + 2) % 3;
  // 2 (1 - cos(a)) u_i^2 = M(i, i) - M(j, j) - M(k, k) + 1.
  const Real twiceVersine = Real(2) - twiceCosine;
  const Real square = (m(i, i) - m(j, j) - m(k, k) + Real(1)) / twiceVersine;
  const Real largest = Math::Sqrt(square > Real(0) ? square : Real(0));
  const Real half = Real(1) / (twiceVersine * largest);
  axis[i] = largest;
  axis[j] = (m(i, j) + m(j, i)) * half;
  axis[k] = (m(i, k) + m(k, i)) * half;
  if (axis.Dot(antisymmetric) < Real(0))
    axis = -axis;
  if (axis.Normalize() == Real(0))
    axis = Vector3::UNIT_X;
}

template <class Real, class Other>
CKRMatrix3T<Real, Other> CKRMatrix3T<Real, Other>::Slerp(Real t, const CKRMatrix3T& r0,
                                                         const CKRMatrix3T& r1) noexcept {
  Vector3 axis;
  Real angle;
  CKRMatrix3T(r0.TransposeTimes(r1)).ToAxisAngle(axis, angle);
  return r0 * CKRMatrix3T(axis, t * angle);
}

// ---- Euler angles ----

template <class Real, class Other>
void CKRMatrix3T<Real, Other>::FromEulerAnglesXYZ(Real x, Real y, Real z) noexcept {
  FromEuler(*this, kXYZ, x, y, z);
}
template <class Real, class Other>
void CKRMatrix3T<Real, Other>::FromEulerAnglesXZY(Real x, Real z, Real y) noexcept {
  FromEuler(*this, kXZY, x, z, y);
}
template <class Real, class Other>
void CKRMatrix3T<Real, Other>::FromEulerAnglesYXZ(Real y, Real x, Real z) noexcept {
  FromEuler(*this, kYXZ, y, x, z);
}
template <class Real, class Other>
void CKRMatrix3T<Real, Other>::FromEulerAnglesYZX(Real y, Real z, Real x) noexcept {
  FromEuler(*this, kYZX, y, z, x);
}
template <class Real, class Other>
void CKRMatrix3T<Real, Other>::FromEulerAnglesZXY(Real z, Real x, Real y) noexcept {
  FromEuler(*this, kZXY, z, x, y);
}
template <class Real, class Other>
void CKRMatrix3T<Real, Other>::FromEulerAnglesZYX(Real z, Real y, Real x) noexcept {
  FromEuler(*this, kZYX, z, y, x);
}

template <class Real, class Other>
bool CKRMatrix3T<Real, Other>::ToEulerAnglesXYZ(Real& x, Real& y, Real& z) const noexcept {
  return ToEuler(*this, kXYZ, x, y, z);
}
template <class Real, class Other>
bool CKRMatrix3T<Real, Other>::ToEulerAnglesXZY(Real& x, Real& z, Real& y) const noexcept {
  return ToEuler(*this, kXZY, x, z, y);
}
template <class Real, class Other>
bool CKRMatrix3T<Real, Other>::ToEulerAnglesYXZ(Real& y, Real& x, Real& z) const noexcept {
  return ToEuler(*this, kYXZ, y, x, z);
}
template <class Real, class Other>
bool CKRMatrix3T<Real, Other>::ToEulerAnglesYZX(Real& y, Real& z, Real& x) const noexcept {
  return ToEuler(*this, kYZX, y, z, x);
}
template <class Real, class Other>
bool CKRMatrix3T<Real, Other>::ToEulerAnglesZXY(Real& z, Real& x, Real& y) const noexcept {
  return ToEuler(*this, kZXY, z, x, y);
}
template <class Real, class Other>
bool CKRMatrix3T<Real, Other>::ToEulerAnglesZYX(Real& z, Real& y, Real& x) const noexcept {
  return ToEuler(*this, kZYX, z, y, x);
}

// ---- Gram-Schmidt ----

template <class Real, class Other>
void CKRMatrix3T<Real, Other>::Orthonormalize() noexcept {
  Vector3 columns[3] = {this->GetColumn(0), this->GetColumn(1), this->GetColumn(2)};
  Vector3::Orthonormalize(columns);
  this->SetVectors(columns, true);
}

template class CKRMatrix3T<float, double>;
template class CKRMatrix3T<double, float>;
