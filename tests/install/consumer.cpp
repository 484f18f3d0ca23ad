// A program built against the installed library only.
#include <krCoreLib/krCoreLib.h>

#include <cstdio>

class CKRConsumerThing : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRConsumerThing, CKRObjectTypeImpl, "{5E1F0A2B-7C3D-4E8F-9A0B-1C2D3E4F5A6B}")
protected:
  CKRConsumerThing() = default;
};
KR_IMPLEMENT_OBJECT_TYPE(CKRConsumerThing, CKRObjectImpl)

int main() {
  CKRTypeSystem::Initialize(CKRGuid::CreateNewGUID());
  IKRObject* thing = CKRConsumerThing::GetCKRConsumerThingType()->CreateInstance(CKRGuid());
  const bool ok = thing != nullptr && thing->IsTypeOf(CKRObjectImpl::TypeID) == 1 &&
                  CKRConsumerThing::GetCKRConsumerThingType()->GetInstance(thing->GetInstanceID()) == thing;
  std::printf("consumer: %s %s\n", ok ? "ok" : "FAILED", thing->GetInstanceID().GetCString().ToUtf8().c_str());
  thing->Release();
  CKRTypeSystem::Release();
  return ok ? 0 : 1;
}
