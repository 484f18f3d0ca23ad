// CKRXMLFileFieldStream: one stored object of an XML file archive, one
// element below its type's named by the element form of the instance ID,
// holding one element per field in the order the object writes them:
//
//   value field       attribute "V" = the value's text (absent for fields
//                     without string storage)
//   link              "T" and "I" = XML64 forms of the linked object's type
//                     and instance IDs (both absent for an empty link)
//   link collection   one child "L" with "T" and "I" per linked object, in
//                     the collection's order
//
// Reading a field finds exactly one element of the field's name below the
// object's element; none or several fail that field only. Links resolve
// through the document's GetObject: an unknown type or a missing object
// reads as null (a collection skips it). Valid only while the archive is
// open.
#pragma once

#include <krCoreLib/serialization/CKRFieldStream.h>

class CKRXMLFileArchive;
class CKRXMLFileTypeManifest;
struct SKRXMLFileElement;

class KRCORELIB_API CKRXMLFileFieldStream : public CKRFieldStream {
  KR_DECLARE_OBJECT_TYPE(CKRXMLFileFieldStream, CKRObjectTypeImpl, "{95945C1C-EC3E-43FF-BD76-FF68DC688A56}")

public:
  // Forgets the element.
  int OnInitialize() override;

  // Records the manifest and its archive.
  virtual void SetManifest(CKRXMLFileTypeManifest* manifest);
  // Reading: the object's element.
  void SetElement(SKRXMLFileElement* element) { m_pElement = element; }
  SKRXMLFileElement* GetElement() const { return m_pElement; }

  // Appends the object's element to the manifest's: 1; 0 when the stream
  // has one already or it cannot be made.
  int WriteObjectHeader(IKRObject* object) override;
  // Gives the object the instance ID its element is named by: 1; 0 when
  // the stream has no element.
  int ReadObjectHeader(IKRObject* object) override;
  int Write(IKRFieldData* fieldData) override;
  int Read(IKRFieldData* fieldData) override;
  IKRObject* ReadLink(IKRFieldData* fieldData) override;
  int ReadLinks(IKRFieldData* fieldData, IKRCollection* collection) override;
  int WriteLink(IKRFieldData* fieldData, IKRObject* object) override;
  int WriteLinks(IKRFieldData* fieldData, IKRIterator* iterator) override;

protected:
  CKRXMLFileFieldStream() = default;
  ~CKRXMLFileFieldStream() override = default;

private:
  CKRXMLFileTypeManifest* m_pManifest = nullptr;
  CKRXMLFileArchive* m_pArchive = nullptr;
  SKRXMLFileElement* m_pElement = nullptr;
};
