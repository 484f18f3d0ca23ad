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
#include <krCoreLib/math/SKRMatrixLanes.h>

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
  // this * Adjoint() = Determinant() * IDENTITY), both from the 2 x 2
  // blocks of the matrix (SKRMatrixLanes).
  Real Determinant() const noexcept { return Lanes::Determinant(this->m_Entry); }
  CKRMatrix4T Adjoint() const noexcept {
    CKRMatrix4T adjoint{typename Base::SKRUninitialized{}};
    Lanes::Adjugate(this->m_Entry, adjoint.m_Entry, false);
    return adjoint;
  }
  // The adjoint divided by the determinant; ZERO when abs(determinant) <=
  // EPSILON (1.1920928955078125e-07, an absolute threshold) or when the
  // determinant is not finite. Always inlined: a call would cost a tenth of
  // the computation and a copy of the result.
  [[gnu::always_inline]] CKRMatrix4T Inverse() const noexcept {
    CKRMatrix4T inverse{typename Base::SKRUninitialized{}};
    if (!Base::IsInvertible(Lanes::Adjugate(this->m_Entry, inverse.m_Entry, true)))
      return ZERO;
    return inverse;
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
  using Lanes = SKRMatrixLanes<Real>;

  explicit CKRMatrix4T(typename Base::SKRUninitialized tag) noexcept : Base(tag) {}
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
