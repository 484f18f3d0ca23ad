#include <krCoreLib/serialization/CKRDocument.h>

#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/IKRSerializableAdaptor.h>

#include "KRContainerRelease.h"

KR_IMPLEMENT_OBJECT_TYPE(CKRDocument, CKRObjectImpl)

int CKRDocument::OnInitialize() {
  AdvanceSerialSessionID();
  return 1;
}

int CKRDocument::OnBeforeRelease() {
  Close();
  return 1;
}

int CKRDocument::Open() {
  return 1;
}

int CKRDocument::Close() {
  return DeleteAllTypeManifests();
}

IKRReadOnlyCollection* CKRDocument::GetTypeManifestCollection() {
  return &m_TypeManifests;
}

CKRObjGuidPtrMap<CKRTypeManifest>::Iterator CKRDocument::GetTypeManifestIterator() {
  return m_TypeManifests.GetIterator();
}

IKRObject* CKRDocument::GetObject(CKRGuid instanceID, CKRGuid typeID) {
  // A type the type system does not know, or not the class the link
  // requires, makes nothing, not even a manifest or stream for it. The
  // requirement is lifted while this object loads (its fields name their
  // own) and holds again for the caller's next link when this call returns.
  const CKRGuid required = m_RequiredLinkType;
  m_RequiredLinkType = CKRGuid();
  struct SKRRequirementRestore {
    CKRGuid& m_Slot;
    const CKRGuid& m_Value;
    ~SKRRequirementRestore() { m_Slot = m_Value; }
  } restore{m_RequiredLinkType, required};
  IKRObjectType* type = CKRTypeSystem::FindType(typeID);
  if (type == nullptr || (required.IsValid() && type->IsTypeOf(required) == 0))
    return nullptr;
  CKRTypeManifest* manifest = FindTypeManifest(typeID);
  if (manifest == nullptr) {
    if ((manifest = CreateTypeManifest(typeID, nullptr)) == nullptr)
      return nullptr;
    manifest->ReadTypeHeader(type);
  }
  CKRFieldStream* stream = manifest->FindFieldStream(instanceID);
  if (stream == nullptr && (stream = manifest->CreateFieldStream(instanceID, nullptr)) == nullptr)
    return nullptr;
  if (IKRObject* loaded = stream->GetResult())
    return loaded;

  IKRObject* object = type->CreateInstance(instanceID);
  if (object == nullptr)
    return nullptr;
  auto* serializable = static_cast<IKRSerializable*>(object->GetInterface(IID_IKRSerializable));
  if (serializable == nullptr) {
    object->Release();
    return nullptr;
  }
  serializable->OnBeforeLoad(this, manifest, stream);
  if (stream->ReadObjectHeader(object) == 0) {
    object->Release();
    return nullptr;
  }
  // The result is set before the fields are read: a link back to this
  // object while they are read resolves to it.
  stream->SetResult(object);
  if (m_LoadNesting >= kMaxNesting) {
    m_PendingLoads.push_back({serializable, stream});
    return object;
  }
  ++m_LoadNesting;
  const int read = serializable->SerializeFieldDataFrom(stream);
  --m_LoadNesting;
  if (read == 0) {
    stream->SetResult(nullptr);
    object->Release();
    return nullptr;
  }
  serializable->OnAfterLoad(this);
  if (m_LoadNesting == 0)
    LoadPending();
  return object;
}

CKRGuid CKRDocument::RequireLinkType(CKRGuid typeID) {
  const CKRGuid previous = m_RequiredLinkType;
  m_RequiredLinkType = typeID;
  return previous;
}

void CKRDocument::LoadPending() {
  // Last in, first out; each may add more, at a shallow nesting again. The
  // objects are linked already, so a failed read cannot undo them: they
  // keep what was read.
  while (!m_PendingLoads.empty()) {
    const SKRPendingLoad next = m_PendingLoads.back();
    m_PendingLoads.pop_back();
    ++m_LoadNesting;
    next.m_pObject->SerializeFieldDataFrom(next.m_pStream);
    --m_LoadNesting;
    next.m_pObject->OnAfterLoad(this);
  }
}

bool CKRDocument::SavePending() {
  bool saved = true;
  while (!m_PendingSaves.empty()) {
    IKRSerializableAdaptor* next = m_PendingSaves.back();
    m_PendingSaves.pop_back();
    ++m_SaveNesting;
    if (next->SaveToDocument(this) == 0)
      saved = false;
    --m_SaveNesting;
  }
  return saved;
}

CKRTypeManifest* CKRDocument::CreateTypeManifest(CKRGuid typeID, IKRObjectType* manifestType) {
  if (manifestType == nullptr || manifestType->IsTypeOf(CKRTypeManifest::TypeID) == 0 ||
      manifestType->IsAbstract() != 0 || m_TypeManifests.Find(typeID) != nullptr)
    return nullptr;
  // Made with the stored type ID at once (the same end as a fresh ID
  // re-keyed).
  IKRObject* made = manifestType->CreateInstance(typeID);
  auto* manifest = dynamic_cast<CKRTypeManifest*>(made);
  if (manifest == nullptr) {
    if (made != nullptr)
      made->Release();
    return nullptr;
  }
  manifest->SetStoredTypeID(typeID);
  manifest->SetDocument(this);
  if (m_TypeManifests.Add(manifest) == 0) {
    manifest->Release();
    return nullptr;
  }
  return manifest;
}

int CKRDocument::DeleteTypeManifest(CKRGuid typeID) {
  return KRReleaseChild(m_TypeManifests, typeID);
}

int CKRDocument::DeleteAllTypeManifests() {
  return KRReleaseChildren(m_TypeManifests);
}

void CKRDocument::AdvanceSerialSessionID() {
  m_SerialSessionID = CKRGuid::CreateNewGUID();
}

CKRGuid CKRDocument::GetSerialSessionID() {
  return m_SerialSessionID;
}
