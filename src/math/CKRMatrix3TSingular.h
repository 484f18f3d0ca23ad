// CKRMatrix3T: the singular value decomposition with its steps, and the QDU
// decomposition.
//
// Member definitions, included once by CKRMatrix3T.cpp, which compiles both
// precision pairs. The Golub-Kahan iteration is bounded by 32 steps in all;
// non-finite input is recognised before it starts.
#pragma once

#include "CKRMatrix3TSteps.h"

// ---- singular value decomposition ----

template <class Real, class Other>
void CKRMatrix3T<Real, Other>::Bidiagonalize(CKRMatrix3T& a, CKRMatrix3T& left, CKRMatrix3T& right) noexcept {
  left = IDENTITY;
  right = IDENTITY;
  Real v[3];
  Real beta;
  const Real column0[3] = {a(0, 0), a(1, 0), a(2, 0)};
  if (Householder(column0, 0, v, beta)) {
    ReflectRows(a, v, beta);
    ReflectColumns(left, v, beta);
  }
  const Real row0[3] = {a(0, 0), a(0, 1), a(0, 2)};
  if (Householder(row0, 1, v, beta)) {
    ReflectColumns(a, v, beta);
    ReflectColumns(right, v, beta);
  }
  const Real column1[3] = {a(0, 1), a(1, 1), a(2, 1)};
  if (Householder(column1, 1, v, beta)) {
    ReflectRows(a, v, beta);
    ReflectColumns(left, v, beta);
  }
  a(1, 0) = a(2, 0) = a(2, 1) = a(0, 2) = Real(0);
}

// One implicit QR step on B^T B of the block, with the Wilkinson shift of its
// trailing 2 x 2 part, carried out on B by chasing the bulge with
// alternating right and left rotations.
template <class Real, class Other>
void CKRMatrix3T<Real, Other>::GolubKahanStep(CKRMatrix3T& a, CKRMatrix3T& left, CKRMatrix3T& right, int low,
                                               int high) noexcept {
  const Real dm = a(high - 1, high - 1);
  const Real dn = a(high, high);
  const Real em = a(high - 1, high);
  const Real fm = high - 1 > low ? a(high - 2, high - 1) : Real(0);
  const Real t11 = dm * dm + fm * fm;
  const Real t12 = dm * em;
  const Real t22 = dn * dn + em * em;
  const Real delta = Real(0.5) * (t11 - t22);
  const Real denominator = delta + (delta < Real(0) ? -Hypot(delta, t12) : Hypot(delta, t12));
  const Real shift = denominator != Real(0) ? t22 - t12 * t12 / denominator : t22;
  Real y = a(low, low) * a(low, low) - shift;
  Real z = a(low, low) * a(low, low + 1);
  for (int k = low; k < high; ++k) {
    Real c;
    Real s;
    Givens(y, z, c, s);
    RotateColumns(a, k, k + 1, c, s);
    RotateColumns(right, k, k + 1, c, s);
    Givens(a(k, k), a(k + 1, k), c, s);
    RotateRows(a, k, k + 1, c, s);
    RotateColumns(left, k, k + 1, c, s);
    if (k + 1 < high) {
      y = a(k, k + 1);
      z = a(k, k + 2);
    }
  }
  a(1, 0) = a(2, 0) = a(2, 1) = a(0, 2) = Real(0);
}

template <class Real, class Other>
void CKRMatrix3T<Real, Other>::SingularValueDecomposition(CKRMatrix3T& left, CKRMatrix3T& diag,
                                                          CKRMatrix3T& right) const noexcept {
  Real largest;
  if (!LargestEntry(*this, false, largest)) {
    left = right = IDENTITY;
    diag = NaNDiagonal<Real, Other>();
    return;
  }
  CKRMatrix3T a = *this;
  const int exponent = ScaleExponent(largest, true);
  Scale(a, exponent);
  Bidiagonalize(a, left, right);
  // Negligible: a super-diagonal entry within rounding of its diagonal
  // neighbours; a diagonal entry within rounding of the bidiagonal's norm.
  const Real epsilon = std::numeric_limits<Real>::epsilon();
  Real norm = Real(0);
  for (int i = 0; i < 3; ++i)
    norm = std::fmax(norm, std::fabs(a(i, i)) + (i < 2 ? std::fabs(a(i, i + 1)) : Real(0)));
  for (int step = 0; step < kGolubKahanSteps; ++step) {
    for (int i = 0; i < 2; ++i)
      if (std::fabs(a(i, i + 1)) <= epsilon * (std::fabs(a(i, i)) + std::fabs(a(i + 1, i + 1))))
        a(i, i + 1) = Real(0);
    for (int i = 0; i < 3; ++i)
      if (std::fabs(a(i, i)) <= epsilon * norm)
        a(i, i) = Real(0);
    if (a(0, 1) == Real(0) && a(1, 2) == Real(0))
      break;
    const int low = a(0, 1) == Real(0) ? 1 : 0;
    const int high = a(1, 2) == Real(0) ? 1 : 2;
    int zero = low;
    while (zero <= high && a(zero, zero) != Real(0))
      ++zero;
    if (zero < high) {
      // A zero diagonal entry: its row's super-diagonal entry is rotated
      // into the rows below until it vanishes, which splits the block.
      for (int j = zero + 1; j <= high; ++j) {
        Real c;
        Real s;
        Givens(a(j, j), a(zero, j), c, s);
        RotateRows(a, j, zero, c, s);
        RotateColumns(left, j, zero, c, s);
      }
    } else if (zero == high) {
      // The last diagonal entry is zero: the column above it is rotated
      // into the columns to its left.
      for (int j = high - 1; j >= low; --j) {
        Real c;
        Real s;
        Givens(a(j, j), a(j, high), c, s);
        RotateColumns(a, j, high, c, s);
        RotateColumns(right, j, high, c, s);
      }
    } else {
      GolubKahanStep(a, left, right, low, high);
    }
  }
  Real d[3] = {a(0, 0), a(1, 1), a(2, 2)};
  for (int i = 0; i < 3; ++i)
    if (d[i] < Real(0)) {
      d[i] = -d[i];
      for (int r = 0; r < 3; ++r)
        right(r, i) = -right(r, i);
    }
  for (const int i : {0, 1, 0})
    if (d[i + 1] > d[i]) {
      std::swap(d[i], d[i + 1]);
      SwapColumns(left, i, i + 1);
      SwapColumns(right, i, i + 1);
    }
  diag = Unscaled<Real, Other>(d[0], d[1], d[2], exponent);
}

template <class Real, class Other>
CKRMatrix3T<Real, Other>& CKRMatrix3T<Real, Other>::SingularValueComposition(const CKRMatrix3T& left,
                                                                             const CKRMatrix3T& diag,
                                                                             const CKRMatrix3T& right) noexcept {
  return *this = left * diag.TimesTranspose(right);
}

// ---- QDU decomposition ----

// Householder QR of the columns (orthogonal to rounding, also for nearly
// dependent columns, where Gram-Schmidt loses orthogonality), the signs
// chosen so that the diagonal of R is non-negative, which makes it the
// Gram-Schmidt factorisation of an invertible matrix.
template <class Real, class Other>
void CKRMatrix3T<Real, Other>::QDUDecomposition(CKRMatrix3T& q, CKRMatrix3T& d, CKRMatrix3T& u) const noexcept {
  Real largest;
  const int exponent = LargestEntry(*this, false, largest) ? ScaleExponent(largest, false) : 0;
  CKRMatrix3T r = *this;
  Scale(r, exponent);
  q = IDENTITY;
  Real v[3];
  Real beta;
  for (int column = 0; column < 2; ++column) {
    const Real x[3] = {r(0, column), r(1, column), r(2, column)};
    if (Householder(x, column, v, beta)) {
      ReflectRows(r, v, beta);
      ReflectColumns(q, v, beta);
    }
  }
  r(1, 0) = r(2, 0) = r(2, 1) = Real(0);
  for (int i = 0; i < 3; ++i)
    if (r(i, i) < Real(0))
      for (int k = 0; k < 3; ++k) {
        r(i, k) = -r(i, k);
        q(k, i) = -q(k, i);
      }
  d = Unscaled<Real, Other>(r(0, 0), r(1, 1), r(2, 2), exponent);
  u = IDENTITY;
  for (int i = 0; i < 2; ++i)
    for (int j = i + 1; j < 3; ++j)
      u(i, j) = r(i, i) != Real(0) ? r(i, j) / r(i, i) : Real(0);
}
