#include "KRMemoryStore.h"

#include <algorithm>

#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/IKRField.h>
#include <krCoreLib/serialization/IKRFieldData.h>

KR_IMPLEMENT_OBJECT_TYPE(CKRMemoryArchive, CKRArchive)
KR_IMPLEMENT_OBJECT_TYPE(CKRMemoryDocument, CKRDocument)
KR_IMPLEMENT_OBJECT_TYPE(CKRMemoryTypeManifest, CKRTypeManifest)
KR_IMPLEMENT_OBJECT_TYPE(CKRMemoryFieldStream, CKRFieldStream)

namespace {

CKRGuid FieldIDOf(IKRFieldData* fieldData) {
  IKRField* field = fieldData != nullptr ? fieldData->GetField() : nullptr;
  return field != nullptr ? field->GetFieldID() : CKRGuid();
}

}  // namespace

CKRBOOL CKRMemoryArchive::Open(AccessMode mode) {
  CKRArchive::Open(mode);
  if ((mode & AccessRead) == 0 || m_pMedium == nullptr)
    return true;
  for (auto& [documentID, stored] : m_pMedium->m_Documents) {
    CKRDocument* document = CreateNewDocument(documentID, nullptr);
    if (document == nullptr)
      return false;
    // One manifest per stored type, then its streams; each stream is handed
    // its stored object, so reading needs no look-up. (Grouped, not sorted:
    // the manifest keys its streams by ID whatever the order they come in.)
    std::map<CKRGuid, std::vector<std::pair<CKRGuid, SKRStoredObject*>>> byType;
    for (auto& [instanceID, object] : stored.m_Objects)
      byType[object.m_TypeID].emplace_back(instanceID, &object);
    for (const auto& [typeID, instances] : byType) {
      CKRTypeManifest* manifest = document->CreateTypeManifest(typeID, nullptr);
      if (manifest == nullptr)
        return false;
      manifest->ReadTypeHeader(CKRTypeSystem::FindType(typeID));
      for (const auto& [instanceID, object] : instances)
        if (auto* stream = dynamic_cast<CKRMemoryFieldStream*>(manifest->CreateFieldStream(instanceID, nullptr)))
          stream->SetStoredObject(object);
    }
  }
  return true;
}

CKRDocument* CKRMemoryArchive::CreateNewDocument(CKRGuid documentID, IKRObjectType* documentType) {
  CKRDocument* document =
      CKRArchive::CreateNewDocument(documentID, documentType != nullptr ? documentType : CKRMemoryDocument::GetCKRMemoryDocumentType());
  if (auto* memory = dynamic_cast<CKRMemoryDocument*>(document))
    memory->m_pMedium = m_pMedium;
  return document;
}

SKRStoredDocument* CKRMemoryDocument::Stored() {
  return m_pMedium != nullptr && !m_pMedium->m_KeepNothing ? &m_pMedium->m_Documents[GetInstanceID()] : nullptr;
}

CKRTypeManifest* CKRMemoryDocument::CreateTypeManifest(CKRGuid typeID, IKRObjectType* manifestType) {
  return CKRDocument::CreateTypeManifest(typeID,
                                         manifestType != nullptr ? manifestType : CKRMemoryTypeManifest::GetCKRMemoryTypeManifestType());
}

CKRFieldStream* CKRMemoryTypeManifest::CreateFieldStream(CKRGuid instanceID, IKRObjectType* streamType) {
  return CKRTypeManifest::CreateFieldStream(instanceID,
                                            streamType != nullptr ? streamType : CKRMemoryFieldStream::GetCKRMemoryFieldStreamType());
}

int CKRMemoryTypeManifest::WriteTypeHeader(IKRObjectType* type) {
  if (auto* document = dynamic_cast<CKRMemoryDocument*>(GetDocument()))
    if (SKRStoredDocument* stored = document->Stored())
      ++stored->m_TypeHeaders[GetStoredTypeID()];
  return CKRTypeManifest::WriteTypeHeader(type);
}

void CKRMemoryFieldStream::SetDocument(CKRDocument* document) {
  CKRFieldStream::SetDocument(document);
  m_pMemoryDocument = dynamic_cast<CKRMemoryDocument*>(document);
}

SKRStoredObject* CKRMemoryFieldStream::Stored(bool create) {
  if (m_pStored != nullptr)
    return m_pStored;
  SKRStoredDocument* stored = m_pMemoryDocument != nullptr ? m_pMemoryDocument->Stored() : nullptr;
  if (stored == nullptr)
    return nullptr;
  if (create)
    return m_pStored = &stored->m_Objects[GetStoredInstanceID()];
  const auto at = stored->m_Objects.find(GetStoredInstanceID());
  return at == stored->m_Objects.end() ? nullptr : (m_pStored = &at->second);
}

int CKRMemoryFieldStream::WriteObjectHeader(IKRObject* object) {
  SKRStoredObject* stored = Stored(true);
  if (stored == nullptr)
    return 1;
  if (m_pMemoryDocument->m_pMedium->m_RefuseSecondHeader && stored->m_HeaderWrites > 0)
    return 0;
  ++stored->m_HeaderWrites;
  stored->m_TypeID = object->GetType()->GetID();
  if (SKRStoredDocument* document = m_pMemoryDocument != nullptr ? m_pMemoryDocument->Stored() : nullptr)
    document->m_HeaderOrder.push_back(GetStoredInstanceID());
  return 1;
}

int CKRMemoryFieldStream::Write(IKRFieldData* fieldData) {
  const CKRGuid fieldID = FieldIDOf(fieldData);
  const SKRStoredMedium* medium = m_pMemoryDocument != nullptr ? m_pMemoryDocument->m_pMedium : nullptr;
  if (medium != nullptr && medium->m_FailWriteOfField.IsValid() && fieldID == medium->m_FailWriteOfField)
    return 0;
  if (SKRStoredObject* stored = Stored(true)) {
    stored->m_Values[fieldID] = fieldData->GetStringValue();
    stored->m_WriteOrder.push_back(fieldID);
  }
  return 1;
}

int CKRMemoryFieldStream::ReadObjectHeader(IKRObject* object) {
  SKRStoredObject* stored = Stored(false);
  if (stored == nullptr)
    return 0;
  ++stored->m_HeaderReads;
  SKRObjectIdentity::SetInstanceID(object, GetStoredInstanceID());
  return 1;
}

int CKRMemoryFieldStream::Read(IKRFieldData* fieldData) {
  SKRStoredObject* stored = Stored(false);
  if (stored == nullptr)
    return 0;
  const auto at = stored->m_Values.find(FieldIDOf(fieldData));
  if (at == stored->m_Values.end())
    return 0;
  fieldData->SetValueFromString(at->second);
  fieldData->NotifyOfChange(KRF_VALUE_CHANGED, CKRGuid());
  return 1;
}

std::vector<SKRStoredLink>* CKRMemoryFieldStream::StoredLinks(IKRFieldData* fieldData) {
  SKRStoredObject* stored = Stored(false);
  if (stored == nullptr)
    return nullptr;
  const auto at = stored->m_Links.find(FieldIDOf(fieldData));
  return at == stored->m_Links.end() ? nullptr : &at->second;
}

IKRObject* CKRMemoryFieldStream::ReadLink(IKRFieldData* fieldData) {
  std::vector<SKRStoredLink>* links = StoredLinks(fieldData);
  if (links == nullptr || links->size() != 1 || links->front().m_TypeID.IsNull())
    return nullptr;
  return GetDocument()->GetObject(links->front().m_InstanceID, links->front().m_TypeID);
}

int CKRMemoryFieldStream::ReadLinks(IKRFieldData* fieldData, IKRCollection* collection) {
  std::vector<SKRStoredLink>* links = StoredLinks(fieldData);
  if (links == nullptr || collection == nullptr)
    return 0;
  for (const SKRStoredLink& link : *links)
    if (IKRObject* object = GetDocument()->GetObject(link.m_InstanceID, link.m_TypeID))
      collection->Add(object);
  return 1;
}

int CKRMemoryFieldStream::WriteLink(IKRFieldData* fieldData, IKRObject* object) {
  if (SKRStoredObject* stored = Stored(true)) {
    const CKRGuid fieldID = FieldIDOf(fieldData);
    stored->m_Links[fieldID] = {object != nullptr ? SKRStoredLink{object->GetType()->GetID(), object->GetInstanceID()}
                                                  : SKRStoredLink{}};
    stored->m_WriteOrder.push_back(fieldID);
  }
  return 1;
}

int CKRMemoryFieldStream::WriteLinks(IKRFieldData* fieldData, IKRIterator* iterator) {
  SKRStoredObject* stored = Stored(true);
  if (stored == nullptr || iterator == nullptr)
    return iterator != nullptr ? 1 : 0;
  const CKRGuid fieldID = FieldIDOf(fieldData);
  std::vector<SKRStoredLink>& links = stored->m_Links[fieldID];
  links.clear();
  for (IKRObject* object = iterator->Next(1); object != nullptr; object = iterator->Next(0))
    links.push_back({object->GetType()->GetID(), object->GetInstanceID()});
  stored->m_WriteOrder.push_back(fieldID);
  return 1;
}
