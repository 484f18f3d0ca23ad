#include <krCoreLib/serialization/CKRFieldStream.h>

#include "KRBlockPool.h"

KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRFieldStream, CKRObjectImpl)

void* CKRFieldStream::GetInterface(CKRGuid iid) {
  if (void* view = CKRObjectImpl::GetInterface(iid))
    return view;
  if (iid.IsValid() && iid == IID_IKRFieldStream)
    return static_cast<IKRFieldStream*>(this);
  return nullptr;
}

int CKRFieldStream::OnInitialize() {
  m_pResult = nullptr;
  return 1;
}

CKRGuid CKRFieldStream::GetStoredInstanceID() {
  return GetInstanceID();
}

void CKRFieldStream::SetStoredInstanceID(CKRGuid instanceID) {
  SKRObjectIdentity::SetInstanceID(this, instanceID);
}

int CKRFieldStream::Open() {
  return 1;
}

int CKRFieldStream::Close() {
  return 1;
}

CKRDocument* CKRFieldStream::GetDocument() {
  return m_pDocument;
}

void CKRFieldStream::SetDocument(CKRDocument* document) {
  m_pDocument = document;
}

int CKRFieldStream::WriteObjectHeader(IKRObject*) {
  return 1;
}

int CKRFieldStream::Write(IKRFieldData*) {
  return 1;
}

int CKRFieldStream::ReadObjectHeader(IKRObject*) {
  return 1;
}

int CKRFieldStream::Read(IKRFieldData*) {
  return 1;
}

int CKRFieldStream::ObjectHasBeenSerialized(CKRGuid session) {
  return session == m_SessionID ? 1 : 0;
}

void CKRFieldStream::SetObjectSerialized(CKRGuid session) {
  m_SessionID = session;
}

IKRObject* CKRFieldStream::GetResult() {
  return m_pResult;
}

void CKRFieldStream::SetResult(IKRObject* object) {
  m_pResult = object;
}

KR_IMPLEMENT_POOLED_ALLOCATION(CKRFieldStream)
