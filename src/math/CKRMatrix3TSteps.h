// The shared steps of the 3 x 3 decompositions: plane rotations, Householder
// reflections, and the scaling of a matrix by a power of two.
//
// Internal to CKRMatrix3T.cpp (which includes it once, with
// CKRMatrix3TEigen.h and CKRMatrix3TSingular.h). Plain functions without
// state.
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
// The eigen and QDU decompositions take a matrix whose largest entry lies
// within 2^-kScaleLimit..2^kScaleLimit as it is and scale any other by a
// power of two (exact), so that no square overflows or underflows in single
// precision (2^60 < FLT_MAX, 2^-60 > FLT_MIN; smaller entries are
// negligible beside the largest). The singular value decomposition always
// scales the largest entry to [0.5, 1): the shift of the Golub-Kahan step
// squares squares of entries down to epsilon times the largest (2^-92 >
// FLT_MIN).
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

// Columns (or, with Rows, rows) k and l turned by (c, s): k becomes c k +
// s l, l becomes c l - s k.
template <bool Rows, class Matrix, class Real>
void Rotate(Matrix& m, int k, int l, Real c, Real s) {
  for (int i = 0; i < 3; ++i) {
    Real& first = Rows ? m(k, i) : m(i, k);
    Real& second = Rows ? m(l, i) : m(i, l);
    const Real a = first;
    first = c * a + s * second;
    second = c * second - s * a;
  }
}
template <class Matrix, class Real>
void RotateColumns(Matrix& m, int k, int l, Real c, Real s) {
  Rotate<false>(m, k, l, c, s);
}
template <class Matrix, class Real>
void RotateRows(Matrix& m, int k, int l, Real c, Real s) {
  Rotate<true>(m, k, l, c, s);
}

// The Householder reflection I - beta v v^T that maps x (its entries first..2)
// to a multiple h of unit vector `first`, h = -sign(x[first]) |x|; false
// when nothing is to be done (the entries after `first` are 0). Scaled so
// that v[first] = 1 and beta = (h - x[first]) / h lies in [1, 2]: only
// ratios of entries are formed, so tiny entries (a rank-deficient rest of
// a matrix) neither underflow nor overflow.
template <class Real>
bool Householder(const Real x[3], int first, Real v[3], Real& beta) {
  const Real tail = first == 0 ? Hypot(x[1], x[2]) : std::fabs(x[2]);
  if (tail == Real(0))
    return false;
  const Real norm = Hypot(x[first], tail);
  // x[first] and h have opposite signs: x[first] - h does not cancel.
  const Real h = x[first] >= Real(0) ? -norm : norm;
  const Real pivot = x[first] - h;
  v[0] = Real(0);
  v[first] = Real(1);
  for (int i = first + 1; i < 3; ++i)
    v[i] = x[i] / pivot;
  beta = (h - x[first]) / h;
  return true;
}

// m = (I - beta v v^T) m (with Rows) or m = m (I - beta v v^T).
template <bool Rows, class Matrix, class Real>
void Reflect(Matrix& m, const Real v[3], Real beta) {
  const auto at = [&](int i, int j) -> Real& { return Rows ? m(j, i) : m(i, j); };
  for (int i = 0; i < 3; ++i) {
    const Real s = beta * (at(i, 0) * v[0] + at(i, 1) * v[1] + at(i, 2) * v[2]);
    for (int j = 0; j < 3; ++j)
      at(i, j) -= s * v[j];
  }
}
template <class Matrix, class Real>
void ReflectRows(Matrix& m, const Real v[3], Real beta) {
  Reflect<true>(m, v, beta);
}
template <class Matrix, class Real>
void ReflectColumns(Matrix& m, const Real v[3], Real beta) {
  Reflect<false>(m, v, beta);
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
// a decomposition, bringing the largest magnitude into [0.5, 1); 0 for zero
// and, unless `always`, for a matrix within the safe range.
template <class Real>
int ScaleExponent(Real largest, bool always) {
  static_assert(kScaleLimit == 30, "the literals below are 2^-30 and 2^30");
  if (largest == Real(0) || (!always && largest >= Real(0x1p-30) && largest <= Real(0x1p30)))
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
