#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>

#include "KRTestObjects.h"

#include <gtest/gtest.h>

#include <algorithm>
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
  EXPECT_EQ(map.GetCount(), 1);
  EXPECT_EQ(map.Find(a->GetInstanceID()), a);
  EXPECT_EQ(map.Find(other->GetInstanceID()), nullptr);

  // Removing the twin must not remove the element stored under its ID.
  EXPECT_EQ(map.Remove(twin), nullptr);
  EXPECT_EQ(map.Find(a->GetInstanceID()), a);
  EXPECT_EQ(map.Remove(other), nullptr);
  EXPECT_EQ(map.Remove(a), a);
  EXPECT_EQ(map.Remove(a), nullptr);
  EXPECT_EQ(map.GetCount(), 0);
  a->Release();
  twin->Release();
  other->Release();
}

TEST(CKRObjGuidPtrMap, WalksAndReleasesInAscendingIDOrder) {
  CKRObjGuidPtrMap<CKRTestItem> map;
  std::vector<CKRTestItem*> items;
  for (int i = 0; i < 5; ++i) {
    items.push_back(NewTestItem());
    map.Add(items.back());
  }
  std::sort(items.begin(), items.end(),
            [](CKRTestItem* x, CKRTestItem* y) { return x->GetInstanceID() < y->GetInstanceID(); });

  auto it = map.GetIterator();
  EXPECT_TRUE(it.IsValid());
  for (CKRTestItem* expected : items)
    EXPECT_EQ(it.Next(0), expected);
  EXPECT_EQ(it.Next(0), nullptr);
  EXPECT_EQ(it.Next(1), items.front());
  CKRObjGuidPtrMap<CKRTestItem>::Iterator unbound;
  EXPECT_FALSE(unbound.IsValid());
  EXPECT_EQ(unbound.Next(1), nullptr);

  // Each element is out of the map when it is released.
  std::vector<CKRTestItem*> order;
  for (CKRTestItem* item : items)
    item->m_OnBeforeRelease = [&](CKRTestItem* self) {
      EXPECT_EQ(map.Find(self->GetInstanceID()), nullptr);
      order.push_back(self);
    };
  const int destroyedBefore = CKRTestItem::s_Destroyed;
  map.RemoveAll(true);
  EXPECT_EQ(order, items);
  EXPECT_EQ(map.GetCount(), 0);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 5);
}

TEST(CKRObjGuidPtrMap, RemoveAllWithoutReleaseKeepsElements) {
  CKRObjGuidPtrMap<IKRObject> map;
  IKRCollection& collection = map;
  CKRTestItem* a = NewTestItem();
  EXPECT_EQ(collection.Add(a), 1);
  EXPECT_EQ(collection.Find(a->GetInstanceID()), a);
  const int destroyedBefore = CKRTestItem::s_Destroyed;
  collection.RemoveAll(false);
  EXPECT_EQ(collection.GetCount(), 0);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore);
  EXPECT_EQ(CKRTestItem::GetCKRTestItemType()->GetInstance(a->GetInstanceID()), a);
  a->Release();
}
