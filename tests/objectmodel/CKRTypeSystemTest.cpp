#include <krCoreLib/objectmodel/CKRTypeSystem.h>

#include "KRTestObjects.h"
#include "KRTestPlugin.h"

#include <gtest/gtest.h>

#include <dlfcn.h>

#include <algorithm>
#include <memory>

namespace {

constexpr CKRGuid kHostRepository = CKRGuid::Literal("{AAAAAAAA-0000-4000-8000-000000000001}");
constexpr CKRGuid kPluginRepository = CKRGuid::Literal("{BBBBBBBB-0000-4000-8000-000000000002}");

using Log = std::vector<std::wstring>;
using Types = std::vector<IKRObjectType*>;

// The types of an iteration that a test makes itself, and the library's root
// type: the library's other types and the static test types come and go
// with every Initialize.
Types Walk(CKRTypeIterator it) {
  Types types;
  for (IKRObjectType* type = it.Next(1); type != nullptr; type = it.Next(0))
    if (dynamic_cast<CKRLocalType*>(type) != nullptr || type == CKRObjectImpl::GetCKRObjectImplType())
      types.push_back(type);
  return types;
}

// Every test starts and ends with a fresh type system.
class CKRTypeSystemTest : public testing::Test {
protected:
  void SetUp() override { CKRTypeSystem::Release(); }
  void TearDown() override { CKRTypeSystem::Release(); }
};

}  // namespace

TEST_F(CKRTypeSystemTest, InitializeLinksEveryTypeBeforeInitialisingAny) {
  Log log;
  // Registered leaf first: registration order must not matter.
  CKRLocalType leaf(L"Leaf", kLeafID, kChildID, &log);
  CKRLocalType child(L"Child", kChildID, kRootID, &log);
  CKRLocalType root(L"Root", kRootID, CKRObjectImpl::TypeID, &log);
  CKRTypeSystem::Initialize(kHostRepository);
  EXPECT_EQ(log, (Log{L"init Root", L"init Child", L"init Leaf"}));
  EXPECT_TRUE(leaf.m_ParentLinkedAtInitialize && child.m_ParentLinkedAtInitialize && root.m_ParentLinkedAtInitialize);
  EXPECT_EQ(leaf.IsTypeOf(CKRObjectImpl::TypeID), 1);
  // The library's root type is claimed with them.
  EXPECT_EQ(CKRTypeSystem::FindType(CKRObjectImpl::TypeID), CKRObjectImpl::GetCKRObjectImplType());
  const Types expected = {&root, &child, &leaf, CKRObjectImpl::GetCKRObjectImplType()};
  EXPECT_EQ(Walk(CKRTypeSystem::GetRepositoryIterator(kHostRepository)), expected);
  EXPECT_EQ(Walk(CKRTypeSystem::GetGlobalIterator()), expected);
  // The iterator hands out each type with its ID, in ascending ID order.
  CKRTypeIterator all = CKRTypeSystem::GetGlobalIterator();
  CKRGuid id;
  CKRGuid previous;
  for (IKRObjectType* type = all.Next(1, &id); type != nullptr; type = all.Next(0, &id)) {
    EXPECT_EQ(type->GetID(), id);
    EXPECT_TRUE(previous < id);
    previous = id;
  }
}

TEST_F(CKRTypeSystemTest, DuplicateTypeIDsKeepTheFirstType) {
  Log log;
  CKRLocalType first(L"First", kRootID, CKRGuid(), &log);
  CKRLocalType second(L"Second", kRootID, CKRGuid(), &log);
  EXPECT_EQ(CKRTypeSystem::FindType(kRootID), &first);
  EXPECT_EQ(CKRTypeSystem::AddType(&second), 0);
  EXPECT_EQ(CKRTypeSystem::AddType(nullptr), 0);
  CKRTypeSystem::Initialize(kHostRepository);
  CKRTypeSystem::Release();
  EXPECT_EQ(log, (Log{L"init First", L"release First"}));
  EXPECT_EQ(second.GetRepositoryID(), CKRGuid());
}

TEST_F(CKRTypeSystemTest, LateTypesAreClaimedByTheNextInitialize) {
  Log log;
  CKRLocalType root(L"Root", kRootID, CKRGuid(), &log);
  CKRTypeSystem::Initialize(kHostRepository);
  CKRLocalType plugin(L"Plugin", kChildID, kRootID, &log);
  CKRLocalType pluginLeaf(L"PluginLeaf", kLeafID, kChildID, &log);
  EXPECT_EQ(plugin.GetRepositoryID(), CKRGuid());
  CKRTypeSystem::Initialize(kPluginRepository);
  EXPECT_EQ(plugin.GetRepositoryID(), kPluginRepository);
  EXPECT_EQ(pluginLeaf.IsTypeOf(kRootID), 1);
  EXPECT_EQ(Walk(CKRTypeSystem::GetRepositoryIterator(kPluginRepository)), (Types{&plugin, &pluginLeaf}));
  // Nothing new: a further Initialize claims nothing.
  const CKRGuid third = CKRGuid::Literal("{CCCCCCCC-0000-4000-8000-000000000003}");
  CKRTypeSystem::Initialize(third);
  EXPECT_TRUE(CKRTypeSystem::GetRepositoryIterator(third).IsValid() && Walk(CKRTypeSystem::GetRepositoryIterator(third)).empty());

  // Unloading the plug-in: its repository goes, in ID order, and with it the
  // live instances; the host's types stay.
  plugin.CreateInstance(CKRGuid());
  log.clear();
  CKRTypeSystem::ReleaseRepository(kPluginRepository);
  EXPECT_EQ(log, (Log{L"release Plugin", L"release PluginLeaf"}));
  EXPECT_EQ(plugin.GetInstanceCount(), 0);
  EXPECT_EQ(CKRTypeSystem::FindType(kChildID), nullptr);
  EXPECT_EQ(CKRTypeSystem::FindType(kRootID), &root);
  EXPECT_EQ(root.HasDerivedTypes(), 0);
  CKRTypeIterator gone = CKRTypeSystem::GetRepositoryIterator(kPluginRepository);
  EXPECT_FALSE(gone.IsValid());
  EXPECT_EQ(gone.Next(1), nullptr);
  CKRTypeSystem::ReleaseRepository(kPluginRepository);  // unknown now: nothing happens
}

TEST_F(CKRTypeSystemTest, ReleaseGoesLeavesFirst) {
  Log log;
  CKRLocalType root(L"Root", kRootID, CKRGuid(), &log);
  CKRLocalType child(L"Child", kChildID, kRootID, &log);
  CKRLocalType leaf(L"Leaf", kLeafID, kChildID, &log);
  CKRTypeSystem::Initialize(kHostRepository);
  log.clear();
  CKRTypeSystem::Release();
  EXPECT_EQ(log, (Log{L"release Leaf", L"release Child", L"release Root"}));
  EXPECT_TRUE(CKRTypeSystem::FindType(CKRObjectImpl::TypeID) == nullptr && CKRTypeSystem::FindType(kRootID) == nullptr);
  EXPECT_EQ(root.GetRepositoryID(), CKRGuid());

  // The living types come back with the next Initialize, the library's root
  // type among them, linked again.
  CKRTypeSystem::Initialize(kHostRepository);
  EXPECT_EQ(CKRTypeSystem::FindType(CKRObjectImpl::TypeID), CKRObjectImpl::GetCKRObjectImplType());
  EXPECT_EQ(CKRTypeSystem::FindType(kLeafID), &leaf);
  EXPECT_EQ(leaf.IsTypeOf(kRootID), 1);
  // A type whose derived type lives in another repository never becomes a
  // leaf of its own, yet Release still ends.
  CKRLocalType late(L"Late", CKRGuid::Literal("{40000000-0000-4000-8000-000000000000}"), kRootID, &log);
  CKRTypeSystem::Initialize(kPluginRepository);
  EXPECT_EQ(late.GetRepositoryID(), kPluginRepository);
  log.clear();
  CKRTypeSystem::Release();
  EXPECT_EQ(log, (Log{L"release Leaf", L"release Child", L"release Root", L"release Late"}));
}

TEST_F(CKRTypeSystemTest, DestroyedTypeLeavesNoDanglingLinks) {
  CKRLocalType root(L"Root", kRootID);
  {
    // Its module goes away without releasing its repository.
    CKRLocalType child(L"Child", kChildID, kRootID);
    CKRTypeSystem::Initialize(kHostRepository);
    EXPECT_EQ(Walk(CKRTypeSystem::GetRepositoryIterator(kHostRepository)).size(), 3u);
  }
  EXPECT_EQ(root.HasDerivedTypes(), 0);
  EXPECT_EQ(CKRTypeSystem::FindType(kChildID), nullptr);
  EXPECT_EQ(Walk(CKRTypeSystem::GetRepositoryIterator(kHostRepository)).size(), 2u);
  // A destroyed parent leaves its derived type unlinked.
  auto parent = std::make_unique<CKRLocalType>(L"Parent", kChildID);
  CKRLocalType orphan(L"Orphan", kLeafID, kChildID);
  ASSERT_EQ(orphan.RegisterWithParentType(parent.get()), 1);
  parent.reset();
  EXPECT_EQ(orphan.GetParentType(), nullptr);
  EXPECT_EQ(orphan.IsTypeOf(kChildID), 0);
  // So does a parent released (its repository went first) and then
  // destroyed before its derived type.
  parent = std::make_unique<CKRLocalType>(L"Parent", kChildID);
  ASSERT_EQ(orphan.RegisterWithParentType(parent.get()), 1);
  parent->Release();
  parent.reset();
  EXPECT_EQ(orphan.GetParentType(), nullptr);
  EXPECT_EQ(orphan.IsTypeOf(kChildID), 0);
}

// A plug-in module built with default options, which uses interface and
// data-type IDs, a storable class and a singleton of its own: loaded,
// claimed, used, released and unloaded three times, its types are found after
// every load, and the loader really unmaps it. Then the same while the loader
// keeps it mapped (RTLD_NODELETE): its static type objects are never
// constructed again, and still its types come back with the next Initialize.
TEST_F(CKRTypeSystemTest, PluginModuleTypesComeBackAfterReload) {
  using namespace KRTestPlugin;
  CKRTypeSystem::Initialize(kHostRepository);
  CKRTestSharedSingleton* shared = CKRTestSharedSingleton::GetInstance();
  for (const bool keepMapped : {false, true}) {
    for (int round = 0; round < 3; ++round) {
      SCOPED_TRACE(testing::Message() << "keep mapped " << keepMapped << ", round " << round);
      void* module = dlopen(KR_TEST_PLUGIN_PATH, RTLD_NOW | RTLD_LOCAL | (keepMapped ? RTLD_NODELETE : 0));
      ASSERT_NE(module, nullptr) << dlerror();
      auto use = reinterpret_cast<UseFunction>(dlsym(module, kUseFunctionName));
      auto sharedInModule = reinterpret_cast<SharedFunction>(dlsym(module, kSharedFunctionName));
      ASSERT_TRUE(use != nullptr && sharedInModule != nullptr);
      CKRTypeSystem::Initialize(kPluginRepository);
      IKRObjectType* thing = CKRTypeSystem::FindType(kThingTypeID);
      IKRObjectType* record = CKRTypeSystem::FindType(kRecordTypeID);
      ASSERT_TRUE(thing != nullptr && record != nullptr);
      EXPECT_EQ(thing->GetRepositoryID(), kPluginRepository);
      EXPECT_EQ(thing->IsTypeOf(CKRObjectImpl::TypeID), 1);
      IKRObject* object = thing->CreateInstance(CKRGuid());
      ASSERT_NE(object, nullptr);
      EXPECT_EQ(thing->GetInstance(object->GetInstanceID()), object);
      EXPECT_EQ(object->Release(), 1);
      IKRObject* stored = record->CreateInstance(CKRGuid());
      ASSERT_NE(stored, nullptr);
      EXPECT_EQ(use(stored), 1);
      EXPECT_EQ(stored->Release(), 1);
      EXPECT_EQ(sharedInModule(), shared);
      CKRTypeSystem::ReleaseRepository(kPluginRepository);
      EXPECT_TRUE(CKRTypeSystem::FindType(kThingTypeID) == nullptr && CKRTypeSystem::FindType(kRecordTypeID) == nullptr);
      Types derived;
      CKRObjectImpl::GetCKRObjectImplType()->GetDerivedTypes(derived);
      EXPECT_EQ(std::count(derived.begin(), derived.end(), thing), 0);
      ASSERT_EQ(dlclose(module), 0);
      void* still = dlopen(KR_TEST_PLUGIN_PATH, RTLD_NOW | RTLD_NOLOAD);
      EXPECT_EQ(still != nullptr, keepMapped);
      if (still != nullptr)
        dlclose(still);
    }
  }
  CKRTestSharedSingleton::ReleaseInstance();
}
