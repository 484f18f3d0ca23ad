#include "KRTestObjects.h"

KR_IMPLEMENT_OBJECT_TYPE(CKRTestItem, CKRObjectImpl)
KR_IMPLEMENT_OBJECT_TYPE(CKRTestDerivedItem, CKRTestItem)
KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRTestAbstract, CKRObjectImpl)

CKRTestItem* NewTestItem(CKRGuid id) {
  return static_cast<CKRTestItem*>(CKRTestItem::GetCKRTestItemType()->CreateInstance(id));
}
