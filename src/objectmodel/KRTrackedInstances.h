// SKRTrackedInstances: a type's tracked instances by instance ID.
//
// Adding and removing are logged and applied to the table in batches: a type
// that makes and releases many instances at IDs scattered over a large table
// (a document's field streams) would otherwise wait for one cache miss per
// change; applied together, the slots of the coming changes are prefetched
// while the current one is made, so the misses overlap. Every read applies
// the log first, and the log is replayed in the order of the calls, so what
// a read sees is exactly what immediate changes would have left. The log
// holds IDs and pointer values only: an object released before its removal
// is applied is never touched again. Not synchronised.
#pragma once

#include <krCoreLib/objectmodel/IKRObject.h>
#include <krCoreLib/objectmodel/SKRGuidTableT.h>

#include <cstddef>
#include <vector>

struct SKRTrackedInstances {
  void Add(const CKRGuid& id, IKRObject* object) { Log(id, object, true); }
  void Remove(const CKRGuid& id, IKRObject* object) { Log(id, object, false); }

  // The table with every logged change applied.
  SKRGuidTableT<IKRObject>& Table() {
    if (!m_Log.empty())
      Apply();
    return m_Table;
  }

private:
  struct SKRChange {
    GUID m_ID;
    IKRObject* m_pObject;
    bool m_Add;
  };

  // Changes held back at most: enough for the prefetch to run ahead, small
  // enough to stay in the first-level cache (256 of 32 bytes, 8 KiB).
  static constexpr std::size_t kBatch = 256;
  // How far ahead the slots are prefetched: about the misses a core keeps
  // in flight (10 to 12 line-fill buffers on current x86 cores), and some.
  static constexpr std::size_t kAhead = 16;

  void Log(const CKRGuid& id, IKRObject* object, bool add) {
    if (object == nullptr)
      return;
    if (m_Log.capacity() == 0)
      m_Log.reserve(kBatch);
    m_Log.push_back({id.GetGUID(), object, add});
    if (m_Log.size() >= kBatch)
      Apply();
  }

  void Apply() {
    std::size_t adds = 0;
    for (const SKRChange& change : m_Log)
      adds += change.m_Add ? 1 : 0;
    // Grown once up front, not in the middle (a growth rehashes the table).
    m_Table.Reserve(m_Table.Size() + adds);
    const std::size_t count = m_Log.size();
    for (std::size_t i = 0; i < count && i < kAhead; ++i)
      m_Table.Prefetch(CKRGuid(m_Log[i].m_ID));
    for (std::size_t i = 0; i < count; ++i) {
      if (i + kAhead < count)
        m_Table.Prefetch(CKRGuid(m_Log[i + kAhead].m_ID));
      const SKRChange& change = m_Log[i];
      if (change.m_Add)
        m_Table.Add(CKRGuid(change.m_ID), change.m_pObject);
      else
        m_Table.Remove(CKRGuid(change.m_ID), change.m_pObject);
    }
    m_Log.clear();
  }

  SKRGuidTableT<IKRObject> m_Table;
  std::vector<SKRChange> m_Log;
};
