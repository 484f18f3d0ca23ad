// The generic matrices and the 2 x 2 and 4 x 4 ones: the operations that are
// not inline, and the instantiations of both precision pairs compiled into
// the library (the 3 x 3 matrices are in CKRMatrix3T.cpp).
#include <krCoreLib/math/CKRMatrixT.h>

#include <krCoreLib/math/CKRMatrix2T.h>
#include <krCoreLib/math/CKRMatrix4T.h>
#include <krCoreLib/math/CKRQuaternionT.h>

#include <cmath>

// ---- CKRMatrix2T ----

template <class Real, class Other>
CKRMatrix2T<Real, Other>::CKRMatrix2T(const Vector2* vectors, bool columns) noexcept
    : Base(typename Base::SKRUninitialized{}) {
  this->SetVectors(vectors, columns);
}

template <class Real, class Other>
CKRMatrix2T<Real, Other>::CKRMatrix2T(const Vector2& u, const Vector2& v, bool columns) noexcept
    : Base(typename Base::SKRUninitialized{}) {
  const Vector2 vectors[2] = {u, v};
  this->SetVectors(vectors, columns);
}

template <class Real, class Other>
void CKRMatrix2T<Real, Other>::Orthonormalize() noexcept {
  Vector2 u = this->GetColumn(0);
  Vector2 v = this->GetColumn(1);
  Vector2::Orthonormalize(u, v);
  this->SetColumn(0, u);
  this->SetColumn(1, v);
}

// The eigenvector of the smaller eigenvalue l0 is perpendicular to both rows
// of M - l0 I; the longer row gives its direction most accurately. Whether
// the eigenvalue is double is decided by that row being 0, not by an
// absolute threshold, so that the result does not depend on the scale of
// the matrix.
template <class Real, class Other>
void CKRMatrix2T<Real, Other>::EigenDecomposition(CKRMatrix2T& rot, CKRMatrix2T& diag) const noexcept {
  const Real a = (*this)(0, 0);
  const Real b = (*this)(0, 1);
  const Real d = (*this)(1, 1);
  const Real root = std::hypot(a - d, Real(2) * b);
  const Real low = Real(0.5) * (a + d - root);
  diag = CKRMatrix2T(low, Real(0.5) * (a + d + root));
  const Vector2 first(a - low, b);
  const Vector2 second(b, d - low);
  const Real firstLength = first.Length();
  const Real secondLength = second.Length();
  const Vector2& row = firstLength > secondLength ? first : second;
  const Real length = firstLength > secondLength ? firstLength : secondLength;
  if (!(length > Real(0)) || !std::isfinite(length)) {
    rot = IDENTITY;
    return;
  }
  // (c, s) = the row turned clockwise by a right angle, divided (not
  // multiplied by a reciprocal, which may overflow for a tiny length).
  const Real c = row.Y() / length;
  const Real s = -row.X() / length;
  rot = CKRMatrix2T(c, -s, s, c);
}

// ---- CKRMatrix4T ----

// Only the direction (x, y, z) is normalised: w does not belong to an axis.
template <class Real, class Other>
CKRMatrix4T<Real, Other> CKRMatrix4T<Real, Other>::BuildRotationMatrix(Real angle, Vector4 axis) noexcept {
  CKRVector3T<Real, Other> direction(axis.X(), axis.Y(), axis.Z());
  direction.Normalize();
  CKRMatrix4T rotation;
  CKRQuaternionT<Real, Other>(direction, angle).ToRotationMatrix(rotation);
  return rotation;
}

namespace {

// IDENTITY with x, y, z of v in column `column` (rows 0..2), or on the
// diagonal for column -1.
template <class Real, class Other>
CKRMatrix4T<Real, Other> IdentityWith(const CKRVector4T<Real, Other>& v, int column) {
  CKRMatrix4T<Real, Other> m = CKRMatrix4T<Real, Other>::IDENTITY;
  for (int i = 0; i < 3; ++i)
    m(i, column < 0 ? i : column) = v[i];
  return m;
}

}  // namespace

template <class Real, class Other>
CKRMatrix4T<Real, Other> CKRMatrix4T<Real, Other>::BuildTranslationMatrix(Vector4 t) noexcept {
  return IdentityWith(t, 3);
}

template <class Real, class Other>
CKRMatrix4T<Real, Other> CKRMatrix4T<Real, Other>::BuildScalingMatrix(Vector4 s) noexcept {
  return IdentityWith(s, -1);
}

template class CKRMatrixT<2, float, double>;
template class CKRMatrixT<3, float, double>;
template class CKRMatrixT<4, float, double>;
template class CKRMatrixT<2, double, float>;
template class CKRMatrixT<3, double, float>;
template class CKRMatrixT<4, double, float>;

template class CKRMatrix2T<float, double>;
template class CKRMatrix2T<double, float>;
template class CKRMatrix4T<float, double>;
template class CKRMatrix4T<double, float>;
