// CKRFieldStream: the bookkeeping of a field stream, the base of every
// store's stream (abstract: a store implements the four link operations and
// its representation of headers and values).
//
// A stream's instance ID is the instance ID of the object it stores
// (GetStoredInstanceID); SetStoredInstanceID re-keys it. The defaults
// accept every header and value without storing anything.
#pragma once

#include <krCoreLib/objectmodel/CKRObjectImpl.h>
#include <krCoreLib/serialization/IKRFieldStream.h>
#include <krCoreLib/serialization/KRFieldTypes.h>

class KRCORELIB_API CKRFieldStream : public CKRObjectImpl, public IKRFieldStream {
  KR_DECLARE_OBJECT_TYPE(CKRFieldStream, CKRObjectTypeImpl, "{3F68C1C9-F7A2-4E46-BEA7-64ED4D22827D}")

public:
  // The object, then its IKRFieldStream view for IID_IKRFieldStream.
  void* GetInterface(CKRGuid iid) override;
  // Clears the result.
  int OnInitialize() override;

  virtual CKRGuid GetStoredInstanceID();
  virtual void SetStoredInstanceID(CKRGuid instanceID);
  virtual int Open();
  virtual int Close();

  CKRDocument* GetDocument() override;
  void SetDocument(CKRDocument* document) override;
  int WriteObjectHeader(IKRObject* object) override;
  int Write(IKRFieldData* fieldData) override;
  int ReadObjectHeader(IKRObject* object) override;
  int Read(IKRFieldData* fieldData) override;
  int ObjectHasBeenSerialized(CKRGuid session) override;
  void SetObjectSerialized(CKRGuid session) override;
  IKRObject* GetResult() override;
  void SetResult(IKRObject* object) override;

protected:
  CKRFieldStream() = default;
  ~CKRFieldStream() override = default;

private:
  CKRGuid m_SessionID;
  CKRDocument* m_pDocument = nullptr;
  IKRObject* m_pResult = nullptr;
};
