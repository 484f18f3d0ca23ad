// How archives, documents and manifests release the children they own:
// one child by ID, or all of them in ascending ID order.
#pragma once

#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>

#include <cstddef>
#include <utility>
#include <vector>

// 1 when no child has `id`; otherwise the child's Release result. A child
// that refuses its release stays in the map (it is still owned).
template <class T>
int KRReleaseChild(CKRObjGuidPtrMap<T>& children, CKRGuid id) {
  T* child = children.Find(id);
  if (child == nullptr)
    return 1;
  children.Remove(child);
  if (child->Release() != 0)
    return 1;
  children.Add(child);
  return 0;
}

// Releases every child in ascending ID order: 1, or 0 when a child refused
// (it stays). The children are taken out in one pass over the map's table
// first, so that each release costs no look-up.
template <class T>
int KRReleaseChildren(CKRObjGuidPtrMap<T>& children) {
  std::vector<std::pair<CKRGuid, T*>> taken;
  children.GetEntries(taken);
  children.RemoveAll(false);
  int result = 1;
  // The children lie scattered in memory and are visited in ID order: their
  // first cache lines are prefetched a few releases ahead.
  constexpr std::size_t kAhead = 8;
  for (std::size_t i = 0; i < taken.size(); ++i) {
    if (i + kAhead < taken.size())
      __builtin_prefetch(taken[i + kAhead].second);
    T* child = taken[i].second;
    if (child->Release() == 0) {
      children.Add(child);
      result = 0;
    }
  }
  return result;
}
