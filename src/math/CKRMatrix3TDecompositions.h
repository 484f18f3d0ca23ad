// CKRMatrix3T: the symmetric eigen decomposition, the singular value
// decomposition and the QDU decomposition, with their steps.
//
// Member definitions, included once by CKRMatrix3T.cpp, which compiles both
// precision pairs. Every loop is bounded: the QL iteration by 32 steps per
// eigenvalue, the Golub-Kahan iteration by 32 steps in all; non-finite input
// is recognised before any iteration starts.
#pragma once

#include <krCoreLib/math/CKRMatrix3T.h>

#include <cmath>
#include <initializer_list>
#include <limits>
#include <utility>

namespace {

// The iteration limits: implicit QL steps per eigenvalue, Golub-Kahan steps
// (and zero-diagonal chases) for the whole singular value decomposition.
// Both iterations converge in two or three steps per value on 3 x 3 input.
constexpr int kQLIterations = 32;
constexpr int kGolubKahanSteps = 32;
// A matrix whose largest entry lies within 2^-kScaleLimit..2^kScaleLimit is
// decomposed as it is; any other is first scaled by a power of two (exact),
// so that no product in the iterations overflows or underflows, in single
// precision too: the shift of the Golub-Kahan step squares squares of
// entries (2^120 < FLT_MAX, 2^-120 > FLT_MIN).
constexpr int kScaleLimit = 30;

// sqrt(a^2 + b^2) without overflow or underflow of the squares.
template <class Real>
Real Hypot(Real a, Real b) {
  a = std::fabs(a);
  b = std::fabs(b);
  if (a < b)
    std::swap(a, b);
  if (a == Real(0))
    return Real(0);
  const Real ratio = b / a;
  return a * std::sqrt(Real(1) + ratio * ratio);
}

// The same, faster: the square root of the sum of squares where that keeps
// full precision (no square overflows, the sum is not subnormal).
template <class Real>
Real Norm(Real a, Real b) {
  const Real squares = a * a + b * b;
  if (squares >= std::numeric_limits<Real>::min() / std::numeric_limits<Real>::epsilon() &&
      squares <= std::numeric_limits<Real>::max())
    return std::sqrt(squares);
  return Hypot(a, b);
}

// (c, s) of the plane rotation taking (y, z) to (r, 0): c = y / r, s = z / r.
template <class Real>
void Givens(Real y, Real z, Real& c, Real& s) {
  const Real r = Hypot(y, z);
  c = r == Real(0) ? Real(1) : y / r;
  s = r == Real(0) ? Real(0) : z / r;
}

// Columns (rows) k and l turned by (c, s): k becomes c k + s l, l becomes
// c l - s k.
template <class Matrix, class Real>
void RotateColumns(Matrix& m, int k, int l, Real c, Real s) {
  for (int r = 0; r < 3; ++r) {
    const Real a = m(r, k);
    const Real b = m(r, l);
    m(r, k) = c * a + s * b;
    m(r, l) = c * b - s * a;
  }
}
template <class Matrix, class Real>
void RotateRows(Matrix& m, int k, int l, Real c, Real s) {
  for (int column = 0; column < 3; ++column) {
    const Real a = m(k, column);
    const Real b = m(l, column);
    m(k, column) = c * a + s * b;
    m(l, column) = c * b - s * a;
  }
}

// The Householder reflection I - beta v v^T that maps x (its entries first..2)
// to a multiple of unit vector `first`; false when nothing is to be done
// (the entries after `first` are 0).
template <class Real>
bool Householder(const Real x[3], int first, Real v[3], Real& beta) {
  const Real tail = first == 0 ? Hypot(x[1], x[2]) : std::fabs(x[2]);
  if (tail == Real(0))
    return false;
  const Real norm = Hypot(x[first], tail);
  // x[first] and the reflected -sign(x[first]) norm have opposite signs: no
  // cancellation.
  v[0] = Real(0);
  v[first] = x[first] + (x[first] >= Real(0) ? norm : -norm);
  for (int i = first + 1; i < 3; ++i)
    v[i] = x[i];
  beta = Real(2) / (v[first] * v[first] + tail * tail);
  return true;
}

// m = (I - beta v v^T) m, and m = m (I - beta v v^T).
template <class Matrix, class Real>
void ReflectRows(Matrix& m, const Real v[3], Real beta) {
  for (int column = 0; column < 3; ++column) {
    const Real s = beta * (v[0] * m(0, column) + v[1] * m(1, column) + v[2] * m(2, column));
    for (int r = 0; r < 3; ++r)
      m(r, column) -= s * v[r];
  }
}
template <class Matrix, class Real>
void ReflectColumns(Matrix& m, const Real v[3], Real beta) {
  for (int r = 0; r < 3; ++r) {
    const Real s = beta * (m(r, 0) * v[0] + m(r, 1) * v[1] + m(r, 2) * v[2]);
    for (int column = 0; column < 3; ++column)
      m(r, column) -= s * v[column];
  }
}

// The largest magnitude among the entries (only those on and above the
// diagonal when `upper`); false when one of them is NaN or infinite.
template <class Real, class Other>
bool LargestEntry(const CKRMatrix3T<Real, Other>& m, bool upper, Real& largest) {
  largest = Real(0);
  for (int r = 0; r < 3; ++r)
    for (int c = upper ? r : 0; c < 3; ++c) {
      const Real magnitude = std::fabs(m(r, c));
      if (!(magnitude <= std::numeric_limits<Real>::max()))
        return false;
      if (magnitude > largest)
        largest = magnitude;
    }
  return true;
}

// The power of two (its exponent) by which the entries are multiplied before
// a decomposition; 0 for a matrix within the safe range (and for zero).
template <class Real>
int ScaleExponent(Real largest) {
  static_assert(kScaleLimit == 30, "the literals below are 2^-30 and 2^30");
  if (largest == Real(0) || (largest >= Real(0x1p-30) && largest <= Real(0x1p30)))
    return 0;
  int exponent = 0;
  std::frexp(largest, &exponent);
  return -exponent;
}

template <class Real, class Other>
void Scale(CKRMatrix3T<Real, Other>& m, int exponent) {
  if (exponent != 0)
    for (int i = 0; i < 9; ++i)
      m[0][i] = std::ldexp(m[0][i], exponent);
}

// The diagonal matrix of d0, d1, d2 scaled back by 2^-exponent.
template <class Real, class Other>
CKRMatrix3T<Real, Other> Unscaled(Real d0, Real d1, Real d2, int exponent) {
  if (exponent == 0)
    return CKRMatrix3T<Real, Other>(d0, d1, d2);
  return CKRMatrix3T<Real, Other>(std::ldexp(d0, -exponent), std::ldexp(d1, -exponent), std::ldexp(d2, -exponent));
}

template <class Real, class Other>
void SwapColumns(CKRMatrix3T<Real, Other>& m, int k, int l) {
  for (int r = 0; r < 3; ++r)
    std::swap(m(r, k), m(r, l));
}

// The diagonal matrix of NaN values that reports non-finite input.
template <class Real, class Other>
CKRMatrix3T<Real, Other> NaNDiagonal() {
  const Real nan = std::numeric_limits<Real>::quiet_NaN();
  return CKRMatrix3T<Real, Other>(nan, nan, nan);
}

}  // namespace

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
  const int exponent = ScaleExponent(largest);
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
  const int exponent = ScaleExponent(largest);
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
  const int exponent = LargestEntry(*this, false, largest) ? ScaleExponent(largest) : 0;
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
