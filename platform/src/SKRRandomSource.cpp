#include "SKRRandomSource.h"

#include <atomic>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <ctime>
#include <fcntl.h>
#include <pthread.h>
#include <sys/random.h>
#include <unistd.h>

namespace {

// 4 KiB: 256 GUIDs per kernel call, which brings the cost of the system call
// (about 1 microsecond with the bytes) down to a few nanoseconds per GUID.
constexpr std::size_t kPoolBytes = 4096;

struct SKRGuidPool {
  unsigned char m_Bytes[kPoolBytes];
  std::size_t m_Available;    // unused bytes, taken from the end
  unsigned m_ForkGeneration;  // g_ForkGeneration when the pool was filled
};

// Zero-initialised per thread: an empty pool.
thread_local SKRGuidPool t_Pool;

// Advanced in the child of every fork; a pool filled in another generation
// holds bytes that the parent may hand out too.
constinit std::atomic<unsigned> g_ForkGeneration{0};

void OnForkChild() {
  g_ForkGeneration.fetch_add(1, std::memory_order_relaxed);
}

std::size_t FillFromKernel(unsigned char* buffer, std::size_t size) {
  std::size_t done = 0;
  while (done < size) {
    const ssize_t got = getrandom(buffer + done, size - done, 0);
    if (got > 0)
      done += std::size_t(got);
    else if (got < 0 && errno == EINTR)
      continue;
    else
      break;
  }
  return done;
}

std::size_t FillFromDevice(unsigned char* buffer, std::size_t size) {
  const int fd = ::open("/dev/urandom", O_RDONLY | O_CLOEXEC);
  if (fd < 0)
    return 0;
  std::size_t done = 0;
  while (done < size) {
    const ssize_t got = ::read(fd, buffer + done, size - done);
    if (got > 0)
      done += std::size_t(got);
    else if (got < 0 && errno == EINTR)
      continue;
    else
      break;
  }
  ::close(fd);
  return done;
}

// Last resort: splitmix64 over the clocks, a process-wide counter and the
// process ID. Distinct on every call, not secret.
void FillFromClock(unsigned char* buffer, std::size_t size) {
  static std::atomic<std::uint64_t> counter{0};
  timespec now{};
  clock_gettime(CLOCK_REALTIME, &now);
  std::uint64_t state = std::uint64_t(now.tv_sec) * 1000000000ull + std::uint64_t(now.tv_nsec);
  state ^= std::uint64_t(::getpid()) << 32;
  state ^= counter.fetch_add(0x9E3779B97F4A7C15ull, std::memory_order_relaxed);
  for (std::size_t i = 0; i < size; i += 8) {
    state += 0x9E3779B97F4A7C15ull;
    std::uint64_t z = state;
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ull;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBull;
    z ^= z >> 31;
    std::memcpy(buffer + i, &z, size - i < 8 ? size - i : 8);
  }
}

}  // namespace

void SKRRandomSource::Fill(void* buffer, std::size_t size) noexcept {
  auto* bytes = static_cast<unsigned char*>(buffer);
  std::size_t done = FillFromKernel(bytes, size);
  if (done < size)
    done += FillFromDevice(bytes + done, size - done);
  if (done < size)
    FillFromClock(bytes + done, size - done);
}

void SKRRandomSource::NewUuid(GUID& guid) noexcept {
  SKRGuidPool& pool = t_Pool;
  const unsigned generation = g_ForkGeneration.load(std::memory_order_relaxed);
  if (pool.m_Available < sizeof(GUID) || pool.m_ForkGeneration != generation) {
    // Registered before the first pool is filled, so no filled pool can
    // cross a fork unnoticed.
    static const bool s_ForkHandlerInstalled = (pthread_atfork(nullptr, nullptr, &OnForkChild) == 0);
    (void)s_ForkHandlerInstalled;
    Fill(pool.m_Bytes, kPoolBytes);
    pool.m_Available = kPoolBytes;
    pool.m_ForkGeneration = g_ForkGeneration.load(std::memory_order_relaxed);
  }
  pool.m_Available -= sizeof(GUID);
  std::memcpy(&guid, pool.m_Bytes + pool.m_Available, sizeof(GUID));
  // Version 4 (random) in the high nibble of Data3, RFC 4122 variant in the
  // two high bits of Data4[0].
  guid.Data3 = std::uint16_t((guid.Data3 & 0x0FFF) | 0x4000);
  guid.Data4[0] = std::uint8_t((guid.Data4[0] & 0x3F) | 0x80);
}
