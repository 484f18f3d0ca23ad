// CKRObjGuidPtrMap: object pointers keyed by instance ID.
//
// Each element is stored under its instance ID at the time it was added, in
// ascending ID order (the order of CKRGuid). The map does not own its
// elements: removing one never destroys it; only RemoveAll(true) asks each
// element to Release() itself. `T` is IKRObject or a class derived from it;
// through the IKRCollection view an element of another class is refused.
// Not synchronised.
//
// Cost: Find takes constant time on average (a hash index beside the
// ordered map); Add and Remove are logarithmic. Iterators survive additions
// and the removal of other elements.
#pragma once

#include <krCoreLib/objectmodel/IKRCollection.h>
#include <krCoreLib/objectmodel/SKRGuidTableT.h>

#include <map>
#include <type_traits>

template <class T>
class CKRObjGuidPtrMap : public IKRCollection {
  using Map = std::map<CKRGuid, T*>;

public:
  // Ascending instance ID.
  class Iterator : public IKRIterator {
  public:
    Iterator() = default;
    explicit Iterator(CKRObjGuidPtrMap* map) : m_pMap(map) { Reset(1); }
    T* Next(int restart) override {
      if (restart)
        Reset(1);
      if (m_pMap == nullptr || m_Position == m_pMap->m_Map.end())
        return nullptr;
      return (m_Position++)->second;
    }
    void Reset(int reset) override {
      if (reset && m_pMap != nullptr)
        m_Position = m_pMap->m_Map.begin();
    }
    bool IsValid() const override { return m_pMap != nullptr; }

  private:
    typename Map::iterator m_Position{};
    CKRObjGuidPtrMap* m_pMap = nullptr;
  };

  int GetCount() const override { return static_cast<int>(m_Map.size()); }

  T* Find(CKRGuid instanceID) override { return m_Index.Find(instanceID); }

  // With `release` false, empties the map. With `release` true, takes the
  // entries in ascending ID order, erasing each before releasing its element.
  void RemoveAll(bool release) override {
    if (!release) {
      m_Map.clear();
      m_Index = SKRGuidTableT<T>();
      return;
    }
    while (!m_Map.empty()) {
      const auto first = m_Map.begin();
      T* element = first->second;
      if (element == nullptr)
        break;
      m_Index.Remove(first->first, element);
      m_Map.erase(first);
      element->Release();
    }
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
    m_Map.emplace(id, typed);
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
    m_Index.Remove(id, removed);
    m_Map.erase(id);
    return removed;
  }

  Iterator GetIterator() { return Iterator(this); }

  // Read-only walk over (instance ID, element) pairs for range-for loops.
  typename Map::const_iterator begin() const { return m_Map.begin(); }
  typename Map::const_iterator end() const { return m_Map.end(); }

private:
  Map m_Map;
  // The same entries, for Find.
  SKRGuidTableT<T> m_Index;
};

extern template class KRCORELIB_API CKRObjGuidPtrMap<IKRObject>;
