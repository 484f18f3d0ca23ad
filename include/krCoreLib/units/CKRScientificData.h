// CKRScientificData: a number with a unit, a unit class and a range.
//
// The unit is a unit key of the process-wide unit helper; "#" stands for the
// default unit of the unit class (metric or imperial as the helper's flag
// says). Conversions go through ConvertUnitValue and leave the value
// unconverted when the units do not convert. Text form
// "min,max,value,unitClass,unit" ("%e,%e,%e,%i,%s" in the "C" locale).
// Not synchronised; m_UnitHelper is shared by the whole process.
#pragma once

#include <krCoreLib/units/SKRUnitHelper.h>

class KRCORELIB_API CKRScientificData {
public:
  // The process-wide unit classes, built while the library loads.
  static SKRUnitHelper m_UnitHelper;

  CKRScientificData() = default;
  CKRScientificData(int unitClass, double value);
  CKRScientificData(int unitClass, double value, double minimum, double maximum);
  // The unit class is the helper's class of `unit` (-1 when it has none).
  CKRScientificData(double value, const CKRString& unit);
  // The unit class is that of `metricUnit`; the unit is `metricUnit` when
  // the helper presents metric defaults, else `imperialUnit`.
  CKRScientificData(double value, const CKRString& metricUnit, const CKRString& imperialUnit);

  double Get() const { return m_Value; }
  double GetValue() const { return m_Value; }
  void Set(double value) { m_Value = value; }
  void SetValue(double value) { m_Value = value; }
  // Sets the value, and the unit when `unit` is not empty.
  void Set(double value, const CKRString& unit);
  // Sets the unit when it is not empty; the value is not converted.
  void SetUnit(const CKRString& unit);
  void SetRange(double minimum, double maximum);
  double GetMin() const { return m_Min; }
  double GetMax() const { return m_Max; }
  int GetUnitClass() const { return m_UnitClass; }

  // The unit key; for "#" the class's default unit, or "" when it has none.
  CKRString GetUnit() const;
  CKRString GetShortDescription() const;
  CKRString GetLongDescription() const;

  // The value in `unit` (the stored value when the units do not convert).
  double GetAs(const CKRString& unit) const;
  // Stores `value` given in `unit`, converted to this object's unit.
  void SetAs(double value, const CKRString& unit);
  // Moves the value to `unit` when `unit` belongs to this object's unit
  // class; otherwise nothing changes. The range is not converted.
  void SetUnitAndUpdateValue(const CKRString& unit);
  // Value 0 and an empty unit (not "#").
  void Reset();

  CKRString ToString() const;
  // Reads the text form trimmed of blanks; the unit is emptied first.
  // Fields 0 to 4 set minimum, maximum, value, unit class and unit; later
  // fields are ignored; missing or empty fields leave their values; a field
  // without a number reads as 0.
  void FromString(const CKRString& text);

  // Compare this value with the other's value converted to this unit;
  // equality is exact.
  bool operator==(const CKRScientificData& other) const { return m_Value == other.GetAs(GetUnit()); }
  bool operator!=(const CKRScientificData& other) const { return m_Value != other.GetAs(GetUnit()); }
  bool operator<(const CKRScientificData& other) const { return m_Value < other.GetAs(GetUnit()); }
  bool operator<=(const CKRScientificData& other) const { return m_Value <= other.GetAs(GetUnit()); }
  bool operator>(const CKRScientificData& other) const { return m_Value > other.GetAs(GetUnit()); }
  bool operator>=(const CKRScientificData& other) const { return m_Value >= other.GetAs(GetUnit()); }

  // Rounded to single precision (beyond its range: an infinity).
  explicit operator float() const;

private:
  int m_UnitClass = 0;
  double m_Min = -1.7976931348623157e308;
  double m_Max = 1.7976931348623157e308;
  double m_Value = 0.0;
  CKRString m_Unit = L"#";
};
