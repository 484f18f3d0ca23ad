// CKRObjectImpl: the default implementation of IKRObject and the root of
// every framework class.
//
// Objects are made by their type (CreateInstance) and end through it
// (Release); construction and destruction are protected. The type of
// CKRObjectImpl itself (GetCKRObjectImplType) is the root of the type
// hierarchy: it has no parent.
#pragma once

#include <krCoreLib/objectmodel/IKRObject.h>
#include <krCoreLib/objectmodel/KRObjectTypeMacros.h>

class KRCORELIB_API CKRObjectImpl : public IKRObject {
  KR_DECLARE_OBJECT_TYPE(CKRObjectImpl, CKRObjectTypeImpl, "{3719246B-C3B0-4AE9-9723-6E998C42484A}")

public:
  // The object itself for IID_IKRObject, otherwise null. A derived class that
  // adds an interface answers the base class first, then its own ID.
  void* GetInterface(CKRGuid iid) override;
  CKRGuid GetInstanceID() override;
  int IsTypeOf(CKRGuid typeID) override;
  bool operator==(CKRGuid id) override;
  int OnBeforeRelease() override;
  int OnInitialize() override;

protected:
  CKRObjectImpl() = default;
  CKRObjectImpl(const CKRObjectImpl&) = delete;
  CKRObjectImpl& operator=(const CKRObjectImpl&) = delete;
  virtual ~CKRObjectImpl() = default;

  void SetInstanceID(CKRGuid id) override;

private:
  CKRGuid m_InstanceID;
};
