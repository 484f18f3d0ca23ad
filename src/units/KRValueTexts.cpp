// Text forms of the small engineering values: precision, ranged values,
// colours and option sets.
#include <krCoreLib/units/CKRPrecision.h>

#include <krCoreLib/units/CKRColor.h>
#include <krCoreLib/units/CKROptionSet.h>
#include <krCoreLib/units/CKRRangedT.h>

#include "units/KRUnitsText.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <tuple>

// ---- CKRPrecision -------------------------------------------------------------

namespace {

// Beyond 1000 digits a number is no longer something to show.
constexpr int kMaxDecimalPlaces = 1000;

}  // namespace

int CKRPrecision::m_iDecimalPlaces = 3;
bool CKRPrecision::m_bRemoveTrailingZeros = false;

CKRString CKRPrecision::GetFormatString() {
  const int places = std::clamp(m_iDecimalPlaces, 0, kMaxDecimalPlaces);
  return CKRString::Formatted(m_bRemoveTrailingZeros ? L"%%.%ig" : L"%%.%if", places);
}

CKRString CKRPrecision::FormatNumber(double value) {
  return CKRString::FormattedInvariant(GetFormatString().GetString(), value);
}

// ---- CKRRangedT ---------------------------------------------------------------

template <class T>
CKRString CKRRangedT<T>::ToString() const {
  if constexpr (std::is_same_v<T, int>)
    return CKRString::FormattedInvariant(L"%d,%d,%d", m_Min, m_Max, m_Value);
  else
    return CKRString::FormattedInvariant(L"%f,%f,%f", m_Min, m_Max, m_Value);
}

template <class T>
void CKRRangedT<T>::FromString(const CKRString& text) {
  const std::vector<CKRString> fields = SKRUnitsText::SplitFields(text);
  for (std::size_t i = 0; i < fields.size(); ++i) {
    if (fields[i].IsEmpty())
      continue;
    T value;
    if constexpr (std::is_same_v<T, int>)
      value = CKRString::ToInt(fields[i].GetString());
    else
      value = CKRString::ToDouble(fields[i].GetString());
    (i == 0 ? m_Min : i == 1 ? m_Max : m_Value) = value;
  }
}

template class CKRRangedT<int>;
template class CKRRangedT<double>;

// ---- CKRColor -----------------------------------------------------------------

void CKRColor::Set(int red, int green, int blue) {
  m_Color = std::uint32_t(red & 0xFF) | (std::uint32_t(green & 0xFF) << 8) | (std::uint32_t(blue & 0xFF) << 16);
}

void CKRColor::Setf(float red, float green, float blue) {
  auto component = [](float value) {
    const double scaled = double(value) * 255.0;
    if (std::isnan(scaled))
      return 0;
    // Saturate before truncating: converting a value beyond int is undefined.
    return int(std::clamp(std::trunc(scaled), double(INT32_MIN), double(INT32_MAX)));
  };
  Set(component(red), component(green), component(blue));
}

CKRString CKRColor::GetStringValue() const {
  return CKRString::Formatted(L"%i,%i,%i", red(), green(), blue());
}

int CKRColor::SetValueFromString(const CKRString& text) {
  const int first = text.Find(L',');
  const int second = first < 0 ? -1 : text.Find(L',', first + 1);
  if (second < 0 || second + 1 >= text.GetLength())
    return 0;
  Set(CKRString::ToInt(text.Left(first).GetString()), CKRString::ToInt(text.Mid(first + 1, second - first - 1).GetString()),
      CKRString::ToInt(text.Mid(second + 1).GetString()));
  return 1;
}

// ---- _Option and CKROptionSet -------------------------------------------------

bool _Option::operator==(const _Option& other) const {
  return m_pData == other.m_pData && m_Selected == other.m_Selected && m_Text == other.m_Text;
}

bool _Option::operator<(const _Option& other) const {
  return std::tie(m_Text, m_pData, m_Selected) < std::tie(other.m_Text, other.m_pData, other.m_Selected);
}

void CKROptionSet::AddOption(const CKRString& text, void* data, bool selected) {
  m_Options.push_back(_Option{text, data, selected});
}

void CKROptionSet::ClearOptions() {
  m_Options.clear();
  m_Position = 0;
}

_Option* CKROptionSet::GetOption(int index) {
  if (index < 0 || index >= Size())
    return nullptr;
  return &m_Options[std::size_t(index)];
}

_Option* CKROptionSet::GetNextOption(bool restart) {
  if (restart)
    m_Position = 0;
  return m_Position < m_Options.size() ? &m_Options[m_Position++] : nullptr;
}

bool CKROptionSet::GetNextSelected(CKRString& text, void*& data, bool restart) {
  if (restart)
    m_Position = 0;
  while (m_Position < m_Options.size()) {
    const _Option& option = m_Options[m_Position++];
    if (option.m_Selected) {
      text = option.m_Text;
      data = option.m_pData;
      return true;
    }
  }
  return false;
}

void CKROptionSet::SelectAll(bool selected) {
  for (_Option& option : m_Options)
    option.m_Selected = selected;
}

void CKROptionSet::SortOptions() {
  std::sort(m_Options.begin(), m_Options.end());
}

CKRString CKROptionSet::GetStringValue() const {
  CKRString text;
  for (const _Option& option : m_Options) {
    if (!text.IsEmpty())
      text += L'#';
    // The data travels as a 32-bit integer.
    const int data = static_cast<int>(reinterpret_cast<std::intptr_t>(option.m_pData));
    text.AppendFormat(option.m_Selected ? L"%s,%i,1" : L"%s,%i,0", option.m_Text.GetString(), data);
  }
  return text;
}

int CKROptionSet::SetValueFromString(const CKRString& text) {
  ClearOptions();
  CKRTokenizer parts(text, L"#");
  for (CKRString part; parts.Next(part);) {
    CKRTokenizer fields(part, L",");
    CKRString optionText, data, selected;
    if (fields.Next(optionText) && fields.Next(data) && fields.Next(selected))
      AddOption(optionText, reinterpret_cast<void*>(std::intptr_t(CKRString::ToInt(data.GetString()))),
                selected == L"1");
  }
  return 1;
}
