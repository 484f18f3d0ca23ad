#include <krCoreLib/units/CKRScientificData.h>

#include <krCoreLib/units/KRUnitConversion.h>

#include "core/KRNumbers.h"
#include "units/KRUnitsText.h"

// Constructed while the library loads, before any host code can run; the
// library's own static initialisers do not use it.
SKRUnitHelper CKRScientificData::m_UnitHelper;

namespace {

// The key that stands for the class's default unit.
constexpr wchar_t kDefaultUnit[] = L"#";

}  // namespace

CKRScientificData::CKRScientificData(int unitClass, double value) : m_UnitClass(unitClass), m_Value(value) {}

CKRScientificData::CKRScientificData(int unitClass, double value, double minimum, double maximum)
    : m_UnitClass(unitClass), m_Min(minimum), m_Max(maximum), m_Value(value) {}

CKRScientificData::CKRScientificData(double value, const CKRString& unit)
    : m_UnitClass(m_UnitHelper.GetUnitClass(unit)), m_Value(value), m_Unit(unit) {}

CKRScientificData::CKRScientificData(double value, const CKRString& metricUnit, const CKRString& imperialUnit)
    : m_UnitClass(m_UnitHelper.GetUnitClass(metricUnit)),
      m_Value(value),
      m_Unit(m_UnitHelper.GetMetricDefaults() ? metricUnit : imperialUnit) {}

void CKRScientificData::Set(double value, const CKRString& unit) {
  m_Value = value;
  SetUnit(unit);
}

void CKRScientificData::SetUnit(const CKRString& unit) {
  if (!unit.IsEmpty())
    m_Unit = unit;
}

void CKRScientificData::SetRange(double minimum, double maximum) {
  m_Min = minimum;
  m_Max = maximum;
}

CKRString CKRScientificData::GetUnit() const {
  if (m_Unit != kDefaultUnit)
    return m_Unit;
  _SKRUnit unit;
  return m_UnitHelper.GetDefaultUnit(m_UnitClass, unit) ? unit.Unit : CKRString();
}

CKRString CKRScientificData::GetShortDescription() const {
  return m_UnitHelper.GetShortDescription(m_UnitClass, GetUnit());
}

CKRString CKRScientificData::GetLongDescription() const {
  return m_UnitHelper.GetLongDescription(m_UnitClass, GetUnit());
}

double CKRScientificData::GetAs(const CKRString& unit) const {
  double value = m_Value;
  ConvertUnitValue(value, GetUnit(), unit);
  return value;
}

void CKRScientificData::SetAs(double value, const CKRString& unit) {
  ConvertUnitValue(value, unit, GetUnit());
  m_Value = value;
}

void CKRScientificData::SetUnitAndUpdateValue(const CKRString& unit) {
  if (m_UnitHelper.GetUnitClass(unit) != m_UnitClass)
    return;
  m_Value = GetAs(unit);
  m_Unit = unit;
}

void CKRScientificData::Reset() {
  m_Value = 0.0;
  m_Unit.Empty();
}

CKRString CKRScientificData::ToString() const {
  return CKRString::FormattedInvariant(L"%e,%e,%e,%i,%s", m_Min, m_Max, m_Value, m_UnitClass, m_Unit.GetString());
}

void CKRScientificData::FromString(const CKRString& text) {
  // Split locally rather than in a shared tokenizer, so that several
  // threads may read values at once.
  const std::vector<CKRString> fields = SKRUnitsText::SplitFields(text);
  m_Unit.Empty();
  double* const numbers[] = {&m_Min, &m_Max, &m_Value};
  for (std::size_t i = 0; i < fields.size() && i < 5; ++i) {
    if (fields[i].IsEmpty())
      continue;
    if (i < 3)
      *numbers[i] = CKRString::ToDouble(fields[i].GetString());
    else if (i == 3)
      m_UnitClass = CKRString::ToInt(fields[i].GetString());
    else
      m_Unit = fields[i];
  }
}

CKRScientificData::operator float() const {
  return SKRNumbers::ToFloat(m_Value);
}
