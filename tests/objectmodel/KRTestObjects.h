// Framework classes and type objects used by the object-model tests.
#pragma once

#include <krCoreLib/objectmodel/CKRObjectImpl.h>
#include <krCoreLib/objectmodel/CKRTypeSystem.h>

#include <functional>
#include <string>
#include <vector>

// A concrete class made through its static type (the nested-type pattern),
// with hooks to veto creation and destruction and a count of destructions.
class CKRTestItem : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRTestItem, CKRObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-000000000001}")

public:
  static inline int s_Destroyed = 0;
  static inline bool s_RefuseInitialize = false;
  int m_AllowRelease = 1;
  int m_Tag = 0;
  // Called by OnBeforeRelease, for elements that act on their containers.
  std::function<void(CKRTestItem*)> m_OnBeforeRelease;

  int OnBeforeRelease() override {
    if (m_OnBeforeRelease)
      m_OnBeforeRelease(this);
    return m_AllowRelease;
  }
  int OnInitialize() override { return s_RefuseInitialize ? 0 : 1; }

protected:
  CKRTestItem() = default;
  ~CKRTestItem() override { ++s_Destroyed; }
};

// A class derived from CKRTestItem, and an abstract class.
class CKRTestDerivedItem : public CKRTestItem {
  KR_DECLARE_OBJECT_TYPE(CKRTestDerivedItem, CKRObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-000000000002}")
protected:
  CKRTestDerivedItem() = default;
};

class CKRTestAbstract : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRTestAbstract, CKRObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-000000000003}")
public:
  virtual void Draw() = 0;
};

// A tracked CKRTestItem made by its type.
CKRTestItem* NewTestItem(CKRGuid id = CKRGuid());

// Claims the test program's static types into a fresh type system.
void ClaimTestTypes();

// A type object that is not static: each test makes the hierarchy it needs.
// Its instances are CKRLocalObject; it logs its InitializeType and Release.
class CKRLocalType : public CKRObjectTypeImpl {
public:
  CKRLocalType(const wchar_t* name, CKRGuid id, CKRGuid parentID = CKRGuid(), bool abstract = false,
               std::vector<std::wstring>* log = nullptr);
  void InitializeType() override;
  void Release() override;

  // Whether the parent was linked when InitializeType ran.
  bool m_ParentLinkedAtInitialize = false;

protected:
  IKRObject* CTOR() override;
  void DTOR(IKRObject* object) override;

private:
  std::vector<std::wstring>* m_pLog;
};

class CKRLocalObject : public CKRObjectImpl {
public:
  explicit CKRLocalObject(IKRObjectType* type) : m_pType(type) {}
  ~CKRLocalObject() override = default;
  IKRObjectType* GetType() override { return m_pType; }
  int Release() override { return m_pType->ReleaseInstance(this); }

private:
  IKRObjectType* m_pType;
};
