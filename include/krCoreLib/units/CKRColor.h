// CKRColor: an RGB colour in one 32-bit value laid out 0x00BBGGRR (red in
// the lowest byte). Text form "red,green,blue" ("%i,%i,%i").
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <cstdint>

class KRCORELIB_API CKRColor {
public:
  CKRColor() = default;
  explicit CKRColor(std::uint32_t color) : m_Color(color & 0x00FFFFFFu) {}
  // Components from 0 to 255; the low 8 bits of each are kept.
  CKRColor(int red, int green, int blue) { Set(red, green, blue); }
  // Components from 0.0 to 1.0 (see Setf).
  CKRColor(float red, float green, float blue) { Setf(red, green, blue); }

  void Set(int red, int green, int blue);
  // Each component times 255, truncated toward zero, low 8 bits kept; NaN
  // counts as 0 and values beyond the range of int saturate first.
  void Setf(float red, float green, float blue);

  std::uint32_t Color() const { return m_Color; }
  int red() const { return int(m_Color & 0xFF); }
  int green() const { return int((m_Color >> 8) & 0xFF); }
  int blue() const { return int((m_Color >> 16) & 0xFF); }

  CKRString GetStringValue() const;
  // Reads "red,green,blue", each component modulo 256 (a part without a
  // number reads as 0). Returns 0 and changes nothing when a "," is missing
  // or the blue part is empty, else 1.
  int SetValueFromString(const CKRString& text);

  bool operator==(const CKRColor& other) const { return m_Color == other.m_Color; }

private:
  std::uint32_t m_Color = 0;
};
