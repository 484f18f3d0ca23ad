// SKRGuidTableT: pointers to T by CKRGuid in one open-addressing array
// (linear probing, at most half full): the index of a type's tracked
// instances and of CKRObjGuidPtrMap. Finding, adding and removing take
// constant time on average and allocate only when the table grows, so
// adding and removing entries costs no allocation once the table has held
// as many before. Removal shifts later entries back, so lookups stay fast
// after many removals. Entries are unordered. Not synchronised.
#pragma once

#include <krCoreLib/objectmodel/CKRGuid.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

template <class T>
class SKRGuidTableT {
public:
  // The object under `id`, or null.
  T* Find(const CKRGuid& id) const {
    if (m_Count == 0)
      return nullptr;
    for (std::size_t slot = Home(id);; slot = Next(slot)) {
      const SKRSlot& entry = m_Slots[slot];
      if (entry.m_pObject == nullptr)
        return nullptr;
      if (id == entry.m_ID)
        return entry.m_pObject;
    }
  }

  // False when `id` is taken (the first object keeps it) or `object` is null.
  bool Add(const CKRGuid& id, T* object) {
    if (object == nullptr || Find(id) != nullptr)
      return false;
    if (2 * (m_Count + 1) > m_Slots.size())
      Grow();
    Place(id, object);
    ++m_Count;
    return true;
  }

  // Removes the entry under `id` when it holds `object`: true, else false.
  bool Remove(const CKRGuid& id, const T* object) {
    if (m_Count == 0)
      return false;
    std::size_t hole = Home(id);
    for (;; hole = Next(hole)) {
      const SKRSlot& entry = m_Slots[hole];
      if (entry.m_pObject == nullptr)
        return false;
      if (id == entry.m_ID)
        break;
    }
    if (m_Slots[hole].m_pObject != object)
      return false;
    // Close the gap: an entry further on moves into the hole unless its
    // home lies cyclically in (hole, next].
    for (std::size_t next = Next(hole); m_Slots[next].m_pObject != nullptr; next = Next(next)) {
      const std::size_t home = Home(CKRGuid(m_Slots[next].m_ID));
      const bool staysPut = hole <= next ? (hole < home && home <= next) : (hole < home || home <= next);
      if (!staysPut) {
        m_Slots[hole] = m_Slots[next];
        hole = next;
      }
    }
    m_Slots[hole] = SKRSlot();
    --m_Count;
    return true;
  }

  std::size_t Size() const { return m_Count; }

  // Room for `count` entries without growing (never shrinks).
  void Reserve(std::size_t count) {
    while (2 * count > m_Slots.size())
      Grow();
  }

  // A hint only: starts loading the slot where a look-up of `id` begins, so
  // that a caller working through many IDs overlaps their cache misses.
  void Prefetch(const CKRGuid& id) const {
    if (!m_Slots.empty())
      __builtin_prefetch(&m_Slots[Home(id)]);
  }

  // Calls function(id, object) for every entry, in no particular order.
  template <class TFunction>
  void ForEach(TFunction&& function) const {
    for (const SKRSlot& entry : m_Slots)
      if (entry.m_pObject != nullptr)
        function(CKRGuid(entry.m_ID), entry.m_pObject);
  }

private:
  // The plain GUID, not a CKRGuid (whose virtual destructor adds a pointer):
  // 24 bytes a slot instead of 32, so a large table misses the cache less.
  struct SKRSlot {
    GUID m_ID{};
    T* m_pObject = nullptr;  // null: empty
  };

  // The high bits of a second multiplication: std::hash<CKRGuid> leaves
  // IDs that differ only in their last bytes equal in their low bits.
  std::size_t Home(const CKRGuid& id) const {
    std::uint64_t hash = std::hash<CKRGuid>()(id);
    hash = (hash ^ (hash >> 32)) * 0x9E3779B97F4A7C15ull;
    return std::size_t(hash >> m_Shift);
  }
  std::size_t Next(std::size_t slot) const { return (slot + 1) & (m_Slots.size() - 1); }

  void Place(const CKRGuid& id, T* object) {
    std::size_t slot = Home(id);
    while (m_Slots[slot].m_pObject != nullptr)
      slot = Next(slot);
    m_Slots[slot] = {id.GetGUID(), object};
  }

  void Grow() {
    std::vector<SKRSlot> old(m_Slots.empty() ? 16 : 2 * m_Slots.size());
    old.swap(m_Slots);
    m_Shift = 64;
    for (std::size_t size = m_Slots.size(); size > 1; size >>= 1)
      --m_Shift;
    for (const SKRSlot& entry : old)
      if (entry.m_pObject != nullptr)
        Place(CKRGuid(entry.m_ID), entry.m_pObject);
  }

  std::vector<SKRSlot> m_Slots;  // a power of two long
  std::size_t m_Count = 0;
  unsigned m_Shift = 64;  // 64 - log2 of the slot count
};
