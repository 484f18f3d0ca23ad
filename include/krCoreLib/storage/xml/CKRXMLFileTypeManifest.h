// CKRXMLFileTypeManifest: one stored type of an XML file document, one
// element below the document's named by the element form of the type ID.
// Its streams are CKRXMLFileFieldStreams. Valid only while its archive is
// open.
#pragma once

#include <krCoreLib/serialization/CKRTypeManifest.h>

class CKRXMLFileArchive;
class CKRXMLFileDocument;
struct SKRXMLFileElement;

class KRCORELIB_API CKRXMLFileTypeManifest : public CKRTypeManifest {
  KR_DECLARE_OBJECT_TYPE(CKRXMLFileTypeManifest, CKRObjectTypeImpl, "{320B405E-56FE-442E-AF44-D64092E45411}")

public:
  // Records the document and its archive.
  void SetDocument(CKRDocument* document) override;
  // Appends the type's element to the document's element, then marks the
  // header written: 1; 0 when the element cannot be made.
  int WriteTypeHeader(IKRObjectType* type) override;
  // 1: the element's name, read while loading, is the whole header.
  int ReadTypeHeader(IKRObjectType* type) override;
  // Without a type, a CKRXMLFileFieldStream linked to this manifest; with
  // one, the base's result.
  CKRFieldStream* CreateFieldStream(CKRGuid instanceID, IKRObjectType* streamType) override;
  // Reading: builds a stream for every child element named by a valid GUID
  // and hands it its element (later duplicates and other children are
  // skipped): 1.
  virtual int LoadFieldStreams(SKRXMLFileElement* typeElement);

  CKRXMLFileArchive* GetArchive() const { return m_pArchive; }
  SKRXMLFileElement* GetElement() const { return m_pElement; }

protected:
  CKRXMLFileTypeManifest() = default;
  ~CKRXMLFileTypeManifest() override = default;

private:
  CKRXMLFileArchive* m_pArchive = nullptr;
  CKRXMLFileDocument* m_pXMLDocument = nullptr;
  SKRXMLFileElement* m_pElement = nullptr;
};
