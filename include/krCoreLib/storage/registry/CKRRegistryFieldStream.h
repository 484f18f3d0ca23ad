// CKRRegistryFieldStream: one stored object of a registry serializer, the
// key root \ location \ {type ID} \ {instance ID}, one value per field
// named by the field's name (layout in CKRRegistrySerializer.h). Holds the
// serializer without owning it.
//
// Every operation opens the object's key first. Reading a value field that
// is missing or unreadable sets the field from the empty text and succeeds,
// so that objects stored before a field existed still load. Links resolve
// through the document's GetObject: an empty link, strings that are not
// GUIDs, an unknown type or a missing object read as null (a collection
// skips them).
#pragma once

#include <krCoreLib/serialization/CKRFieldStream.h>

#include <vector>

class CKRRegistrySerializer;

class KRCORELIB_API CKRRegistryFieldStream : public CKRFieldStream {
  KR_DECLARE_OBJECT_TYPE(CKRRegistryFieldStream, CKRObjectTypeImpl, "{512ACB6B-8ED2-4E84-BBB4-3326C569BD48}")

public:
  void SetSerializer(CKRRegistrySerializer* serializer) { m_pSerializer = serializer; }
  CKRRegistrySerializer* GetSerializer() const { return m_pSerializer; }
  void SetStoredTypeID(CKRGuid typeID) { m_StoredTypeID = typeID; }
  CKRGuid GetStoredTypeID() const { return m_StoredTypeID; }

  // Creates (volatile) or opens the object's key: 1; 0 for a null object,
  // without a serializer or location, or when the key cannot be created.
  int WriteObjectHeader(IKRObject* object) override;
  // 1 when the object's key exists; 0 otherwise, so that a link to an
  // object that was never stored reads as null instead of as an empty
  // object.
  int ReadObjectHeader(IKRObject* object) override;
  // 0 without field data, field or serializer; 1 without writing for a
  // field without string storage; otherwise 1 when the field's text was
  // written, 0 when the object's key or the value cannot be written.
  int Write(IKRFieldData* fieldData) override;
  // 0 without field data, field or serializer; otherwise 1 (see above).
  int Read(IKRFieldData* fieldData) override;
  // The linked object; null when the key or value is missing or the value
  // is not a list of exactly two strings.
  IKRObject* ReadLink(IKRFieldData* fieldData) override;
  // Adds the linked objects in stored order: 1; 0 when the key or value is
  // missing, the value is not a string list or its strings do not pair up.
  int ReadLinks(IKRFieldData* fieldData, IKRCollection* collection) override;
  // 0 without field data, field or serializer, or when the object's key
  // does not exist or the value cannot be written; otherwise 1.
  int WriteLink(IKRFieldData* fieldData, IKRObject* object) override;
  int WriteLinks(IKRFieldData* fieldData, IKRIterator* iterator) override;

protected:
  CKRRegistryFieldStream() = default;
  ~CKRRegistryFieldStream() override = default;

private:
  // Opens the object's key as the serializer's current key: 1 when it
  // exists.
  int OpenObjectKey();
  // The linked objects' type and instance IDs, stored under the field's
  // name.
  int WriteLinkStrings(IKRFieldData* fieldData, const std::vector<CKRString>& strings);
  // The stored strings of the field's link value: false when the key or
  // value is missing or not a string list.
  bool ReadLinkStrings(IKRFieldData* fieldData, std::vector<CKRString>& strings);

  CKRRegistrySerializer* m_pSerializer = nullptr;
  CKRGuid m_StoredTypeID;
};
