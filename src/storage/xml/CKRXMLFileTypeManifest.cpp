#include <krCoreLib/storage/xml/CKRXMLFileTypeManifest.h>

#include <krCoreLib/storage/xml/CKRXMLFileArchive.h>
#include <krCoreLib/storage/xml/CKRXMLFileDocument.h>
#include <krCoreLib/storage/xml/CKRXMLFileFieldStream.h>

#include "KRXMLFileTree.h"

XERCES_CPP_NAMESPACE_USE

KR_IMPLEMENT_OBJECT_TYPE(CKRXMLFileTypeManifest, CKRTypeManifest)

void CKRXMLFileTypeManifest::SetDocument(CKRDocument* document) {
  CKRTypeManifest::SetDocument(document);
  m_pXMLDocument = dynamic_cast<CKRXMLFileDocument*>(document);
  m_pArchive = m_pXMLDocument != nullptr ? m_pXMLDocument->GetArchive() : nullptr;
}

int CKRXMLFileTypeManifest::WriteTypeHeader(IKRObjectType* type) {
  if (m_pArchive == nullptr || m_pArchive->m_pTree == nullptr || m_pXMLDocument == nullptr)
    return 0;
  const CKRGuid typeID = type != nullptr ? type->GetID() : GetStoredTypeID();
  DOMElement* element = KRAppendGuidElement(m_pArchive->m_pTree, KRToDOM(m_pXMLDocument->GetElement()), typeID);
  if (element == nullptr)
    return 0;
  m_pElement = KRFromDOM(element);
  return CKRTypeManifest::WriteTypeHeader(type);
}

int CKRXMLFileTypeManifest::ReadTypeHeader(IKRObjectType*) {
  return 1;
}

CKRFieldStream* CKRXMLFileTypeManifest::CreateFieldStream(CKRGuid instanceID, IKRObjectType* streamType) {
  if (streamType != nullptr)
    return CKRTypeManifest::CreateFieldStream(instanceID, streamType);
  CKRFieldStream* stream =
      CKRTypeManifest::CreateFieldStream(instanceID, CKRXMLFileFieldStream::GetCKRXMLFileFieldStreamType());
  // Made by the stream type of this store: its class.
  if (stream != nullptr)
    static_cast<CKRXMLFileFieldStream*>(stream)->SetManifest(this);
  return stream;
}

int CKRXMLFileTypeManifest::LoadFieldStreams(SKRXMLFileElement* typeElement) {
  m_pElement = typeElement;
  KRForEachGuidChild(KRToDOM(typeElement), [&](const CKRGuid& id, DOMElement* element) {
    if (auto* stream = dynamic_cast<CKRXMLFileFieldStream*>(CreateFieldStream(id, nullptr)))
      stream->SetElement(KRFromDOM(element));
  });
  return 1;
}
