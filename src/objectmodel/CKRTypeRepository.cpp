#include <krCoreLib/objectmodel/CKRTypeRepository.h>

CKRTypeIterator::CKRTypeIterator(TypeMap* map) : m_pMap(map) {
  Reset(1);
}

IKRObjectType* CKRTypeIterator::Next(int restart, CKRGuid* typeID) {
  if (restart)
    Reset(1);
  if (m_pMap == nullptr || m_Position == m_pMap->end())
    return nullptr;
  if (typeID != nullptr)
    *typeID = m_Position->first;
  return (m_Position++)->second;
}

void CKRTypeIterator::Reset(int reset) {
  if (reset && m_pMap != nullptr)
    m_Position = m_pMap->begin();
}

int CKRTypeRepository::Add(IKRObjectType* type) {
  if (type == nullptr)
    return 0;
  return m_TypeMap.try_emplace(type->GetID(), type).second ? 1 : 0;
}

IKRObjectType* CKRTypeRepository::Find(CKRGuid typeID) const {
  const auto at = m_TypeMap.find(typeID);
  return at == m_TypeMap.end() ? nullptr : at->second;
}

int CKRTypeRepository::Remove(CKRGuid typeID, IKRObjectType* type) {
  const auto at = m_TypeMap.find(typeID);
  if (at == m_TypeMap.end() || at->second != type)
    return 0;
  m_TypeMap.erase(at);
  return 1;
}
