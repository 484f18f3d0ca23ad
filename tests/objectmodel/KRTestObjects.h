// Framework classes and type objects used by the object-model tests.
#pragma once

#include <krCoreLib/objectmodel/CKRObjectImpl.h>
#include <krCoreLib/objectmodel/CKRTypeSystem.h>

#include <functional>
#include <string>
#include <vector>

// A class made through its static type (the nested-type pattern), with vetoes
// of creation and destruction, a hook for elements that act on their
// containers, and a count of destructions.
class CKRTestItem : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRTestItem, CKRObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-000000000001}")

public:
  static inline int s_Destroyed = 0;
  static inline bool s_RefuseInitialize = false;
  static inline int s_AllowReleaseOfNew = 1;
  int m_AllowRelease = s_AllowReleaseOfNew;
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

class CKRTestDerivedItem : public CKRTestItem {
  KR_DECLARE_OBJECT_TYPE(CKRTestDerivedItem, CKRObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-000000000002}")
};

class CKRTestAbstract : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRTestAbstract, CKRObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-000000000003}")
public:
  virtual void Draw() = 0;
};

// IDs of the local type hierarchies, ascending from root to leaf, so that
// plain ID order would release a root first.
constexpr CKRGuid kRootID = CKRGuid::Literal("{10000000-0000-4000-8000-000000000000}");
constexpr CKRGuid kChildID = CKRGuid::Literal("{20000000-0000-4000-8000-000000000000}");
constexpr CKRGuid kOtherChildID = CKRGuid::Literal("{25000000-0000-4000-8000-000000000000}");
constexpr CKRGuid kLeafID = CKRGuid::Literal("{30000000-0000-4000-8000-000000000000}");

// A tracked CKRTestItem made by its type.
CKRTestItem* NewTestItem(CKRGuid id = CKRGuid());

class CKRLocalObject : public CKRObjectImpl {
public:
  explicit CKRLocalObject(IKRObjectType* type) : m_pType(type) {}
  IKRObjectType* GetType() override { return m_pType; }
  int Release() override { return m_pType->ReleaseInstance(this); }

private:
  IKRObjectType* m_pType;
};

// A type object that is not static: each test makes the hierarchy it needs.
// It logs its InitializeType and Release.
class CKRLocalType : public CKRObjectTypeImpl {
public:
  CKRLocalType(const wchar_t* name, CKRGuid id, CKRGuid parentID = CKRGuid(), std::vector<std::wstring>* log = nullptr)
      : m_pLog(log) {
    SetID(id);
    SetParentTypeID(parentID);
    SetName(name);
    SetClassName(name);
  }
  void InitializeType() override {
    m_ParentLinkedAtInitialize = GetParentType() != nullptr;
    if (m_pLog != nullptr)
      m_pLog->push_back(L"init " + GetName().str());
  }
  void Release() override {
    if (m_pLog != nullptr)
      m_pLog->push_back(L"release " + GetName().str());
    CKRObjectTypeImpl::Release();
  }
  bool m_ParentLinkedAtInitialize = false;

protected:
  IKRObject* CTOR() override { return new CKRLocalObject(this); }
  void DTOR(IKRObject* object) override { delete static_cast<CKRLocalObject*>(object); }

private:
  std::vector<std::wstring>* m_pLog;
};
