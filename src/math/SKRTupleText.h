// SKRTupleText: the text forms of points and vectors, "%f,%f[,%f[,%f]]".
//
// Writing and reading are independent of the process locale: numbers are
// written with std::to_chars (the digits of printf's "%f": six decimals, no
// exponent) and read as the "C" locale reads them (CKRString::ToDouble).
// Every call splits its own copy of the text, so any number of threads may
// read and write at once.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <cstddef>

struct SKRTupleText {
  // The `count` values formatted "%f" each, joined with ",".
  static CKRString Write(const float* tuple, int count);
  static CKRString Write(const double* tuple, int count);

  // Removes every space (U+0020) from the text, splits it at "," and reads
  // the pieces in order into tuple[0], tuple[1], ... . At most `count` pieces
  // are used; components without a piece keep their values. Consecutive
  // commas give empty pieces, a trailing comma does not; a piece that is not
  // a number gives 0. `length` characters are read (they may include NULs,
  // which end a piece's number); a null text reads nothing. Values beyond the
  // float range become infinite in the float form.
  static void Read(float* tuple, int count, const wchar_t* text, std::size_t length);
  static void Read(double* tuple, int count, const wchar_t* text, std::size_t length);
};
