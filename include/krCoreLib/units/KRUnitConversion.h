// Unit expressions: evaluation over nine base dimensions and conversion.
//
// A unit text is built from 129 named units (the unit table), 20 one-letter
// decimal prefixes, powers ("^" and a signed integer), products ("*") and at
// most one quotient ("/": everything after it is the denominator, so
// "Kg/m*s^2" is kilogram per metre and second squared). Evaluating a text
// gives a factor and the exponents of the base dimensions; two texts convert
// when their exponents agree. Temperatures carry a scale only, so they
// convert as differences. Angles and solid angles are dimensions of their
// own.
//
// Nothing allocates and nothing throws. Texts are read up to their end or
// their first NUL, whichever comes first; what follows a complete expression
// is ignored. Thread safety:
// evaluation may run on any number of threads; SetConstant changes a factor
// atomically, and a conversion running at the same time sees the old or the
// new factor.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <cstddef>
#include <cstdint>
#include <string_view>

// The value of a unit expression.
struct KRCORELIB_API UnitFactor {
  // Indexes of the base dimensions in m_Exponents.
  enum EKRBaseDimension {
    KR_CURRENT = 0,      // A
    KR_TEMPERATURE = 1,  // K
    KR_LUMINOUS = 2,     // cd
    KR_MASS = 3,         // g (the base is the gram: "Kg" is K on g)
    KR_LENGTH = 4,       // m
    KR_AMOUNT = 5,       // mol
    KR_ANGLE = 6,        // r
    KR_TIME = 7,         // s
    KR_SOLID_ANGLE = 8,  // sr
    KR_DIMENSIONS = 9
  };

  double m_Factor = 1.0;
  std::int16_t m_Exponents[KR_DIMENSIONS] = {};

  bool HasSameDimensions(const UnitFactor& other) const noexcept;
};

// The unit table and the evaluator.
struct KRCORELIB_API SKRUnitTable {
  // Number of rows: 129.
  static int GetRowCount() noexcept;
  // Name, current factor and definition of a row; "" / 0 outside the table.
  // The definition of a base row is the base unit's name.
  static const wchar_t* GetRowName(int row) noexcept;
  static double GetRowFactor(int row) noexcept;
  static const wchar_t* GetRowDefinition(int row) noexcept;
  // -1 for a row defined by an expression, else the base dimension index.
  static int GetRowBase(int row) noexcept;

  // The row whose name is the whole leading word of `text` (a word runs
  // while letters, digits, "_", "°", "µ" and "Å" follow), or -1. On success
  // `length` (when given) receives the length of the name.
  static int FindRow(std::wstring_view text, std::size_t* length = nullptr) noexcept;

  // Evaluates a unit expression: false when it does not parse.
  static bool Evaluate(std::wstring_view text, UnitFactor& value) noexcept;

  // Replaces the factor of the named row for the whole process (the device
  // pixel "pixelx"/"pixely" once its resolution is known, for example).
  // Returns false, changing nothing, for an unknown name.
  static bool SetConstant(std::wstring_view name, double factor) noexcept;
};

// Converts `value` from the unit `fromUnit` to `toUnit`. Returns true with
// the value unchanged when, after leading white space, the texts are equal or
// either is empty; false, leaving the value unchanged, when either does not
// parse or their dimensions differ; otherwise true with
// value * factor(from) / factor(to).
KRCORELIB_API bool ConvertUnitValue(double& value, std::wstring_view fromUnit, std::wstring_view toUnit) noexcept;
