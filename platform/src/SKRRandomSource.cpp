#include "SKRRandomSource.h"

#include <atomic>
#include <cerrno>
#include <cstdint>
#include <cstring>
#include <ctime>
#include <fcntl.h>
#include <new>
#include <sys/mman.h>
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

// Advanced when a draw finds itself in a child process: a pool filled in
// another generation holds bytes that the parent may hand out too.
constinit std::atomic<unsigned> g_ForkGeneration{0};

// One page that the kernel zeroes in every child however it was made (fork,
// _Fork, clone without CLONE_VM), where no fork handler runs: a zero flag
// tells the first draw in a child that the pools came from the parent.
// Null where the kernel cannot wipe on fork (before Linux 4.14); the process
// ID is compared then.
struct SKRForkSentinel {
  std::atomic<unsigned> m_Alive;
};

SKRForkSentinel* ForkSentinel() {
  static SKRForkSentinel* const s_pSentinel = []() -> SKRForkSentinel* {
    const long pageSize = sysconf(_SC_PAGESIZE);
    const std::size_t size = pageSize > 0 ? std::size_t(pageSize) : 4096;
    void* page = mmap(nullptr, size, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (page == MAP_FAILED)
      return nullptr;
    if (madvise(page, size, MADV_WIPEONFORK) != 0) {
      munmap(page, size);
      return nullptr;
    }
    auto* sentinel = new (page) SKRForkSentinel{};
    sentinel->m_Alive.store(1, std::memory_order_relaxed);
    return sentinel;
  }();
  return s_pSentinel;
}

// True (once per child) when this process is a child of the one that filled
// the pools.
bool EnteredChild() {
  if (SKRForkSentinel* sentinel = ForkSentinel()) {
    unsigned expected = 0;
    return sentinel->m_Alive.load(std::memory_order_relaxed) == 0 &&
           sentinel->m_Alive.compare_exchange_strong(expected, 1, std::memory_order_relaxed);
  }
  static std::atomic<pid_t> s_Pid{::getpid()};
  const pid_t now = ::getpid();
  pid_t before = s_Pid.load(std::memory_order_relaxed);
  return before != now && s_Pid.compare_exchange_strong(before, now, std::memory_order_relaxed);
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
  if (EnteredChild())
    g_ForkGeneration.fetch_add(1, std::memory_order_relaxed);
  const unsigned generation = g_ForkGeneration.load(std::memory_order_relaxed);
  if (pool.m_Available < sizeof(GUID) || pool.m_ForkGeneration != generation) {
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
