#include <krCoreLib/objectmodel/CKRObjectTypeImpl.h>

#include <krCoreLib/core/CKRDebugOutput.h>
#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/objectmodel/IKRObject.h>

#include "KRTrackedInstances.h"

#include <algorithm>

namespace {

// Deeper than any real class hierarchy; bounds the walk that keeps parent
// links free of cycles even if another IKRObjectType implementation loops.
constexpr int kMaxHierarchyDepth = 4096;

}  // namespace

CKRObjectTypeImpl::CKRObjectTypeImpl() : m_pInstances(std::make_unique<SKRTrackedInstances>()) {}

int CKRObjectTypeImpl::GetInstanceCount() const {
  return static_cast<int>(m_pInstances->Table().Size());
}

CKRObjectTypeImpl::~CKRObjectTypeImpl() {
  // A type object ends with its module. Leave nothing behind that points at
  // it: the type system's tables and the links of parent and children.
  CKRTypeSystem::RemoveDestroyedType(this);
  if (m_pParentType != nullptr)
    m_pParentType->RemoveChildType(this);
  DetachChildTypes();
}

void CKRObjectTypeImpl::DetachChildTypes() {
  // A child that still names this type as its parent would follow the link
  // (IsTypeOf) after this type is released or destroyed.
  for (const auto& [id, child] : m_ChildTypeMap)
    if (auto* impl = dynamic_cast<CKRObjectTypeImpl*>(child); impl != nullptr && impl->m_pParentType == this)
      impl->m_pParentType = nullptr;
  m_ChildTypeMap.clear();
}

CKRGuid CKRObjectTypeImpl::GetID() {
  return m_TypeID;
}

void CKRObjectTypeImpl::SetID(CKRGuid id) {
  m_TypeID = id;
  // A second type with the same ID is refused by the type system; the
  // refusal is deliberately not reported.
  CKRTypeSystem::AddType(this);
}

CKRGuid CKRObjectTypeImpl::GetParentTypeID() {
  return m_ParentTypeID;
}

void CKRObjectTypeImpl::SetParentTypeID(CKRGuid id) {
  m_ParentTypeID = id;
}

CKRGuid CKRObjectTypeImpl::GetRepositoryID() {
  return m_RepositoryID;
}

void CKRObjectTypeImpl::SetRepositoryID(CKRGuid id) {
  m_RepositoryID = id;
}

void CKRObjectTypeImpl::SetName(CKRString name) {
  m_Name = std::move(name);
}

CKRString CKRObjectTypeImpl::GetName() {
  return m_Name;
}

void CKRObjectTypeImpl::SetClassName(CKRString name) {
  m_ClassName = std::move(name);
}

CKRString CKRObjectTypeImpl::GetClassName() {
  return m_ClassName;
}

int CKRObjectTypeImpl::IsAbstract() {
  return m_IsAbstract;
}

int CKRObjectTypeImpl::HasDerivedTypes() {
  return m_ChildTypeMap.empty() ? 0 : 1;
}

void CKRObjectTypeImpl::InitializeType() {}

void CKRObjectTypeImpl::Release() {
  if (const int count = GetInstanceCount(); count > 0) {
    CKRDebugOutput::Printf(L"Warning! %d instances of class %s were not released\n", count, m_Name.GetString());
    // In ascending ID order, each taken out before it is released (its
    // Release may release others, which then are gone when their turn comes).
    std::vector<CKRGuid> ids;
    GetInstanceList(ids);
    for (const CKRGuid& id : ids)
      if (IKRObject* object = m_pInstances->Table().Find(id)) {
        m_pInstances->Table().Remove(id, object);
        object->Release();
      }
  }
  DetachChildTypes();
  if (m_pParentType != nullptr)
    m_pParentType->RemoveChildType(this);
  // Back to the state of a type that was never claimed, so that the type
  // system can register and claim it again.
  m_pParentType = nullptr;
  m_RepositoryID.SetEmpty();
}

int CKRObjectTypeImpl::RegisterWithParentType(IKRObjectType* parent) {
  if (parent == nullptr)
    return 0;
  // Refuse a parent that is this type or one of its descendants: parent
  // links are followed recursively by IsTypeOf and must not loop.
  int depth = 0;
  for (IKRObjectType* ancestor = parent; ancestor != nullptr; ancestor = ancestor->GetParentType())
    if (ancestor == this || ++depth > kMaxHierarchyDepth)
      return 0;
  if (parent->AddChildType(this) == 0)
    return 0;
  m_pParentType = parent;
  return 1;
}

IKRObjectType* CKRObjectTypeImpl::GetParentType() {
  return m_pParentType;
}

IKRObject* CKRObjectTypeImpl::CreateInstance(CKRGuid instanceID) {
  IKRObject* object = CTOR();
  if (object == nullptr)
    return nullptr;
  object->SetInstanceID(instanceID.IsValid() ? instanceID : CKRGuid::CreateNewGUID());
  if (object->OnInitialize() != 0) {
    AddTrackedInstance(object);
    return object;
  }
  // The object was never handed out, so nobody could release it later:
  // destroy it even if its OnBeforeRelease refuses.
  if (ReleaseInstance(object) == 0)
    DTOR(object);
  return nullptr;
}

int CKRObjectTypeImpl::ReleaseInstance(IKRObject* object) {
  // Only this type's DTOR knows how to destroy an object; an object of
  // another type would be destroyed as the wrong class.
  if (object == nullptr || object->GetType() != this)
    return 0;
  if (object->OnBeforeRelease() == 0)
    return 0;
  RemoveTrackedInstance(object);
  DTOR(object);
  return 1;
}

IKRObject* CKRObjectTypeImpl::GetInstance(CKRGuid instanceID) {
  return m_pInstances->Table().Find(instanceID);
}

int CKRObjectTypeImpl::AddChildType(IKRObjectType* child) {
  if (child == nullptr)
    return 0;
  return m_ChildTypeMap.try_emplace(child->GetID(), child).second ? 1 : 0;
}

int CKRObjectTypeImpl::RemoveChildType(IKRObjectType* child) {
  if (child == nullptr)
    return 0;
  return m_ChildTypeMap.erase(child->GetID()) > 0 ? 1 : 0;
}

int CKRObjectTypeImpl::IsTypeOf(IKRObjectType* type) {
  if (type == nullptr)
    return 0;
  if (type == this)
    return 1;
  return m_pParentType != nullptr ? m_pParentType->IsTypeOf(type) : 0;
}

int CKRObjectTypeImpl::IsTypeOf(CKRGuid typeID) {
  if (typeID.IsNull())
    return 0;
  if (typeID == m_TypeID)
    return 1;
  return m_pParentType != nullptr ? m_pParentType->IsTypeOf(typeID) : 0;
}

void CKRObjectTypeImpl::GetInstanceList(std::vector<CKRGuid>& list) {
  const std::size_t first = list.size();
  m_pInstances->Table().ForEach([&](const CKRGuid& id, IKRObject*) { list.push_back(id); });
  std::sort(list.begin() + std::ptrdiff_t(first), list.end());
}

void CKRObjectTypeImpl::GetDerivedTypes(std::vector<IKRObjectType*>& list) {
  for (const auto& [id, child] : m_ChildTypeMap) {
    if (child->HasDerivedTypes())
      child->GetDerivedTypes(list);
    list.push_back(child);
  }
}

void CKRObjectTypeImpl::RemoveTrackedInstance(IKRObject* object) {
  // Removes the entry only when it holds this very object: an untracked twin
  // with the same instance ID leaves the tracked object in place.
  if (object != nullptr)
    m_pInstances->Remove(object->GetInstanceID(), object);
}

void CKRObjectTypeImpl::AddTrackedInstance(IKRObject* object) {
  if (object != nullptr)
    m_pInstances->Add(object->GetInstanceID(), object);
}

void SKRObjectIdentity::SetInstanceID(IKRObject* object, CKRGuid id) {
  if (object == nullptr || object->GetInstanceID() == id)
    return;
  IKRObjectType* type = object->GetType();
  const bool tracked = type != nullptr && type->GetInstance(object->GetInstanceID()) == object;
  if (tracked)
    type->RemoveTrackedInstance(object);
  object->SetInstanceID(id);
  if (tracked)
    type->AddTrackedInstance(object);
}
