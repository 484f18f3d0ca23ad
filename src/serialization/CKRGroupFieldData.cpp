#include <krCoreLib/serialization/CKRGroupFieldData.h>

#include <algorithm>

CKRGroupFieldData::CKRGroupFieldData(IKRField* field) : m_pField(field) {}

bool CKRGroupFieldData::AllEqual() {
  const CKRString first = m_Members.front()->GetStringValue();
  return std::all_of(m_Members.begin() + 1, m_Members.end(),
                     [&](IKRFieldData* member) { return member->GetStringValue() == first; });
}

int CKRGroupFieldData::NotifyOfPendingChange(CKRString& newValue) {
  // Every member is asked, also after a refusal: each object hears of it.
  int allowed = 1;
  for (IKRFieldData* member : m_Members)
    if (member->NotifyOfPendingChange(newValue) == 0)
      allowed = 0;
  return allowed;
}

void CKRGroupFieldData::NotifyOfChange(KRF_NOTIFICATION_TYPE kind, CKRGuid id) {
  for (IKRFieldData* member : m_Members)
    member->NotifyOfChange(kind, id);
}

int CKRGroupFieldData::SetTo(IKRFieldData* other) {
  for (IKRFieldData* member : m_Members)
    member->SetTo(other);
  return 1;
}

IKRField* CKRGroupFieldData::GetField() {
  return m_pField;
}

CKRString CKRGroupFieldData::GetStringValue() {
  if (m_Members.empty())
    return CKRString(L"EMPTY");
  return AllEqual() ? m_Members.front()->GetStringValue() : CKRString(L"*Varies*");
}

int CKRGroupFieldData::GroupDataVaries() {
  return m_Members.empty() || !AllEqual() ? 1 : 0;
}

int CKRGroupFieldData::IsGroupData() {
  return 1;
}

IKRFieldData* CKRGroupFieldData::GetEffectiveData() {
  return !m_Members.empty() && AllEqual() ? m_Members.front() : nullptr;
}

void CKRGroupFieldData::Release(bool deep) {
  if (deep)
    for (IKRFieldData* member : m_Members)
      member->Release(true);
  delete this;
}

int CKRGroupFieldData::SetValueFromString(const CKRString& text) {
  CKRString trimmed = text;
  trimmed.Trim();
  if (trimmed.IsEmpty())
    return 1;
  int all = 1;
  for (IKRFieldData* member : m_Members)
    if (member->SetValueFromString(trimmed) == 0)
      all = 0;
  return all;
}

int CKRGroupFieldData::HasFieldDataImplTypeOf(CKRGuid implementationID) {
  return implementationID == KRIMPL_FIELDDATA_VALUE ? 1 : 0;
}

void CKRGroupFieldData::AddFieldData(IKRFieldData* fieldData) {
  if (fieldData != nullptr && std::find(m_Members.begin(), m_Members.end(), fieldData) == m_Members.end())
    m_Members.push_back(fieldData);
}

IKRFieldData* CKRGroupFieldData::GetFirstFieldData() {
  return m_Members.empty() ? nullptr : m_Members.front();
}

int CKRGroupFieldData::SupportsStringStorage() {
  return 0;
}
