// krRationalArithmetic::TInteger: a fixed-size signed integer of 2N blocks
// of 16 bits (32N bits), for the exact evaluation of geometric predicates.
//
// Stored least significant block first, in two's complement; instantiated
// for N = 2 (64 bits), 4 (128 bits), 16 (512 bits) and 32 (1024 bits).
// Arithmetic wraps like the unsigned integers of the same width: a result
// that does not fit keeps its low 2N blocks (the predicates that use these
// integers document the coordinate ranges within which nothing wraps).
// >>= is an arithmetic shift, <<= a logical one; shifts by 32N bits or more
// give 0 (or -1 for a negative value shifted right).
//
// Plain values with no heap allocation; the multiplication skips the zero
// blocks above both operands' highest non-zero block, so small values in a
// wide integer cost little. Distinct objects may be used from different
// threads.
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <cstdint>

namespace krRationalArithmetic {

template <int N>
class TRational;

template <int N>
class TInteger {
public:
  static constexpr int BLOCKS = 2 * N;
  static constexpr int BITS = 16 * BLOCKS;

  // The value of an int, sign-extended.
  TInteger(int value = 0) noexcept {
    const std::uint32_t bits = std::uint32_t(value);
    m_Buffer[0] = std::uint16_t(bits);
    m_Buffer[1] = std::uint16_t(bits >> 16);
    const std::uint16_t fill = value < 0 ? 0xFFFFu : 0u;
    for (int i = 2; i < BLOCKS; ++i)
      m_Buffer[i] = fill;
  }
  TInteger(const TInteger&) noexcept = default;
  TInteger& operator=(const TInteger&) noexcept = default;

  // Two's complement: the bits inverted plus one.
  TInteger operator-() const noexcept {
    TInteger result;
    std::uint32_t carry = 1;
    for (int i = 0; i < BLOCKS; ++i) {
      const std::uint32_t sum = std::uint32_t(std::uint16_t(~m_Buffer[i])) + carry;
      result.m_Buffer[i] = std::uint16_t(sum);
      carry = sum >> 16;
    }
    return result;
  }
  TInteger operator+(const TInteger& v) const noexcept {
    TInteger result;
    std::uint32_t carry = 0;
    for (int i = 0; i < BLOCKS; ++i) {
      const std::uint32_t sum = std::uint32_t(m_Buffer[i]) + v.m_Buffer[i] + carry;
      result.m_Buffer[i] = std::uint16_t(sum);
      carry = sum >> 16;
    }
    return result;
  }
  TInteger operator-(const TInteger& v) const noexcept { return *this + (-v); }
  TInteger operator*(const TInteger& v) const noexcept;
  TInteger& operator+=(const TInteger& v) noexcept { return *this = *this + v; }
  TInteger& operator-=(const TInteger& v) noexcept { return *this = *this - v; }
  TInteger& operator*=(const TInteger& v) noexcept { return *this = *this * v; }
  TInteger& operator>>=(int bits) noexcept;
  TInteger& operator<<=(int bits) noexcept;

  bool operator==(const TInteger& v) const noexcept {
    for (int i = 0; i < BLOCKS; ++i)
      if (m_Buffer[i] != v.m_Buffer[i])
        return false;
    return true;
  }
  bool operator!=(const TInteger& v) const noexcept { return !(*this == v); }
  bool operator<(const TInteger& v) const noexcept {
    const int sign = GetSign();
    if (sign != v.GetSign())
      return sign < 0;
    // Equal signs: the two's complement images order like unsigned values.
    return Compare(*this, v) < 0;
  }
  bool operator>(const TInteger& v) const noexcept { return v < *this; }
  bool operator<=(const TInteger& v) const noexcept { return !(v < *this); }
  bool operator>=(const TInteger& v) const noexcept { return !(*this < v); }

  // -1, 0 or 1.
  int GetSignum() const noexcept {
    if (GetSign() < 0)
      return -1;
    for (int i = 0; i < BLOCKS; ++i)
      if (m_Buffer[i] != 0)
        return 1;
    return 0;
  }
  bool IsZero() const noexcept { return GetTrailingBlock() < 0; }
  bool IsOdd() const noexcept { return (m_Buffer[0] & 1u) != 0; }
  // Block i (0 the least significant), for inspection; i in 0..BLOCKS-1.
  std::uint16_t GetBlock(int i) const noexcept { return m_Buffer[i]; }

private:
  template <int>
  friend class TRational;

  // -1 when the top bit is set, else 1 (also for 0).
  int GetSign() const noexcept { return (m_Buffer[BLOCKS - 1] & 0x8000u) != 0 ? -1 : 1; }
  // The blocks of a and b as unsigned values from the most significant
  // down: -1, 0 or 1.
  static int Compare(const TInteger& a, const TInteger& b) noexcept {
    for (int i = BLOCKS - 1; i >= 0; --i) {
      if (a.m_Buffer[i] < b.m_Buffer[i])
        return -1;
      if (a.m_Buffer[i] > b.m_Buffer[i])
        return 1;
    }
    return 0;
  }
  // The index of the lowest non-zero block, -1 for 0.
  int GetTrailingBlock() const noexcept {
    for (int i = 0; i < BLOCKS; ++i)
      if (m_Buffer[i] != 0)
        return i;
    return -1;
  }
  // The index of the highest non-zero block, -1 for 0.
  int GetLeadingBlock() const noexcept {
    for (int i = BLOCKS - 1; i >= 0; --i)
      if (m_Buffer[i] != 0)
        return i;
    return -1;
  }
  // The index of the lowest set bit of block i (16 when the block is 0).
  int GetTrailingBit(int i) const noexcept {
    const std::uint16_t value = m_Buffer[i];
    return value == 0 ? 16 : __builtin_ctz(value);
  }
  // Blocks i and i + 1 as one 32-bit value (block i the low half).
  std::uint32_t ToUnsignedInt(int i) const noexcept {
    return std::uint32_t(m_Buffer[i]) | (std::uint32_t(m_Buffer[i + 1]) << 16);
  }
  void FromUnsignedInt(int i, std::uint32_t value) noexcept {
    m_Buffer[i] = std::uint16_t(value);
    m_Buffer[i + 1] = std::uint16_t(value >> 16);
  }
  // The number of trailing zero bits; BITS for 0.
  int GetTrailingZeros() const noexcept {
    const int block = GetTrailingBlock();
    return block < 0 ? BITS : 16 * block + GetTrailingBit(block);
  }

  std::uint16_t m_Buffer[BLOCKS];
};

// The signs are taken off, the magnitudes multiplied block by block
// (16 x 16 bits into 32, the high half carried) and the low 2N blocks kept;
// the sign is restored by negation. The magnitude of the most negative
// value is its own two's complement image read unsigned, so it multiplies
// correctly too.
template <int N>
TInteger<N> TInteger<N>::operator*(const TInteger& v) const noexcept {
  const bool negative = (GetSign() < 0) != (v.GetSign() < 0);
  const TInteger a = GetSign() < 0 ? -*this : *this;
  const TInteger b = v.GetSign() < 0 ? -v : v;
  TInteger product(0);
  const int topA = a.GetLeadingBlock();
  const int topB = b.GetLeadingBlock();
  if (topA < 0 || topB < 0)
    return product;
  for (int i = 0; i <= topA; ++i) {
    const std::uint32_t factor = a.m_Buffer[i];
    if (factor == 0)
      continue;
    std::uint32_t carry = 0;
    int k = i;
    for (int j = 0; j <= topB && k < BLOCKS; ++j, ++k) {
      const std::uint32_t sum = factor * b.m_Buffer[j] + product.m_Buffer[k] + carry;
      product.m_Buffer[k] = std::uint16_t(sum);
      carry = sum >> 16;
    }
    for (; carry != 0 && k < BLOCKS; ++k) {
      const std::uint32_t sum = std::uint32_t(product.m_Buffer[k]) + carry;
      product.m_Buffer[k] = std::uint16_t(sum);
      carry = sum >> 16;
    }
  }
  return negative ? -product : product;
}

template <int N>
TInteger<N>& TInteger<N>::operator>>=(int bits) noexcept {
  if (bits <= 0)
    return *this;
  const std::uint16_t fill = GetSign() < 0 ? 0xFFFFu : 0u;
  const int blocks = bits / 16;
  const int rest = bits % 16;
  for (int i = 0; i < BLOCKS; ++i) {
    const int from = i + blocks;
    const std::uint32_t low = from < BLOCKS ? m_Buffer[from] : fill;
    const std::uint32_t high = from + 1 < BLOCKS ? m_Buffer[from + 1] : fill;
    m_Buffer[i] = std::uint16_t(((high << 16) | low) >> rest);
  }
  return *this;
}

template <int N>
TInteger<N>& TInteger<N>::operator<<=(int bits) noexcept {
  if (bits <= 0)
    return *this;
  const int blocks = bits / 16;
  const int rest = bits % 16;
  for (int i = BLOCKS - 1; i >= 0; --i) {
    const int from = i - blocks;
    const std::uint32_t high = from >= 0 ? m_Buffer[from] : 0u;
    const std::uint32_t low = from - 1 >= 0 ? m_Buffer[from - 1] : 0u;
    m_Buffer[i] = std::uint16_t(((high << 16) | low) >> (16 - rest));
  }
  return *this;
}

extern template class KRCORELIB_API TInteger<2>;
extern template class KRCORELIB_API TInteger<4>;
extern template class KRCORELIB_API TInteger<16>;
extern template class KRCORELIB_API TInteger<32>;

}  // namespace krRationalArithmetic
