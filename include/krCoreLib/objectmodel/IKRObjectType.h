// IKRObjectType: the type object of a class of framework objects.
//
// A type object is class object, factory and instance registry at once: it
// carries the type ID, names and the links to its parent and child types,
// creates instances, keeps the live ones by instance ID, finds them again and
// destroys them. Each class has exactly one type object, a static object
// that registers itself in the type system (CKRTypeSystem) when its ID is
// set. Not synchronised: types are used from one thread at a time.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/objectmodel/CKRGuid.h>

#include <vector>

class IKRObject;

class KRCORELIB_API IKRObjectType {
public:
  virtual CKRGuid GetID() = 0;

protected:
  virtual void SetID(CKRGuid id) = 0;

public:
  virtual CKRGuid GetParentTypeID() = 0;

protected:
  virtual void SetParentTypeID(CKRGuid id) = 0;

public:
  // Releases the instances still alive, unlinks the type from its parent
  // and children; called when the type's repository is released.
  virtual void Release() = 0;
  virtual void SetName(CKRString name) = 0;
  virtual CKRString GetName() = 0;
  virtual CKRString GetClassName() = 0;
  virtual int IsAbstract() = 0;
  virtual int HasDerivedTypes() = 0;
  // Called once when the type system claims the type.
  virtual void InitializeType() = 0;
  // Links the type below `parent`: 1 on success, 0 for null, for a parent
  // that refuses the child, and for a link that would make a cycle.
  virtual int RegisterWithParentType(IKRObjectType* parent) = 0;
  virtual IKRObjectType* GetParentType() = 0;
  virtual CKRGuid GetRepositoryID() = 0;

protected:
  virtual void SetRepositoryID(CKRGuid id) = 0;

public:
  // A new tracked instance with `instanceID` (a fresh ID when it is null),
  // or null for an abstract type or a refused OnInitialize. An ID that is
  // already tracked gives an untracked twin.
  virtual IKRObject* CreateInstance(CKRGuid instanceID) = 0;
  // Destroys an instance of this type: 1, or 0 for null, for an object of
  // another type and for a refusal by its OnBeforeRelease.
  virtual int ReleaseInstance(IKRObject* object) = 0;
  // The tracked instance with that ID, or null.
  virtual IKRObject* GetInstance(CKRGuid instanceID) = 0;
  virtual int AddChildType(IKRObjectType* child) = 0;
  virtual int RemoveChildType(IKRObjectType* child) = 0;
  virtual int IsTypeOf(IKRObjectType* type) = 0;
  virtual int IsTypeOf(CKRGuid typeID) = 0;
  // Appends the IDs of the tracked instances in ascending order.
  virtual void GetInstanceList(std::vector<CKRGuid>& list) = 0;
  // Appends all descendants, each after its own descendants.
  virtual void GetDerivedTypes(std::vector<IKRObjectType*>& list) = 0;
  virtual void RemoveTrackedInstance(IKRObject* object) = 0;
  virtual void AddTrackedInstance(IKRObject* object) = 0;

protected:
  ~IKRObjectType() = default;

  // The type system claims types: it sets their repository.
  friend class CKRTypeSystem;
};
