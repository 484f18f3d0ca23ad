// CKRObjPtrList: an ordered list of object pointers.
//
// Elements are kept in insertion order, each pointer at most once, never
// null. The list does not own its elements: removing one never destroys it;
// only RemoveAll(true) asks each element to Release() itself. `T` is
// IKRObject or a class derived from it; through the IKRCollection view an
// element of another class is refused. Not synchronised.
#pragma once

#include <krCoreLib/objectmodel/IKRCollection.h>

#include <algorithm>
#include <list>
#include <type_traits>

template <class T>
class CKRObjPtrList : public IKRCollection {
  static_assert(std::is_base_of_v<IKRObject, T>, "elements are framework objects");
  using List = std::list<T*>;

public:
  // First to last.
  class Iterator : public IKRIterator {
  public:
    Iterator() = default;
    explicit Iterator(CKRObjPtrList* list) : m_pList(list) { Reset(1); }
    T* Next(int restart) override {
      if (restart)
        Reset(1);
      if (m_pList == nullptr || m_Position == m_pList->m_List.end())
        return nullptr;
      return *m_Position++;
    }
    void Reset(int reset) override {
      if (reset && m_pList != nullptr)
        m_Position = m_pList->m_List.begin();
    }
    bool IsValid() const override { return m_pList != nullptr; }

  private:
    typename List::iterator m_Position{};
    CKRObjPtrList* m_pList = nullptr;
  };

  // Last to first.
  class ReverseIterator : public IKRIterator {
  public:
    ReverseIterator() = default;
    explicit ReverseIterator(CKRObjPtrList* list) : m_pList(list) { Reset(1); }
    T* Next(int restart) override {
      if (restart)
        Reset(1);
      if (m_pList == nullptr || m_Position == m_pList->m_List.rend())
        return nullptr;
      return *m_Position++;
    }
    void Reset(int reset) override {
      if (reset && m_pList != nullptr)
        m_Position = m_pList->m_List.rbegin();
    }
    bool IsValid() const override { return m_pList != nullptr; }

  private:
    typename List::reverse_iterator m_Position{};
    CKRObjPtrList* m_pList = nullptr;
  };

  int GetCount() const override { return static_cast<int>(m_List.size()); }

  // The first element, in list order, with that instance ID; null if none.
  T* Find(CKRGuid instanceID) override {
    for (T* element : m_List)
      if (element->GetInstanceID() == instanceID)
        return element;
    return nullptr;
  }

  // With `release` false, empties the list. With `release` true, releases
  // the first element and unlinks it (unless its Release already did),
  // until the list is empty; each element is released once.
  void RemoveAll(bool release) override {
    if (!release) {
      m_List.clear();
      return;
    }
    while (!m_List.empty()) {
      T* first = m_List.front();
      first->Release();
      // Only the pointer value is compared: the element may be gone.
      const auto at = std::find(m_List.begin(), m_List.end(), first);
      if (at != m_List.end())
        m_List.erase(at);
    }
  }

  // 0 for null, for an element that is not a T and for one already listed.
  int Add(IKRObject* element) override {
    T* typed = CastElement<T>(element);
    if (typed == nullptr || Contains(typed))
      return 0;
    m_List.push_back(typed);
    return 1;
  }

  // Unlinks the element; null when it is not listed.
  T* Remove(IKRObject* element) override {
    if (element == nullptr)
      return nullptr;
    const auto at = std::find_if(m_List.begin(), m_List.end(),
                                 [&](T* listed) { return static_cast<IKRObject*>(listed) == element; });
    if (at == m_List.end())
      return nullptr;
    T* removed = *at;
    m_List.erase(at);
    return removed;
  }

  bool Contains(const IKRObject* element) const {
    return element != nullptr &&
           std::any_of(m_List.begin(), m_List.end(),
                       [&](const T* listed) { return static_cast<const IKRObject*>(listed) == element; });
  }

  Iterator GetIterator() { return Iterator(this); }
  ReverseIterator GetReverseIterator() { return ReverseIterator(this); }

  // Read-only walk for range-for loops.
  typename List::const_iterator begin() const { return m_List.begin(); }
  typename List::const_iterator end() const { return m_List.end(); }

private:
  List m_List;
};

extern template class KRCORELIB_API CKRObjPtrList<IKRObject>;
