// krRationalArithmetic::TRational: an exact fraction of two TInteger<N>
// (N = 16 or 32), and TRVector/RVector2, pairs of them.
//
// Arithmetic follows the textbook rules (a/b + c/d = (ad + cb)/(bd) and so
// on); each result drops the common powers of two of numerator and
// denominator (EliminatePowersOfTwo) and nothing else, which keeps the
// dyadic values that floats are exact and small. Comparisons cross-multiply
// with the signs of the denominators taken into account. Dividing by zero
// gives a zero denominator, whose comparisons treat the value as 0.
//
// A float converts exactly (subnormals too); infinities and NaN, for which
// the predicates are not meant, convert to 0. Whether a result is exact
// depends on the integers' width: products of the numerators and
// denominators must fit in 32N bits (the predicates document their ranges).
//
// Plain values with no heap allocation; distinct objects may be used from
// different threads.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/geometry/KRTInteger.h>

namespace krRationalArithmetic {

template <int N>
class TRational {
public:
  using Integer = TInteger<N>;

  // 0/1.
  TRational() noexcept : m_Numer(0), m_Denom(1) {}
  // n/1.
  TRational(int numerator) noexcept : m_Numer(numerator), m_Denom(1) {}
  TRational(int numerator, int denominator) noexcept : m_Numer(numerator), m_Denom(denominator) {
    EliminatePowersOfTwo();
  }
  TRational(const Integer& numerator) noexcept : m_Numer(numerator), m_Denom(1) {}
  TRational(const Integer& numerator, const Integer& denominator) noexcept
      : m_Numer(numerator), m_Denom(denominator) {
    EliminatePowersOfTwo();
  }
  // The exact value of f (0/1 for infinities and NaN).
  explicit TRational(float f) noexcept;
  TRational(const TRational&) noexcept = default;
  TRational& operator=(const TRational&) noexcept = default;

  const Integer& Numerator() const noexcept { return m_Numer; }
  const Integer& Denominator() const noexcept { return m_Denom; }

  TRational operator+(const TRational& r) const noexcept {
    return TRational(m_Numer * r.m_Denom + r.m_Numer * m_Denom, m_Denom * r.m_Denom);
  }
  TRational operator-(const TRational& r) const noexcept {
    return TRational(m_Numer * r.m_Denom - r.m_Numer * m_Denom, m_Denom * r.m_Denom);
  }
  TRational operator*(const TRational& r) const noexcept {
    return TRational(m_Numer * r.m_Numer, m_Denom * r.m_Denom);
  }
  TRational operator/(const TRational& r) const noexcept {
    return TRational(m_Numer * r.m_Denom, m_Denom * r.m_Numer);
  }
  TRational operator-() const noexcept { return TRational(-m_Numer, m_Denom); }
  TRational& operator+=(const TRational& r) noexcept { return *this = *this + r; }
  TRational& operator-=(const TRational& r) noexcept { return *this = *this - r; }
  TRational& operator*=(const TRational& r) noexcept { return *this = *this * r; }
  TRational& operator/=(const TRational& r) noexcept { return *this = *this / r; }

  // -1, 0 or 1 (0 also for a zero denominator).
  int GetSignum() const noexcept { return m_Numer.GetSignum() * m_Denom.GetSignum(); }
  bool operator<(const TRational& r) const noexcept { return CompareTo(r) < 0; }
  bool operator>(const TRational& r) const noexcept { return CompareTo(r) > 0; }
  bool operator==(const TRational& r) const noexcept { return CompareTo(r) == 0; }
  bool operator!=(const TRational& r) const noexcept { return CompareTo(r) != 0; }

private:
  // Both shifted right by the smaller count of trailing zero bits when both
  // are even.
  void EliminatePowersOfTwo() noexcept {
    if (m_Numer.IsOdd() || m_Denom.IsOdd())
      return;
    const int zerosN = m_Numer.GetTrailingZeros();
    const int zerosD = m_Denom.GetTrailingZeros();
    const int shift = zerosN < zerosD ? zerosN : zerosD;
    if (shift >= Integer::BITS) {  // 0/0
      return;
    }
    m_Numer >>= shift;
    m_Denom >>= shift;
  }
  // The sign of this - r: a/b against c/d as ad against cb, both sides
  // multiplied by bd's sign.
  int CompareTo(const TRational& r) const noexcept {
    const int denominators = m_Denom.GetSignum() * r.m_Denom.GetSignum();
    if (denominators == 0)
      return GetSignum() - r.GetSignum() > 0 ? 1 : (GetSignum() - r.GetSignum() < 0 ? -1 : 0);
    const Integer left = m_Numer * r.m_Denom;
    const Integer right = r.m_Numer * m_Denom;
    const int order = left < right ? -1 : (right < left ? 1 : 0);
    return order * denominators;
  }

  Integer m_Numer;
  Integer m_Denom;
};

// A vector of VSIZE rationals of TRational<ISIZE>; operator[] is not
// checked (the caller keeps i in 0..VSIZE-1).
template <int VSIZE, int ISIZE>
class TRVector {
public:
  using Rational = TRational<ISIZE>;

  TRVector() noexcept = default;
  TRVector(const TRVector&) noexcept = default;
  TRVector& operator=(const TRVector&) noexcept = default;

  Rational& operator[](int i) noexcept { return m_Tuple[i]; }
  const Rational& operator[](int i) const noexcept { return m_Tuple[i]; }

protected:
  Rational m_Tuple[VSIZE];
};

template <int ISIZE>
class RVector2 : public TRVector<2, ISIZE> {
  using Base = TRVector<2, ISIZE>;

public:
  using typename Base::Rational;
  RVector2() noexcept = default;
  RVector2(const Base& v) noexcept : Base(v) {}
  RVector2(const Rational& x, const Rational& y) noexcept {
    this->m_Tuple[0] = x;
    this->m_Tuple[1] = y;
  }
  Rational& X() noexcept { return this->m_Tuple[0]; }
  const Rational& X() const noexcept { return this->m_Tuple[0]; }
  Rational& Y() noexcept { return this->m_Tuple[1]; }
  const Rational& Y() const noexcept { return this->m_Tuple[1]; }
};

extern template class KRCORELIB_API TRational<16>;
extern template class KRCORELIB_API TRational<32>;
extern template class KRCORELIB_API TRVector<2, 16>;
extern template class KRCORELIB_API TRVector<2, 32>;
extern template class KRCORELIB_API RVector2<16>;
extern template class KRCORELIB_API RVector2<32>;

}  // namespace krRationalArithmetic
