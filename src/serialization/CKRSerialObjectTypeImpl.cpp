#include <krCoreLib/serialization/CKRSerialObjectTypeImpl.h>

#include <krCoreLib/objectmodel/IKRObject.h>

#include <vector>

CKRSerialObjectTypeImpl::CKRSerialObjectTypeImpl() {
  SetName(L"CKRSerialObject");
  SetClassName(L"CKRSerialObject");
}

CKRSerialObjectTypeImpl::~CKRSerialObjectTypeImpl() {
  DestroyOwnFields();
}

void CKRSerialObjectTypeImpl::DestroyOwnFields() {
  // Shared base fields belong to their origin types.
  for (const auto& [id, field] : m_FieldMap)
    if (field->GetOriginType() == this)
      field->Release();
  m_FieldMap.clear();
  m_FieldsCreated = false;
}

void CKRSerialObjectTypeImpl::InitializeType() {
  CreateFields(this, nullptr);
}

void CKRSerialObjectTypeImpl::Release() {
  // The derived types go first (each removes itself from the child map).
  std::vector<IKRObjectType*> children;
  GetDerivedTypes(children);
  for (IKRObjectType* child : children)
    if (child->GetParentType() == this)
      child->Release();
  // The field descriptors stay until the type object ends: storable
  // instances are not tracked, so some may outlive the release, and their
  // field data refer to the descriptors. Claimed again, the type keeps them
  // (AddField refuses the new copies).
  CKRObjectTypeImpl::Release();
}

IKRObject* CKRSerialObjectTypeImpl::CreateInstance(CKRGuid instanceID) {
  IKRObject* object = CTOR();
  if (object == nullptr)
    return nullptr;
  auto* serializable = static_cast<IKRSerializable*>(object->GetInterface(IID_IKRSerializable));
  if (serializable == nullptr) {
    // Not storable: nothing was bound, so nothing but the object to undo.
    DTOR(object);
    return nullptr;
  }
  SKRObjectIdentity::SetInstanceID(object, instanceID.IsValid() ? instanceID : CKRGuid::CreateNewGUID());
  serializable->InitFieldData();
  if (object->OnInitialize() != 0) {
    ++m_InstanceCounter;
    return object;
  }
  // Never handed out, so nobody could release it later: destroyed even if
  // its OnBeforeRelease refuses.
  if (ReleaseInstance(object) == 0) {
    serializable->ReleaseFieldData();
    DTOR(object);
  }
  return nullptr;
}

int CKRSerialObjectTypeImpl::ReleaseInstance(IKRObject* object) {
  if (object == nullptr || object->GetType() != this)
    return 0;
  if (object->OnBeforeRelease() == 0)
    return 0;
  if (auto* serializable = static_cast<IKRSerializable*>(object->GetInterface(IID_IKRSerializable)))
    serializable->ReleaseFieldData();
  DTOR(object);
  return 1;
}

void CKRSerialObjectTypeImpl::AddField(IKRField* field) {
  if (field == nullptr)
    return;
  if (!m_FieldMap.try_emplace(field->GetFieldID(), field).second) {
    field->Release();
    return;
  }
  m_FieldsCreated = true;
}

void CKRSerialObjectTypeImpl::AppendBaseFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  if (!m_FieldsCreated)
    CreateFields(this, nullptr);
  if (target == nullptr)
    return;
  if (object == nullptr) {
    for (const auto& [id, field] : m_FieldMap)
      target->m_FieldMap.try_emplace(id, field);
    return;
  }
  CreateFields(target, object);
}

void CKRSerialObjectTypeImpl::AppendParentFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  if (auto* parent = dynamic_cast<CKRSerialObjectTypeImpl*>(GetParentType()))
    parent->AppendBaseFields(target, object);
}

IKRField* CKRSerialObjectTypeImpl::GetField(CKRGuid fieldID) {
  const auto at = m_FieldMap.find(fieldID);
  return at == m_FieldMap.end() ? nullptr : at->second;
}

CKRString CKRSerialObjectTypeImpl::GetNextInstanceName() {
  return CKRString::Formatted(L"%s %d", GetName().GetString(), m_InstanceCounter);
}

void CKRSerialObjectTypeImpl::SetDescription(CKRString description) {
  m_Description = std::move(description);
}

CKRString CKRSerialObjectTypeImpl::GetDescription() {
  return m_Description;
}

void CKRSerialObjectTypeImpl::SetHelp(bool help) {
  m_Help = help;
}

bool CKRSerialObjectTypeImpl::HasHelp() {
  return m_Help;
}

CKRString CKRSerialObjectTypeImpl::GetHelp() {
  return GetClassName();
}

int CKRSerialObjectTypeImpl::GetIconIndex(int a, int b) const {
  const int first = a != 0 ? m_IconIndices[0] : m_IconIndices[2];
  const int second = a != 0 ? m_IconIndices[1] : m_IconIndices[3];
  return b == 0 || second == -1 ? first : second;
}

void CKRSerialObjectTypeImpl::SetIconIndices(int first, int second, int third, int fourth) {
  m_IconIndices[0] = first;
  m_IconIndices[1] = second;
  m_IconIndices[2] = third;
  m_IconIndices[3] = fourth;
}
