// _SKRUnit and SKRUnitHelper: the units a user may choose from, by class of
// quantity (length, flow, speed, temperature, ...), with their descriptions
// and the defaults for metric and imperial presentation.
//
// The helper only names units; conversions go through the unit texts
// (ConvertUnitValue), and the Unit of every registered unit is a valid unit
// expression. The process-wide helper is CKRScientificData::m_UnitHelper.
// Unit keys compare exactly (case-sensitive, whole texts). Not synchronised:
// changes are meant for start-up or the user-interface thread.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <cstdint>
#include <map>
#include <vector>

// One selectable unit.
struct KRCORELIB_API _SKRUnit {
  // Bits of Defaults.
  enum { KR_DEFAULT_IMPERIAL = 1, KR_DEFAULT_METRIC = 2 };

  CKRString ShortDescription;  // "MPH", "mm of Hg", "pixel"
  CKRString Unit;              // the key and unit expression: "mph", "mmHg", "pixelx"
  CKRString LongDescription;   // "miles per hour"
  std::int32_t Defaults = 0;   // KR_DEFAULT_IMPERIAL | KR_DEFAULT_METRIC
};

class KRCORELIB_API SKRUnitHelper {
public:
  // Registers the library's twelve unit classes (0 length, 1 volume flow,
  // 2 speed, 3 temperature, 4 pressure, 5 viscosity, 6 pressure as mass per
  // area, 7 angle, 8 and 9 horizontal and vertical screen length, 10 area,
  // 11 time) with their 36 units.
  SKRUnitHelper();

  // Adds a unit to the class (creating the class), or, when the class has a
  // unit with this key, replaces only its defaults. Returns the class's
  // unit count afterwards.
  int AddUnit(int unitClass, const CKRString& shortDescription, const CKRString& unit,
              const CKRString& longDescription, int defaults);
  // Removes the units of a class; the class stays known. Unknown: ignored.
  void ClearUnits(int unitClass);

  // 0 for an unknown class.
  int GetUnitCount(int unitClass) const;
  // Copies out the unit at `index`, or the unit with key `unit`; false when
  // there is none.
  bool GetUnit(int unitClass, unsigned index, _SKRUnit& out) const;
  bool GetUnit(int unitClass, const CKRString& unit, _SKRUnit& out) const;
  // The unit after (or, with `previous`, before) the one with key `unit`,
  // wrapping around; false for an unknown class, a class of fewer than two
  // units, or a key not in the class.
  bool GetNextUnit(int unitClass, const CKRString& unit, _SKRUnit& out, bool previous) const;
  // The first unit with the metric (or imperial) default bit, else the
  // class's first unit; false for an unknown or empty class.
  bool GetDefaultUnit(int unitClass, _SKRUnit& out, bool metric) const;
  // The same, with the helper's metric flag.
  bool GetDefaultUnit(int unitClass, _SKRUnit& out) const;
  // The key of the first unit with any default bit, else "".
  CKRString GetDefaultUnit(int unitClass) const;
  // The lowest class holding a unit with this key, or -1.
  int GetUnitClass(const CKRString& unit) const;
  // Descriptions of the unit with this key in the class, or "".
  CKRString GetShortDescription(int unitClass, const CKRString& unit) const;
  CKRString GetLongDescription(int unitClass, const CKRString& unit) const;
  // The class's unit keys joined with "," ("cm,in,ft,mm,m"), or "".
  CKRString GetUnitSet(int unitClass);

  bool GetMetricDefaults() const { return m_MetricDefaults; }
  void SetMetricDefaults(bool metric) { m_MetricDefaults = metric; }

  // Replaces the factor of a unit-table row (see SKRUnitTable::SetConstant);
  // an unknown name is ignored.
  void SetConstant(const CKRString& name, double factor);

private:
  struct SKRUnitClass {
    std::vector<_SKRUnit> m_Units;
    CKRString m_UnitSet;  // cached, built on first request
  };

  const SKRUnitClass* FindClass(int unitClass) const;
  static const _SKRUnit* FindUnit(const SKRUnitClass& entry, const CKRString& unit);

  std::map<int, SKRUnitClass> m_ClassMap;
  bool m_MetricDefaults = false;
};
