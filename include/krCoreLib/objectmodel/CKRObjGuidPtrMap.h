// CKRObjGuidPtrMap: object pointers keyed by instance ID.
//
// Each element is stored under its instance ID at the time it was added and
// walked in ascending ID order (the order of CKRGuid). The map does not own
// its elements: removing one never destroys it; only RemoveAll(true) asks
// each element to Release() itself. `T` is IKRObject or a class derived from
// it; through the IKRCollection view an element of another class is refused.
// Not synchronised.
//
// Cost: Find, Add and Remove take constant time on average (a hash table);
// the ascending order is kept apart and brought up to date when a walk needs
// it (after n additions, once, in O(n log n)). An iterator remembers the ID
// it returned last, so it survives additions and removals of any element,
// its own included: it goes on with the next greater ID present.
#pragma once

#include <krCoreLib/objectmodel/IKRCollection.h>
#include <krCoreLib/objectmodel/SKRGuidTableT.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <type_traits>
#include <utility>
#include <vector>

template <class T>
class CKRObjGuidPtrMap : public IKRCollection {
public:
  // Ascending instance ID.
  class Iterator : public IKRIterator {
  public:
    Iterator() = default;
    explicit Iterator(CKRObjGuidPtrMap* map) : m_pMap(map) { Reset(1); }
    T* Next(int restart) override {
      if (restart)
        Reset(1);
      if (m_pMap == nullptr || m_AtEnd)
        return nullptr;
      CKRGuid id;
      T* element = m_pMap->NextAfter(m_Last, m_Started, id);
      if (element == nullptr) {
        m_AtEnd = true;
        return nullptr;
      }
      m_Last = id;
      m_Started = true;
      return element;
    }
    void Reset(int reset) override {
      if (reset && m_pMap != nullptr) {
        m_Started = false;
        m_AtEnd = false;
      }
    }
    bool IsValid() const override { return m_pMap != nullptr; }

  private:
    CKRGuid m_Last;  // the ID returned last, when started
    bool m_Started = false;
    bool m_AtEnd = false;
    CKRObjGuidPtrMap* m_pMap = nullptr;
  };

  // Read-only walk over (instance ID, element) pairs for range-for loops;
  // the map must not change during it.
  class ConstIterator {
  public:
    using iterator_category = std::forward_iterator_tag;
    using value_type = std::pair<CKRGuid, T*>;
    using difference_type = std::ptrdiff_t;
    using pointer = void;
    using reference = value_type;

    ConstIterator() = default;
    value_type operator*() const { return {*m_pID, m_pMap->m_Index.Find(*m_pID)}; }
    ConstIterator& operator++() {
      ++m_pID;
      SkipAbsent();
      return *this;
    }
    bool operator==(const ConstIterator& other) const { return m_pID == other.m_pID; }

  private:
    friend class CKRObjGuidPtrMap;
    ConstIterator(const CKRObjGuidPtrMap* map, const CKRGuid* id, const CKRGuid* end)
        : m_pMap(map), m_pID(id), m_pEnd(end) {
      SkipAbsent();
    }
    void SkipAbsent() {
      while (m_pID != m_pEnd && m_pMap->m_Index.Find(*m_pID) == nullptr)
        ++m_pID;
    }
    const CKRObjGuidPtrMap* m_pMap = nullptr;
    const CKRGuid* m_pID = nullptr;
    const CKRGuid* m_pEnd = nullptr;
  };

  int GetCount() const override { return static_cast<int>(m_Index.Size()); }

  T* Find(CKRGuid instanceID) override { return m_Index.Find(instanceID); }

  // With `release` false, empties the map. With `release` true, takes the
  // entries in ascending ID order, erasing each before releasing its element.
  void RemoveAll(bool release) override {
    if (!release) {
      Clear();
      return;
    }
    const std::vector<CKRGuid> ids = Sorted();
    for (const CKRGuid& id : ids)
      if (T* element = m_Index.Find(id)) {
        m_Index.Remove(id, element);
        element->Release();
      }
    if (m_Index.Size() == 0)
      Clear();
  }

  // 0 for null, for an element that is not a T and when an element is
  // already stored under the element's instance ID.
  int Add(IKRObject* element) override {
    // Checked here, not at class scope: a class may hold a map of itself.
    static_assert(std::is_base_of_v<IKRObject, T>, "elements are framework objects");
    T* typed = CastElement<T>(element);
    if (typed == nullptr)
      return 0;
    const CKRGuid id = element->GetInstanceID();
    if (!m_Index.Add(id, typed))
      return 0;
    m_Recent.push_back(id);
    return 1;
  }

  // Removes the entry under the element's instance ID when it holds this
  // very element. Another object with the same ID (two live objects may
  // share one) keeps its entry, and the result is null.
  T* Remove(IKRObject* element) override {
    if (element == nullptr)
      return nullptr;
    const CKRGuid id = element->GetInstanceID();
    T* removed = m_Index.Find(id);
    if (removed == nullptr || static_cast<IKRObject*>(removed) != element)
      return nullptr;
    // Its ID stays in the order until the next merge; walks skip it.
    m_Index.Remove(id, removed);
    return removed;
  }

  Iterator GetIterator() { return Iterator(this); }

  // Every (instance ID, element) pair in ascending ID order, appended to
  // `entries`. One sequential pass over the hash table and a sort: cheaper
  // than a walk, which looks each ID up again, for taking a whole large map.
  void GetEntries(std::vector<std::pair<CKRGuid, T*>>& entries) const {
    // Sorted as two integers per ID that order exactly as CKRGuid does
    // (Data1, Data2, Data3, then the bytes of Data4 in turn): far cheaper
    // to compare than the field-by-field order.
    struct SKRKeyed {
      std::uint64_t m_High;
      std::uint64_t m_Low;
      T* m_pElement;
    };
    std::vector<SKRKeyed> keyed;
    keyed.reserve(m_Index.Size());
    m_Index.ForEach([&](const CKRGuid& id, T* element) {
      const GUID& guid = id.GetGUID();
      std::uint64_t low = 0;
      for (unsigned char byte : guid.Data4)
        low = (low << 8) | byte;
      keyed.push_back({(std::uint64_t(guid.Data1) << 32) | (std::uint64_t(guid.Data2) << 16) | guid.Data3, low, element});
    });
    std::sort(keyed.begin(), keyed.end(), [](const SKRKeyed& a, const SKRKeyed& b) {
      return a.m_High != b.m_High ? a.m_High < b.m_High : a.m_Low < b.m_Low;
    });
    entries.reserve(entries.size() + keyed.size());
    for (const SKRKeyed& entry : keyed) {
      GUID guid{};
      guid.Data1 = decltype(guid.Data1)(entry.m_High >> 32);
      guid.Data2 = decltype(guid.Data2)(entry.m_High >> 16);
      guid.Data3 = decltype(guid.Data3)(entry.m_High);
      for (int i = 7; i >= 0; --i)
        guid.Data4[i] = (unsigned char)(entry.m_Low >> (8 * (7 - i)));
      entries.emplace_back(CKRGuid(guid), entry.m_pElement);
    }
  }

  ConstIterator begin() const {
    const std::vector<CKRGuid>& ids = Sorted();
    return ConstIterator(this, ids.data(), ids.data() + ids.size());
  }
  ConstIterator end() const {
    const std::vector<CKRGuid>& ids = Sorted();
    return ConstIterator(this, ids.data() + ids.size(), ids.data() + ids.size());
  }

private:
  void Clear() {
    m_Index = SKRGuidTableT<T>();
    m_Sorted.clear();
    m_Recent.clear();
  }

  // The IDs in ascending order, with the recent additions merged in and the
  // removed ones dropped.
  const std::vector<CKRGuid>& Sorted() const {
    if (!m_Recent.empty() || m_Sorted.size() != m_Index.Size()) {
      std::sort(m_Recent.begin(), m_Recent.end());
      std::vector<CKRGuid> merged;
      merged.reserve(m_Sorted.size() + m_Recent.size());
      std::merge(m_Sorted.begin(), m_Sorted.end(), m_Recent.begin(), m_Recent.end(), std::back_inserter(merged));
      merged.erase(std::unique(merged.begin(), merged.end()), merged.end());
      merged.erase(std::remove_if(merged.begin(), merged.end(),
                                  [&](const CKRGuid& id) { return m_Index.Find(id) == nullptr; }),
                   merged.end());
      m_Sorted.swap(merged);
      m_Recent.clear();
    }
    return m_Sorted;
  }

  // The element with the smallest ID greater than `last` (any, when not
  // `started`), and its ID; null when there is none. Recent additions are
  // merged once they outnumber the square root of the map, so that a walk
  // that interleaves with additions stays far from quadratic.
  T* NextAfter(const CKRGuid& last, bool started, CKRGuid& id) {
    if (m_Recent.size() > 16 + std::size_t(std::sqrt(double(m_Sorted.size()))))
      Sorted();
    const auto greater = [&](const CKRGuid& candidate) { return !started || last < candidate; };
    const CKRGuid* best = nullptr;
    auto at = started ? std::upper_bound(m_Sorted.begin(), m_Sorted.end(), last) : m_Sorted.begin();
    for (; at != m_Sorted.end(); ++at)
      if (m_Index.Find(*at) != nullptr) {
        best = &*at;
        break;
      }
    for (const CKRGuid& candidate : m_Recent)
      if (greater(candidate) && (best == nullptr || candidate < *best) && m_Index.Find(candidate) != nullptr)
        best = &candidate;
    if (best == nullptr)
      return nullptr;
    id = *best;
    return m_Index.Find(id);
  }

  SKRGuidTableT<T> m_Index;
  // IDs in ascending order as of the last merge (some may have left since),
  // and the IDs added after it, unordered.
  mutable std::vector<CKRGuid> m_Sorted;
  mutable std::vector<CKRGuid> m_Recent;
};

extern template class KRCORELIB_API CKRObjGuidPtrMap<IKRObject>;
