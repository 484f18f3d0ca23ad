#include <krCoreLib/serialization/CKRSerialObject.h>

#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/IKRFieldData.h>

KR_IMPLEMENT_SERIAL_TYPE(CKRSerialObject, CKRObjectImpl)

// The root of the storable classes: Initialize registers it again whenever
// it is missing, as it does for CKRObjectImpl's type.
[[maybe_unused]] static const bool kr_SerialObjectIsBaseType =
    (CKRTypeSystem::AddBaseType(CKRSerialObject::GetCKRSerialObjectType()), true);

void CKRSerialObject::CKRSerialObjectType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  // No fields of its own; the parent is not storable.
  AppendParentFields(target, object);
}

void* CKRSerialObject::GetInterface(CKRGuid iid) {
  if (void* view = CKRObjectImpl::GetInterface(iid))
    return view;
  if (iid.IsValid() && iid == IID_IKRSerializable)
    return static_cast<IKRSerializable*>(this);
  return nullptr;
}

IKRObject* CKRSerialObject::GetThisObject() {
  return this;
}

void CKRSerialObject::AddFieldData(IKRFieldData* fieldData) {
  IKRSerializableAdaptor::AddFieldData(fieldData);
  if (fieldData != nullptr)
    fieldData->SetOriginObject(this);
}

void CKRSerialObject::InitFieldData() {
  // The object's own type (GetType is the concrete class's), so that a
  // storable class need not override this to bind its fields.
  if (auto* type = dynamic_cast<CKRSerialObjectTypeImpl*>(GetType())) {
    ReserveFieldData(type->GetFieldMap().size());
    type->CreateFields(type, this);
  }
}
