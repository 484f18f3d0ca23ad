#include <krCoreLib/objectmodel/CKRObjectImpl.h>

// The root type: no parent, and an empty class name.
CKRObjectImpl::CKRObjectImplType::CKRObjectImplType() {
  SetID(CKRObjectImpl::TypeID);
  SetName(L"CKRObjectImpl");
}

CKRObjectImpl::CKRObjectImplType* CKRObjectImpl::GetCKRObjectImplType() {
  static CKRObjectImplType s_Type;
  return &s_Type;
}

[[maybe_unused]] static const bool kr_TypeRegistered_CKRObjectImpl = (CKRObjectImpl::GetCKRObjectImplType() != nullptr);

IKRObject* CKRObjectImpl::CKRObjectImplType::CTOR() {
  return new CKRObjectImpl();
}

void CKRObjectImpl::CKRObjectImplType::DTOR(IKRObject* object) {
  delete static_cast<CKRObjectImpl*>(object);
}

IKRObjectType* CKRObjectImpl::GetType() {
  return GetCKRObjectImplType();
}

int CKRObjectImpl::Release() {
  return GetCKRObjectImplType()->ReleaseInstance(this);
}

void* CKRObjectImpl::GetInterface(CKRGuid iid) {
  if (iid.IsValid() && iid == IID_IKRObject)
    return static_cast<IKRObject*>(this);
  return nullptr;
}

CKRGuid CKRObjectImpl::GetInstanceID() {
  return m_InstanceID;
}

void CKRObjectImpl::SetInstanceID(CKRGuid id) {
  m_InstanceID = id;
}

int CKRObjectImpl::IsTypeOf(CKRGuid typeID) {
  IKRObjectType* type = GetType();
  return type != nullptr ? type->IsTypeOf(typeID) : 0;
}

bool CKRObjectImpl::operator==(CKRGuid id) {
  return m_InstanceID == id;
}

int CKRObjectImpl::OnBeforeRelease() {
  return 1;
}

int CKRObjectImpl::OnInitialize() {
  return 1;
}
