// CKRMatrix3T: the symmetric eigen decomposition and its steps.
//
// Member definitions, included once by CKRMatrix3T.cpp, which compiles both
// precision pairs. The QL iteration is bounded by 32 steps per eigenvalue;
// non-finite input is recognised before it starts.
#pragma once

#include "CKRMatrix3TSteps.h"

// ---- symmetric eigen decomposition ----

// The Householder reflection Q = (1, 0, 0; 0, c, s; 0, s, -c) with (c, s) =
// (m01, m02) normalised zeroes entry (0, 2) of transpose(Q) * M * Q. It is
// applied whenever m02 is not 0: an absolute threshold would drop a
// significant m02 of a small matrix.
template <class Real, class Other>
bool CKRMatrix3T<Real, Other>::Tridiagonalize(Real d[3], Real e[2]) noexcept {
  const CKRMatrix3T& m = *this;
  const Real a00 = m(0, 0), a01 = m(0, 1), a02 = m(0, 2), a11 = m(1, 1), a12 = m(1, 2), a22 = m(2, 2);
  d[0] = a00;
  if (a02 == Real(0)) {
    d[1] = a11;
    d[2] = a22;
    e[0] = a01;
    e[1] = a12;
    *this = IDENTITY;
    return false;
  }
  const Real length = Norm(a01, a02);
  const Real inverse = Real(1) / length;
  const Real c = a01 * inverse;
  const Real s = a02 * inverse;
  const Real q = Real(2) * c * a12 + s * (a22 - a11);
  d[1] = a11 + s * q;
  d[2] = a22 - s * q;
  e[0] = length;
  e[1] = a12 - c * q;
  *this = CKRMatrix3T(Real(1), Real(0), Real(0), Real(0), c, s, Real(0), s, -c);
  return true;
}

// Implicit QL with Wilkinson's shift (the classic tql2 scheme): for each
// eigenvalue i0, find the first negligible sub-diagonal entry i2 at or after
// it (one that does not change the sum of the magnitudes of its two diagonal
// neighbours), and chase a shifted rotation from i2 up to i0.
template <class Real, class Other>
bool CKRMatrix3T<Real, Other>::QLAlgorithm(Real d[3], Real e[2]) noexcept {
  Real sub[3] = {e[0], e[1], Real(0)};
  bool converged = true;
  for (int i0 = 0; i0 < 3; ++i0) {
    for (int iteration = 0;; ++iteration) {
      int i2 = i0;
      for (; i2 < 2; ++i2) {
        const Real sum = std::fabs(d[i2]) + std::fabs(d[i2 + 1]);
        if (std::fabs(sub[i2]) + sum == sum)
          break;
      }
      if (i2 == i0)
        break;
      if (iteration == kQLIterations) {
        converged = false;
        break;
      }
      // |g| stays below 1 / epsilon (sub[i0] is not negligible against the
      // diagonal), so its square cannot overflow.
      Real g = (d[i0 + 1] - d[i0]) / (Real(2) * sub[i0]);
      Real r = Math::Sqrt(g * g + Real(1));
      g = d[i2] - d[i0] + sub[i0] / (g + (g < Real(0) ? -r : r));
      Real s = Real(1), c = Real(1), p = Real(0);
      bool underflow = false;
      for (int i3 = i2 - 1; i3 >= i0; --i3) {
        const Real f = s * sub[i3];
        const Real b = c * sub[i3];
        r = Norm(f, g);
        sub[i3 + 1] = r;
        if (r == Real(0)) {
          // Both parts of the rotation underflowed: the split is found.
          d[i3 + 1] -= p;
          sub[i2] = Real(0);
          underflow = true;
          break;
        }
        const Real inverse = Real(1) / r;
        s = f * inverse;
        c = g * inverse;
        g = d[i3 + 1] - p;
        r = (d[i3] - g) * s + Real(2) * c * b;
        p = s * r;
        d[i3 + 1] = g + p;
        g = c * r - b;
        RotateColumns(*this, i3 + 1, i3, c, s);
      }
      if (!underflow) {
        d[i0] -= p;
        sub[i0] = g;
        sub[i2] = Real(0);
      }
    }
  }
  e[0] = sub[0];
  e[1] = sub[1];
  return converged;
}

template <class Real, class Other>
void CKRMatrix3T<Real, Other>::EigenDecomposition(CKRMatrix3T& rot, CKRMatrix3T& diag) const noexcept {
  Real largest;
  if (!LargestEntry(*this, true, largest)) {
    rot = IDENTITY;
    diag = NaNDiagonal<Real, Other>();
    return;
  }
  const CKRMatrix3T& m = *this;
  rot = CKRMatrix3T(m(0, 0), m(0, 1), m(0, 2), m(0, 1), m(1, 1), m(1, 2), m(0, 2), m(1, 2), m(2, 2));
  const int exponent = ScaleExponent(largest, false);
  Scale(rot, exponent);
  Real d[3];
  Real e[2];
  rot.Tridiagonalize(d, e);
  rot.QLAlgorithm(d, e);
  // Increasing order by three exchanges, the eigenvectors following.
  for (const int i : {0, 1, 0})
    if (d[i + 1] < d[i]) {
      std::swap(d[i], d[i + 1]);
      SwapColumns(rot, i, i + 1);
    }
  // The reflection and the exchanges may leave a determinant of -1; the
  // sign of an eigenvector is free, so the last one turns it into a
  // rotation.
  if (rot.Determinant() < Real(0))
    for (int r = 0; r < 3; ++r)
      rot(r, 2) = -rot(r, 2);
  diag = Unscaled<Real, Other>(d[0], d[1], d[2], exponent);
}
