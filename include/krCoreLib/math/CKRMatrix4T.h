// CKRMatrix4T: the 4 x 4 (homogeneous) matrix in one precision pair.
//
// Adds constructors, the inverse and the builders of rotations, translations
// and scalings to the generic CKRMatrixT<4> (row-major, column vectors: see
// there; a translation stands in column 3 and moves points with w = 1, not
// vectors with w = 0). Constants ZERO and IDENTITY are initialised at compile
// time. Plain values, as the generic class.
#pragma once

#include <krCoreLib/math/CKRMatrixT.h>
#include <krCoreLib/math/CKRVector4T.h>

template <class Real, class Other>
class CKRMatrix4T : public CKRMatrixT<4, Real, Other> {
  using Base = CKRMatrixT<4, Real, Other>;

public:
  using typename Base::Math;
  using Vector4 = CKRVector4T<Real, Other>;

  static const CKRMatrix4T ZERO;
  static const CKRMatrix4T IDENTITY;

  // The zero matrix when `zero` is true (the default), the identity when false.
  explicit CKRMatrix4T(bool zero = true) noexcept : Base(zero) {}
  constexpr CKRMatrix4T(const CKRMatrix4T&) noexcept = default;
  constexpr CKRMatrix4T(const Base& m) noexcept : Base(m) {}
  constexpr CKRMatrix4T(Real m00, Real m01, Real m02, Real m03, Real m10, Real m11, Real m12, Real m13, Real m20,
                        Real m21, Real m22, Real m23, Real m30, Real m31, Real m32, Real m33) noexcept
      : Base(std::in_place, m00, m01, m02, m03, m10, m11, m12, m13, m20, m21, m22, m23, m30, m31, m32, m33) {}
  // Sixteen entries row by row, or column by column when rowMajor is false;
  // a null array gives the zero matrix.
  // (A pointer parameter of its own, so that a vector, which converts to a
  // pointer to its components, is never taken for the array.)
  template <class Pointer>
    requires KRRealPointer<Pointer, Real>
  explicit CKRMatrix4T(Pointer entries, bool rowMajor = true) noexcept : Base(typename Base::SKRUninitialized{}) {
    this->SetEntries(entries, rowMajor);
  }
  CKRMatrix4T& operator=(const CKRMatrix4T&) noexcept = default;

  // The determinant and the adjoint (the transposed cofactors, so that
  // this * Adjoint() = Determinant() * IDENTITY), both from the twelve 2 x 2
  // minors of rows 0-1 and rows 2-3.
  Real Determinant() const noexcept {
    Real determinant;
    Minors(nullptr, determinant);
    return determinant;
  }
  CKRMatrix4T Adjoint() const noexcept {
    CKRMatrix4T adjoint{typename Base::SKRUninitialized{}};
    Real determinant;
    Minors(&adjoint, determinant);
    return adjoint;
  }
  // The adjoint divided by the determinant; ZERO when abs(determinant) <=
  // EPSILON (1.1920928955078125e-07, an absolute threshold) or when the
  // determinant is not finite.
  CKRMatrix4T Inverse() const noexcept {
    CKRMatrix4T adjoint{typename Base::SKRUninitialized{}};
    Real determinant;
    Minors(&adjoint, determinant);
    if (!Base::IsInvertible(determinant))
      return ZERO;
    return adjoint * (Real(1) / determinant);
  }

  // ---- builders ----
  // The rotation by `angle` (right-hand rule) about the direction (x, y, z)
  // of `axis`, normalised here (w is ignored); last row and column (0, 0, 0,
  // 1). A zero axis gives IDENTITY.
  static CKRMatrix4T BuildRotationMatrix(Real angle, Vector4 axis) noexcept;
  // IDENTITY with column 3 replaced by (t.x, t.y, t.z, 1); t.w is ignored.
  static CKRMatrix4T BuildTranslationMatrix(Vector4 t) noexcept;
  // diag(s.x, s.y, s.z, 1); s.w is ignored.
  static CKRMatrix4T BuildScalingMatrix(Vector4 s) noexcept;

private:
  explicit CKRMatrix4T(typename Base::SKRUninitialized tag) noexcept : Base(tag) {}

  // The determinant, and the adjoint unless `adjoint` is null.
  void Minors(CKRMatrix4T* adjoint, Real& determinant) const noexcept {
    const Real* m = this->m_Entry;
    const Real a0 = m[0] * m[5] - m[1] * m[4];
    const Real a1 = m[0] * m[6] - m[2] * m[4];
    const Real a2 = m[0] * m[7] - m[3] * m[4];
    const Real a3 = m[1] * m[6] - m[2] * m[5];
    const Real a4 = m[1] * m[7] - m[3] * m[5];
    const Real a5 = m[2] * m[7] - m[3] * m[6];
    const Real b0 = m[8] * m[13] - m[9] * m[12];
    const Real b1 = m[8] * m[14] - m[10] * m[12];
    const Real b2 = m[8] * m[15] - m[11] * m[12];
    const Real b3 = m[9] * m[14] - m[10] * m[13];
    const Real b4 = m[9] * m[15] - m[11] * m[13];
    const Real b5 = m[10] * m[15] - m[11] * m[14];
    determinant = a0 * b5 - a1 * b4 + a2 * b3 + a3 * b2 - a4 * b1 + a5 * b0;
    if (adjoint == nullptr)
      return;
    *adjoint = CKRMatrix4T(m[5] * b5 - m[6] * b4 + m[7] * b3, -m[1] * b5 + m[2] * b4 - m[3] * b3,
                           m[13] * a5 - m[14] * a4 + m[15] * a3, -m[9] * a5 + m[10] * a4 - m[11] * a3,
                           -m[4] * b5 + m[6] * b2 - m[7] * b1, m[0] * b5 - m[2] * b2 + m[3] * b1,
                           -m[12] * a5 + m[14] * a2 - m[15] * a1, m[8] * a5 - m[10] * a2 + m[11] * a1,
                           m[4] * b4 - m[5] * b2 + m[7] * b0, -m[0] * b4 + m[1] * b2 - m[3] * b0,
                           m[12] * a4 - m[13] * a2 + m[15] * a0, -m[8] * a4 + m[9] * a2 - m[11] * a0,
                           -m[4] * b3 + m[5] * b1 - m[6] * b0, m[0] * b3 - m[1] * b1 + m[2] * b0,
                           -m[12] * a3 + m[13] * a1 - m[14] * a0, m[8] * a3 - m[9] * a1 + m[10] * a0);
  }
};

template <class Real, class Other>
constexpr CKRMatrix4T<Real, Other> CKRMatrix4T<Real, Other>::ZERO{
    Real(0), Real(0), Real(0), Real(0), Real(0), Real(0), Real(0), Real(0),
    Real(0), Real(0), Real(0), Real(0), Real(0), Real(0), Real(0), Real(0)};
template <class Real, class Other>
constexpr CKRMatrix4T<Real, Other> CKRMatrix4T<Real, Other>::IDENTITY{
    Real(1), Real(0), Real(0), Real(0), Real(0), Real(1), Real(0), Real(0),
    Real(0), Real(0), Real(1), Real(0), Real(0), Real(0), Real(0), Real(1)};

extern template class KRCORELIB_API CKRMatrix4T<float, double>;
extern template class KRCORELIB_API CKRMatrix4T<double, float>;
