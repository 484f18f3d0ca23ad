// The five query strategies of both precision pairs.
#include <krCoreLib/geometry/KRQuery2.h>

#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>

#include <cmath>
#include <cstdint>
#include <limits>

namespace krRationalArithmetic {

namespace {

// Truncation toward zero that never leaves the integer's range: NaN gives
// 0, values beyond the range its nearest end.
template <class Integer>
Integer Truncate(float value) {
  constexpr double limit = double(std::numeric_limits<Integer>::max()) + 1.0;  // 2^31 or 2^63, exact
  if (!(value == value))
    return 0;
  if (double(value) >= limit)
    return std::numeric_limits<Integer>::max();
  if (double(value) < -limit)
    return std::numeric_limits<Integer>::min();
  return Integer(value);
}

// Wrapping 64-bit arithmetic: the unsigned operations wrap by definition.
std::int64_t Add(std::int64_t a, std::int64_t b) { return std::int64_t(std::uint64_t(a) + std::uint64_t(b)); }
std::int64_t Sub(std::int64_t a, std::int64_t b) { return std::int64_t(std::uint64_t(a) - std::uint64_t(b)); }
std::int64_t Mul(std::int64_t a, std::int64_t b) { return std::int64_t(std::uint64_t(a) * std::uint64_t(b)); }

int Sign(double d) { return (d > 0) - (d < 0); }

// The in-triangle rule over a line test line(u, v) of the point: outside
// as soon as it lies right of b -> c, left of a -> c or right of a -> b; on
// an edge when on any of those lines; strictly inside otherwise.
template <class LineTest>
int TriangleSign(LineTest&& line, int a, int b, int c) {
  const int s0 = line(b, c);
  if (s0 > 0)
    return 1;
  const int s1 = line(a, c);
  if (s1 < 0)
    return 1;
  const int s2 = line(a, b);
  if (s2 > 0)
    return 1;
  return s0 != 0 && s1 != 0 && s2 != 0 ? -1 : 0;
}

// The circumcircle determinant's sign rule: +1 outside (d < 0).
int CircleSign(int sign) { return -sign; }

}  // namespace

Query::~Query() = default;

// ---- Query2 ----

template <class Real, class Other>
int Query2<Real, Other>::ToLine(const Vector& p, int a, int b) const {
  const Vector& va = m_akVertex[a];
  const Vector& vb = m_akVertex[b];
  const Real x0 = Real(p.X()) - Real(va.X());
  const Real y0 = Real(p.Y()) - Real(va.Y());
  const Real x1 = Real(vb.X()) - Real(va.X());
  const Real y1 = Real(vb.Y()) - Real(va.Y());
  return Sign(double(Det2(x0, y0, x1, y1)));
}

template <class Real, class Other>
int Query2<Real, Other>::ToTriangle(const Vector& p, int a, int b, int c) const {
  return TriangleSign([&](int u, int v) { return ToLine(p, u, v); }, a, b, c);
}

template <class Real, class Other>
int Query2<Real, Other>::ToCircumcircle(const Vector& p, int a, int b, int c) const {
  Real row[3][3];
  const int vertices[3] = {a, b, c};
  for (int k = 0; k < 3; ++k) {
    const Vector& v = m_akVertex[vertices[k]];
    const Real sx = Real(v.X()) + Real(p.X()), sy = Real(v.Y()) + Real(p.Y());
    const Real dx = Real(v.X()) - Real(p.X()), dy = Real(v.Y()) - Real(p.Y());
    row[k][0] = dx;
    row[k][1] = dy;
    row[k][2] = sx * dx + sy * dy;
  }
  const Real d = Det3(row[0][0], row[0][1], row[0][2], row[1][0], row[1][1], row[1][2], row[2][0], row[2][1],
                      row[2][2]);
  return CircleSign(Sign(double(d)));
}

// ---- Query2Int64 ----

template <class Real, class Other>
std::int64_t Query2Int64<Real, Other>::Det2(std::int64_t x0, std::int64_t y0, std::int64_t x1,
                                            std::int64_t y1) noexcept {
  return Sub(Mul(x0, y1), Mul(x1, y0));
}

template <class Real, class Other>
std::int64_t Query2Int64<Real, Other>::Det3(std::int64_t x0, std::int64_t y0, std::int64_t z0, std::int64_t x1,
                                            std::int64_t y1, std::int64_t z1, std::int64_t x2, std::int64_t y2,
                                            std::int64_t z2) noexcept {
  const std::int64_t c0 = Sub(Mul(y1, z2), Mul(y2, z1));
  const std::int64_t c1 = Sub(Mul(z1, x2), Mul(z2, x1));
  const std::int64_t c2 = Sub(Mul(x1, y2), Mul(x2, y1));
  return Add(Add(Mul(x0, c0), Mul(y0, c1)), Mul(z0, c2));
}

template <class Real, class Other>
int Query2Int64<Real, Other>::ToLine(const Vector& p, int a, int b) const {
  const Vector& va = this->m_akVertex[a];
  const Vector& vb = this->m_akVertex[b];
  const std::int64_t ax = Truncate<std::int64_t>(va.X()), ay = Truncate<std::int64_t>(va.Y());
  const std::int64_t x0 = Sub(Truncate<std::int64_t>(p.X()), ax), y0 = Sub(Truncate<std::int64_t>(p.Y()), ay);
  const std::int64_t x1 = Sub(Truncate<std::int64_t>(vb.X()), ax), y1 = Sub(Truncate<std::int64_t>(vb.Y()), ay);
  const std::int64_t d = Det2(x0, y0, x1, y1);
  return (d > 0) - (d < 0);
}

template <class Real, class Other>
int Query2Int64<Real, Other>::ToCircumcircle(const Vector& p, int a, int b, int c) const {
  const std::int64_t px = Truncate<std::int64_t>(p.X()), py = Truncate<std::int64_t>(p.Y());
  std::int64_t row[3][3];
  const int vertices[3] = {a, b, c};
  for (int k = 0; k < 3; ++k) {
    const Vector& v = this->m_akVertex[vertices[k]];
    const std::int64_t vx = Truncate<std::int64_t>(v.X()), vy = Truncate<std::int64_t>(v.Y());
    row[k][0] = Sub(vx, px);
    row[k][1] = Sub(vy, py);
    row[k][2] = Add(Mul(Add(vx, px), row[k][0]), Mul(Add(vy, py), row[k][1]));
  }
  const std::int64_t d = Det3(row[0][0], row[0][1], row[0][2], row[1][0], row[1][1], row[1][2], row[2][0],
                              row[2][1], row[2][2]);
  return CircleSign((d > 0) - (d < 0));
}

// ---- Query2TInteger ----

template <class Real, class Other>
int Query2TInteger<Real, Other>::ToLine(const Vector& p, int a, int b) const {
  const Vector& va = this->m_akVertex[a];
  const Vector& vb = this->m_akVertex[b];
  // Differences in 32 bits (wrapping), widened.
  const auto difference = [](float u, float v) {
    return TInteger<2>(int(std::uint32_t(Truncate<std::int32_t>(u)) - std::uint32_t(Truncate<std::int32_t>(v))));
  };
  const TInteger<2> d = Det2(difference(p.X(), va.X()), difference(p.Y(), va.Y()), difference(vb.X(), va.X()),
                             difference(vb.Y(), va.Y()));
  const TInteger<2> zero(0);
  return d > zero ? 1 : (d < zero ? -1 : 0);
}

template <class Real, class Other>
int Query2TInteger<Real, Other>::ToCircumcircle(const Vector& p, int a, int b, int c) const {
  const TInteger<4> px(Truncate<std::int32_t>(p.X())), py(Truncate<std::int32_t>(p.Y()));
  TInteger<4> row[3][3];
  const int vertices[3] = {a, b, c};
  for (int k = 0; k < 3; ++k) {
    const Vector& v = this->m_akVertex[vertices[k]];
    const TInteger<4> vx(Truncate<std::int32_t>(v.X())), vy(Truncate<std::int32_t>(v.Y()));
    row[k][0] = vx - px;
    row[k][1] = vy - py;
    row[k][2] = (vx + px) * row[k][0] + (vy + py) * row[k][1];
  }
  const TInteger<4> d = Det3(row[0][0], row[0][1], row[0][2], row[1][0], row[1][1], row[1][2], row[2][0],
                             row[2][1], row[2][2]);
  const TInteger<4> zero(0);
  return CircleSign(d > zero ? 1 : (d < zero ? -1 : 0));
}

// ---- Query2TRational ----

template <class Real, class Other>
Query2TRational<Real, Other>& Query2TRational<Real, Other>::operator=(const Query2TRational& q) {
  if (this != &q) {
    Base::operator=(q);
    m_akRVertex.reset();
    m_abEvaluated.reset();
  }
  return *this;
}

template <class Real, class Other>
Query2TRational<Real, Other>::~Query2TRational() = default;

template <class Real, class Other>
void Query2TRational<Real, Other>::Convert(int count, const int* indices) const {
  if (!m_akRVertex) {
    const int n = this->m_iVQuantity > 0 ? this->m_iVQuantity : 0;
    m_akRVertex = std::make_unique<RVector[]>(std::size_t(n));
    m_abEvaluated = std::make_unique<bool[]>(std::size_t(n));  // all false
  }
  for (int k = 0; k < count; ++k) {
    const int i = indices[k];
    if (!m_abEvaluated[i]) {
      m_akRVertex[i] = ToRational(this->m_akVertex[i]);
      m_abEvaluated[i] = true;
    }
  }
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToLine(const RVector& p, int a, int b) const {
  const RVector& va = m_akRVertex[a];
  const RVector& vb = m_akRVertex[b];
  const Rational x0 = p.X() - va.X(), y0 = p.Y() - va.Y();
  const Rational x1 = vb.X() - va.X(), y1 = vb.Y() - va.Y();
  return Det2(x0, y0, x1, y1).GetSignum();
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToTriangle(const RVector& p, int a, int b, int c) const {
  return TriangleSign([&](int u, int v) { return ToLine(p, u, v); }, a, b, c);
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToCircumcircle(const RVector& p, int a, int b, int c) const {
  Rational row[3][3];
  const int vertices[3] = {a, b, c};
  for (int k = 0; k < 3; ++k) {
    const RVector& v = m_akRVertex[vertices[k]];
    row[k][0] = v.X() - p.X();
    row[k][1] = v.Y() - p.Y();
    row[k][2] = (v.X() + p.X()) * row[k][0] + (v.Y() + p.Y()) * row[k][1];
  }
  return CircleSign(Det3(row[0][0], row[0][1], row[0][2], row[1][0], row[1][1], row[1][2], row[2][0], row[2][1],
                         row[2][2])
                        .GetSignum());
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToLine(const Vector& p, int a, int b) const {
  const int indices[2] = {a, b};
  Convert(2, indices);
  return ToLine(ToRational(p), a, b);
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToLine(int i, int a, int b) const {
  const int indices[3] = {i, a, b};
  Convert(3, indices);
  return ToLine(m_akRVertex[i], a, b);
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToTriangle(const Vector& p, int a, int b, int c) const {
  const int indices[3] = {a, b, c};
  Convert(3, indices);
  return ToTriangle(ToRational(p), a, b, c);
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToTriangle(int i, int a, int b, int c) const {
  const int indices[4] = {i, a, b, c};
  Convert(4, indices);
  return ToTriangle(m_akRVertex[i], a, b, c);
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToCircumcircle(const Vector& p, int a, int b, int c) const {
  const int indices[3] = {a, b, c};
  Convert(3, indices);
  return ToCircumcircle(ToRational(p), a, b, c);
}

template <class Real, class Other>
int Query2TRational<Real, Other>::ToCircumcircle(int i, int a, int b, int c) const {
  const int indices[4] = {i, a, b, c};
  Convert(4, indices);
  return ToCircumcircle(m_akRVertex[i], a, b, c);
}

// ---- Query2Filtered ----

// A floating-point value decides when it reaches the bound. A bound of 0
// from a positive uncertainty means lengths that underflowed, so only a
// zero uncertainty trusts a value at the bound of 0.
template <class Real, class Other>
bool Query2Filtered<Real, Other>::Trusted(Real d, Real bound) const noexcept {
  return std::fabs(d) > bound || (std::fabs(d) == bound && (bound > 0 || m_fUncertainty == 0));
}

// Below the filter's bound the exact orientation answers (orient2d is
// exact for every finite float input: the differences and products of
// floats neither overflow nor underflow in double), and the rationals
// answer for input that is not finite.
template <class Real, class Other>
int Query2Filtered<Real, Other>::ExactLine(const Vector& p, int a, int b) const {
  const Vector& va = this->m_akVertex[a];
  const Vector& vb = this->m_akVertex[b];
  const double exact = krPolygonTriangulation::orient2d(va.X(), va.Y(), vb.X(), vb.Y(), p.X(), p.Y());
  if (exact == exact)
    return -Sign(exact);  // orient2d is positive when p lies left
  return m_kRQuery.ToLine(p, a, b);
}

// The third entry of each row, z = sx dx + sy dy, is rounded relative to
// |sx dx| + |sy dy|, not to |z|: the rows' lengths take that magnitude for
// z, so that the bound covers the rounding of z as well.
template <class Real, class Other>
int Query2Filtered<Real, Other>::ToCircumcircle(const Vector& p, int a, int b, int c) const {
  Real row[3][3];
  Real bound = m_fUncertainty;
  const int vertices[3] = {a, b, c};
  for (int k = 0; k < 3; ++k) {
    const Vector& v = this->m_akVertex[vertices[k]];
    const Real sx = Real(v.X()) + Real(p.X()), sy = Real(v.Y()) + Real(p.Y());
    const Real dx = Real(v.X()) - Real(p.X()), dy = Real(v.Y()) - Real(p.Y());
    row[k][0] = dx;
    row[k][1] = dy;
    row[k][2] = sx * dx + sy * dy;
    const Real z = std::fabs(sx * dx) + std::fabs(sy * dy);
    bound *= std::sqrt(dx * dx + dy * dy + z * z);
  }
  const Real d = Base::Det3(row[0][0], row[0][1], row[0][2], row[1][0], row[1][1], row[1][2], row[2][0],
                            row[2][1], row[2][2]);
  if (Trusted(d, bound))
    return CircleSign(Sign(double(d)));
  return m_kRQuery.ToCircumcircle(p, a, b, c);
}

template class Query2<float, double>;
template class Query2<double, float>;
template class Query2Int64<float, double>;
template class Query2Int64<double, float>;
template class Query2TInteger<float, double>;
template class Query2TInteger<double, float>;
template class Query2TRational<float, double>;
template class Query2TRational<double, float>;
template class Query2Filtered<float, double>;
template class Query2Filtered<double, float>;

}  // namespace krRationalArithmetic
