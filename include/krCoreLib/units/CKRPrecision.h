// CKRPrecision: the process-wide format of numbers shown to the user.
#pragma once

#include <krCoreLib/core/CKRString.h>

class KRCORELIB_API CKRPrecision {
public:
  // Digits after the decimal point (the significant digits with trailing
  // zeros removed). Values below 0 count as 0, above 1000 as 1000.
  static inline int m_iDecimalPlaces = 3;
  // Write "%g" (no trailing zeros) instead of "%f".
  static inline bool m_bRemoveTrailingZeros = false;

  // "%.3f" by default; "%.Ng" with m_bRemoveTrailingZeros.
  static CKRString GetFormatString();
  // `value` written with that format, with a "." decimal point whatever
  // the process locale.
  static CKRString FormatNumber(double value);
};
