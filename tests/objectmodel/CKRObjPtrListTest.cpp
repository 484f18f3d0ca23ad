#include <krCoreLib/objectmodel/CKRObjPtrList.h>

#include "KRTestObjects.h"

#include <gtest/gtest.h>

#include <vector>

namespace {

std::vector<CKRTestItem*> Walk(CKRObjPtrList<CKRTestItem>::Iterator it) {
  std::vector<CKRTestItem*> seen;
  for (CKRTestItem* item = it.Next(1); item != nullptr; item = it.Next(0))
    seen.push_back(item);
  return seen;
}

void ReleaseAll(const std::vector<CKRTestItem*>& items) {
  for (CKRTestItem* item : items)
    item->Release();
}

}  // namespace

TEST(CKRObjPtrList, AddRefusesNullDuplicatesAndForeignClasses) {
  CKRTestItem* a = NewTestItem();
  CKRTestItem* b = NewTestItem();
  auto* other = static_cast<CKRObjectImpl*>(CKRObjectImpl::GetCKRObjectImplType()->CreateInstance(CKRGuid()));
  CKRObjPtrList<CKRTestItem> list;
  EXPECT_EQ(list.Add(a), 1);
  EXPECT_EQ(list.Add(a), 0);
  EXPECT_EQ(list.Add(nullptr), 0);
  EXPECT_EQ(list.Add(other), 0);  // not a CKRTestItem
  EXPECT_EQ(list.Add(b), 1);
  EXPECT_EQ(list.GetCount(), 2);
  EXPECT_EQ(Walk(list.GetIterator()), (std::vector<CKRTestItem*>{a, b}));

  // The untyped view takes any object.
  CKRObjPtrList<IKRObject> any;
  IKRCollection& collection = any;
  EXPECT_EQ(collection.Add(other), 1);
  EXPECT_EQ(collection.Add(a), 1);
  EXPECT_EQ(collection.GetCount(), 2);
  ReleaseAll({a, b});
  other->Release();
}

TEST(CKRObjPtrList, FindAndRemove) {
  CKRTestItem* a = NewTestItem();
  // An untracked twin: another object with a's instance ID.
  CKRTestItem* twin = NewTestItem(a->GetInstanceID());
  CKRTestItem* b = NewTestItem();
  CKRTestItem* absent = NewTestItem();
  CKRObjPtrList<CKRTestItem> list;
  list.Add(twin);
  list.Add(a);
  list.Add(b);
  EXPECT_EQ(list.Find(a->GetInstanceID()), twin);  // the first in list order
  EXPECT_EQ(list.Find(b->GetInstanceID()), b);
  EXPECT_EQ(list.Find(absent->GetInstanceID()), nullptr);
  EXPECT_EQ(list.Find(CKRGuid()), nullptr);

  EXPECT_EQ(list.Remove(absent), nullptr);
  EXPECT_EQ(list.Remove(nullptr), nullptr);
  EXPECT_EQ(list.GetCount(), 3);
  EXPECT_EQ(list.Remove(twin), twin);
  EXPECT_EQ(list.Remove(twin), nullptr);
  EXPECT_EQ(list.Find(a->GetInstanceID()), a);
  EXPECT_FALSE(list.Contains(twin));
  EXPECT_TRUE(list.Contains(b));
  ReleaseAll({a, twin, b, absent});
}

TEST(CKRObjPtrList, RemoveAllReleasesEachElementOnce) {
  const int destroyedBefore = CKRTestItem::s_Destroyed;
  CKRObjPtrList<CKRTestItem> kept;
  CKRTestItem* x = NewTestItem();
  CKRTestItem* y = NewTestItem();
  kept.Add(x);
  kept.Add(y);
  kept.RemoveAll(false);
  EXPECT_EQ(kept.GetCount(), 0);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore);  // never released

  // One element removes itself from the list while it is released, one
  // refuses to be released: each is asked once, and the list ends empty.
  CKRObjPtrList<CKRTestItem> list;
  int asked = 0;
  CKRTestItem* selfRemoving = NewTestItem();
  selfRemoving->m_OnBeforeRelease = [&](CKRTestItem* item) {
    ++asked;
    list.Remove(item);
  };
  CKRTestItem* refusing = NewTestItem();
  refusing->m_AllowRelease = 0;
  refusing->m_OnBeforeRelease = [&](CKRTestItem*) { ++asked; };
  CKRTestItem* plain = NewTestItem();
  plain->m_OnBeforeRelease = [&](CKRTestItem*) { ++asked; };
  list.Add(selfRemoving);
  list.Add(refusing);
  list.Add(plain);
  list.RemoveAll(true);
  EXPECT_EQ(list.GetCount(), 0);
  EXPECT_EQ(asked, 3);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 2);
  EXPECT_EQ(CKRTestItem::GetCKRTestItemType()->GetInstance(refusing->GetInstanceID()), refusing);

  refusing->m_AllowRelease = 1;
  refusing->m_OnBeforeRelease = nullptr;
  ReleaseAll({x, y, refusing});
}

TEST(CKRObjPtrList, IteratorsWalkBothDirections) {
  CKRObjPtrList<CKRTestItem> list;
  CKRObjPtrList<CKRTestItem>::Iterator empty = list.GetIterator();
  EXPECT_TRUE(empty.IsValid());
  EXPECT_EQ(empty.Next(1), nullptr);

  std::vector<CKRTestItem*> items = {NewTestItem(), NewTestItem(), NewTestItem()};
  for (CKRTestItem* item : items)
    list.Add(item);
  auto forward = list.GetIterator();
  EXPECT_EQ(forward.Next(1), items[0]);
  EXPECT_EQ(forward.Next(0), items[1]);
  EXPECT_EQ(forward.Next(0), items[2]);
  EXPECT_EQ(forward.Next(0), nullptr);
  forward.Reset(0);  // no effect
  EXPECT_EQ(forward.Next(0), nullptr);
  forward.Reset(1);
  EXPECT_EQ(forward.Next(0), items[0]);

  auto backward = list.GetReverseIterator();
  EXPECT_EQ(backward.Next(1), items[2]);
  EXPECT_EQ(backward.Next(0), items[1]);
  EXPECT_EQ(backward.Next(0), items[0]);
  EXPECT_EQ(backward.Next(0), nullptr);

  // Through the interface, as a storage back-end walks it.
  IKRIterator& view = forward;
  EXPECT_EQ(view.Next(1), items[0]);

  std::vector<CKRTestItem*> ranged(list.begin(), list.end());
  EXPECT_EQ(ranged, items);

  CKRObjPtrList<CKRTestItem>::Iterator unbound;
  CKRObjPtrList<CKRTestItem>::ReverseIterator unboundReverse;
  EXPECT_FALSE(unbound.IsValid());
  EXPECT_FALSE(unboundReverse.IsValid());
  unbound.Reset(1);
  EXPECT_EQ(unbound.Next(1), nullptr);
  EXPECT_EQ(unboundReverse.Next(1), nullptr);
  ReleaseAll(items);
}
