// CKRObjPtrList: an ordered list of object pointers.
//
// Elements are kept in insertion order, each pointer at most once, never
// null. The list does not own its elements: removing one never destroys it;
// only RemoveAll(true) asks each element to Release() itself. `T` is
// IKRObject or a class derived from it; through the IKRCollection view an
// element of another class is refused. Not synchronised.
//
// Cost: Add, Contains and Remove of an element take constant time on
// average. The elements sit in an array of nodes linked in list order, found
// through an open-addressing hash index of node numbers and hash bits:
// 16 bytes a node and at most 16 of index. Find by instance ID walks the list, since an element's
// instance ID may change while it is listed. Removing an element leaves
// iterators at other positions valid. At most 2^32 - 2 elements.
#pragma once

#include <krCoreLib/objectmodel/IKRCollection.h>

#include <bit>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <type_traits>
#include <utility>
#include <vector>

template <class T>
class CKRObjPtrList : public IKRCollection {

  using Index = std::uint32_t;
  static constexpr Index kNone = ~Index(0);

  // A listed element and its neighbours; a free node (null element) links
  // the free nodes through m_Next.
  struct SKRNode {
    T* m_pElement = nullptr;
    Index m_Prev = kNone;
    Index m_Next = kNone;
  };

public:
  // Nodes are numbered, not pointed to, so copies and moves are plain.
  CKRObjPtrList() = default;
  CKRObjPtrList(const CKRObjPtrList&) = default;
  CKRObjPtrList(CKRObjPtrList&& other) noexcept
      : m_Nodes(std::move(other.m_Nodes)), m_Slots(std::move(other.m_Slots)), m_First(other.m_First),
        m_Last(other.m_Last), m_FreeNode(other.m_FreeNode), m_Count(other.m_Count) {
    other.Clear();
  }
  CKRObjPtrList& operator=(const CKRObjPtrList&) = default;
  CKRObjPtrList& operator=(CKRObjPtrList&& other) noexcept {
    if (this != &other) {
      m_Nodes = std::move(other.m_Nodes);
      m_Slots = std::move(other.m_Slots);
      m_First = other.m_First;
      m_Last = other.m_Last;
      m_FreeNode = other.m_FreeNode;
      m_Count = other.m_Count;
      other.Clear();
    }
    return *this;
  }

  // First to last.
  class Iterator : public IKRIterator {
  public:
    Iterator() = default;
    explicit Iterator(CKRObjPtrList* list) : m_pList(list) { Reset(1); }
    T* Next(int restart) override {
      if (restart)
        Reset(1);
      if (m_pList == nullptr || m_Position == kNone)
        return nullptr;
      const SKRNode& node = m_pList->m_Nodes[m_Position];
      m_Position = node.m_Next;
      return node.m_pElement;
    }
    void Reset(int reset) override {
      if (reset && m_pList != nullptr)
        m_Position = m_pList->m_First;
    }
    bool IsValid() const override { return m_pList != nullptr; }

  private:
    Index m_Position = kNone;
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
      if (m_pList == nullptr || m_Position == kNone)
        return nullptr;
      const SKRNode& node = m_pList->m_Nodes[m_Position];
      m_Position = node.m_Prev;
      return node.m_pElement;
    }
    void Reset(int reset) override {
      if (reset && m_pList != nullptr)
        m_Position = m_pList->m_Last;
    }
    bool IsValid() const override { return m_pList != nullptr; }

  private:
    Index m_Position = kNone;
    CKRObjPtrList* m_pList = nullptr;
  };

  // Read-only walk for range-for loops and standard algorithms.
  class ConstIterator {
  public:
    using iterator_category = std::forward_iterator_tag;
    using value_type = T*;
    using difference_type = std::ptrdiff_t;
    using pointer = T* const*;
    using reference = T* const&;

    ConstIterator() = default;
    reference operator*() const { return (*m_pNodes)[m_Position].m_pElement; }
    ConstIterator& operator++() {
      m_Position = (*m_pNodes)[m_Position].m_Next;
      return *this;
    }
    ConstIterator operator++(int) {
      ConstIterator before = *this;
      ++*this;
      return before;
    }
    bool operator==(const ConstIterator& other) const { return m_Position == other.m_Position; }

  private:
    friend class CKRObjPtrList;
    ConstIterator(const std::vector<SKRNode>* nodes, Index position) : m_pNodes(nodes), m_Position(position) {}
    const std::vector<SKRNode>* m_pNodes = nullptr;
    Index m_Position = kNone;
  };

  int GetCount() const override { return static_cast<int>(m_Count); }

  // The first element, in list order, with that instance ID; null if none.
  T* Find(CKRGuid instanceID) override {
    for (Index at = m_First; at != kNone; at = m_Nodes[at].m_Next)
      if (m_Nodes[at].m_pElement->GetInstanceID() == instanceID)
        return m_Nodes[at].m_pElement;
    return nullptr;
  }

  // With `release` false, empties the list. With `release` true, releases
  // the first element and unlinks it (unless its Release already did),
  // until the list is empty; each element is released once.
  void RemoveAll(bool release) override {
    if (release) {
      while (m_First != kNone) {
        T* first = m_Nodes[m_First].m_pElement;
        // Taken before the release: only the pointer value is looked up
        // after it, since the element may be gone.
        const IKRObject* key = first;
        first->Release();
        if (const std::size_t slot = FindSlot(key); slot != kNoSlot)
          Erase(slot);
      }
    }
    Clear();
  }

  // 0 for null, for an element that is not a T and for one already listed.
  int Add(IKRObject* element) override {
    // Checked here, not at class scope: a class may hold a list of itself.
    static_assert(std::is_base_of_v<IKRObject, T>, "elements are framework objects");
    T* typed = CastElement<T>(element);
    if (typed == nullptr || Contains(typed) || m_Count >= kNone - 1)
      return 0;
    if (2 * (std::size_t(m_Count) + 1) > m_Slots.size())
      Rehash(m_Slots.empty() ? 8 : 2 * m_Slots.size());
    Index at = m_FreeNode;
    if (at != kNone) {
      m_FreeNode = m_Nodes[at].m_Next;
    } else {
      at = Index(m_Nodes.size());
      m_Nodes.emplace_back();
    }
    m_Nodes[at] = {typed, m_Last, kNone};
    (m_Last != kNone ? m_Nodes[m_Last].m_Next : m_First) = at;
    m_Last = at;
    ++m_Count;
    Place(at);
    return 1;
  }

  // Unlinks the element; null when it is not listed.
  T* Remove(IKRObject* element) override {
    const std::size_t slot = FindSlot(element);
    if (slot == kNoSlot)
      return nullptr;
    T* removed = m_Nodes[NodeOf(m_Slots[slot])].m_pElement;
    Erase(slot);
    return removed;
  }

  bool Contains(const IKRObject* element) const { return FindSlot(element) != kNoSlot; }

  Iterator GetIterator() { return Iterator(this); }
  ReverseIterator GetReverseIterator() { return ReverseIterator(this); }

  ConstIterator begin() const { return ConstIterator(&m_Nodes, m_First); }
  ConstIterator end() const { return ConstIterator(&m_Nodes, kNone); }

private:
  const IKRObject* KeyOf(Index node) const { return m_Nodes[node].m_pElement; }

  // An index slot holds a node number in its low half and the element's
  // tag (see Tag) in its high half, so that probes and the shifts of Erase
  // compare and place entries without reading the nodes (each read of a
  // node is a cache miss in a large list).
  using Entry = std::uint64_t;
  static constexpr Entry kEmpty = ~Entry(0);
  static constexpr std::size_t kNoSlot = ~std::size_t(0);
  static Index NodeOf(Entry entry) { return Index(entry); }
  static std::uint32_t TagOf(Entry entry) { return std::uint32_t(entry >> 32); }
  static Entry MakeEntry(std::uint32_t tag, Index node) { return (Entry(tag) << 32) | node; }

  // Where an element goes. Objects made one after another sit next to each
  // other in memory, and a list is mostly filled, searched and emptied in
  // that order: a large index that scatters them costs a cache and TLB miss
  // per operation. So the memory page of an element (4 KiB, the smallest
  // page size) picks a window of kWindowBits slots at random, and the
  // element's 16-byte granule in the page (malloc's alignment) a fixed slot
  // in it, 2^(kWindowBits - 8) slots from its neighbours. A window is thus at
  // most 1/32 full even for the densest objects (16 bytes), and at half load
  // some 16 windows overlap any slot, so the load stays near its mean
  // everywhere; narrower windows let a few dense pages overlap and merge
  // into runs of hundreds of slots. Measured for 10^3 .. 4 * 10^6 elements
  // (malloc'd objects of 16 to 200 bytes, strides of 16 bytes to 1 MiB,
  // random addresses): mean probe lengths 0.2 .. 0.5 and longest 2 .. 65,
  // as for a fully mixed pointer. An index of fewer than 2^kLocalBits slots
  // (1 MiB) stays in the cache anyway and mixes the tag fully.
  static constexpr unsigned kPageBits = 12;
  static constexpr unsigned kGranuleBits = 4;
  static constexpr unsigned kWindowBits = 13;
  static constexpr unsigned kLocalBits = 17;
  // The tag keeps 24 bits of the page's hash, enough for indexes of up to
  // 2^24 slots; a larger one hashes the element's page again.
  static constexpr unsigned kTagPageBits = 24;

  // The page number fully mixed (the finalizer of SplitMix64, constants
  // from Steele, Lea and Flood, "Fast splittable pseudorandom number
  // generators", 2014).
  static std::uint64_t MixPage(const IKRObject* key) {
    std::uint64_t mixed = std::uint64_t(reinterpret_cast<std::uintptr_t>(key)) >> kPageBits;
    mixed = (mixed ^ (mixed >> 30)) * 0xBF58476D1CE4E5B9ull;
    mixed = (mixed ^ (mixed >> 27)) * 0x94D049BB133111EBull;
    return mixed ^ (mixed >> 31);
  }
  // The high bits of the page's hash over the element's granule in the page.
  static std::uint32_t Tag(const IKRObject* key) {
    const auto granule = std::uint32_t(reinterpret_cast<std::uintptr_t>(key) >> kGranuleBits) &
                         ((1u << (kPageBits - kGranuleBits)) - 1);
    return (std::uint32_t(MixPage(key) >> (64 - kTagPageBits)) << (kPageBits - kGranuleBits)) | granule;
  }

  // Bits of the index size; the index has at least 8 slots.
  unsigned SizeBits() const { return unsigned(std::bit_width(m_Slots.size() - 1)); }
  // The home slot from the page's hash and the tag.
  std::size_t Home(std::uint64_t pageMix, std::uint32_t tag) const {
    const unsigned bits = SizeBits();
    if (bits < kLocalBits)  // Fibonacci hashing: 2^64 / golden ratio
      return std::size_t((std::uint64_t(tag) * 0x9E3779B97F4A7C15ull) >> (64 - bits));
    const std::uint64_t granule = tag & ((1u << (kPageBits - kGranuleBits)) - 1);
    const std::uint64_t start = pageMix >> (64 - bits);
    return std::size_t((start + (granule << (kWindowBits - (kPageBits - kGranuleBits)))) & (m_Slots.size() - 1));
  }
  std::size_t HomeOf(const IKRObject* key) const { return Home(MixPage(key), Tag(key)); }
  std::size_t HomeOf(Entry entry) const {
    const std::uint32_t tag = TagOf(entry);
    // The tag's page bits are the high bits of the page's hash.
    return SizeBits() <= kTagPageBits
               ? Home(std::uint64_t(tag >> (kPageBits - kGranuleBits)) << (64 - kTagPageBits), tag)
               : HomeOf(KeyOf(NodeOf(entry)));
  }

  // The index slot holding `key`, or kNoSlot.
  std::size_t FindSlot(const IKRObject* key) const {
    if (key == nullptr || m_Count == 0)
      return kNoSlot;
    const std::uint32_t tag = Tag(key);
    const std::size_t mask = m_Slots.size() - 1;
    for (std::size_t slot = Home(MixPage(key), tag);; slot = (slot + 1) & mask) {
      const Entry entry = m_Slots[slot];
      if (entry == kEmpty)
        return kNoSlot;
      if (TagOf(entry) == tag && KeyOf(NodeOf(entry)) == key)
        return slot;
    }
  }

  // Enters node `at` into the index (linear probing; at most half full).
  void Place(Index at) {
    const IKRObject* key = KeyOf(at);
    const std::uint32_t tag = Tag(key);
    const std::size_t mask = m_Slots.size() - 1;
    std::size_t slot = Home(MixPage(key), tag);
    while (m_Slots[slot] != kEmpty)
      slot = (slot + 1) & mask;
    m_Slots[slot] = MakeEntry(tag, at);
  }

  void Rehash(std::size_t slots) {
    m_Slots.assign(slots, kEmpty);
    for (Index at = m_First; at != kNone; at = m_Nodes[at].m_Next)
      Place(at);
  }

  // Unlinks the node in index slot `slot`, frees it and closes the gap in
  // the probe sequence by shifting later entries back (no tombstones, so
  // lookups never slow down after many removals).
  void Erase(std::size_t slot) {
    const Index at = NodeOf(m_Slots[slot]);
    SKRNode& node = m_Nodes[at];
    (node.m_Prev != kNone ? m_Nodes[node.m_Prev].m_Next : m_First) = node.m_Next;
    (node.m_Next != kNone ? m_Nodes[node.m_Next].m_Prev : m_Last) = node.m_Prev;
    node = {nullptr, kNone, m_FreeNode};
    m_FreeNode = at;
    --m_Count;

    const std::size_t mask = m_Slots.size() - 1;
    std::size_t hole = slot;
    for (std::size_t next = (hole + 1) & mask; m_Slots[next] != kEmpty; next = (next + 1) & mask) {
      const std::size_t home = HomeOf(m_Slots[next]);
      // The entry at `next` may move into the hole unless its home lies
      // cyclically in (hole, next].
      const bool staysPut = hole <= next ? (hole < home && home <= next) : (hole < home || home <= next);
      if (!staysPut) {
        m_Slots[hole] = m_Slots[next];
        hole = next;
      }
    }
    m_Slots[hole] = kEmpty;
  }

  void Clear() noexcept {
    m_Nodes.clear();
    m_Nodes.shrink_to_fit();
    m_Slots.clear();
    m_Slots.shrink_to_fit();
    m_First = m_Last = m_FreeNode = kNone;
    m_Count = 0;
  }

  std::vector<SKRNode> m_Nodes;
  std::vector<Entry> m_Slots;  // see Entry; kEmpty is empty; a power of two
  Index m_First = kNone;
  Index m_Last = kNone;
  Index m_FreeNode = kNone;
  Index m_Count = 0;
};

extern template class KRCORELIB_API CKRObjPtrList<IKRObject>;
