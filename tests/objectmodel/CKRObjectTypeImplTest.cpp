#include <krCoreLib/objectmodel/CKRObjectTypeImpl.h>

#include "KRTestObjects.h"
#include "KRTestSeed.h"

#include <krCoreLib/core/CKRDebugOutput.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <iterator>
#include <map>
#include <random>

namespace {

void Collect(const wchar_t* text, void* context) {
  static_cast<std::vector<std::wstring>*>(context)->push_back(text);
}

}  // namespace

TEST(CKRObjectTypeImpl, TracksItsOwnInstancesAndReleasesOnlyThem) {
  auto* type = CKRTestItem::GetCKRTestItemType();
  auto* derivedType = CKRTestDerivedItem::GetCKRTestDerivedItemType();
  EXPECT_EQ(derivedType->GetParentTypeID(), CKRTestItem::TypeID);
  EXPECT_EQ(CKRTestAbstract::GetCKRTestAbstractType()->CreateInstance(CKRGuid()), nullptr);
  IKRObject* fresh = type->CreateInstance(CKRGuid());
  ASSERT_NE(fresh, nullptr);
  EXPECT_EQ(fresh->GetType(), type);
  EXPECT_EQ(fresh->GetInterface(IID_IKRObject), fresh);
  EXPECT_TRUE(fresh->GetInstanceID().IsValid() && type->GetInstance(fresh->GetInstanceID()) == fresh);
  const CKRGuid chosen = CKRGuid::Literal("{ABCDEF00-1234-4321-8765-0123456789AB}");
  IKRObject* named = type->CreateInstance(chosen);
  std::vector<CKRGuid> ids, expected = {fresh->GetInstanceID(), chosen};
  type->GetInstanceList(ids);
  std::sort(expected.begin(), expected.end());
  EXPECT_EQ(ids, expected);
  // An untracked twin (another object with the same instance ID) and an
  // object of another type are not released in the tracked one's place.
  IKRObject* twin = type->CreateInstance(chosen);
  ASSERT_TRUE(twin != nullptr && twin != named);
  EXPECT_EQ(type->GetInstanceCount(), 2);
  EXPECT_EQ(twin->Release(), 1);
  EXPECT_EQ(type->GetInstance(chosen), named);
  EXPECT_EQ(derivedType->ReleaseInstance(named), 0);
  EXPECT_EQ(derivedType->ReleaseInstance(nullptr), 0);
  EXPECT_EQ(type->GetInstance(chosen), named);
  EXPECT_EQ(fresh->Release(), 1);
  EXPECT_EQ(named->Release(), 1);
  EXPECT_EQ(type->GetInstance(chosen), nullptr);
  EXPECT_EQ(type->GetInstanceCount(), 0);
}

TEST(CKRObjectTypeImpl, VetoesAreHonoured) {
  auto* type = CKRTestItem::GetCKRTestItemType();
  const int destroyedBefore = CKRTestItem::s_Destroyed;
  // A refused OnInitialize destroys the object, which was never handed out,
  // even when it would also refuse its release.
  CKRTestItem::s_RefuseInitialize = true;
  CKRTestItem::s_AllowReleaseOfNew = 0;
  EXPECT_EQ(type->CreateInstance(CKRGuid()), nullptr);
  CKRTestItem::s_RefuseInitialize = false;
  CKRTestItem::s_AllowReleaseOfNew = 1;
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 1);
  EXPECT_EQ(type->GetInstanceCount(), 0);

  CKRTestItem* stubborn = NewTestItem();
  stubborn->m_AllowRelease = 0;
  EXPECT_EQ(stubborn->Release(), 0);
  EXPECT_EQ(type->ReleaseInstance(stubborn), 0);
  EXPECT_EQ(type->GetInstance(stubborn->GetInstanceID()), stubborn);
  stubborn->m_AllowRelease = 1;
  EXPECT_EQ(stubborn->Release(), 1);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 2);
}

TEST(CKRObjectTypeImpl, ParentLinksDecideIsTypeOf) {
  CKRLocalType root(L"Root", kRootID);
  CKRLocalType child(L"Child", kChildID, kRootID);
  CKRLocalType otherChild(L"OtherChild", kOtherChildID, kRootID);
  CKRLocalType grandchild(L"Grandchild", kLeafID, kChildID);
  EXPECT_EQ(child.IsTypeOf(CKRGuid()), 0);
  EXPECT_EQ(child.IsTypeOf(kRootID), 0);  // not linked yet
  EXPECT_EQ(child.RegisterWithParentType(nullptr), 0);
  ASSERT_EQ(child.RegisterWithParentType(&root), 1);
  ASSERT_EQ(otherChild.RegisterWithParentType(&root), 1);
  ASSERT_EQ(grandchild.RegisterWithParentType(&child), 1);
  EXPECT_EQ(grandchild.IsTypeOf(kRootID), 1);
  EXPECT_EQ(root.IsTypeOf(kChildID), 0);
  std::vector<IKRObjectType*> derived;
  root.GetDerivedTypes(derived);
  EXPECT_EQ(derived, (std::vector<IKRObjectType*>{&grandchild, &child, &otherChild}));
  // Objects answer through their type.
  IKRObject* object = child.CreateInstance(CKRGuid());
  EXPECT_EQ(object->IsTypeOf(kRootID), 1);
  EXPECT_EQ(object->IsTypeOf(kOtherChildID), 0);
  object->Release();

  // A link that would close a cycle is refused, so IsTypeOf always ends.
  EXPECT_EQ(root.RegisterWithParentType(&grandchild), 0);
  EXPECT_EQ(root.RegisterWithParentType(&root), 0);
  EXPECT_EQ(root.IsTypeOf(kOtherChildID), 0);
}

TEST(CKRObjectTypeImpl, ReleaseEndsLiveInstancesAndReportsThem) {
  CKRLocalType root(L"Root", kRootID);
  CKRLocalType child(L"Child", kChildID, kRootID);
  ASSERT_EQ(child.RegisterWithParentType(&root), 1);
  child.CreateInstance(CKRGuid());
  child.CreateInstance(CKRGuid());
  std::vector<std::wstring> texts;
  const CKRDebugOutput::Handler previous = CKRDebugOutput::SetHandler(&Collect, &texts);
  child.Release();
  root.Release();  // without live instances there is nothing to report
  CKRDebugOutput::SetHandler(previous);
  EXPECT_EQ(texts, std::vector<std::wstring>{L"Warning! 2 instances of class Child were not released\n"});
  EXPECT_EQ(child.GetInstanceCount(), 0);
  EXPECT_EQ(root.HasDerivedTypes(), 0);
  EXPECT_EQ(child.GetParentType(), nullptr);
}

// Many instances created and released in random order, with IDs that
// differ only in their last bytes (they share every other bit, the hardest
// case for a hash table): every live one is found, every released one is
// gone, and the list stays in ascending order.
TEST(CKRObjectTypeImpl, TracksManyInstancesCreatedAndReleasedAtRandom) {
  const unsigned seed = KRTestSeed();
  std::mt19937 random(seed);
  auto* type = CKRTestItem::GetCKRTestItemType();
  const int before = type->GetInstanceCount();
  std::map<CKRGuid, IKRObject*> live;
  for (int step = 0; step < 20000; ++step) {
    if (live.empty() || random() % 3 != 0) {
      GUID raw = CKRGuid::Literal("{7C0D2E1F-0000-4000-8000-000000000000}").GetGUID();
      const unsigned n = random() % 4096;
      raw.Data4[6] = std::uint8_t(n >> 8);
      raw.Data4[7] = std::uint8_t(n);
      const CKRGuid id(raw);
      if (live.count(id) != 0)
        continue;
      IKRObject* made = type->CreateInstance(id);
      ASSERT_NE(made, nullptr);
      live[id] = made;
    } else {
      auto at = live.begin();
      std::advance(at, random() % live.size());
      ASSERT_EQ(at->second->Release(), 1);
      EXPECT_EQ(type->GetInstance(at->first), nullptr);
      live.erase(at);
    }
    if (step % 1000 == 0) {
      for (const auto& [id, object] : live)
        ASSERT_EQ(type->GetInstance(id), object) << "step " << step;
    }
  }
  std::vector<CKRGuid> listed;
  type->GetInstanceList(listed);
  EXPECT_TRUE(std::is_sorted(listed.begin(), listed.end()));
  EXPECT_EQ(type->GetInstanceCount(), before + int(live.size()));
  for (const auto& [id, object] : live)
    object->Release();
}
