// CKRMatrix3T: the 3 x 3 matrix in one precision pair.
//
// Adds constructors, rotations (axis and angle, Euler angles in all six
// orders, interpolation), tensor products, the inverse, Gram-Schmidt and the
// decompositions (symmetric eigen, singular value, QDU) to the generic
// CKRMatrixT<3> (row-major, column vectors: see there). Constants ZERO and
// IDENTITY are initialised at compile time. Plain values, as the generic
// class; nothing throws and every operation terminates, also for NaN and
// infinite entries.
//
// Angles follow the right-hand rule: a positive angle turns counter-
// clockwise looking down the axis towards the origin, so the rotation by a
// about (0, 0, 1) maps (1, 0, 0) to (cos a, sin a, 0). The angle constants
// of CKRMathT are single-precision values in both pairs: HALF_PI is about
// 4.37e-8 above pi / 2, so FromAxisAngle(UNIT_Z, CKRMathT::HALF_PI) maps
// (1, 0, 0) to (-4.37e-8, 1, 0), below the rounding of single precision but
// not of double. Pass pi / 2 at full precision (std::numbers::pi / 2) for a
// quarter turn exact to double rounding. Angles this class computes (axis
// and angle, Euler angles, also at a gimbal lock) use pi at the precision
// of Real.
#pragma once

#include <krCoreLib/math/CKRMatrixT.h>
#include <krCoreLib/math/CKRVector3T.h>

template <class Real, class Other>
class CKRMatrix3T : public CKRMatrixT<3, Real, Other> {
  using Base = CKRMatrixT<3, Real, Other>;

public:
  using typename Base::Math;
  using Vector3 = CKRVector3T<Real, Other>;

  static const CKRMatrix3T ZERO;
  static const CKRMatrix3T IDENTITY;

  // The zero matrix when `zero` is true (the default), the identity when false.
  explicit CKRMatrix3T(bool zero = true) noexcept : Base(zero) {}
  constexpr CKRMatrix3T(const CKRMatrix3T&) noexcept = default;
  constexpr CKRMatrix3T(const Base& m) noexcept : Base(m) {}
  constexpr CKRMatrix3T(Real m00, Real m01, Real m02, Real m10, Real m11, Real m12, Real m20, Real m21,
                        Real m22) noexcept
      : Base(std::in_place, m00, m01, m02, m10, m11, m12, m20, m21, m22) {}
  // Nine entries row by row, or column by column when rowMajor is false; a
  // null array gives the zero matrix.
  // (A pointer parameter of its own, so that a vector, which converts to a
  // pointer to its components, is never taken for the array.)
  template <class Pointer>
    requires KRRealPointer<Pointer, Real>
  explicit CKRMatrix3T(Pointer entries, bool rowMajor = true) noexcept : Base(typename Base::SKRUninitialized{}) {
    this->SetEntries(entries, rowMajor);
  }
  // Three vectors as the columns, or as the rows when `columns` is false; a
  // null array gives the zero matrix.
  CKRMatrix3T(const Vector3* vectors, bool columns) noexcept;
  CKRMatrix3T(const Vector3& u, const Vector3& v, const Vector3& w, bool columns) noexcept;
  // The diagonal matrix diag(d0, d1, d2).
  CKRMatrix3T(Real d0, Real d1, Real d2) noexcept
      : Base(std::in_place, d0, Real(0), Real(0), Real(0), d1, Real(0), Real(0), Real(0), d2) {}
  // The rotation FromAxisAngle(axis, angle).
  CKRMatrix3T(const Vector3& axis, Real angle) noexcept : Base(typename Base::SKRUninitialized{}) {
    FromAxisAngle(axis, angle);
  }
  // The tensor product u v^T (MakeTensorProduct).
  CKRMatrix3T(const Vector3& u, const Vector3& v) noexcept : Base(typename Base::SKRUninitialized{}) {
    MakeTensorProduct(u, v);
  }
  CKRMatrix3T& operator=(const CKRMatrix3T&) noexcept = default;

  using Base::MakeDiagonal;
  void MakeDiagonal(Real d0, Real d1, Real d2) noexcept { *this = CKRMatrix3T(d0, d1, d2); }
  // Entry (i, j) = u(i) v(j).
  void MakeTensorProduct(const Vector3& u, const Vector3& v) noexcept;

  // ---- rotations ----
  // The rotation by `angle` about a unit axis (x, y, z), with c = cos a,
  // s = sin a, t = 1 - c: rows (t x x + c, t x y - s z, t x z + s y),
  // (t x y + s z, t y y + c, t y z - s x), (t x z - s y, t y z + s x,
  // t z z + c). The axis is not normalised.
  void FromAxisAngle(const Vector3& axis, Real angle) noexcept;
  // Axis and angle of a rotation matrix, angle in [0, pi]: angle 0 gives
  // axis (1, 0, 0); a half turn gives the axis whose largest component is
  // positive. The angle is computed from the trace and the antisymmetric
  // part together (accurate near 0 and pi); a half turn gives pi rounded to
  // Real (not the single-precision PI). A matrix that is not a rotation
  // gives an axis and angle without meaning; NaN entries give angle 0 about
  // (1, 0, 0).
  void ToAxisAngle(Vector3& axis, Real& angle) const noexcept;

  // Euler angles: the product of the three axis rotations in the order of the
  // name, each argument belonging to the axis at the same position
  // (FromEulerAnglesXZY(x, z, y) is Rx(x) * Rz(z) * Ry(y)), with Rx = (1, 0,
  // 0; 0, c, -s; 0, s, c), Ry = (c, 0, s; 0, 1, 0; -s, 0, c), Rz = (c, -s,
  // 0; s, c, 0; 0, 0, 1).
  void FromEulerAnglesXYZ(Real x, Real y, Real z) noexcept;
  void FromEulerAnglesXZY(Real x, Real z, Real y) noexcept;
  void FromEulerAnglesYXZ(Real y, Real x, Real z) noexcept;
  void FromEulerAnglesYZX(Real y, Real z, Real x) noexcept;
  void FromEulerAnglesZXY(Real z, Real x, Real y) noexcept;
  void FromEulerAnglesZYX(Real z, Real y, Real x) noexcept;
  // The inverse of the matching From: true when the factorisation is unique.
  // The middle angle is the arcsine of one entry t; when t >= 1 or t <= -1
  // (gimbal lock) only a sum or difference of the outer angles is defined:
  // the first angle receives it, the middle angle +-pi/2 (in Real
  // precision, not HALF_PI), the last angle 0, and false is returned; the
  // From of these angles rebuilds the matrix. The outer angles lie in
  // [-pi, pi], the middle one in [-pi/2, pi/2]. NaN entries give false.
  bool ToEulerAnglesXYZ(Real& x, Real& y, Real& z) const noexcept;
  bool ToEulerAnglesXZY(Real& x, Real& z, Real& y) const noexcept;
  bool ToEulerAnglesYXZ(Real& y, Real& x, Real& z) const noexcept;
  bool ToEulerAnglesYZX(Real& y, Real& z, Real& x) const noexcept;
  bool ToEulerAnglesZXY(Real& z, Real& x, Real& y) const noexcept;
  bool ToEulerAnglesZYX(Real& z, Real& y, Real& x) const noexcept;

  // The rotation a fraction t of the way from r0 to r1: r0 *
  // FromAxisAngle(axis, t * angle) with axis and angle of transpose(r0) * r1
  // (ToAxisAngle, so the way is at most a half turn).
  static CKRMatrix3T Slerp(Real t, const CKRMatrix3T& r0, const CKRMatrix3T& r1) noexcept;

  // ---- inverse and Gram-Schmidt ----
  // Cofactor expansion along the first row; the adjoint (the transposed
  // cofactors), so that this * Adjoint() = Determinant() * IDENTITY.
  Real Determinant() const noexcept {
    const Real* m = this->m_Entry;
    return m[0] * (m[4] * m[8] - m[5] * m[7]) + m[1] * (m[5] * m[6] - m[3] * m[8]) +
           m[2] * (m[3] * m[7] - m[4] * m[6]);
  }
  CKRMatrix3T Adjoint() const noexcept {
    const Real* m = this->m_Entry;
    return CKRMatrix3T(m[4] * m[8] - m[5] * m[7], m[2] * m[7] - m[1] * m[8], m[1] * m[5] - m[2] * m[4],
                       m[5] * m[6] - m[3] * m[8], m[0] * m[8] - m[2] * m[6], m[2] * m[3] - m[0] * m[5],
                       m[3] * m[7] - m[4] * m[6], m[1] * m[6] - m[0] * m[7], m[0] * m[4] - m[1] * m[3]);
  }
  // The adjoint divided by the determinant; ZERO when abs(determinant) <=
  // EPSILON (1.1920928955078125e-07, an absolute threshold: diag(1e-3,
  // 1e-3, 1e-3) counts as singular) or when the determinant is not finite.
  CKRMatrix3T Inverse() const noexcept {
    const CKRMatrix3T adjoint = Adjoint();
    const Real* m = this->m_Entry;
    // The first row times the first column of the adjoint: the expansion
    // along the first row, from the cofactors already computed.
    const Real determinant = m[0] * adjoint(0, 0) + m[1] * adjoint(1, 0) + m[2] * adjoint(2, 0);
    if (!Base::IsInvertible(determinant))
      return ZERO;
    return adjoint * (Real(1) / determinant);
  }
  // Gram-Schmidt on the columns (as CKRVector3T::Orthonormalize): column 0
  // normalised, column 1 minus its projection on column 0, normalised, column
  // 2 minus its projections on both, normalised. A column whose remainder is
  // not longer than EPSILON becomes zero (a column dependent on the ones
  // before may leave a remainder of rounding noise).
  void Orthonormalize() noexcept;

  // ---- decompositions ----
  // For a symmetric matrix (only the upper triangle is read): rot a rotation
  // whose columns are unit eigenvectors, diag the eigenvalues on its diagonal
  // in increasing order, so that this = rot * diag * transpose(rot).
  // Householder tridiagonalisation and at most 32 implicit QL steps per
  // eigenvalue (the result so far is kept when they do not converge). The
  // zero matrix gives IDENTITY and ZERO; NaN or infinite entries give
  // rot = IDENTITY and NaN eigenvalues.
  void EigenDecomposition(CKRMatrix3T& rot, CKRMatrix3T& diag) const noexcept;
  // this = left * diag * transpose(right) with left and right orthogonal and
  // the singular values on the diagonal of diag, non-negative and in
  // decreasing order. Householder bidiagonalisation and at most 32
  // Golub-Kahan steps. NaN or infinite entries give left = right = IDENTITY
  // and NaN singular values.
  void SingularValueDecomposition(CKRMatrix3T& left, CKRMatrix3T& diag, CKRMatrix3T& right) const noexcept;
  // Sets this to left * diag * transpose(right) and returns it.
  CKRMatrix3T& SingularValueComposition(const CKRMatrix3T& left, const CKRMatrix3T& diag,
                                        const CKRMatrix3T& right) noexcept;
  // this = q * d * u with q orthogonal, d diagonal with non-negative entries
  // and u upper triangular with unit diagonal (the QR factorisation of the
  // columns, d the diagonal of R, u = d^-1 R). A singular matrix gives a 0
  // in d; that row of u is then the identity's and the product no longer
  // reproduces what this matrix adds along it.
  void QDUDecomposition(CKRMatrix3T& q, CKRMatrix3T& d, CKRMatrix3T& u) const noexcept;

protected:
  // The steps of the decompositions. Tridiagonalize replaces this symmetric
  // matrix by the Householder reflection Q with transpose(Q) * this * Q
  // tridiagonal (diagonal d, sub-diagonal e) and returns whether Q is a
  // reflection. QLAlgorithm diagonalises (d, e) with implicit QL steps,
  // accumulating the rotations into this, and returns false when an
  // eigenvalue does not converge within 32 steps.
  bool Tridiagonalize(Real d[3], Real e[2]) noexcept;
  bool QLAlgorithm(Real d[3], Real e[2]) noexcept;
  // Bidiagonalize makes a upper bidiagonal by Householder reflections,
  // accumulating them so that left * a * transpose(right) is unchanged.
  // GolubKahanStep applies one implicitly shifted QR step to the unreduced
  // block of rows and columns low..high of the bidiagonal a.
  static void Bidiagonalize(CKRMatrix3T& a, CKRMatrix3T& left, CKRMatrix3T& right) noexcept;
  static void GolubKahanStep(CKRMatrix3T& a, CKRMatrix3T& left, CKRMatrix3T& right, int low, int high) noexcept;
};

template <class Real, class Other>
constexpr CKRMatrix3T<Real, Other> CKRMatrix3T<Real, Other>::ZERO{Real(0), Real(0), Real(0), Real(0), Real(0),
                                                                  Real(0), Real(0), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRMatrix3T<Real, Other> CKRMatrix3T<Real, Other>::IDENTITY{Real(1), Real(0), Real(0), Real(0), Real(1),
                                                                      Real(0), Real(0), Real(0), Real(1)};

extern template class KRCORELIB_API CKRMatrix3T<float, double>;
extern template class KRCORELIB_API CKRMatrix3T<double, float>;
