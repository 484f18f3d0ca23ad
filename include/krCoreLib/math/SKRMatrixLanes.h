// SKRMatrixLanes: four-lane arithmetic for the 4 x 4 matrices (matrix times
// vector, adjugate, determinant).
//
// An internal helper of CKRMatrixT and CKRMatrix4T, public only because
// their hot operations are inline. A row of four Reals is held in the
// compiler's vectors (the vector extension of GCC and Clang), SKRQuad: one
// vector of four lanes in single precision (an SSE register), two of two
// lanes in double precision (a vector of four doubles needs AVX; without it
// the compiler moves its lanes through memory). Everything is inlined, so
// no call passes a vector. The adjugate works on the four 2 x 2 blocks of
// the matrix, each packed row by row into one SKRQuad: for M = (A, B; C, D)
// and the 2 x 2 adjugate X# (X X# = det(X) I),
//
//   adj(M) = ((|D| A - B D#C)#, (|B| C - D (A#B)#)#;
//             (|C| B - A (D#C)#)#, (|A| D - C A#B)#),
//   det(M) = |A| |D| + |B| |C| - trace(A#B D#C),
//
// which follows from the inverse of a block matrix through the Schur
// complement, with every inverse of a 2 x 2 block replaced by its adjugate.
// Plain functions without state: callable from any thread.
#pragma once

#include <cstring>

#if !defined(__GNUC__)
#error "krCoreLib's matrices use the vector extensions of GCC and Clang"
#endif

#define KR_LANES_INLINE inline __attribute__((always_inline))

// Four Reals; Shuffle<a, b, c, d>(x, y) picks lanes a, b, c, d of the eight
// lanes of x and y (0..3 from x, 4..7 from y).
template <class Real>
struct SKRQuad;

template <>
struct SKRQuad<float> {
  typedef float Native __attribute__((vector_size(16)));
  Native m_Lanes;

  static KR_LANES_INLINE SKRQuad Load(const float* p) noexcept {
    SKRQuad q;
    std::memcpy(&q.m_Lanes, p, sizeof q.m_Lanes);
    return q;
  }
  KR_LANES_INLINE void Store(float* p) const noexcept { std::memcpy(p, &m_Lanes, sizeof m_Lanes); }
  static KR_LANES_INLINE SKRQuad Of(float a, float b, float c, float d) noexcept { return {Native{a, b, c, d}}; }
  KR_LANES_INLINE float operator[](int i) const noexcept { return m_Lanes[i]; }
  KR_LANES_INLINE SKRQuad operator+(SKRQuad q) const noexcept { return {m_Lanes + q.m_Lanes}; }
  KR_LANES_INLINE SKRQuad operator-(SKRQuad q) const noexcept { return {m_Lanes - q.m_Lanes}; }
  KR_LANES_INLINE SKRQuad operator*(SKRQuad q) const noexcept { return {m_Lanes * q.m_Lanes}; }
  template <int A, int B, int C, int D>
  static KR_LANES_INLINE SKRQuad Shuffle(SKRQuad x, SKRQuad y) noexcept {
    return {__builtin_shufflevector(x.m_Lanes, y.m_Lanes, A, B, C, D)};
  }
};

template <>
struct SKRQuad<double> {
  typedef double Native __attribute__((vector_size(16)));
  Native m_Low;
  Native m_High;

  static KR_LANES_INLINE SKRQuad Load(const double* p) noexcept {
    SKRQuad q;
    std::memcpy(&q.m_Low, p, sizeof q.m_Low);
    std::memcpy(&q.m_High, p + 2, sizeof q.m_High);
    return q;
  }
  KR_LANES_INLINE void Store(double* p) const noexcept {
    std::memcpy(p, &m_Low, sizeof m_Low);
    std::memcpy(p + 2, &m_High, sizeof m_High);
  }
  static KR_LANES_INLINE SKRQuad Of(double a, double b, double c, double d) noexcept {
    return {Native{a, b}, Native{c, d}};
  }
  KR_LANES_INLINE double operator[](int i) const noexcept { return i < 2 ? m_Low[i] : m_High[i - 2]; }
  KR_LANES_INLINE SKRQuad operator+(SKRQuad q) const noexcept { return {m_Low + q.m_Low, m_High + q.m_High}; }
  KR_LANES_INLINE SKRQuad operator-(SKRQuad q) const noexcept { return {m_Low - q.m_Low, m_High - q.m_High}; }
  KR_LANES_INLINE SKRQuad operator*(SKRQuad q) const noexcept { return {m_Low * q.m_Low, m_High * q.m_High}; }
  // Each half of the result from one or two halves of x and y: one
  // two-lane shuffle each.
  template <int A, int B, int C, int D>
  static KR_LANES_INLINE SKRQuad Shuffle(SKRQuad x, SKRQuad y) noexcept {
    return {__builtin_shufflevector(Half<A / 2>(x, y), Half<B / 2>(x, y), A % 2, 2 + B % 2),
            __builtin_shufflevector(Half<C / 2>(x, y), Half<D / 2>(x, y), C % 2, 2 + D % 2)};
  }

private:
  template <int H>
  static KR_LANES_INLINE Native Half(SKRQuad x, SKRQuad y) noexcept {
    if constexpr (H == 0)
      return x.m_Low;
    else if constexpr (H == 1)
      return x.m_High;
    else if constexpr (H == 2)
      return y.m_Low;
    else
      return y.m_High;
  }
};

template <class Real>
struct SKRMatrixLanes {
  // The four dot products of rows 0..3 of a row-major 4 x 4 matrix with x,
  // each summed as (r0 x0 + r2 x2) + (r1 x1 + r3 x3), to out.
  static KR_LANES_INLINE void RowDots(const Real* m, const Real* x, Real* out) noexcept {
    const Quad v = Quad::Load(x);
    const Quad p0 = Quad::Load(m) * v, p1 = Quad::Load(m + 4) * v;
    const Quad p2 = Quad::Load(m + 8) * v, p3 = Quad::Load(m + 12) * v;
    const Quad s01 = Quad::template Shuffle<0, 4, 1, 5>(p0, p1) + Quad::template Shuffle<2, 6, 3, 7>(p0, p1);
    const Quad s23 = Quad::template Shuffle<0, 4, 1, 5>(p2, p3) + Quad::template Shuffle<2, 6, 3, 7>(p2, p3);
    (Quad::template Shuffle<0, 1, 4, 5>(s01, s23) + Quad::template Shuffle<2, 3, 6, 7>(s01, s23)).Store(out);
  }
  // The determinant of a row-major 4 x 4 matrix.
  static KR_LANES_INLINE Real Determinant(const Real* m) noexcept { return SKRBlocks(m).m_Determinant; }
  // Writes adj(M), divided by det(M) when `inverse` is set and det(M) is not
  // 0, to out (row-major) and returns det(M).
  static KR_LANES_INLINE Real Adjugate(const Real* m, Real* out, bool inverse) noexcept {
    const SKRBlocks b(m);
    const Quad x = b.m_DetD * b.m_A - Times(b.m_B, b.m_DC);
    const Quad w = b.m_DetA * b.m_D - Times(b.m_C, b.m_AB);
    const Quad y = b.m_DetB * b.m_C - TimesAdjugate(b.m_D, b.m_AB);
    const Quad z = b.m_DetC * b.m_B - TimesAdjugate(b.m_A, b.m_DC);
    // The adjugate of a packed (p0, p1; p2, p3) is (p3, -p1; -p2, p0).
    const Real scale = inverse && b.m_Determinant != Real(0) ? Real(1) / b.m_Determinant : Real(1);
    const Quad plusMinus = Quad::Of(scale, -scale, scale, -scale);
    const Quad minusPlus = Quad::Of(-scale, scale, -scale, scale);
    (Quad::template Shuffle<3, 1, 7, 5>(x, y) * plusMinus).Store(out);
    (Quad::template Shuffle<2, 0, 6, 4>(x, y) * minusPlus).Store(out + 4);
    (Quad::template Shuffle<3, 1, 7, 5>(z, w) * plusMinus).Store(out + 8);
    (Quad::template Shuffle<2, 0, 6, 4>(z, w) * minusPlus).Store(out + 12);
    return b.m_Determinant;
  }

private:
  using Quad = SKRQuad<Real>;

  // The blocks of the matrix, their determinants (each in all four lanes),
  // A#B, D#C and the determinant of the matrix.
  struct SKRBlocks {
    Quad m_A, m_B, m_C, m_D;
    Quad m_DetA, m_DetB, m_DetC, m_DetD;
    Quad m_AB, m_DC;
    Real m_Determinant;

    explicit KR_LANES_INLINE SKRBlocks(const Real* m) noexcept {
      const Quad r0 = Quad::Load(m), r1 = Quad::Load(m + 4), r2 = Quad::Load(m + 8), r3 = Quad::Load(m + 12);
      m_A = Quad::template Shuffle<0, 1, 4, 5>(r0, r1);
      m_B = Quad::template Shuffle<2, 3, 6, 7>(r0, r1);
      m_C = Quad::template Shuffle<0, 1, 4, 5>(r2, r3);
      m_D = Quad::template Shuffle<2, 3, 6, 7>(r2, r3);
      // (|A|, |B|, |C|, |D|) from the even and odd columns of the row pairs.
      const Quad determinants =
          Quad::template Shuffle<0, 2, 4, 6>(r0, r2) * Quad::template Shuffle<1, 3, 5, 7>(r1, r3) -
          Quad::template Shuffle<1, 3, 5, 7>(r0, r2) * Quad::template Shuffle<0, 2, 4, 6>(r1, r3);
      m_DetA = Quad::template Shuffle<0, 0, 0, 0>(determinants, determinants);
      m_DetB = Quad::template Shuffle<1, 1, 1, 1>(determinants, determinants);
      m_DetC = Quad::template Shuffle<2, 2, 2, 2>(determinants, determinants);
      m_DetD = Quad::template Shuffle<3, 3, 3, 3>(determinants, determinants);
      m_AB = AdjugateTimes(m_A, m_B);
      m_DC = AdjugateTimes(m_D, m_C);
      // trace(A#B D#C) = sum of A#B times the transpose of D#C.
      const Quad trace = m_AB * Quad::template Shuffle<0, 2, 1, 3>(m_DC, m_DC);
      m_Determinant = determinants[0] * determinants[3] + determinants[1] * determinants[2] -
                      ((trace[0] + trace[1]) + (trace[2] + trace[3]));
    }
  };

  // Products of packed 2 x 2 matrices: X Y, X# Y and X Y#.
  static KR_LANES_INLINE Quad Times(Quad x, Quad y) noexcept {
    return Quad::template Shuffle<0, 0, 2, 2>(x, x) * Quad::template Shuffle<0, 1, 0, 1>(y, y) +
           Quad::template Shuffle<1, 1, 3, 3>(x, x) * Quad::template Shuffle<2, 3, 2, 3>(y, y);
  }
  static KR_LANES_INLINE Quad AdjugateTimes(Quad x, Quad y) noexcept {
    return Quad::template Shuffle<3, 3, 0, 0>(x, x) * y -
           Quad::template Shuffle<1, 1, 2, 2>(x, x) * Quad::template Shuffle<2, 3, 0, 1>(y, y);
  }
  static KR_LANES_INLINE Quad TimesAdjugate(Quad x, Quad y) noexcept {
    return x * Quad::template Shuffle<3, 0, 3, 0>(y, y) -
           Quad::template Shuffle<1, 0, 3, 2>(x, x) * Quad::template Shuffle<2, 1, 2, 1>(y, y);
  }
};

#undef KR_LANES_INLINE
