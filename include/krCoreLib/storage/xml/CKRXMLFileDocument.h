// CKRXMLFileDocument: a document of an XML file archive, one element below
// the root named by the element form of the document ID. Its manifests are
// CKRXMLFileTypeManifests. Valid only while its archive is open.
#pragma once

#include <krCoreLib/serialization/CKRDocument.h>

class CKRXMLFileArchive;
struct SKRXMLFileElement;

class KRCORELIB_API CKRXMLFileDocument : public CKRDocument {
  KR_DECLARE_OBJECT_TYPE(CKRXMLFileDocument, CKRObjectTypeImpl, "{9B4DB7C7-29CA-4F6D-A78B-D2825148CE30}")

public:
  // Records the archive; in write mode appends the document's element to
  // the root.
  virtual void SetArchive(CKRXMLFileArchive* archive);
  CKRXMLFileArchive* GetArchive() const { return m_pArchive; }
  // Without a type, a CKRXMLFileTypeManifest linked to this document;
  // with one, the base's result.
  CKRTypeManifest* CreateTypeManifest(CKRGuid typeID, IKRObjectType* manifestType) override;
  // Reading: builds a manifest for every child element named by a valid
  // GUID (later duplicates and other children are skipped): 1.
  virtual int LoadTypeManifests(SKRXMLFileElement* documentElement);

  SKRXMLFileElement* GetElement() const { return m_pElement; }

protected:
  CKRXMLFileDocument() = default;
  ~CKRXMLFileDocument() override = default;

private:
  CKRXMLFileArchive* m_pArchive = nullptr;
  SKRXMLFileElement* m_pElement = nullptr;
};
