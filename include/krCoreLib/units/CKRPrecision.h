// CKRPrecision: the process-wide format of numbers shown to the user.
#pragma once

#include <krCoreLib/core/CKRString.h>

// The two settings are defined in the library, not inline: a plug-in that
// reads them uses the library's, and does not carry a copy of its own that
// would be a process-wide unique symbol and keep it from being unloaded.
class KRCORELIB_API CKRPrecision {
public:
  // Digits after the decimal point (the significant digits with trailing
  // zeros removed). Values below 0 count as 0, above 1000 as 1000.
  static int m_iDecimalPlaces;  // 3 at start
  // Write "%g" (no trailing zeros) instead of "%f".
  static bool m_bRemoveTrailingZeros;  // false at start

  // "%.3f" by default; "%.Ng" with m_bRemoveTrailingZeros.
  static CKRString GetFormatString();
  // `value` written with that format, with a "." decimal point whatever
  // the process locale.
  static CKRString FormatNumber(double value);
};
