// CKRRangedT: a number with a range, for T = int and T = double.
//
// Text form "min,max,value": "%d,%d,%d" for int, "%f,%f,%f" for double, in
// the "C" locale. Nothing clamps the value into the range.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <limits>
#include <type_traits>

template <class T>
class CKRRangedT {
  static_assert(std::is_same_v<T, int> || std::is_same_v<T, double>, "CKRRangedT exists for int and double");

public:
  CKRRangedT() = default;
  CKRRangedT(T minimum, T maximum, T value) : m_Min(minimum), m_Max(maximum), m_Value(value) {}

  void Set(T minimum, T maximum, T value) {
    m_Min = minimum;
    m_Max = maximum;
    m_Value = value;
  }
  void SetValue(T value) { m_Value = value; }
  T GetValue() const { return m_Value; }
  void SetMin(T minimum) { m_Min = minimum; }
  T GetMin() const { return m_Min; }
  void SetMax(T maximum) { m_Max = maximum; }
  T GetMax() const { return m_Max; }

  CKRString ToString() const;
  // Reads "min,max,value" trimmed of blanks: field 0 the minimum, field 1
  // the maximum, field 2 and every later field the value (the last wins).
  // Missing and empty fields leave their values; a field without a number
  // reads as 0; double fields keep double precision.
  void FromString(const CKRString& text);

  bool operator==(const CKRRangedT& other) const {
    return m_Min == other.m_Min && m_Max == other.m_Max && m_Value == other.m_Value;
  }

private:
  T m_Min = std::numeric_limits<T>::lowest();
  T m_Max = std::numeric_limits<T>::max();
  T m_Value = T(0);
};

extern template class KRCORELIB_API CKRRangedT<int>;
extern template class KRCORELIB_API CKRRangedT<double>;
