#include <krCoreLib/objectmodel/CKRObjPtrList.h>

#include "KRTestObjects.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <list>
#include <random>
#include <set>
#include <utility>
#include <vector>

namespace {

using Items = std::vector<CKRTestItem*>;

template <class TIterator>
Items Walk(TIterator&& it) {
  Items seen;
  for (CKRTestItem* item = it.Next(1); item != nullptr; item = it.Next(0))
    seen.push_back(item);
  return seen;
}

}  // namespace

TEST(CKRObjPtrList, AddFindAndRemove) {
  CKRTestItem* a = NewTestItem();
  // An untracked twin: another object with a's instance ID.
  CKRTestItem* twin = NewTestItem(a->GetInstanceID());
  CKRTestItem* absent = NewTestItem();
  auto* other = static_cast<CKRObjectImpl*>(CKRObjectImpl::GetCKRObjectImplType()->CreateInstance(CKRGuid()));
  CKRObjPtrList<CKRTestItem> list;
  EXPECT_EQ(list.Add(twin), 1);
  EXPECT_EQ(list.Add(a), 1);
  EXPECT_EQ(list.Add(a), 0);
  EXPECT_EQ(list.Add(nullptr), 0);
  EXPECT_EQ(list.Add(other), 0);  // not a CKRTestItem
  EXPECT_EQ(list.Find(a->GetInstanceID()), twin);  // the first in list order
  EXPECT_EQ(list.Find(absent->GetInstanceID()), nullptr);
  EXPECT_EQ(list.Remove(absent), nullptr);
  EXPECT_EQ(list.Remove(twin), twin);
  EXPECT_EQ(list.Remove(twin), nullptr);
  EXPECT_EQ(list.Find(a->GetInstanceID()), a);
  EXPECT_EQ(list.GetCount(), 1);
  // A copy is a list of its own: removing from it leaves the original, and
  // it still refuses what it holds.
  CKRObjPtrList<CKRTestItem> copy = list;
  EXPECT_EQ(copy.Add(a), 0);
  EXPECT_EQ(copy.Remove(a), a);
  EXPECT_TRUE(list.Contains(a) && !copy.Contains(a));
  copy = list;
  EXPECT_EQ(copy.Remove(a), a);
  CKRObjPtrList<CKRTestItem> moved = std::move(list);
  EXPECT_EQ(moved.Remove(a), a);
  EXPECT_EQ(moved.GetCount(), 0);
  // The untyped view takes any object.
  CKRObjPtrList<IKRObject> any;
  EXPECT_EQ(static_cast<IKRCollection&>(any).Add(other), 1);
  for (IKRObject* object : std::vector<IKRObject*>{a, twin, absent, other})
    object->Release();
}

// Random additions and removals against a plain list: order, membership and
// count agree throughout, also after the index has grown and emptied.
TEST(CKRObjPtrList, RandomEditsKeepOrderAndMembership) {
  const unsigned seed = KRTestSeed();
  std::mt19937 random(seed);
  Items pool;
  for (int i = 0; i < 300; ++i)
    pool.push_back(NewTestItem());
  CKRObjPtrList<CKRTestItem> list;
  std::list<CKRTestItem*> model;
  for (int step = 0; step < 30000; ++step) {
    CKRTestItem* item = pool[random() % pool.size()];
    const bool listed = std::find(model.begin(), model.end(), item) != model.end();
    // Mostly additions in the first half, mostly removals in the second.
    const bool add = (random() % 100) < (step % 10000 < 5000 ? 70u : 30u);
    if (add) {
      ASSERT_EQ(list.Add(item), listed ? 0 : 1) << "step " << step;
      if (!listed)
        model.push_back(item);
    } else {
      ASSERT_EQ(list.Remove(item), listed ? item : nullptr) << "step " << step;
      model.remove(item);
    }
    ASSERT_EQ(list.Contains(item), add);
    if (step % 997 == 0) {
      ASSERT_EQ(Items(list.begin(), list.end()), Items(model.begin(), model.end())) << "step " << step;
      ASSERT_EQ(Walk(list.GetReverseIterator()), Items(model.rbegin(), model.rend()));
    }
  }
  EXPECT_EQ(list.GetCount(), int(model.size()));
  for (CKRTestItem* item : pool)
    item->Release();
}

// Enough elements for the index to place them by their memory pages:
// removals in random order and additions again keep every one findable.
TEST(CKRObjPtrList, LargeListsKeepEveryElementFindable) {
  std::mt19937 random(KRTestSeed());
  Items items;
  for (int i = 0; i < 70000; ++i)
    items.push_back(NewTestItem());
  CKRObjPtrList<CKRTestItem> list;
  for (CKRTestItem* item : items)
    ASSERT_EQ(list.Add(item), 1);
  Items removed = items;
  std::shuffle(removed.begin(), removed.end(), random);
  removed.resize(items.size() / 2);
  for (CKRTestItem* item : removed)
    ASSERT_EQ(list.Remove(item), item);
  const std::set<CKRTestItem*> gone(removed.begin(), removed.end());
  Items kept;
  for (CKRTestItem* item : items) {
    ASSERT_EQ(list.Contains(item), gone.count(item) == 0);
    if (gone.count(item) == 0)
      kept.push_back(item);
  }
  EXPECT_EQ(Items(list.begin(), list.end()), kept);
  for (CKRTestItem* item : removed)
    ASSERT_EQ(list.Add(item), 1);
  EXPECT_EQ(list.GetCount(), int(items.size()));
  list.RemoveAll(false);
  for (CKRTestItem* item : items)
    item->Release();
}

TEST(CKRObjPtrList, RemoveAllReleasesEachElementOnce) {
  const int destroyedBefore = CKRTestItem::s_Destroyed;
  CKRObjPtrList<CKRTestItem> list;
  // One element removes itself from the list while it is released, one
  // refuses to be released: each is asked once, and the list ends empty.
  int asked = 0;
  const Items items = {NewTestItem(), NewTestItem(), NewTestItem()};
  for (CKRTestItem* item : items) {
    item->m_OnBeforeRelease = [&](CKRTestItem* self) {
      ++asked;
      if (self == items[0])
        list.Remove(self);
    };
    list.Add(item);
  }
  items[1]->m_AllowRelease = 0;
  list.RemoveAll(false);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore);  // none released
  for (CKRTestItem* item : items)
    list.Add(item);
  list.RemoveAll(true);
  EXPECT_EQ(list.GetCount(), 0);
  EXPECT_EQ(asked, 3);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 2);
  EXPECT_EQ(CKRTestItem::GetCKRTestItemType()->GetInstance(items[1]->GetInstanceID()), items[1]);
  items[1]->m_AllowRelease = 1;
  items[1]->m_OnBeforeRelease = nullptr;
  items[1]->Release();
}

TEST(CKRObjPtrList, IteratorsWalkBothDirections) {
  CKRObjPtrList<CKRTestItem> list;
  EXPECT_TRUE(list.GetIterator().IsValid());
  EXPECT_TRUE(Walk(list.GetIterator()).empty());
  CKRTestItem* item = NewTestItem();
  list.Add(item);
  auto forward = list.GetIterator();
  EXPECT_EQ(forward.Next(1), item);
  forward.Reset(0);  // no effect
  EXPECT_EQ(forward.Next(0), nullptr);
  forward.Reset(1);
  // Through the interface, as a storage back-end walks it.
  EXPECT_EQ(static_cast<IKRIterator&>(forward).Next(0), item);
  CKRObjPtrList<CKRTestItem>::ReverseIterator unbound;
  EXPECT_FALSE(unbound.IsValid());
  EXPECT_EQ(unbound.Next(1), nullptr);
  item->Release();
}
