// Saving framework objects into the memory store of tests/common and
// loading them back, for the framework tests.
#pragma once

#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/CKRSerialObject.h>

#include "KRMemoryStore.h"

#include <vector>

class CKRFrameworkStore {
public:
  static constexpr CKRGuid kDocumentID = CKRGuid::Literal("{6D000000-0000-4000-8000-0000000000D0}");

  // The storable test types get their fields.
  CKRFrameworkStore() { CKRTypeSystem::Initialize(CKRGuid::Literal("{6D000000-0000-4000-8000-000000000001}")); }
  ~CKRFrameworkStore() { Close(); }
  CKRFrameworkStore(const CKRFrameworkStore&) = delete;
  CKRFrameworkStore& operator=(const CKRFrameworkStore&) = delete;

  // Saves the roots into one document of a fresh medium: 1 when every root
  // was stored.
  int Save(const std::vector<IKRSerializable*>& roots) {
    Close();
    m_Medium = SKRStoredMedium();
    CKRMemoryArchive* archive = Open(CKRArchive::AccessWrite);
    CKRDocument* document = archive->CreateNewDocument(kDocumentID, nullptr);
    int result = document != nullptr ? 1 : 0;
    for (IKRSerializable* root : roots)
      result &= document != nullptr ? root->SerializeTo(document) : 0;
    archive->Release();
    return result;
  }

  // The stored object `instanceID` of type `typeID` as a T, through one
  // reading archive kept until the next Save or the end of the store.
  template <class T>
  T* Load(CKRGuid instanceID, CKRGuid typeID) {
    if (m_pArchive == nullptr)
      m_pArchive = Open(CKRArchive::AccessRead);
    auto* document = static_cast<CKRDocument*>(m_pArchive->GetDocumentCollection()->Find(kDocumentID));
    return document != nullptr ? dynamic_cast<T*>(document->GetObject(instanceID, typeID)) : nullptr;
  }

  SKRStoredDocument& Stored() { return m_Medium.m_Documents[kDocumentID]; }

private:
  CKRMemoryArchive* Open(CKRArchive::AccessMode mode) {
    auto* archive = static_cast<CKRMemoryArchive*>(CKRMemoryArchive::GetCKRMemoryArchiveType()->CreateInstance(CKRGuid()));
    archive->SetMedium(&m_Medium);
    archive->Open(mode);
    return archive;
  }
  void Close() {
    if (m_pArchive != nullptr)
      m_pArchive->Release();
    m_pArchive = nullptr;
  }

  SKRStoredMedium m_Medium;
  CKRMemoryArchive* m_pArchive = nullptr;
};
