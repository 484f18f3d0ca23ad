// Random bytes and random GUIDs from the kernel's random source.
#pragma once

#include <krCoreLib/platform/KRGuidDef.h>

#include <cstddef>

struct SKRRandomSource {
  // Fills `buffer` with bytes from the kernel's cryptographic generator.
  // Falls back to /dev/urandom, and if that too is unavailable (no kernel
  // support, no device in a chroot) to a clock-and-counter mix that is
  // unique per call but not unpredictable. Thread-safe; never fails.
  static void Fill(void* buffer, std::size_t size) noexcept;

  // A version-4 (random) UUID. Bytes are drawn from the kernel in large
  // batches into a per-thread pool, so most calls make no system call; the
  // pool is discarded in a child process however it was made (fork, _Fork,
  // clone), so that parent and child never hand out the same value.
  static void NewUuid(GUID& guid) noexcept;
};
