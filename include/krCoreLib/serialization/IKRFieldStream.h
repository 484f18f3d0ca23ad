// IKRFieldStream: one stored object in a document, as a store sees it.
//
// A field stream writes and reads the object header (the object's stored
// identity), the field values and the links of one object, in the store's
// representation. The serial session marks say whether the object was
// already written or read in the document's current session; the result is
// the object loaded through the stream. CKRFieldStream implements the
// bookkeeping; each store derives its own stream and implements the four
// link operations. Not synchronised.
#pragma once

#include <krCoreLib/objectmodel/CKRGuid.h>

class CKRDocument;
class IKRCollection;
class IKRFieldData;
class IKRIterator;
class IKRObject;

class KRCORELIB_API IKRFieldStream {
public:
  virtual CKRDocument* GetDocument() = 0;
  virtual void SetDocument(CKRDocument* document) = 0;
  virtual int WriteObjectHeader(IKRObject* object) = 0;
  // One field value.
  virtual int Write(IKRFieldData* fieldData) = 0;
  // Reads the stored identity and applies the stored instance ID to
  // `object`.
  virtual int ReadObjectHeader(IKRObject* object) = 0;
  virtual int Read(IKRFieldData* fieldData) = 0;
  // 1 when the stream was marked with `session`.
  virtual int ObjectHasBeenSerialized(CKRGuid session) = 0;
  virtual void SetObjectSerialized(CKRGuid session) = 0;
  // The linked object, resolved through the document's GetObject; null
  // when there is none.
  virtual IKRObject* ReadLink(IKRFieldData* fieldData) = 0;
  // Adds the linked objects to `collection`.
  virtual int ReadLinks(IKRFieldData* fieldData, IKRCollection* collection) = 0;
  // Stores the type and instance IDs of `object` (null: an empty link).
  virtual int WriteLink(IKRFieldData* fieldData, IKRObject* object) = 0;
  virtual int WriteLinks(IKRFieldData* fieldData, IKRIterator* iterator) = 0;
  virtual IKRObject* GetResult() = 0;
  virtual void SetResult(IKRObject* object) = 0;

protected:
  ~IKRFieldStream() = default;
};
