#include <krCoreLib/serialization/CKRFieldDataAdaptor.h>

#include <krCoreLib/serialization/CKRSerialObject.h>
#include <krCoreLib/serialization/IKRField.h>
#include <krCoreLib/serialization/IKRFieldStream.h>

#include "KRBlockPool.h"

int CKRFieldDataAdaptor::FlagsOfField() {
  IKRField* field = GetField();
  return field != nullptr ? field->GetFlags() : 0;
}

int CKRFieldDataAdaptor::NotifyOfPendingChange(CKRString& newValue) {
  return m_pOriginObject != nullptr ? m_pOriginObject->OnBeforeFieldChanged(this, newValue) : 0;
}

void CKRFieldDataAdaptor::NotifyOfChange(KRF_NOTIFICATION_TYPE kind, CKRGuid id) {
  if (m_pOriginObject != nullptr)
    m_pOriginObject->OnAfterFieldChanged(this, kind, id);
}

int CKRFieldDataAdaptor::Equals(IKRFieldData*) {
  return 0;
}

int CKRFieldDataAdaptor::SetTo(IKRFieldData*) {
  return 0;
}

CKRString CKRFieldDataAdaptor::GetStringValue() {
  return CKRString();
}

CKRSerialObject* CKRFieldDataAdaptor::GetOriginObject() {
  return m_pOriginObject;
}

void CKRFieldDataAdaptor::SetOriginObject(CKRSerialObject* object) {
  m_pOriginObject = object;
}

int CKRFieldDataAdaptor::GroupDataVaries() {
  return 0;
}

int CKRFieldDataAdaptor::IsGroupData() {
  return 0;
}

IKRFieldData* CKRFieldDataAdaptor::GetEffectiveData() {
  return this;
}

IKRFieldData* CKRFieldDataAdaptor::GetParentField() {
  return m_pParentField;
}

void CKRFieldDataAdaptor::SetParentField(IKRFieldData* parent) {
  m_pParentField = parent;
}

int CKRFieldDataAdaptor::SetValueFromString(const CKRString&) {
  return 0;
}

int CKRFieldDataAdaptor::SerializeTo(IKRFieldStream* stream) {
  return stream != nullptr ? stream->Write(this) : 0;
}

int CKRFieldDataAdaptor::SerializeFrom(IKRFieldStream* stream) {
  return stream != nullptr ? stream->Read(this) : 0;
}

int CKRFieldDataAdaptor::HasFieldDataImplTypeOf(CKRGuid implementationID) {
  return implementationID == KRIMPL_FIELDDATA_ADAPTOR ? 1 : 0;
}

int CKRFieldDataAdaptor::HasFieldTypeOf(CKRGuid dataTypeID) {
  IKRField* field = GetField();
  return field != nullptr && field->GetDataTypeID() == dataTypeID ? 1 : 0;
}

int CKRFieldDataAdaptor::ReadOnly() {
  const int flags = FlagsOfField();
  if (GetField() == nullptr)
    return 0;
  if (flags & KRF_READONLY)
    return 1;
  if ((flags & KRF_READONLY_BY_OBJECT) && m_pOriginObject != nullptr)
    return m_pOriginObject->IsFieldReadOnly(this);
  return 0;
}

int CKRFieldDataAdaptor::HiliteReadable() {
  return (FlagsOfField() & KRF_HILITE_EDITABLE) && ReadOnly() == 0 ? 1 : 0;
}

int CKRFieldDataAdaptor::Visible() {
  if (GetField() == nullptr)
    return 0;
  const int flags = FlagsOfField();
  if (flags & KRF_VISIBLE_BY_OBJECT)
    return m_pOriginObject != nullptr ? m_pOriginObject->IsFieldVisible(this) : 0;
  return (flags & KRF_VISIBLE) ? 1 : 0;
}

int CKRFieldDataAdaptor::Expanded() {
  if (GetField() == nullptr)
    return 0;
  const int flags = FlagsOfField();
  if (flags & KRF_EXPANDED)
    return 1;
  if (flags & KRF_EXPANDED_BY_OBJECT)
    return m_pOriginObject != nullptr ? m_pOriginObject->IsFieldExpanded(this) : 0;
  return 0;
}

int CKRFieldDataAdaptor::HasCheckbox() {
  return (FlagsOfField() & KRF_CHECKBOX) ? 1 : 0;
}

int CKRFieldDataAdaptor::Checked() {
  if (HasCheckbox() == 0 || m_pOriginObject == nullptr)
    return 0;
  return m_pOriginObject->IsFieldChecked(this);
}

KR_IMPLEMENT_POOLED_ALLOCATION(CKRFieldDataAdaptor)
