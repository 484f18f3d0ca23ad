#include "KRSerialTestObjects.h"

#include <krCoreLib/serialization/CKRFieldT.h>
#include <krCoreLib/serialization/CKRObjCollectionFieldT.h>
#include <krCoreLib/serialization/CKRObjFieldT.h>

using namespace KRTestFields;

KR_IMPLEMENT_SERIAL_TYPE(CKRTestRecord, CKRSerialObject)
KR_IMPLEMENT_SERIAL_TYPE(CKRTestIndex, CKRSerialObject)
KR_IMPLEMENT_SERIAL_TYPE(CKRTestBase, CKRSerialObject)
KR_IMPLEMENT_SERIAL_TYPE(CKRTestMiddle, CKRTestBase)
KR_IMPLEMENT_SERIAL_TYPE(CKRTestLeaf, CKRTestMiddle)
KR_IMPLEMENT_OBJECT_TYPE(CKRTestPlain, CKRObjectImpl)

namespace {
constexpr int kStored = KRF_READ | KRF_WRITE | KRF_VISIBLE;
}

void CKRTestRecord::CKRTestRecordType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRTestRecord::m_Name, L"Name", L"The name", kName, KRDT_STRING, kStored);
  BindField<CKRFieldT<int>>(target, object, &CKRTestRecord::m_Count, L"Count", L"A count", kCount, KRDT_INTEGER, kStored);
  BindField<CKRFieldT<CKRGuid>>(target, object, &CKRTestRecord::m_Ref, L"Ref", L"An identifier", kRef, KRDT_GUID, kStored);
  BindField<CKRObjFieldT<CKRTestRecord>>(target, object, &CKRTestRecord::m_pNext, L"Next", L"The next record", kNext,
                                         KRDT_OBJECT_LINK, kStored);
  BindField<CKRObjCollectionFieldT<CKRObjPtrList<CKRTestRecord>>>(target, object, &CKRTestRecord::m_Children, L"Children",
                                                                  L"Child records", kChildren, KRDT_OBJECT_COLLECTION, kStored);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRTestRecord::m_ReadOnly, L"ReadOnly", L"Read, never written",
                                  kReadOnly, KRDT_STRING, KRF_READ);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRTestRecord::m_WriteOnly, L"WriteOnly", L"Written, never read",
                                  kWriteOnly, KRDT_STRING, KRF_WRITE);
}

void CKRTestIndex::CKRTestIndexType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRObjCollectionFieldT<CKRObjGuidPtrMap<CKRTestRecord>>>(target, object, &CKRTestIndex::m_Members, L"Members",
                                                                     L"Records by ID", kMembers,
                                                                     KRDT_OBJECT_COLLECTION, kStored);
}

void CKRTestBase::CKRTestBaseType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRTestBase::m_Base, L"Base", L"", kBase, KRDT_STRING, kStored);
}

void CKRTestMiddle::CKRTestMiddleType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRTestMiddle::m_Middle, L"Middle", L"", kMiddle, KRDT_STRING, kStored);
}

void CKRTestLeaf::CKRTestLeafType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRTestLeaf::m_Leaf, L"Leaf", L"", kLeaf, KRDT_STRING, kStored);
}

CKRTestRecord* NewRecord(const wchar_t* name, CKRGuid id) {
  auto* record = static_cast<CKRTestRecord*>(CKRTestRecord::GetCKRTestRecordType()->CreateInstance(id));
  if (record != nullptr)
    record->m_Name = name;
  return record;
}

void ReleaseChains(CKRTestRecord* first, const std::vector<CKRTestRecord*>& originals) {
  while (first != nullptr) {
    CKRTestRecord* following = first->m_pNext;
    first->Release();
    first = following;
  }
  for (CKRTestRecord* record : originals)
    record->Release();
}
