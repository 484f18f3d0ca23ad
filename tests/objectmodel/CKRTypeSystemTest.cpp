#include <krCoreLib/objectmodel/CKRTypeSystem.h>

#include "KRTestObjects.h"

#include <gtest/gtest.h>

#include <memory>
#include <vector>

namespace {

constexpr CKRGuid kHostRepository = CKRGuid::Literal("{AAAAAAAA-0000-4000-8000-000000000001}");
constexpr CKRGuid kPluginRepository = CKRGuid::Literal("{BBBBBBBB-0000-4000-8000-000000000002}");
// Ascending IDs from root to leaf, so that plain ID order would release the
// root first.
constexpr CKRGuid kRootID = CKRGuid::Literal("{10000000-0000-4000-8000-000000000000}");
constexpr CKRGuid kChildID = CKRGuid::Literal("{20000000-0000-4000-8000-000000000000}");
constexpr CKRGuid kLeafID = CKRGuid::Literal("{30000000-0000-4000-8000-000000000000}");

std::vector<IKRObjectType*> Walk(CKRTypeIterator it) {
  std::vector<IKRObjectType*> types;
  for (IKRObjectType* type = it.Next(1); type != nullptr; type = it.Next(0))
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
  std::vector<std::wstring> log;
  // Registered leaf first: registration order must not matter.
  CKRLocalType leaf(L"Leaf", kLeafID, kChildID, false, &log);
  CKRLocalType child(L"Child", kChildID, kRootID, false, &log);
  CKRLocalType root(L"Root", kRootID, CKRObjectImpl::TypeID, true, &log);
  EXPECT_EQ(leaf.IsTypeOf(kRootID), 0);

  CKRTypeSystem::Initialize(kHostRepository);
  EXPECT_EQ(log, (std::vector<std::wstring>{L"init Root", L"init Child", L"init Leaf"}));
  EXPECT_TRUE(leaf.m_ParentLinkedAtInitialize && child.m_ParentLinkedAtInitialize && root.m_ParentLinkedAtInitialize);
  EXPECT_EQ(leaf.IsTypeOf(kRootID), 1);
  EXPECT_EQ(leaf.IsTypeOf(CKRObjectImpl::TypeID), 1);
  EXPECT_EQ(leaf.IsTypeOf(&root), 1);
  EXPECT_EQ(leaf.GetRepositoryID(), kHostRepository);
  // The library's root type is claimed with them.
  EXPECT_EQ(CKRTypeSystem::FindType(CKRObjectImpl::TypeID), CKRObjectImpl::GetCKRObjectImplType());
  EXPECT_EQ(CKRObjectImpl::GetCKRObjectImplType()->GetRepositoryID(), kHostRepository);

  const std::vector<IKRObjectType*> expected = {&root, &child, &leaf, CKRObjectImpl::GetCKRObjectImplType()};
  EXPECT_EQ(Walk(CKRTypeSystem::GetRepositoryIterator(kHostRepository)), expected);
  EXPECT_EQ(Walk(CKRTypeSystem::GetGlobalIterator()), expected);
  CKRGuid firstID;
  CKRTypeIterator it = CKRTypeSystem::GetGlobalIterator();
  EXPECT_EQ(it.Next(1, &firstID), &root);
  EXPECT_EQ(firstID, kRootID);
}

TEST_F(CKRTypeSystemTest, DuplicateTypeIDsKeepTheFirstType) {
  std::vector<std::wstring> log;
  CKRLocalType first(L"First", kRootID, CKRGuid(), false, &log);
  CKRLocalType second(L"Second", kRootID, CKRGuid(), false, &log);
  EXPECT_EQ(CKRTypeSystem::FindType(kRootID), &first);
  EXPECT_EQ(CKRTypeSystem::AddType(&second), 0);
  EXPECT_EQ(CKRTypeSystem::AddType(nullptr), 0);

  CKRTypeSystem::Initialize(kHostRepository);
  CKRTypeSystem::Release();
  EXPECT_EQ(log, (std::vector<std::wstring>{L"init First", L"release First"}));
  EXPECT_EQ(second.GetRepositoryID(), CKRGuid());
}

TEST_F(CKRTypeSystemTest, LateTypesAreClaimedByTheNextInitialize) {
  CKRLocalType root(L"Root", kRootID);
  CKRTypeSystem::Initialize(kHostRepository);
  auto plugin = std::make_unique<CKRLocalType>(L"PluginType", kChildID, kRootID);
  EXPECT_EQ(plugin->GetRepositoryID(), CKRGuid());

  CKRTypeSystem::Initialize(kPluginRepository);
  EXPECT_EQ(plugin->GetRepositoryID(), kPluginRepository);
  EXPECT_EQ(plugin->IsTypeOf(kRootID), 1);
  EXPECT_EQ(Walk(CKRTypeSystem::GetRepositoryIterator(kPluginRepository)),
            (std::vector<IKRObjectType*>{plugin.get()}));

  // Nothing new: a further Initialize claims nothing.
  const CKRGuid third = CKRGuid::Literal("{CCCCCCCC-0000-4000-8000-000000000003}");
  CKRTypeSystem::Initialize(third);
  EXPECT_TRUE(Walk(CKRTypeSystem::GetRepositoryIterator(third)).empty());
  EXPECT_TRUE(CKRTypeSystem::GetRepositoryIterator(third).IsValid());

  // Unloading the plug-in: its repository goes, the host's types stay.
  plugin->CreateInstance(CKRGuid());
  CKRTypeSystem::ReleaseRepository(kPluginRepository);
  EXPECT_EQ(plugin->GetInstanceCount(), 0);
  EXPECT_EQ(CKRTypeSystem::FindType(kChildID), nullptr);
  EXPECT_EQ(root.HasDerivedTypes(), 0);
  EXPECT_EQ(CKRTypeSystem::FindType(kRootID), &root);
  EXPECT_FALSE(CKRTypeSystem::GetRepositoryIterator(kPluginRepository).IsValid());
  CKRTypeSystem::ReleaseRepository(kPluginRepository);  // unknown now: nothing happens
}

TEST_F(CKRTypeSystemTest, UnknownRepositoryGivesAnUnboundIterator) {
  CKRTypeIterator it = CKRTypeSystem::GetRepositoryIterator(kPluginRepository);
  EXPECT_FALSE(it.IsValid());
  EXPECT_EQ(it.Next(1), nullptr);
  CKRTypeIterator unbound;
  unbound.Reset(1);
  EXPECT_EQ(unbound.Next(0), nullptr);
}

TEST_F(CKRTypeSystemTest, ReleaseGoesLeavesFirst) {
  std::vector<std::wstring> log;
  CKRLocalType root(L"Root", kRootID, CKRGuid(), false, &log);
  CKRLocalType child(L"Child", kChildID, kRootID, false, &log);
  CKRLocalType leaf(L"Leaf", kLeafID, kChildID, false, &log);
  CKRTypeSystem::Initialize(kHostRepository);
  log.clear();
  CKRTypeSystem::Release();
  EXPECT_EQ(log, (std::vector<std::wstring>{L"release Leaf", L"release Child", L"release Root"}));
  EXPECT_EQ(CKRTypeSystem::FindType(CKRObjectImpl::TypeID), nullptr);
  EXPECT_EQ(CKRTypeSystem::FindType(kRootID), nullptr);
}

TEST_F(CKRTypeSystemTest, ReleaseRepositoryGoesInIDOrder) {
  std::vector<std::wstring> log;
  CKRLocalType root(L"Root", kRootID, CKRGuid(), false, &log);
  CKRLocalType child(L"Child", kChildID, kRootID, false, &log);
  CKRTypeSystem::Initialize(kHostRepository);
  log.clear();
  CKRTypeSystem::ReleaseRepository(kHostRepository);
  EXPECT_EQ(log, (std::vector<std::wstring>{L"release Root", L"release Child"}));
  EXPECT_EQ(root.HasDerivedTypes(), 0);
}

TEST_F(CKRTypeSystemTest, ReleaseEndsWhenDerivedTypesLiveInAnotherRepository) {
  // The host's type has a derived type in a plug-in repository that the host
  // forgot to release first: it never becomes a leaf of its own repository.
  std::vector<std::wstring> log;
  CKRLocalType root(L"Root", kRootID, CKRGuid(), false, &log);
  CKRTypeSystem::Initialize(kHostRepository);
  CKRLocalType plugin(L"Plugin", kChildID, kRootID, false, &log);
  CKRTypeSystem::Initialize(kPluginRepository);
  log.clear();
  CKRTypeSystem::Release();
  EXPECT_EQ(log, (std::vector<std::wstring>{L"release Root", L"release Plugin"}));
}

TEST_F(CKRTypeSystemTest, ReleasedTypesCanBeClaimedAgain) {
  CKRLocalType root(L"Root", kRootID);
  CKRTypeSystem::Initialize(kHostRepository);
  CKRTypeSystem::Release();
  EXPECT_EQ(CKRTypeSystem::FindType(CKRObjectImpl::TypeID), nullptr);
  EXPECT_EQ(root.GetRepositoryID(), CKRGuid());

  // A new type system: the library's root type comes back with Initialize,
  // other types when the host registers them again.
  EXPECT_EQ(CKRTypeSystem::AddType(&root), 1);
  CKRTypeSystem::Initialize(kPluginRepository);
  EXPECT_EQ(CKRTypeSystem::FindType(CKRObjectImpl::TypeID), CKRObjectImpl::GetCKRObjectImplType());
  EXPECT_EQ(root.GetRepositoryID(), kPluginRepository);
}

TEST_F(CKRTypeSystemTest, TypesReleasedWithTheirLiveInstances) {
  ClaimTestTypes();
  const int destroyedBefore = CKRTestItem::s_Destroyed;
  NewTestItem();
  auto* derived = CKRTestDerivedItem::GetCKRTestDerivedItemType()->CreateInstance(CKRGuid());
  EXPECT_EQ(derived->IsTypeOf(CKRTestItem::TypeID), 1);
  EXPECT_EQ(derived->IsTypeOf(CKRObjectImpl::TypeID), 1);
  EXPECT_EQ(CKRTestAbstract::GetCKRTestAbstractType()->IsTypeOf(CKRTestItem::TypeID), 0);
  CKRTypeSystem::Release();
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 2);
  EXPECT_EQ(CKRTestItem::GetCKRTestItemType()->GetInstanceCount(), 0);
}

TEST_F(CKRTypeSystemTest, DestroyedTypeIsForgotten) {
  CKRLocalType root(L"Root", kRootID);
  {
    CKRLocalType plugin(L"Plugin", kChildID, kRootID);
    CKRTypeSystem::Initialize(kHostRepository);
    EXPECT_EQ(Walk(CKRTypeSystem::GetRepositoryIterator(kHostRepository)).size(), 3u);
  }
  // Its module went away without releasing its repository.
  EXPECT_EQ(CKRTypeSystem::FindType(kChildID), nullptr);
  EXPECT_EQ(Walk(CKRTypeSystem::GetRepositoryIterator(kHostRepository)).size(), 2u);
  EXPECT_EQ(root.HasDerivedTypes(), 0);
}
