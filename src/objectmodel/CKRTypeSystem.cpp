#include <krCoreLib/objectmodel/CKRTypeSystem.h>

#include <krCoreLib/objectmodel/CKRObjectImpl.h>

#include <algorithm>
#include <vector>

// Constant-initialised, so registrations made while any module's static
// objects are constructed find it, whatever the order of initialisation.
CKRTypeSystem* CKRTypeSystem::m_pInstance = nullptr;

namespace {

// The process-wide lists of living type objects, created on first use and
// never destroyed: type objects of modules unloaded at exit still remove
// themselves from them after other function-local statics are gone.
struct SKRLivingTypes {
  // The roots that every other type derives from (CKRObjectImpl's type and
  // those a subsystem adds with AddBaseType): Initialize registers them
  // when they are missing.
  std::vector<IKRObjectType*> m_BaseTypes;
  // Type objects that live on after the type system let go of them:
  // released with their repository or dropped by Release while their module
  // stays loaded (the library's own types, or a plug-in the loader keeps
  // mapped). The next Initialize registers them again, so that a module
  // claimed again finds its types.
  std::vector<IKRObjectType*> m_Dormant;
};

SKRLivingTypes& LivingTypes() {
  static auto* s_pTypes = new SKRLivingTypes{{CKRObjectImpl::GetCKRObjectImplType()}, {}};
  return *s_pTypes;
}

std::vector<IKRObjectType*>& DormantTypes() {
  return LivingTypes().m_Dormant;
}

void EraseType(std::vector<IKRObjectType*>& types, IKRObjectType* type) {
  types.erase(std::remove(types.begin(), types.end(), type), types.end());
}

// Removes the entry under `id` when it holds `type`.
void EraseIfHolds(CKRTypeIterator::TypeMap& map, CKRGuid id, IKRObjectType* type) {
  const auto at = map.find(id);
  if (at != map.end() && at->second == type)
    map.erase(at);
}

}  // namespace

CKRTypeSystem::~CKRTypeSystem() {
  for (auto& [id, repository] : m_RepositoryMap)
    delete repository;
}

CKRTypeSystem* CKRTypeSystem::GetInstance() {
  if (m_pInstance == nullptr)
    m_pInstance = new CKRTypeSystem();
  return m_pInstance;
}

int CKRTypeSystem::AddType(IKRObjectType* type) {
  return GetInstance()->_AddType(type);
}

IKRObjectType* CKRTypeSystem::FindType(CKRGuid typeID) {
  return GetInstance()->_FindType(typeID);
}

void CKRTypeSystem::Initialize(CKRGuid repositoryID) {
  GetInstance()->_Initialize(repositoryID);
}

void CKRTypeSystem::ReleaseRepository(CKRGuid repositoryID) {
  GetInstance()->_ReleaseRepository(repositoryID);
}

void CKRTypeSystem::Release() {
  GetInstance()->_Release();
}

void CKRTypeSystem::AddBaseType(IKRObjectType* type) {
  std::vector<IKRObjectType*>& bases = LivingTypes().m_BaseTypes;
  if (type != nullptr && std::find(bases.begin(), bases.end(), type) == bases.end())
    bases.push_back(type);
}

CKRTypeIterator CKRTypeSystem::GetGlobalIterator() {
  return GetInstance()->_GetGlobalIterator();
}

CKRTypeIterator CKRTypeSystem::GetRepositoryIterator(CKRGuid repositoryID) {
  return GetInstance()->_GetRepositoryIterator(repositoryID);
}

int CKRTypeSystem::_AddType(IKRObjectType* type) {
  if (type == nullptr)
    return 0;
  return m_GlobalTypeMap.try_emplace(type->GetID(), type).second ? 1 : 0;
}

IKRObjectType* CKRTypeSystem::_FindType(CKRGuid typeID) {
  const auto at = m_GlobalTypeMap.find(typeID);
  return at == m_GlobalTypeMap.end() ? nullptr : at->second;
}

CKRTypeRepository* CKRTypeSystem::_GetRepository(CKRGuid repositoryID) {
  const auto at = m_RepositoryMap.find(repositoryID);
  return at == m_RepositoryMap.end() ? nullptr : at->second;
}

CKRTypeIterator CKRTypeSystem::_GetGlobalIterator() {
  return CKRTypeIterator(&m_GlobalTypeMap);
}

CKRTypeIterator CKRTypeSystem::_GetRepositoryIterator(CKRGuid repositoryID) {
  CKRTypeRepository* repository = _GetRepository(repositoryID);
  return repository != nullptr ? repository->GetIterator() : CKRTypeIterator();
}

void CKRTypeSystem::_Initialize(CKRGuid repositoryID) {
  for (IKRObjectType* base : LivingTypes().m_BaseTypes)
    if (_FindType(base->GetID()) == nullptr)
      _AddType(base);
  // In the order they were let go; a type whose ID has been taken since by
  // another type object stays out, as any second type with that ID.
  std::vector<IKRObjectType*>& dormant = DormantTypes();
  for (IKRObjectType* type : dormant)
    _AddType(type);
  dormant.clear();

  CKRTypeRepository*& repository = m_RepositoryMap[repositoryID];
  if (repository == nullptr)
    repository = new CKRTypeRepository();

  // All parents are linked before any type is initialised, so that a type's
  // initialisation can rely on its whole ancestry.
  for (const auto& [id, type] : m_GlobalTypeMap)
    if (type->GetRepositoryID().IsNull())
      type->RegisterWithParentType(_FindType(type->GetParentTypeID()));

  for (const auto& [id, type] : m_GlobalTypeMap) {
    if (!type->GetRepositoryID().IsNull())
      continue;
    type->InitializeType();
    type->SetRepositoryID(repositoryID);
    repository->Add(type);
  }
}

void CKRTypeSystem::_ReleaseRepository(CKRGuid repositoryID) {
  const auto at = m_RepositoryMap.find(repositoryID);
  if (at == m_RepositoryMap.end())
    return;
  CKRTypeRepository* repository = at->second;
  // Taken out first: a type released below may call back into the system.
  m_RepositoryMap.erase(at);
  ReleaseInOrder(repository->GetTypeMap());
  delete repository;
}

CKRTypeIterator::TypeMap::iterator CKRTypeSystem::ReleaseEntry(CKRTypeIterator::TypeMap& types,
                                                                CKRTypeIterator::TypeMap::iterator at) {
  const CKRGuid id = at->first;
  IKRObjectType* type = at->second;
  const auto next = types.erase(at);
  EraseIfHolds(m_GlobalTypeMap, id, type);
  type->Release();
  DormantTypes().push_back(type);
  return next;
}

void CKRTypeSystem::ReleaseInOrder(CKRTypeIterator::TypeMap& types) {
  while (!types.empty())
    ReleaseEntry(types, types.begin());
}

void CKRTypeSystem::ReleaseLeavesFirst(CKRTypeRepository& repository) {
  CKRTypeIterator::TypeMap& types = repository.GetTypeMap();
  while (!types.empty()) {
    // One sweep releases every type that no longer has derived types;
    // releasing a type unlinks it from its parent, so the next sweep finds
    // the parents releasable.
    bool releasedAny = false;
    for (auto at = types.begin(); at != types.end();) {
      IKRObjectType* type = at->second;
      if (type->HasDerivedTypes()) {
        ++at;
        continue;
      }
      at = ReleaseEntry(types, at);
      releasedAny = true;
    }
    // A type whose derived types live in another repository that is still
    // registered never becomes a leaf: release what remains in ID order
    // rather than sweep forever.
    if (!releasedAny)
      ReleaseInOrder(types);
  }
}

void CKRTypeSystem::_Release() {
  // Repositories are taken out one at a time, so that a type's Release that
  // calls back into the type system finds consistent tables.
  while (!m_RepositoryMap.empty()) {
    const auto first = m_RepositoryMap.begin();
    CKRTypeRepository* repository = first->second;
    m_RepositoryMap.erase(first);
    ReleaseLeavesFirst(*repository);
    delete repository;
  }
  // Registered but never claimed: not released, but registered again by the
  // next Initialize like the released ones.
  for (const auto& [id, type] : m_GlobalTypeMap)
    DormantTypes().push_back(type);
  m_GlobalTypeMap.clear();
  if (m_pInstance == this)
    m_pInstance = nullptr;
  delete this;
}

void CKRTypeSystem::RemoveDestroyedType(IKRObjectType* type) {
  if (type == nullptr)
    return;
  EraseType(LivingTypes().m_BaseTypes, type);
  EraseType(DormantTypes(), type);
  CKRTypeSystem* system = m_pInstance;
  if (system == nullptr)
    return;
  const CKRGuid id = type->GetID();
  EraseIfHolds(system->m_GlobalTypeMap, id, type);
  for (auto& [repositoryID, repository] : system->m_RepositoryMap)
    repository->Remove(id, type);
}
