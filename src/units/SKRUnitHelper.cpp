#include <krCoreLib/units/SKRUnitHelper.h>

#include <krCoreLib/units/KRUnitConversion.h>

#include <algorithm>

SKRUnitHelper::SKRUnitHelper() {
  struct SKRUnitEntry {
    int m_Class;
    const wchar_t* m_pShort;
    const wchar_t* m_pUnit;
    const wchar_t* m_pLong;
    int m_Defaults;
  };
  static constexpr SKRUnitEntry kUnits[] = {
      {0, L"cm", L"cm", L"centimeters", 0},
      {0, L"in", L"in", L"inches", 1},
      {0, L"ft", L"ft", L"feet", 0},
      {0, L"mm", L"mm", L"millimeters", 2},
      {0, L"m", L"m", L"meters", 0},
      {1, L"lpm", L"lpm", L"liters per minute", 0},
      {1, L"gpm", L"gpm", L"gallons per minute", 1},
      {1, L"m^3/s", L"m^3/s", L"cubic meters per second", 2},
      {2, L"m/s", L"m/s", L"meters per second", 2},
      {2, L"MPH", L"mph", L"miles per hour", 1},
      {2, L"KPH", L"kph", L"kilometers per hour", 0},
      {3, L"\u00B0F", L"\u00B0F", L"degrees Farenheit", 1},
      {3, L"\u00B0C", L"\u00B0C", L"degrees Celsius", 2},
      {3, L"\u00B0K", L"K", L"degrees Kelvin", 0},
      {4, L"psig", L"psig", L"pounds per square inch", 1},
      {4, L"Kg/m*s^2", L"Kg/m*s^2", L"Kilogram per square meter", 2},
      {4, L"mm of Hg", L"mmHg", L"millimeter of Mercury", 0},
      {5, L"centipoise", L"centipoise", L"centipoise", 3},
      {6, L"psi", L"psi", L"pounds per square inch", 1},
      {6, L"Kg/m^2", L"Kg/m^2", L"Kilograms per square meter", 2},
      {7, L"r", L"r", L"radians", 0},
      {7, L"\u00B0", L"\u00B0", L"degrees", 3},
      {8, L"mm", L"mm", L"millimeters", 2},
      {8, L"in", L"in", L"inches", 1},
      {8, L"pixel", L"pixelx", L"Pixels", 0},
      {9, L"mm", L"mm", L"millimeters", 2},
      {9, L"in", L"in", L"inches", 1},
      {9, L"pixel", L"pixely", L"Pixels", 0},
      {10, L"cm^2", L"cm^2", L"Square centimeters", 0},
      {10, L"in^2", L"in^2", L"Square inches", 1},
      {10, L"ft^2", L"ft^2", L"Square feet", 0},
      {10, L"mm^2", L"mm^2", L"Square millimeters", 2},
      {10, L"m^2", L"m^2", L"Square meters", 0},
      {11, L"min", L"min", L"Minutes", 3},
      {11, L"s", L"s", L"Seconds", 0},
      {11, L"h", L"h", L"Hours", 0},
  };
  for (const SKRUnitEntry& unit : kUnits)
    AddUnit(unit.m_Class, unit.m_pShort, unit.m_pUnit, unit.m_pLong, unit.m_Defaults);
}

const SKRUnitHelper::SKRUnitClass* SKRUnitHelper::FindClass(int unitClass) const {
  const auto at = m_ClassMap.find(unitClass);
  return at == m_ClassMap.end() ? nullptr : &at->second;
}

const _SKRUnit* SKRUnitHelper::FindUnit(const SKRUnitClass& entry, const CKRString& unit) {
  const auto at = std::find_if(entry.m_Units.begin(), entry.m_Units.end(),
                               [&](const _SKRUnit& candidate) { return candidate.Unit == unit; });
  return at == entry.m_Units.end() ? nullptr : &*at;
}

int SKRUnitHelper::AddUnit(int unitClass, const CKRString& shortDescription, const CKRString& unit,
                           const CKRString& longDescription, int defaults) {
  SKRUnitClass& entry = m_ClassMap[unitClass];
  entry.m_UnitSet.Empty();
  const auto existing = std::find_if(entry.m_Units.begin(), entry.m_Units.end(),
                                     [&](const _SKRUnit& candidate) { return candidate.Unit == unit; });
  if (existing != entry.m_Units.end())
    existing->Defaults = defaults;  // the descriptions stay as they were
  else
    entry.m_Units.push_back(_SKRUnit{shortDescription, unit, longDescription, defaults});
  return static_cast<int>(entry.m_Units.size());
}

void SKRUnitHelper::ClearUnits(int unitClass) {
  const auto at = m_ClassMap.find(unitClass);
  if (at == m_ClassMap.end())
    return;
  at->second.m_Units.clear();
  at->second.m_UnitSet.Empty();
}

int SKRUnitHelper::GetUnitCount(int unitClass) const {
  const SKRUnitClass* entry = FindClass(unitClass);
  return entry != nullptr ? static_cast<int>(entry->m_Units.size()) : 0;
}

bool SKRUnitHelper::GetUnit(int unitClass, unsigned index, _SKRUnit& out) const {
  const SKRUnitClass* entry = FindClass(unitClass);
  if (entry == nullptr || index >= entry->m_Units.size())
    return false;
  out = entry->m_Units[index];
  return true;
}

bool SKRUnitHelper::GetUnit(int unitClass, const CKRString& unit, _SKRUnit& out) const {
  const SKRUnitClass* entry = FindClass(unitClass);
  const _SKRUnit* found = entry != nullptr ? FindUnit(*entry, unit) : nullptr;
  if (found == nullptr)
    return false;
  out = *found;
  return true;
}

bool SKRUnitHelper::GetNextUnit(int unitClass, const CKRString& unit, _SKRUnit& out, bool previous) const {
  const SKRUnitClass* entry = FindClass(unitClass);
  if (entry == nullptr || entry->m_Units.size() < 2)
    return false;
  const _SKRUnit* found = FindUnit(*entry, unit);
  if (found == nullptr)
    return false;
  const std::size_t count = entry->m_Units.size();
  const std::size_t at = std::size_t(found - entry->m_Units.data());
  out = entry->m_Units[previous ? (at + count - 1) % count : (at + 1) % count];
  return true;
}

bool SKRUnitHelper::GetDefaultUnit(int unitClass, _SKRUnit& out, bool metric) const {
  const SKRUnitClass* entry = FindClass(unitClass);
  if (entry == nullptr || entry->m_Units.empty())
    return false;
  const int mask = metric ? _SKRUnit::KR_DEFAULT_METRIC : _SKRUnit::KR_DEFAULT_IMPERIAL;
  const auto at = std::find_if(entry->m_Units.begin(), entry->m_Units.end(),
                               [&](const _SKRUnit& unit) { return (unit.Defaults & mask) != 0; });
  out = at != entry->m_Units.end() ? *at : entry->m_Units.front();
  return true;
}

bool SKRUnitHelper::GetDefaultUnit(int unitClass, _SKRUnit& out) const {
  return GetDefaultUnit(unitClass, out, m_MetricDefaults);
}

CKRString SKRUnitHelper::GetDefaultUnit(int unitClass) const {
  const SKRUnitClass* entry = FindClass(unitClass);
  if (entry == nullptr)
    return CKRString();
  for (const _SKRUnit& unit : entry->m_Units)
    if (unit.Defaults != 0)
      return unit.Unit;
  return CKRString();
}

int SKRUnitHelper::GetUnitClass(const CKRString& unit) const {
  for (const auto& [unitClass, entry] : m_ClassMap)
    if (FindUnit(entry, unit) != nullptr)
      return unitClass;
  return -1;
}

CKRString SKRUnitHelper::GetShortDescription(int unitClass, const CKRString& unit) const {
  _SKRUnit found;
  return GetUnit(unitClass, unit, found) ? found.ShortDescription : CKRString();
}

CKRString SKRUnitHelper::GetLongDescription(int unitClass, const CKRString& unit) const {
  _SKRUnit found;
  return GetUnit(unitClass, unit, found) ? found.LongDescription : CKRString();
}

CKRString SKRUnitHelper::GetUnitSet(int unitClass) {
  const auto at = m_ClassMap.find(unitClass);
  if (at == m_ClassMap.end())
    return CKRString();
  SKRUnitClass& entry = at->second;
  if (entry.m_UnitSet.IsEmpty()) {
    // A separator between every two keys, empty keys included.
    for (std::size_t i = 0; i < entry.m_Units.size(); ++i) {
      if (i > 0)
        entry.m_UnitSet += L',';
      entry.m_UnitSet += entry.m_Units[i].Unit;
    }
  }
  return entry.m_UnitSet;
}

void SKRUnitHelper::SetConstant(const CKRString& name, double factor) {
  SKRUnitTable::SetConstant(name, factor);
}
