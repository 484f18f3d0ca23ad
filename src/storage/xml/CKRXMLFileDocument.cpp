#include <krCoreLib/storage/xml/CKRXMLFileDocument.h>

#include <krCoreLib/storage/xml/CKRXMLFileArchive.h>
#include <krCoreLib/storage/xml/CKRXMLFileTypeManifest.h>

#include "KRXMLFileTree.h"

XERCES_CPP_NAMESPACE_USE

KR_IMPLEMENT_OBJECT_TYPE(CKRXMLFileDocument, CKRDocument)

void CKRXMLFileDocument::SetArchive(CKRXMLFileArchive* archive) {
  m_pArchive = archive;
  if (archive == nullptr || archive->GetAccessMode() != CKRArchive::AccessWrite || archive->m_pTree == nullptr)
    return;
  SKRXMLFileTree* tree = archive->m_pTree;
  m_pElement = KRFromDOM(KRAppendGuidElement(tree, tree->m_pDocument->getDocumentElement(), GetInstanceID()));
}

CKRTypeManifest* CKRXMLFileDocument::CreateTypeManifest(CKRGuid typeID, IKRObjectType* manifestType) {
  // The base links the manifest to this document, and through it to the
  // archive (CKRXMLFileTypeManifest::SetDocument).
  return CKRDocument::CreateTypeManifest(
      typeID, manifestType != nullptr ? manifestType : CKRXMLFileTypeManifest::GetCKRXMLFileTypeManifestType());
}

int CKRXMLFileDocument::LoadTypeManifests(SKRXMLFileElement* documentElement) {
  m_pElement = documentElement;
  KRForEachGuidChild(KRToDOM(documentElement), [&](const CKRGuid& id, DOMElement* element) {
    if (auto* manifest = dynamic_cast<CKRXMLFileTypeManifest*>(CreateTypeManifest(id, nullptr)))
      manifest->LoadFieldStreams(KRFromDOM(element));
  });
  return 1;
}
