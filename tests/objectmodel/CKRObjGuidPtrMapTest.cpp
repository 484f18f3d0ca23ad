#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>

#include "KRTestObjects.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <random>
#include <vector>

TEST(CKRObjGuidPtrMap, KeysElementsByInstanceID) {
  CKRTestItem* a = NewTestItem();
  CKRTestItem* twin = NewTestItem(a->GetInstanceID());
  auto* other = static_cast<CKRObjectImpl*>(CKRObjectImpl::GetCKRObjectImplType()->CreateInstance(CKRGuid()));
  CKRObjGuidPtrMap<CKRTestItem> map;
  EXPECT_EQ(map.Add(a), 1);
  EXPECT_EQ(map.Add(twin), 0);  // same instance ID
  EXPECT_EQ(map.Add(nullptr), 0);
  EXPECT_EQ(map.Add(other), 0);  // not a CKRTestItem
  // Removing the twin must not remove the element stored under its ID.
  EXPECT_EQ(map.Remove(twin), nullptr);
  EXPECT_EQ(map.Remove(other), nullptr);
  EXPECT_EQ(map.Find(a->GetInstanceID()), a);
  EXPECT_EQ(map.Remove(a), a);
  EXPECT_EQ(map.GetCount(), 0);
  // The untyped view takes any object.
  CKRObjGuidPtrMap<IKRObject> any;
  EXPECT_EQ(static_cast<IKRCollection&>(any).Add(other), 1);
  for (IKRObject* object : std::vector<IKRObject*>{a, twin, other})
    object->Release();
}

TEST(CKRObjGuidPtrMap, ReleasesInAscendingIDOrder) {
  CKRObjGuidPtrMap<CKRTestItem> map;
  std::vector<CKRTestItem*> items, order;
  for (int i = 0; i < 5; ++i) {
    items.push_back(NewTestItem());
    map.Add(items.back());
    // Each element is out of the map when it is released.
    items.back()->m_OnBeforeRelease = [&](CKRTestItem* self) {
      EXPECT_EQ(map.Find(self->GetInstanceID()), nullptr);
      order.push_back(self);
    };
  }
  std::sort(items.begin(), items.end(),
            [](CKRTestItem* x, CKRTestItem* y) { return x->GetInstanceID() < y->GetInstanceID(); });
  EXPECT_EQ(CKRObjGuidPtrMap<CKRTestItem>::Iterator().Next(1), nullptr);
  const int destroyedBefore = CKRTestItem::s_Destroyed;
  map.RemoveAll(true);
  EXPECT_EQ(order, items);
  EXPECT_EQ(map.GetCount(), 0);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 5);
}

// Random additions and removals against an ordered map, with walks that
// run while elements come and go: every walk returns exactly the elements
// present, in ascending ID order, going on after its own element left.
TEST(CKRObjGuidPtrMap, RandomEditsKeepOrderDuringWalks) {
  std::mt19937 random(KRTestSeed());
  std::vector<CKRTestItem*> pool;
  for (int i = 0; i < 300; ++i)
    pool.push_back(NewTestItem());
  // Nearly equal IDs: one shared GUID with a few bytes changed (high bytes
  // included), so that orders decided late in the ID are exercised.
  const GUID shared = CKRGuid::CreateNewGUID().GetGUID();
  for (int i = 0; i < 100; ++i) {
    GUID id = shared;
    for (int changes = 1 + int(random() % 2); changes > 0; --changes)
      switch (random() % 4) {
        case 0: id.Data2 = decltype(id.Data2)(random()); break;
        case 1: id.Data3 = decltype(id.Data3)(random()); break;
        default: id.Data4[random() % 8] = (unsigned char)(random()); break;
      }
    if (std::none_of(pool.begin(), pool.end(), [&](CKRTestItem* item) { return item->GetInstanceID() == CKRGuid(id); }))
      pool.push_back(NewTestItem(CKRGuid(id)));
  }
  CKRObjGuidPtrMap<CKRTestItem> map;
  std::map<CKRGuid, CKRTestItem*> model;
  auto edit = [&] {
    CKRTestItem* item = pool[random() % pool.size()];
    if (random() % 2 == 0) {
      EXPECT_EQ(map.Add(item), model.count(item->GetInstanceID()) ? 0 : 1);
      model.emplace(item->GetInstanceID(), item);
    } else {
      EXPECT_EQ(map.Remove(item), model.count(item->GetInstanceID()) ? item : nullptr);
      model.erase(item->GetInstanceID());
    }
  };
  for (int round = 0; round < 60; ++round) {
    for (int i = 0; i < 50; ++i)
      edit();
    ASSERT_EQ(map.GetCount(), int(model.size()));
    std::vector<CKRTestItem*> walked;
    for (const auto& [id, item] : map)
      walked.push_back(item);
    std::vector<CKRTestItem*> expected;
    for (const auto& [id, item] : model)
      expected.push_back(item);
    ASSERT_EQ(walked, expected) << "round " << round;
    using SEntries = std::vector<std::pair<CKRGuid, CKRTestItem*>>;
    SEntries entries;
    map.GetEntries(entries);
    ASSERT_EQ(entries, SEntries(model.begin(), model.end())) << "round " << round;
    // A walk with edits between its steps returns ascending IDs, each
    // present when it is returned.
    auto it = map.GetIterator();
    CKRGuid last;
    bool started = false;
    for (CKRTestItem* item = it.Next(1); item != nullptr; item = it.Next(0)) {
      ASSERT_EQ(map.Find(item->GetInstanceID()), item);
      if (started) {
        ASSERT_TRUE(last < item->GetInstanceID());
      }
      last = item->GetInstanceID();
      started = true;
      edit();
    }
  }
  map.RemoveAll(false);
  for (CKRTestItem* item : pool)
    item->Release();
}
