// How archives, documents and manifests release the children they own:
// one child by ID, or all of them in ascending ID order.
#pragma once

#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>

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
  for (const auto& [id, child] : taken)
    if (child->Release() == 0) {
      children.Add(child);
      result = 0;
    }
  return result;
}
