// Saving framework objects into the memory store of tests/common and
// loading them back, for the framework tests.
#pragma once

#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/CKRSerialObject.h>

#include "KRMemoryStore.h"

#include <vector>

class CKRFrameworkStore {
public:
  static constexpr CKRGuid kRepository = CKRGuid::Literal("{6D000000-0000-4000-8000-000000000001}");
  static constexpr CKRGuid kDocumentID = CKRGuid::Literal("{6D000000-0000-4000-8000-0000000000D0}");

  // The storable test types get their fields.
  CKRFrameworkStore() { CKRTypeSystem::Initialize(kRepository); }
  ~CKRFrameworkStore() {
    if (m_pArchive != nullptr)
      m_pArchive->Release();
  }
  CKRFrameworkStore(const CKRFrameworkStore&) = delete;
  CKRFrameworkStore& operator=(const CKRFrameworkStore&) = delete;

  // Saves the roots into one document of a fresh medium: 1 when every root
  // was stored.
  int Save(const std::vector<IKRSerializable*>& roots) {
    if (m_pArchive != nullptr)
      m_pArchive->Release();
    m_pArchive = nullptr;
    m_Medium = SKRStoredMedium();
    CKRMemoryArchive* archive = Open(CKRArchive::AccessWrite);
    CKRDocument* document = archive != nullptr ? archive->CreateNewDocument(kDocumentID, nullptr) : nullptr;
    int result = document != nullptr ? 1 : 0;
    for (IKRSerializable* root : roots)
      result &= document != nullptr ? root->SerializeTo(document) : 0;
    if (archive != nullptr)
      archive->Release();
    return result;
  }

  // The stored object `instanceID` of type `typeID` as a T, loaded from
  // the medium (one reading archive, kept until the next Save or the end
  // of the store).
  template <class T>
  T* Load(CKRGuid instanceID, CKRGuid typeID) {
    if (m_pArchive == nullptr)
      m_pArchive = Open(CKRArchive::AccessRead);
    auto* document = m_pArchive != nullptr
                         ? static_cast<CKRDocument*>(m_pArchive->GetDocumentCollection()->Find(kDocumentID))
                         : nullptr;
    return document != nullptr ? dynamic_cast<T*>(document->GetObject(instanceID, typeID)) : nullptr;
  }

  SKRStoredDocument& Stored() { return m_Medium.m_Documents[kDocumentID]; }

private:
  CKRMemoryArchive* Open(CKRArchive::AccessMode mode) {
    auto* archive = static_cast<CKRMemoryArchive*>(CKRMemoryArchive::GetCKRMemoryArchiveType()->CreateInstance(CKRGuid()));
    if (archive == nullptr)
      return nullptr;
    archive->SetMedium(&m_Medium);
    if (!archive->Open(mode)) {
      archive->Release();
      return nullptr;
    }
    return archive;
  }

  SKRStoredMedium m_Medium;
  CKRMemoryArchive* m_pArchive = nullptr;
};
