// The exact rationals: conversion from float, and the instantiations
// compiled into the library.
#include <krCoreLib/geometry/KRTRational.h>

#include <bit>
#include <cstdint>

namespace krRationalArithmetic {

// A finite float is M * 2^E with an integral M below 2^24: the hidden bit
// joins the 23 fraction bits of a normal number (E = biased exponent - 150),
// a subnormal has none (E = -149). The power of two goes to the numerator
// or the denominator, and the common powers of two are dropped: the same
// reduced fraction as adding the fraction bits' powers of two one by one.
template <int N>
TRational<N>::TRational(float f) noexcept : m_Numer(0), m_Denom(1) {
  const std::uint32_t bits = std::bit_cast<std::uint32_t>(f);
  const int biased = int((bits >> 23) & 0xFFu);
  const std::uint32_t fraction = bits & 0x7FFFFFu;
  if (biased == 0xFF)
    return;  // infinity or NaN
  const int mantissa = int(biased == 0 ? fraction : (fraction | 0x800000u));
  if (mantissa == 0)
    return;
  const int exponent = biased == 0 ? -149 : biased - 150;
  m_Numer = Integer(mantissa);
  if (exponent >= 0)
    m_Numer <<= exponent;
  else
    m_Denom <<= -exponent;
  EliminatePowersOfTwo();
  if ((bits & 0x80000000u) != 0)
    m_Numer = -m_Numer;
}

template class TRational<16>;
template class TRational<32>;
template class TRVector<2, 16>;
template class TRVector<2, 32>;
template class RVector2<16>;
template class RVector2<32>;

}  // namespace krRationalArithmetic
