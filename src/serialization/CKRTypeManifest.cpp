#include <krCoreLib/serialization/CKRTypeManifest.h>

#include "KRContainerRelease.h"

KR_IMPLEMENT_OBJECT_TYPE(CKRTypeManifest, CKRObjectImpl)

int CKRTypeManifest::OnInitialize() {
  m_HeaderWritten = 0;
  return 1;
}

int CKRTypeManifest::OnBeforeRelease() {
  Close();
  return 1;
}

int CKRTypeManifest::Open() {
  return 1;
}

int CKRTypeManifest::Close() {
  return DeleteAllFieldStreams();
}

int CKRTypeManifest::ReadTypeHeader(IKRObjectType*) {
  return 1;
}

int CKRTypeManifest::TypeHeaderIsWritten() {
  return m_HeaderWritten;
}

int CKRTypeManifest::WriteTypeHeader(IKRObjectType*) {
  m_HeaderWritten = 1;
  return 1;
}

IKRReadOnlyCollection* CKRTypeManifest::GetInstanceFieldStreamCollection() {
  return &m_FieldStreams;
}

CKRObjGuidPtrMap<CKRFieldStream>::Iterator CKRTypeManifest::GetInstanceFieldStreamIterator() {
  return m_FieldStreams.GetIterator();
}

CKRFieldStream* CKRTypeManifest::CreateFieldStream(CKRGuid instanceID, IKRObjectType* streamType) {
  if (streamType == nullptr || streamType->IsTypeOf(CKRFieldStream::TypeID) == 0 || streamType->IsAbstract() != 0)
    return nullptr;
  // Made with the stored ID at once (the same end as a fresh ID re-keyed);
  // a stream for the ID that exists already makes Add refuse the new one.
  IKRObject* made = streamType->CreateInstance(instanceID);
  auto* stream = dynamic_cast<CKRFieldStream*>(made);
  if (stream == nullptr) {
    if (made != nullptr)
      made->Release();
    return nullptr;
  }
  stream->SetStoredInstanceID(instanceID);
  stream->SetDocument(m_pDocument);
  if (m_FieldStreams.Add(stream) == 0) {
    stream->Release();
    return nullptr;
  }
  return stream;
}

int CKRTypeManifest::DeleteFieldStream(CKRGuid instanceID) {
  return KRReleaseChild(m_FieldStreams, instanceID);
}

int CKRTypeManifest::DeleteAllFieldStreams() {
  return KRReleaseChildren(m_FieldStreams);
}

CKRDocument* CKRTypeManifest::GetDocument() {
  return m_pDocument;
}

void CKRTypeManifest::SetDocument(CKRDocument* document) {
  m_pDocument = document;
}

CKRGuid CKRTypeManifest::GetStoredTypeID() {
  return GetInstanceID();
}

void CKRTypeManifest::SetStoredTypeID(CKRGuid typeID) {
  SKRObjectIdentity::SetInstanceID(this, typeID);
}
