// Counts the program's allocations, for benchmarks that show an operation
// allocates nothing. Include it in exactly one file of a benchmark program:
// it replaces the global operator new and delete.
#pragma once

#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <new>

// Every global operator new of the program (the library's included: the
// executable's definitions take precedence over libstdc++'s) counts into a
// per-thread counter. Benchmarks run on the main thread; a thread-local plain
// counter costs next to nothing, unlike an atomic read-modify-write, and so
// does not penalise the allocating side of a pair.

namespace {

thread_local std::size_t t_Allocations = 0;

void* CountedAllocate(std::size_t size) {
  ++t_Allocations;
  if (size == 0)
    size = 1;
  for (;;) {
    if (void* memory = std::malloc(size))
      return memory;
    std::new_handler handler = std::get_new_handler();
    if (handler == nullptr)
      throw std::bad_alloc();
    handler();
  }
}

void* CountedAllocateAligned(std::size_t size, std::align_val_t alignment) {
  ++t_Allocations;
  const std::size_t align = std::max(static_cast<std::size_t>(alignment), sizeof(void*));
  // aligned_alloc wants a size that is a multiple of the alignment.
  const std::size_t rounded = (std::max<std::size_t>(size, 1) + align - 1) / align * align;
  for (;;) {
    if (void* memory = std::aligned_alloc(align, rounded))
      return memory;
    std::new_handler handler = std::get_new_handler();
    if (handler == nullptr)
      throw std::bad_alloc();
    handler();
  }
}

template <class Allocate, class... Args>
void* NoThrow(Allocate allocate, Args... args) noexcept {
  try {
    return allocate(args...);
  } catch (...) {
    return nullptr;
  }
}

}  // namespace

void* operator new(std::size_t size) { return CountedAllocate(size); }
void* operator new[](std::size_t size) { return CountedAllocate(size); }
void* operator new(std::size_t size, const std::nothrow_t&) noexcept { return NoThrow(CountedAllocate, size); }
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept { return NoThrow(CountedAllocate, size); }
void* operator new(std::size_t size, std::align_val_t alignment) { return CountedAllocateAligned(size, alignment); }
void* operator new[](std::size_t size, std::align_val_t alignment) { return CountedAllocateAligned(size, alignment); }
void* operator new(std::size_t size, std::align_val_t alignment, const std::nothrow_t&) noexcept {
  return NoThrow(CountedAllocateAligned, size, alignment);
}
void* operator new[](std::size_t size, std::align_val_t alignment, const std::nothrow_t&) noexcept {
  return NoThrow(CountedAllocateAligned, size, alignment);
}

void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete[](void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::size_t) noexcept { std::free(memory); }
void operator delete(void* memory, const std::nothrow_t&) noexcept { std::free(memory); }
void operator delete[](void* memory, const std::nothrow_t&) noexcept { std::free(memory); }
void operator delete(void* memory, std::align_val_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::align_val_t) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t, std::align_val_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::size_t, std::align_val_t) noexcept { std::free(memory); }
void operator delete(void* memory, std::align_val_t, const std::nothrow_t&) noexcept { std::free(memory); }
void operator delete[](void* memory, std::align_val_t, const std::nothrow_t&) noexcept { std::free(memory); }

namespace {

// Counts the allocations of the timed loop: construct right before the loop;
// the destructor (after the loop) sets the counter "allocs/iter".
class AllocationProbe {
public:
  explicit AllocationProbe(benchmark::State& state) : m_State(state), m_Start(t_Allocations) {}
  ~AllocationProbe() {
    const double allocations = static_cast<double>(t_Allocations - m_Start);
    m_State.counters["allocs/iter"] = benchmark::Counter(allocations, benchmark::Counter::kAvgIterations);
  }
  AllocationProbe(const AllocationProbe&) = delete;
  AllocationProbe& operator=(const AllocationProbe&) = delete;

private:
  benchmark::State& m_State;
  std::size_t m_Start;
};

}  // namespace
