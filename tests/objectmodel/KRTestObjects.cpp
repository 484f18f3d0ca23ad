#include "KRTestObjects.h"

KR_IMPLEMENT_OBJECT_TYPE(CKRTestItem, CKRObjectImpl)
KR_IMPLEMENT_OBJECT_TYPE(CKRTestDerivedItem, CKRTestItem)
KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRTestAbstract, CKRObjectImpl)

CKRTestItem* NewTestItem(CKRGuid id) {
  return static_cast<CKRTestItem*>(CKRTestItem::GetCKRTestItemType()->CreateInstance(id));
}

void ClaimTestTypes() {
  CKRTypeSystem::Release();
  CKRTypeSystem::AddType(CKRTestItem::GetCKRTestItemType());
  CKRTypeSystem::AddType(CKRTestDerivedItem::GetCKRTestDerivedItemType());
  CKRTypeSystem::AddType(CKRTestAbstract::GetCKRTestAbstractType());
  CKRTypeSystem::Initialize(CKRGuid::Literal("{7C0D2E1F-0000-4000-8000-0000000000FF}"));
}

CKRLocalType::CKRLocalType(const wchar_t* name, CKRGuid id, CKRGuid parentID, bool abstract,
                           std::vector<std::wstring>* log)
    : m_pLog(log) {
  SetID(id);
  SetParentTypeID(parentID);
  SetName(name);
  SetClassName(name);
  m_IsAbstract = abstract ? 1 : 0;
}

void CKRLocalType::InitializeType() {
  m_ParentLinkedAtInitialize = GetParentType() != nullptr;
  if (m_pLog != nullptr)
    m_pLog->push_back(L"init " + GetName().str());
}

void CKRLocalType::Release() {
  if (m_pLog != nullptr)
    m_pLog->push_back(L"release " + GetName().str());
  CKRObjectTypeImpl::Release();
}

IKRObject* CKRLocalType::CTOR() {
  return m_IsAbstract ? nullptr : new CKRLocalObject(this);
}

void CKRLocalType::DTOR(IKRObject* object) {
  delete static_cast<CKRLocalObject*>(object);
}
