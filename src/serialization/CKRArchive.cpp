#include <krCoreLib/serialization/CKRArchive.h>

#include "KRContainerRelease.h"

KR_IMPLEMENT_OBJECT_TYPE(CKRArchive, CKRObjectImpl)

int CKRArchive::OnBeforeRelease() {
  Close();
  return 1;
}

CKRBOOL CKRArchive::OpenWithUI(AccessMode mode) {
  return Open(mode);
}

CKRBOOL CKRArchive::Open(AccessMode mode) {
  m_AccessMode = mode;
  return true;
}

CKRBOOL CKRArchive::SaveWithUI() {
  return Save();
}

CKRBOOL CKRArchive::Save() {
  if ((m_AccessMode & AccessWrite) == 0)
    return CKRBOOL(false, L"Archive Not Open in Write Mode");
  return true;
}

CKRBOOL CKRArchive::CloseWithUI() {
  return Close();
}

CKRBOOL CKRArchive::Close() {
  return DeleteAllDocuments();
}

IKRReadOnlyCollection* CKRArchive::GetDocumentCollection() {
  return &m_Documents;
}

CKRObjGuidPtrMap<CKRDocument>::Iterator CKRArchive::GetDocumentIterator() {
  return m_Documents.GetIterator();
}

CKRDocument* CKRArchive::CreateNewDocument(CKRGuid documentID, IKRObjectType* documentType) {
  if (documentType == nullptr || documentType->IsTypeOf(CKRDocument::TypeID) == 0 ||
      documentType->IsAbstract() != 0 || m_Documents.Find(documentID) != nullptr)
    return nullptr;
  IKRObject* made = documentType->CreateInstance(documentID);
  auto* document = dynamic_cast<CKRDocument*>(made);
  if (document == nullptr) {
    if (made != nullptr)
      made->Release();
    return nullptr;
  }
  if (m_Documents.Add(document) == 0) {
    document->Release();
    return nullptr;
  }
  return document;
}

CKRBOOL CKRArchive::DeleteDocument(CKRGuid documentID) {
  return KRReleaseChild(m_Documents, documentID) != 0;
}

CKRBOOL CKRArchive::DeleteAllDocuments() {
  return KRReleaseChildren(m_Documents) != 0;
}
