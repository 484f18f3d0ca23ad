// CKRFieldStream: the bookkeeping of a field stream, the base of every
// store's stream (abstract: a store implements the four link operations and
// its representation of headers and values).
//
// A stream's instance ID is the instance ID of the object it stores
// (GetStoredInstanceID); SetStoredInstanceID re-keys it. The defaults
// accept every header and value without storing anything.
#pragma once

#include <cstddef>
#include <new>

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

  // Memory from the framework's pool of small blocks (a document makes and
  // releases one of these per stored object); derived classes inherit it.
  static void* operator new(std::size_t size);
  static void* operator new(std::size_t size, std::align_val_t alignment);
  static void operator delete(void* block, std::size_t size) noexcept;
  static void operator delete(void* block, std::size_t size, std::align_val_t alignment) noexcept;

protected:
  CKRFieldStream() = default;
  ~CKRFieldStream() override = default;

private:
  CKRGuid m_SessionID;
  CKRDocument* m_pDocument = nullptr;
  IKRObject* m_pResult = nullptr;
};
