// CKRObjectTypeImpl: the default implementation of IKRObjectType, from which
// every type class derives (directly or through the nested-type pattern of
// KRObjectTypeMacros.h). Finding, adding and removing a tracked instance
// take constant time on average.
//
// A derived type supplies CTOR (allocate one instance, or null for an
// abstract class) and DTOR (destroy an instance made by CTOR). The type
// tracks the instances made by CreateInstance without owning their memory
// beyond that: ReleaseInstance and Release destroy them through DTOR.
//
// A type object registers itself with the type system when its ID is set and
// unregisters when it is destroyed (at module unload), so that the type
// system never holds a dangling type. Not synchronised.
#pragma once

#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>
#include <krCoreLib/objectmodel/IKRObjectType.h>

#include <map>
#include <memory>

struct SKRTrackedInstances;

class KRCORELIB_API CKRObjectTypeImpl : public IKRObjectType {
public:
  CKRGuid GetID() override;
  CKRGuid GetParentTypeID() override;
  void Release() override;
  void SetName(CKRString name) override;
  CKRString GetName() override;
  CKRString GetClassName() override;
  int IsAbstract() override;
  int HasDerivedTypes() override;
  void InitializeType() override;
  int RegisterWithParentType(IKRObjectType* parent) override;
  IKRObjectType* GetParentType() override;
  CKRGuid GetRepositoryID() override;
  IKRObject* CreateInstance(CKRGuid instanceID) override;
  int ReleaseInstance(IKRObject* object) override;
  IKRObject* GetInstance(CKRGuid instanceID) override;
  int AddChildType(IKRObjectType* child) override;
  int RemoveChildType(IKRObjectType* child) override;
  int IsTypeOf(IKRObjectType* type) override;
  int IsTypeOf(CKRGuid typeID) override;
  void GetInstanceList(std::vector<CKRGuid>& list) override;
  void GetDerivedTypes(std::vector<IKRObjectType*>& list) override;
  void RemoveTrackedInstance(IKRObject* object) override;
  void AddTrackedInstance(IKRObject* object) override;

  virtual ~CKRObjectTypeImpl();
  virtual void SetClassName(CKRString name);

  // Number of tracked instances.
  int GetInstanceCount() const;

protected:
  CKRObjectTypeImpl();
  CKRObjectTypeImpl(const CKRObjectTypeImpl&) = delete;
  CKRObjectTypeImpl& operator=(const CKRObjectTypeImpl&) = delete;

  void SetID(CKRGuid id) override;
  void SetParentTypeID(CKRGuid id) override;
  void SetRepositoryID(CKRGuid id) override;

  // Allocates and constructs one instance; null for an abstract class.
  virtual IKRObject* CTOR() = 0;
  // Destroys an instance made by CTOR; null is ignored.
  virtual void DTOR(IKRObject* object) = 0;

  int m_IsAbstract = 0;

private:
  // Clears the parent link of every child that still points here, then the
  // child map.
  void DetachChildTypes();

  CKRGuid m_TypeID;
  CKRGuid m_RepositoryID;
  CKRGuid m_ParentTypeID;
  CKRString m_Name;
  CKRString m_ClassName;
  // Tracked instances by instance ID (hashed: a type may track a great many,
  // a document's field streams; the operations that list or release them go
  // in ascending ID order all the same; changes are applied in batches).
  // Owned; a private table.
  std::unique_ptr<SKRTrackedInstances> m_pInstances;
  IKRObjectType* m_pParentType = nullptr;
  std::map<CKRGuid, IKRObjectType*> m_ChildTypeMap;
};

// The sanctioned way to give an existing object another instance ID: a
// storable type naming a new instance, a store applying the stored ID to an
// object, a manifest or stream re-keyed to what it stores. An object its
// type tracks is removed under its old ID and added again under the new
// one, so that GetInstance finds it by the new ID (if another tracked object
// holds that ID already, this one stays untracked, as an untracked twin of
// CreateInstance). Null objects are ignored. Not synchronised.
struct KRCORELIB_API SKRObjectIdentity {
  static void SetInstanceID(IKRObject* object, CKRGuid id);
};
