// CKRTypeRepository and CKRTypeIterator: the types one module contributed,
// and a walk over a GUID-ordered table of types.
#pragma once

#include <krCoreLib/objectmodel/IKRObjectType.h>

#include <map>

// Walks (type ID, type) pairs in ascending type-ID order, in the protocol of
// IKRIterator: Next(1) once, then Next(0) until it returns null. A default
// iterator is unbound (IsValid() false, Next returns null). The iterator
// does not survive the release of the types it walks.
class KRCORELIB_API CKRTypeIterator {
public:
  using TypeMap = std::map<CKRGuid, IKRObjectType*>;

  CKRTypeIterator() = default;
  explicit CKRTypeIterator(TypeMap* map);

  // Returns the type at the position (and its ID in `typeID` when given) and
  // advances; null at the end.
  IKRObjectType* Next(int restart, CKRGuid* typeID = nullptr);
  void Reset(int reset);
  bool IsValid() const { return m_pMap != nullptr; }

private:
  TypeMap::iterator m_Position{};
  TypeMap* m_pMap = nullptr;
};

// The types of one repository keyed by type ID; the repository does not own
// them.
class KRCORELIB_API CKRTypeRepository {
public:
  // 0 for null or when a type with that ID is already present.
  int Add(IKRObjectType* type);
  IKRObjectType* Find(CKRGuid typeID) const;
  // Removes the entry under `typeID` when it holds `type`; 1 when removed.
  int Remove(CKRGuid typeID, IKRObjectType* type);
  int GetCount() const { return static_cast<int>(m_TypeMap.size()); }
  CKRTypeIterator GetIterator() { return CKRTypeIterator(&m_TypeMap); }
  CKRTypeIterator::TypeMap& GetTypeMap() { return m_TypeMap; }

private:
  CKRTypeIterator::TypeMap m_TypeMap;
};
