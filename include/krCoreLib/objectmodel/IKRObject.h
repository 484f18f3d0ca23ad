// IKRUnknown and IKRObject: the interfaces of every framework object.
//
// An object has a 128-bit instance ID, knows its type object, answers
// requests for further interfaces by interface ID, and is created and
// destroyed only through its type: users call Release(), never delete.
// IKRObject therefore has no public virtual destructor.
#pragma once

#include <krCoreLib/objectmodel/CKRGuid.h>

class IKRObjectType;

// Interface ID of IKRObject. The ID constants of the public headers are
// hidden: every module has its own copy (equal values, different addresses).
// Shared between modules they would be process-wide unique symbols, and a
// plug-in that uses one could then never be unmapped.
KRCORELIB_LOCAL inline constexpr CKRGuid IID_IKRObject = CKRGuid::Literal("{95E11590-E209-41B1-811A-263330087175}");

class KRCORELIB_API IKRUnknown {
public:
  // The view of this object as the interface `iid`, or null when the object
  // does not implement it. The caller casts the result to that interface.
  virtual void* GetInterface(CKRGuid iid) = 0;

protected:
  ~IKRUnknown() = default;
};

class KRCORELIB_API IKRObject : public IKRUnknown {
public:
  virtual CKRGuid GetInstanceID() = 0;

protected:
  virtual void SetInstanceID(CKRGuid id) = 0;

public:
  // The object's type (never null for objects made by a type).
  virtual IKRObjectType* GetType() = 0;
  // 1 when the object's type is `typeID` or derives from it, otherwise 0.
  virtual int IsTypeOf(CKRGuid typeID) = 0;
  // True when the instance ID equals `id`.
  virtual bool operator==(CKRGuid id) = 0;
  // Ends the object's life through its type. Returns 1 when the object was
  // destroyed, 0 when it refused (OnBeforeRelease) or is not its type's.
  virtual int Release() = 0;
  // Hook before destruction: return 0 to keep the object alive.
  virtual int OnBeforeRelease() = 0;
  // Hook after creation: return 0 to have the new object destroyed at once.
  virtual int OnInitialize() = 0;

protected:
  ~IKRObject() = default;

  // The type sets the instance ID of the objects it creates; stores and
  // storable types give objects their stored IDs through SKRObjectIdentity.
  friend class CKRObjectTypeImpl;
  friend struct SKRObjectIdentity;
};
