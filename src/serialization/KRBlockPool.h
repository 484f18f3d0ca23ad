// Small blocks for the objects the framework makes by the hundred thousand
// per document (field streams, field data): kept on per-thread free lists of
// a few sizes and reused, instead of going to the general heap, whose
// consolidation of that many freed chunks cost more than making them.
//
// Blocks of up to kMaxPooledBlock bytes come from 64 KiB slabs that are
// never returned to the system: the pool holds on to its highest use
// (a thread that ends hands its free blocks to the other threads). Larger
// requests, and every request in builds with the address sanitizer, go to
// the global operator new and delete. A block may be freed on another
// thread than the one that made it. Freeing must name the size allocated.
#pragma once

#include <cstddef>
#include <new>

inline constexpr std::size_t kMaxPooledBlock = 256;

void* KRPoolAllocate(std::size_t size);
void KRPoolFree(void* block, std::size_t size) noexcept;

// Defines the class-specific operator new and delete that a class declares
// (the plain and the over-aligned pair; over-aligned objects are not pooled).
#define KR_IMPLEMENT_POOLED_ALLOCATION(Class)                                                  \
  void* Class::operator new(std::size_t size) { return KRPoolAllocate(size); }                 \
  void* Class::operator new(std::size_t size, std::align_val_t alignment) {                    \
    return ::operator new(size, alignment);                                                    \
  }                                                                                            \
  void Class::operator delete(void* block, std::size_t size) noexcept { KRPoolFree(block, size); } \
  void Class::operator delete(void* block, std::size_t size, std::align_val_t alignment) noexcept { \
    ::operator delete(block, size, alignment);                                                 \
  }
