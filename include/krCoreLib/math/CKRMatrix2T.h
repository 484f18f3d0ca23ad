// CKRMatrix2T: the 2 x 2 matrix in one precision pair.
//
// Adds constructors, rotations by an angle, tensor products, the inverse,
// Gram-Schmidt and the symmetric eigen decomposition to the generic
// CKRMatrixT<2> (row-major, column vectors: see there). Constants ZERO and
// IDENTITY are initialised at compile time. Plain values, as the generic
// class.
//
// Angles: a rotation by a turns counter-clockwise, (1, 0) to (cos a, sin a).
// The angle constants of CKRMathT are single-precision values in both pairs:
// a rotation by CKRMathT::HALF_PI maps (1, 0) to (-4.37e-8, 1), not to
// (0, 1), which is below the rounding of single precision but not of
// double; pass pi / 2 at full precision (std::numbers::pi / 2) for a
// quarter turn exact to double rounding.
#pragma once

#include <krCoreLib/math/CKRMatrixT.h>
#include <krCoreLib/math/CKRVector2T.h>

template <class Real, class Other>
class CKRMatrix2T : public CKRMatrixT<2, Real, Other> {
  using Base = CKRMatrixT<2, Real, Other>;

public:
  using typename Base::Math;
  using Vector2 = CKRVector2T<Real, Other>;

  static const CKRMatrix2T ZERO;
  static const CKRMatrix2T IDENTITY;

  // The zero matrix when `zero` is true (the default), the identity when false.
  explicit CKRMatrix2T(bool zero = true) noexcept : Base(zero) {}
  constexpr CKRMatrix2T(const CKRMatrix2T&) noexcept = default;
  constexpr CKRMatrix2T(const Base& m) noexcept : Base(m) {}
  constexpr CKRMatrix2T(Real m00, Real m01, Real m10, Real m11) noexcept : Base(std::in_place, m00, m01, m10, m11) {}
  // Four entries row by row, or column by column when rowMajor is false; a
  // null array gives the zero matrix.
  // (A pointer parameter of its own, so that a vector, which converts to a
  // pointer to its components, is never taken for the array.)
  template <class Pointer>
    requires KRRealPointer<Pointer, Real>
  explicit CKRMatrix2T(Pointer entries, bool rowMajor = true) noexcept : Base(typename Base::SKRUninitialized{}) {
    this->SetEntries(entries, rowMajor);
  }
  // Two vectors as the columns, or as the rows when `columns` is false; a
  // null array gives the zero matrix.
  CKRMatrix2T(const Vector2* vectors, bool columns) noexcept;
  CKRMatrix2T(const Vector2& u, const Vector2& v, bool columns) noexcept;
  // The diagonal matrix diag(d0, d1).
  CKRMatrix2T(Real d0, Real d1) noexcept : Base(std::in_place, d0, Real(0), Real(0), d1) {}
  // The rotation by `angle` (FromAngle); an angle of the other precision is
  // converted to Real first.
  explicit CKRMatrix2T(Real angle) noexcept : Base(typename Base::SKRUninitialized{}) { FromAngle(angle); }
  explicit CKRMatrix2T(Other angle) noexcept : CKRMatrix2T(Real(angle)) {}
  // The tensor product u v^T (MakeTensorProduct).
  CKRMatrix2T(const Vector2& u, const Vector2& v) noexcept : Base(typename Base::SKRUninitialized{}) {
    MakeTensorProduct(u, v);
  }
  CKRMatrix2T& operator=(const CKRMatrix2T&) noexcept = default;

  using Base::MakeDiagonal;
  void MakeDiagonal(Real d0, Real d1) noexcept { *this = CKRMatrix2T(d0, d1); }
  // Entry (i, j) = u(i) v(j).
  void MakeTensorProduct(const Vector2& u, const Vector2& v) noexcept {
    *this = CKRMatrix2T(u.X() * v.X(), u.X() * v.Y(), u.Y() * v.X(), u.Y() * v.Y());
  }

  // The rotation (cos a, -sin a; sin a, cos a), and its angle atan2(m10,
  // m00) in (-pi, pi].
  void FromAngle(Real angle) noexcept {
    const Real c = Math::Cos(angle);
    const Real s = Math::Sin(angle);
    *this = CKRMatrix2T(c, -s, s, c);
  }
  void ToAngle(Real& angle) const noexcept { angle = Math::ATan2((*this)(1, 0), (*this)(0, 0)); }

  // m00 m11 - m01 m10; the adjoint (m11, -m01; -m10, m00).
  Real Determinant() const noexcept { return (*this)(0, 0) * (*this)(1, 1) - (*this)(0, 1) * (*this)(1, 0); }
  CKRMatrix2T Adjoint() const noexcept {
    return CKRMatrix2T((*this)(1, 1), -(*this)(0, 1), -(*this)(1, 0), (*this)(0, 0));
  }
  // The adjoint divided by the determinant; ZERO when abs(determinant) <=
  // EPSILON (1.1920928955078125e-07, an absolute threshold) or when the
  // determinant is not finite (NaN or infinite entries, overflow).
  CKRMatrix2T Inverse() const noexcept {
    const Real determinant = Determinant();
    if (!Base::IsInvertible(determinant))
      return ZERO;
    return Adjoint() * (Real(1) / determinant);
  }

  // Gram-Schmidt on the columns (as CKRVector2T::Orthonormalize): a column
  // whose remainder is not longer than EPSILON becomes zero (a column
  // dependent on the first may leave a remainder of rounding noise).
  void Orthonormalize() noexcept;

  // For a symmetric matrix (m10 is not read): diag = diag(l0, l1) with the
  // eigenvalues l0 <= l1, and rot the rotation whose columns are their unit
  // eigenvectors, so that this = rot * diag * transpose(rot). A double
  // eigenvalue gives rot = IDENTITY; NaN entries give NaN eigenvalues and
  // rot = IDENTITY.
  void EigenDecomposition(CKRMatrix2T& rot, CKRMatrix2T& diag) const noexcept;
};

template <class Real, class Other>
constexpr CKRMatrix2T<Real, Other> CKRMatrix2T<Real, Other>::ZERO{Real(0), Real(0), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRMatrix2T<Real, Other> CKRMatrix2T<Real, Other>::IDENTITY{Real(1), Real(0), Real(0), Real(1)};

extern template class KRCORELIB_API CKRMatrix2T<float, double>;
extern template class KRCORELIB_API CKRMatrix2T<double, float>;
