// A plug-in module for the type-system tests, built with the compiler's
// default options (default visibility, no special flags), as a plug-in author
// would build it. It uses what plug-ins commonly use: a framework class, a
// storable class with a field, interface and data-type IDs, and a singleton
// of its own. None of it may keep the module from being unloaded.
#include "KRTestPlugin.h"

#include <krCoreLib/objectmodel/CKRObjectImpl.h>
#include <krCoreLib/serialization/CKRFieldT.h>
#include <krCoreLib/serialization/CKRSerialObject.h>

using namespace KRTestPlugin;

class CKRTestPluginThing : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRTestPluginThing, CKRObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-0000000000A1}")

protected:
  CKRTestPluginThing() = default;
};

KR_IMPLEMENT_OBJECT_TYPE(CKRTestPluginThing, CKRObjectImpl)

class CKRTestPluginRecord : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRTestPluginRecord, CKRSerialObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-0000000000A2}")

public:
  int m_Count = 0;

protected:
  CKRTestPluginRecord() = default;
};

KR_IMPLEMENT_SERIAL_TYPE(CKRTestPluginRecord, CKRSerialObject)

void CKRTestPluginRecord::CKRTestPluginRecordType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<int>>(target, object, &CKRTestPluginRecord::m_Count, L"Count", L"A count", kCountFieldID,
                            KRDT_INTEGER, KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

class CKRTestPluginCounter : public CKRSingletonT<CKRTestPluginCounter> {
  friend class CKRSingletonT<CKRTestPluginCounter>;
  CKRTestPluginCounter() = default;

public:
  int m_iUses = 0;
};

extern "C" int KRTestPluginUse(IKRObject* object) {
  if (object == nullptr || object->GetInterface(IID_IKRObject) != object)
    return 0;
  auto* record = static_cast<IKRSerializable*>(object->GetInterface(IID_IKRSerializable));
  IKRFieldData* count = record != nullptr ? record->GetFieldData(kCountFieldID) : nullptr;
  if (count == nullptr || count->HasFieldTypeOf(KRDT_INTEGER) == 0 ||
      count->HasFieldDataImplTypeOf(KRIMPL_FIELDDATA_VALUE) == 0 || count->SetValueFromString(L"42") == 0 ||
      count->GetStringValue() != L"42")
    return 0;
  ++CKRTestPluginCounter::GetInstance()->m_iUses;
  const bool once = CKRTestPluginCounter::GetInstance()->m_iUses == 1;
  CKRTestPluginCounter::ReleaseInstance();
  return once && !CKRTestPluginCounter::HasInstance() ? 1 : 0;
}

extern "C" void* KRTestPluginShared() {
  return CKRTestSharedSingleton::GetInstance();
}
