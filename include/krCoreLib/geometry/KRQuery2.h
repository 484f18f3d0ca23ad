// krRationalArithmetic queries: on which side of a line a point lies,
// whether it lies inside a triangle, and whether inside a circumcircle,
// each for a point and vertices of a caller-owned array of 2-D vertices.
//
// Results, alike in every strategy:
//   ToLine(p, a, b)            +1 right of the directed line a -> b, 0 on it,
//                              -1 left
//   ToTriangle(p, a, b, c)     +1 outside, 0 on an edge, -1 strictly inside
//                              (a, b, c counter-clockwise)
//   ToCircumcircle(p, a, b, c) +1 outside, 0 on the circle, -1 inside
//                              (a, b, c counter-clockwise)
// The index forms use vertex i as the point. Indexes are not checked: the
// caller keeps them in 0..n-1. The vertex array is not copied and must
// outlive the query. The vertices are single-precision 2-D vectors in both
// precision pairs; the pair sets the type of the floating-point strategies
// (Real) and the size of the rationals (TRational<16> for <float, double>,
// TRational<32> for <double, float>).
//
// Strategies and the inputs for which they are exact (no rounding changes
// a sign, no integer wraps):
//   TYPE_INT64     Query2Int64: coordinates truncated toward zero to 64-bit
//                  integers. ToLine (and ToTriangle) exact for integral
//                  coordinates of magnitude below 2^29, ToCircumcircle below
//                  2^13; beyond that the 64-bit values wrap.
//   TYPE_INTEGER   Query2TInteger: coordinates truncated to 32-bit integers,
//                  ToLine in TInteger<2>, ToCircumcircle in TInteger<4>.
//                  Exact for integral coordinates of magnitude below 2^29;
//                  beyond that the differences or the integers wrap.
//   TYPE_RATIONAL  Query2TRational: exact rationals of the float values.
//                  With every coordinate below 2^A in magnitude and a
//                  multiple of 2^-B, ToLine is exact while 2A + 4B <= 500
//                  and ToCircumcircle while 4A + 8B <= 480 (TRational<16>);
//                  1010 and 990 for TRational<32>. A float of magnitude at
//                  least 2^m is a multiple of 2^(m-23): coordinates that are
//                  0 or between 2^-20 and 2^20 in magnitude have A = 20,
//                  B = 43, well inside both.
//   TYPE_REAL      Query2: floating point in Real. ToLine exact for integral
//                  coordinates below 2^11 (float) or 2^25 (double),
//                  ToCircumcircle below 2^4 (float) or 2^10 (double);
//                  otherwise rounding may flip nearly degenerate answers.
//   TYPE_FILTERED  Query2Filtered with uncertainty u: the floating-point
//                  value decides when abs(d) exceeds u times the product of
//                  the row lengths (ToLine compares the squares; for
//                  ToCircumcircle the third entry of a row counts as
//                  |sx dx| + |sy dy|, which bounds its rounding), an exact
//                  evaluation otherwise: for ToLine the adaptive orientation
//                  predicate (exact for all finite float coordinates), then
//                  the rationals (non-finite input); for ToCircumcircle the
//                  rationals. With u at least 16 epsilon of Real (2e-6 for
//                  float, 4e-15 for double) every answer is exact within the
//                  rational range; u = 0 always trusts the floating-point
//                  value.
//
// Thread safety: the rational strategy and the filtered one fill a cache of
// converted vertices inside const queries; such a query must not be used by
// two threads at once. The others are safe to share once built.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/geometry/KRTRational.h>
#include <krCoreLib/math/CKRVector2T.h>

#include <cstdint>
#include <memory>
#include <type_traits>

namespace krRationalArithmetic {

class KRCORELIB_API Query {
public:
  enum Type {
    TYPE_INT64 = 0,
    TYPE_INTEGER = 1,
    TYPE_RATIONAL = 2,
    TYPE_REAL = 3,
    TYPE_FILTERED = 4,
  };

  virtual ~Query();
  virtual Type GetType() const = 0;

protected:
  Query() = default;
  Query(const Query&) = default;
  Query& operator=(const Query&) = default;
};

// Floating-point strategy, and the base of the others.
template <class Real, class Other>
class Query2 : public Query {
public:
  using Vector = CKRVector2T<float, double>;

  // n vertices at `vertices` (not copied, not owned).
  Query2(int n, const Vector* vertices) noexcept : m_iVQuantity(n), m_akVertex(vertices) {}
  Query2(const Query2&) = default;
  Query2& operator=(const Query2&) = default;
  ~Query2() override = default;

  Type GetType() const override { return TYPE_REAL; }

  virtual int ToLine(const Vector& p, int a, int b) const;
  virtual int ToLine(int i, int a, int b) const { return ToLine(m_akVertex[i], a, b); }
  virtual int ToTriangle(const Vector& p, int a, int b, int c) const;
  virtual int ToTriangle(int i, int a, int b, int c) const { return ToTriangle(m_akVertex[i], a, b, c); }
  virtual int ToCircumcircle(const Vector& p, int a, int b, int c) const;
  virtual int ToCircumcircle(int i, int a, int b, int c) const { return ToCircumcircle(m_akVertex[i], a, b, c); }

  int GetQuantity() const noexcept { return m_iVQuantity; }
  const Vector* GetVertices() const noexcept { return m_akVertex; }

  static Real Dot(Real x0, Real y0, Real x1, Real y1) noexcept { return x0 * x1 + y0 * y1; }
  static Real Det2(Real x0, Real y0, Real x1, Real y1) noexcept { return x0 * y1 - x1 * y0; }
  static Real Det3(Real x0, Real y0, Real z0, Real x1, Real y1, Real z1, Real x2, Real y2, Real z2) noexcept {
    return x0 * (y1 * z2 - y2 * z1) + y0 * (z1 * x2 - z2 * x1) + z0 * (x1 * y2 - x2 * y1);
  }

protected:
  int m_iVQuantity;
  const Vector* m_akVertex;
};

// 64-bit integer strategy.
template <class Real, class Other>
class Query2Int64 : public Query2<Real, Other> {
  using Base = Query2<Real, Other>;

public:
  using typename Base::Vector;
  Query2Int64(int n, const Vector* vertices) noexcept : Base(n, vertices) {}
  Query2Int64(const Query2Int64&) = default;
  Query2Int64& operator=(const Query2Int64&) = default;

  Query::Type GetType() const override { return Query::TYPE_INT64; }
  using Base::ToCircumcircle;
  using Base::ToLine;
  int ToLine(const Vector& p, int a, int b) const override;
  int ToCircumcircle(const Vector& p, int a, int b, int c) const override;

  // Wrapping (two's complement) 64-bit determinants.
  static std::int64_t Det2(std::int64_t x0, std::int64_t y0, std::int64_t x1, std::int64_t y1) noexcept;
  static std::int64_t Det3(std::int64_t x0, std::int64_t y0, std::int64_t z0, std::int64_t x1, std::int64_t y1,
                           std::int64_t z1, std::int64_t x2, std::int64_t y2, std::int64_t z2) noexcept;
};

// Multi-word integer strategy.
template <class Real, class Other>
class Query2TInteger : public Query2<Real, Other> {
  using Base = Query2<Real, Other>;

public:
  using typename Base::Vector;
  Query2TInteger(int n, const Vector* vertices) noexcept : Base(n, vertices) {}
  Query2TInteger(const Query2TInteger&) = default;
  Query2TInteger& operator=(const Query2TInteger&) = default;

  Query::Type GetType() const override { return Query::TYPE_INTEGER; }
  using Base::ToCircumcircle;
  using Base::ToLine;
  int ToLine(const Vector& p, int a, int b) const override;
  int ToCircumcircle(const Vector& p, int a, int b, int c) const override;

  static TInteger<2> Det2(const TInteger<2>& x0, const TInteger<2>& y0, const TInteger<2>& x1,
                          const TInteger<2>& y1) noexcept {
    return x0 * y1 - x1 * y0;
  }
  static TInteger<4> Det3(const TInteger<4>& x0, const TInteger<4>& y0, const TInteger<4>& z0,
                          const TInteger<4>& x1, const TInteger<4>& y1, const TInteger<4>& z1,
                          const TInteger<4>& x2, const TInteger<4>& y2, const TInteger<4>& z2) noexcept {
    return x0 * (y1 * z2 - y2 * z1) + y0 * (z1 * x2 - z2 * x1) + z0 * (x1 * y2 - x2 * y1);
  }
};

// Exact rational strategy; converts each vertex once, when first needed.
template <class Real, class Other>
class Query2TRational : public Query2<Real, Other> {
  using Base = Query2<Real, Other>;

public:
  static constexpr int ISIZE = std::is_same_v<Real, float> ? 16 : 32;
  using Rational = TRational<ISIZE>;
  using RVector = RVector2<ISIZE>;
  using typename Base::Vector;

  Query2TRational(int n, const Vector* vertices) : Base(n, vertices) {}
  // A copy starts with an empty cache (the cache is derived data).
  Query2TRational(const Query2TRational& q) : Base(q) {}
  Query2TRational& operator=(const Query2TRational& q);
  ~Query2TRational() override;

  Query::Type GetType() const override { return Query::TYPE_RATIONAL; }
  int ToLine(const Vector& p, int a, int b) const override;
  int ToLine(int i, int a, int b) const override;
  int ToTriangle(const Vector& p, int a, int b, int c) const override;
  int ToTriangle(int i, int a, int b, int c) const override;
  int ToCircumcircle(const Vector& p, int a, int b, int c) const override;
  int ToCircumcircle(int i, int a, int b, int c) const override;

  static Rational Dot(const Rational& x0, const Rational& y0, const Rational& x1, const Rational& y1) noexcept {
    return x0 * x1 + y0 * y1;
  }
  static Rational Det2(const Rational& x0, const Rational& y0, const Rational& x1, const Rational& y1) noexcept {
    return x0 * y1 - x1 * y0;
  }
  static Rational Det3(const Rational& x0, const Rational& y0, const Rational& z0, const Rational& x1,
                       const Rational& y1, const Rational& z1, const Rational& x2, const Rational& y2,
                       const Rational& z2) noexcept {
    return x0 * (y1 * z2 - y2 * z1) + y0 * (z1 * x2 - z2 * x1) + z0 * (x1 * y2 - x2 * y1);
  }

private:
  // Converts the listed vertices that are not converted yet.
  void Convert(int count, const int* indices) const;
  int ToLine(const RVector& p, int a, int b) const;
  int ToTriangle(const RVector& p, int a, int b, int c) const;
  int ToCircumcircle(const RVector& p, int a, int b, int c) const;
  static RVector ToRational(const Vector& v) noexcept { return RVector(Rational(v.X()), Rational(v.Y())); }

  // Allocated with the vertex count on the first conversion.
  mutable std::unique_ptr<RVector[]> m_akRVertex;
  mutable std::unique_ptr<bool[]> m_abEvaluated;
};

// Floating point where the value is clearly decided, exact otherwise.
template <class Real, class Other>
class Query2Filtered : public Query2<Real, Other> {
  using Base = Query2<Real, Other>;

public:
  using typename Base::Vector;
  Query2Filtered(int n, const Vector* vertices, Real uncertainty)
      : Base(n, vertices), m_kRQuery(n, vertices), m_fUncertainty(uncertainty) {}
  Query2Filtered(const Query2Filtered&) = default;
  Query2Filtered& operator=(const Query2Filtered&) = default;

  Query::Type GetType() const override { return Query::TYPE_FILTERED; }
  using Base::ToCircumcircle;
  using Base::ToLine;
  // Inline, so that a call on a known query object costs no more than the
  // floating-point test; squares compare, which spares the square roots of
  // the two lengths. A square that overflows is trusted only against a
  // finite bound, one that underflows to the bound is not trusted.
  int ToLine(const Vector& p, int a, int b) const override {
    const Vector& va = this->m_akVertex[a];
    const Vector& vb = this->m_akVertex[b];
    const Real x0 = Real(p.X()) - Real(va.X());
    const Real y0 = Real(p.Y()) - Real(va.Y());
    const Real x1 = Real(vb.X()) - Real(va.X());
    const Real y1 = Real(vb.Y()) - Real(va.Y());
    const Real d = x0 * y1 - x1 * y0;
    const Real bound = m_fUncertainty * m_fUncertainty * (x0 * x0 + y0 * y0) * (x1 * x1 + y1 * y1);
    if (d * d > bound || m_fUncertainty == Real(0))
      return (d > Real(0)) - (d < Real(0));
    return ExactLine(p, a, b);
  }
  int ToCircumcircle(const Vector& p, int a, int b, int c) const override;

private:
  // The exact stage of ToLine.
  int ExactLine(const Vector& p, int a, int b) const;
  bool Trusted(Real d, Real bound) const noexcept;

  Query2TRational<Real, Other> m_kRQuery;
  Real m_fUncertainty;
};

extern template class KRCORELIB_API Query2<float, double>;
extern template class KRCORELIB_API Query2<double, float>;
extern template class KRCORELIB_API Query2Int64<float, double>;
extern template class KRCORELIB_API Query2Int64<double, float>;
extern template class KRCORELIB_API Query2TInteger<float, double>;
extern template class KRCORELIB_API Query2TInteger<double, float>;
extern template class KRCORELIB_API Query2TRational<float, double>;
extern template class KRCORELIB_API Query2TRational<double, float>;
extern template class KRCORELIB_API Query2Filtered<float, double>;
extern template class KRCORELIB_API Query2Filtered<double, float>;

}  // namespace krRationalArithmetic
