// CKRTypeSystem: the process-wide registry of object types.
//
// Every type object registers itself here when its ID is set, so any type
// can be found by ID. A host claims the registered types into a repository
// of its own with Initialize (linking each to its parent, then initialising
// it); a module loaded later claims the types it added with a further
// Initialize; each repository is released as a whole. Calling order: load
// (types register), Initialize once per module that brings types,
// ReleaseRepository before such a module is unloaded, Release at shutdown.
//
// A released type is no longer found, but its type object lives on as long
// as its module: whether or not the loader really unmaps a module that was
// released and unloaded, its types are registered again when it is loaded
// and the next Initialize runs (a type object destroyed with its module
// removes itself; one constructed again registers itself). The same holds
// for the library's own types after Release.
//
// All operations are static and work on the single instance, created on
// first use. No locks are taken: registration happens while modules load,
// and the host calls Initialize, ReleaseRepository and Release from one
// thread.
#pragma once

#include <krCoreLib/objectmodel/CKRTypeRepository.h>

class KRCORELIB_API CKRTypeSystem {
public:
  // Registers `type` under its ID: 1, or 0 for null and for an ID already
  // registered (the first type keeps it).
  static int AddType(IKRObjectType* type);
  // The registered type with that ID, or null.
  static IKRObjectType* FindType(CKRGuid typeID);
  // Registers again the living types that an earlier release let go of
  // (unless another type took the ID meanwhile), then claims every unclaimed
  // type into the repository `repositoryID` (created when new): first links
  // all of them to their parents, then initialises each and sets its
  // repository, in ascending type-ID order.
  static void Initialize(CKRGuid repositoryID);
  // Releases the repository's types in ascending ID order, then the
  // repository; an unknown ID does nothing.
  static void ReleaseRepository(CKRGuid repositoryID);
  // Releases every repository (each type after the types derived from it),
  // then the type system itself; a later call starts a new, empty one, in
  // which the living types are found again after the next Initialize.
  static void Release();
  // Makes `type` a root type that Initialize registers whenever no type
  // with its ID is registered (as it does for CKRObjectImpl's type): a
  // subsystem calls it for the roots of its classes while it loads. Null
  // and repeated calls are ignored; a destroyed type leaves the list.
  static void AddBaseType(IKRObjectType* type);
  static CKRTypeIterator GetGlobalIterator();
  // An unbound iterator for an unknown repository.
  static CKRTypeIterator GetRepositoryIterator(CKRGuid repositoryID);

protected:
  CKRTypeSystem() = default;
  CKRTypeSystem(const CKRTypeSystem&) = delete;
  CKRTypeSystem& operator=(const CKRTypeSystem&) = delete;
  ~CKRTypeSystem();

  static CKRTypeSystem* GetInstance();

  int _AddType(IKRObjectType* type);
  IKRObjectType* _FindType(CKRGuid typeID);
  CKRTypeRepository* _GetRepository(CKRGuid repositoryID);
  CKRTypeIterator _GetGlobalIterator();
  CKRTypeIterator _GetRepositoryIterator(CKRGuid repositoryID);
  void _Initialize(CKRGuid repositoryID);
  void _Release();
  void _ReleaseRepository(CKRGuid repositoryID);

private:
  // A type object is being destroyed (its module unloads): forget it
  // everywhere, without creating a type system.
  static void RemoveDestroyedType(IKRObjectType* type);
  friend class CKRObjectTypeImpl;

  // Takes the type at `at` out of `types` and the global table, releases
  // it, and returns the position after it.
  CKRTypeIterator::TypeMap::iterator ReleaseEntry(CKRTypeIterator::TypeMap& types,
                                                  CKRTypeIterator::TypeMap::iterator at);
  // Releases the types in ascending ID order.
  void ReleaseInOrder(CKRTypeIterator::TypeMap& types);
  // Releases the types of `repository`, each after its derived types.
  void ReleaseLeavesFirst(CKRTypeRepository& repository);

  std::map<CKRGuid, CKRTypeRepository*> m_RepositoryMap;
  CKRTypeIterator::TypeMap m_GlobalTypeMap;

  static CKRTypeSystem* m_pInstance;
};
