#include <krCoreLib/storage/registry/CKRRegistryFieldStream.h>

#include <krCoreLib/objectmodel/IKRCollection.h>
#include <krCoreLib/serialization/CKRDocument.h>
#include <krCoreLib/serialization/IKRField.h>
#include <krCoreLib/serialization/IKRFieldData.h>
#include <krCoreLib/storage/registry/CKRRegistrySerializer.h>

KR_IMPLEMENT_OBJECT_TYPE(CKRRegistryFieldStream, CKRFieldStream)

namespace {

// Prefixes of the two strings that name a linked object.
constexpr const wchar_t* kTypePrefix = L"T:";
constexpr const wchar_t* kInstancePrefix = L"I:";
constexpr int kPrefixLength = 2;

IKRField* FieldOf(IKRFieldData* fieldData) {
  return fieldData != nullptr ? fieldData->GetField() : nullptr;
}

void AppendLinkStrings(std::vector<CKRString>& strings, IKRObject* object) {
  if (object == nullptr) {
    strings.emplace_back();
    strings.emplace_back();
    return;
  }
  strings.push_back(kTypePrefix + object->GetType()->GetID().GetCString());
  strings.push_back(kInstancePrefix + object->GetInstanceID().GetCString());
}

// The GUID after a link string's prefix (which is not checked); null when
// the rest is not a braced GUID.
CKRGuid LinkGuid(const CKRString& text) {
  CKRGuid id;
  if (text.GetLength() > kPrefixLength)
    id.ReadCString(text.Mid(kPrefixLength));
  return id;
}

// The object a pair of link strings names, through the document: null for
// an empty link, strings that are not GUIDs, an unknown type or a missing
// object.
IKRObject* ResolveLink(CKRDocument* document, const CKRString& typeText, const CKRString& instanceText) {
  const CKRGuid typeID = LinkGuid(typeText);
  const CKRGuid instanceID = LinkGuid(instanceText);
  if (document == nullptr || typeID.IsNull() || instanceID.IsNull())
    return nullptr;
  return document->GetObject(instanceID, typeID);
}

}  // namespace

int CKRRegistryFieldStream::OpenObjectKey() {
  return m_pSerializer->OpenStored(
      m_StoredTypeID.GetCString() + L"\\" + GetStoredInstanceID().GetCString(), false);
}

int CKRRegistryFieldStream::WriteObjectHeader(IKRObject* object) {
  if (object == nullptr || m_pSerializer == nullptr)
    return 0;
  return m_pSerializer->OpenStored(m_StoredTypeID.GetCString() + L"\\" + object->GetInstanceID().GetCString(), true);
}

int CKRRegistryFieldStream::ReadObjectHeader(IKRObject* object) {
  return object != nullptr && m_pSerializer != nullptr ? OpenObjectKey() : 0;
}

int CKRRegistryFieldStream::Write(IKRFieldData* fieldData) {
  IKRField* field = FieldOf(fieldData);
  if (field == nullptr || m_pSerializer == nullptr)
    return 0;
  if (field->SupportsStringStorage() == 0)
    return 1;
  if (OpenObjectKey() == 0)
    return 0;
  return m_pSerializer->Write(field->GetName(), fieldData->GetStringValue());
}

int CKRRegistryFieldStream::Read(IKRFieldData* fieldData) {
  IKRField* field = FieldOf(fieldData);
  if (field == nullptr || m_pSerializer == nullptr)
    return 0;
  if (field->SupportsStringStorage() == 0)
    return 1;
  // A missing key or value, or one of another type, reads as empty text.
  CKRString text;
  if (OpenObjectKey() != 0 && m_pSerializer->Read(field->GetName(), text) == 0)
    text.Empty();
  fieldData->SetValueFromString(text);
  fieldData->NotifyOfChange(KRF_VALUE_CHANGED, CKRGuid());
  return 1;
}

int CKRRegistryFieldStream::WriteLinkStrings(IKRFieldData* fieldData, const std::vector<CKRString>& strings) {
  CKRRegistryStringArray list(strings);
  return OpenObjectKey() != 0 && m_pSerializer->Write(FieldOf(fieldData)->GetName(), list) != 0 ? 1 : 0;
}

bool CKRRegistryFieldStream::ReadLinkStrings(IKRFieldData* fieldData, std::vector<CKRString>& strings) {
  return OpenObjectKey() != 0 && m_pSerializer->Read(FieldOf(fieldData)->GetName(), strings) != 0;
}

int CKRRegistryFieldStream::WriteLink(IKRFieldData* fieldData, IKRObject* object) {
  if (FieldOf(fieldData) == nullptr || m_pSerializer == nullptr)
    return 0;
  std::vector<CKRString> strings;
  AppendLinkStrings(strings, object);
  return WriteLinkStrings(fieldData, strings);
}

int CKRRegistryFieldStream::WriteLinks(IKRFieldData* fieldData, IKRIterator* iterator) {
  if (FieldOf(fieldData) == nullptr || m_pSerializer == nullptr)
    return 0;
  std::vector<CKRString> strings;
  if (iterator != nullptr)
    for (IKRObject* object = iterator->Next(1); object != nullptr; object = iterator->Next(0))
      AppendLinkStrings(strings, object);
  return WriteLinkStrings(fieldData, strings);
}

IKRObject* CKRRegistryFieldStream::ReadLink(IKRFieldData* fieldData) {
  std::vector<CKRString> strings;
  if (FieldOf(fieldData) == nullptr || m_pSerializer == nullptr || !ReadLinkStrings(fieldData, strings) ||
      strings.size() != 2)
    return nullptr;
  return ResolveLink(GetDocument(), strings[0], strings[1]);
}

int CKRRegistryFieldStream::ReadLinks(IKRFieldData* fieldData, IKRCollection* collection) {
  std::vector<CKRString> strings;
  if (FieldOf(fieldData) == nullptr || m_pSerializer == nullptr || collection == nullptr ||
      !ReadLinkStrings(fieldData, strings) || strings.size() % 2 != 0)
    return 0;
  for (std::size_t i = 0; i < strings.size(); i += 2)
    if (IKRObject* object = ResolveLink(GetDocument(), strings[i], strings[i + 1]))
      collection->Add(object);
  return 1;
}
