#include "KRBlockPool.h"

#include <mutex>
#include <new>
#include <vector>

#if defined(__SANITIZE_ADDRESS__)
#define KR_POOL_BYPASS 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define KR_POOL_BYPASS 1
#endif
#endif

namespace {

// Sizes in steps of 16 bytes (the alignment of the global operator new).
constexpr std::size_t kStep = 16;
constexpr std::size_t kClasses = kMaxPooledBlock / kStep;
constexpr std::size_t kSlabSize = 64 * 1024;

struct SKRFreeBlock {
  SKRFreeBlock* m_pNext;
};

// Free blocks no thread holds, and every slab ever made (so that the blocks
// stay reachable for leak checkers). Immortal: blocks may be freed while
// the process shuts down.
struct SKRPoolDepot {
  std::mutex m_Lock;
  // Whole lists, as the threads handed them over (taken back one at a time).
  std::vector<SKRFreeBlock*> m_Lists[kClasses];
  std::vector<void*> m_Slabs;
};

SKRPoolDepot& Depot() {
  static SKRPoolDepot* depot = new SKRPoolDepot;
  return *depot;
}

// This thread's free lists; plain data, so usable at any point of the
// thread's life.
thread_local SKRFreeBlock* t_pFree[kClasses] = {};
thread_local bool t_Ended = false;

// Registered on a thread's first refill: hands the thread's free blocks to
// the depot when the thread ends.
struct SKRThreadCache {
  ~SKRThreadCache() {
    t_Ended = true;
    SKRPoolDepot& depot = Depot();
    std::lock_guard<std::mutex> lock(depot.m_Lock);
    for (std::size_t i = 0; i < kClasses; ++i)
      if (t_pFree[i] != nullptr) {
        depot.m_Lists[i].push_back(t_pFree[i]);
        t_pFree[i] = nullptr;
      }
  }
};

std::size_t ClassOf(std::size_t size) {
  return size == 0 ? 0 : (size - 1) / kStep;
}

SKRFreeBlock* Refill(std::size_t index) {
  thread_local SKRThreadCache cache;
  (void)cache;
  SKRPoolDepot& depot = Depot();
  std::lock_guard<std::mutex> lock(depot.m_Lock);
  if (!depot.m_Lists[index].empty()) {
    SKRFreeBlock* taken = depot.m_Lists[index].back();
    depot.m_Lists[index].pop_back();
    return taken;
  }
  const std::size_t blockSize = (index + 1) * kStep;
  char* slab = static_cast<char*>(::operator new(kSlabSize));
  depot.m_Slabs.push_back(slab);
  SKRFreeBlock* list = nullptr;
  for (std::size_t offset = kSlabSize / blockSize * blockSize; offset >= blockSize; offset -= blockSize) {
    auto* block = reinterpret_cast<SKRFreeBlock*>(slab + offset - blockSize);
    block->m_pNext = list;
    list = block;
  }
  return list;
}

}  // namespace

void* KRPoolAllocate(std::size_t size) {
#ifdef KR_POOL_BYPASS
  return ::operator new(size);
#else
  if (size > kMaxPooledBlock)
    return ::operator new(size);
  const std::size_t index = ClassOf(size);
  // A thread past its end keeps no lists; the block is made in the full
  // size of its class, so that the pool can reuse it when it is freed.
  if (t_Ended)
    return ::operator new((index + 1) * kStep);
  SKRFreeBlock* block = t_pFree[index];
  if (block == nullptr)
    block = Refill(index);
  // Blocks come back in the order their objects were released, scattered
  // over the slabs: the next one is prefetched while this one is used.
  SKRFreeBlock* next = block->m_pNext;
  if (next != nullptr)
    __builtin_prefetch(next);
  t_pFree[index] = next;
  return block;
#endif
}

void KRPoolFree(void* block, std::size_t size) noexcept {
  if (block == nullptr)
    return;
#ifdef KR_POOL_BYPASS
  ::operator delete(block, size);
#else
  if (size > kMaxPooledBlock) {
    ::operator delete(block, size);
    return;
  }
  auto* free = static_cast<SKRFreeBlock*>(block);
  const std::size_t index = ClassOf(size);
  if (t_Ended) {
    // The thread's own lists are gone with its end: straight to the depot.
    SKRPoolDepot& depot = Depot();
    std::lock_guard<std::mutex> lock(depot.m_Lock);
    free->m_pNext = nullptr;
    depot.m_Lists[index].push_back(free);
    return;
  }
  free->m_pNext = t_pFree[index];
  t_pFree[index] = free;
#endif
}
