#include "SKRSharedMemory.h"

#include "SKROwnerOnly.h"

#include <cerrno>
#include <cstdio>
#include <ctime>
#include <fcntl.h>
#include <new>
#include <pthread.h>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

// Object names end up as file names in the shared-memory file system, whose
// limit is 255 bytes (NAME_MAX); 200 leaves room for the prefix.
constexpr std::size_t kMaxObjectName = 200;
// Attempts to attach while other processes create or remove the same
// segment at the same moment; each retry means another process made
// progress, so a handful suffices.
constexpr int kAttachAttempts = 64;

std::size_t PageSize() noexcept {
  const long size = ::sysconf(_SC_PAGESIZE);
  return size > 0 ? std::size_t(size) : 4096;
}

std::size_t RoundUp(std::size_t value, std::size_t unit) noexcept {
  return (value + unit - 1) / unit * unit;
}

// FNV-1a, 64 bits: a stable name hash (the same in every process).
std::uint64_t HashName(const std::string& text) noexcept {
  std::uint64_t hash = 0xcbf29ce484222325ull;
  for (const unsigned char c : text) {
    hash ^= c;
    hash *= 0x100000001b3ull;
  }
  return hash;
}

bool IsUnlinked(int fd) noexcept {
  struct stat info {};
  return ::fstat(fd, &info) != 0 || info.st_nlink == 0;
}

int Flock(int fd, int operation) noexcept {
  int result;
  do
    result = ::flock(fd, operation);
  while (result != 0 && errno == EINTR);
  return result;
}

bool MapShared(int fd, std::size_t size, bool readOnly, SKRMemoryView& view) noexcept {
  const int protection = readOnly ? PROT_READ : PROT_READ | PROT_WRITE;
  void* address = ::mmap(nullptr, size, protection, MAP_SHARED, fd, 0);
  if (address == MAP_FAILED)
    return false;
  view.m_pAddress = address;
  view.m_Length = RoundUp(size, PageSize());
  return true;
}

struct SKRMutexBlock {
  pthread_mutex_t m_Mutex;
};

void InitializeMutex(void* memory) {
  auto* block = static_cast<SKRMutexBlock*>(memory);
  pthread_mutexattr_t attributes;
  pthread_mutexattr_init(&attributes);
  pthread_mutexattr_setpshared(&attributes, PTHREAD_PROCESS_SHARED);
  pthread_mutexattr_setrobust(&attributes, PTHREAD_MUTEX_ROBUST);
  // Recursive like the named mutexes hosts know: the owning thread may take
  // it again through a second mapping of the same name.
  pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_RECURSIVE);
  pthread_mutex_init(&block->m_Mutex, &attributes);
  pthread_mutexattr_destroy(&attributes);
}

}  // namespace

std::string SKRSharedMemory::MakeObjectName(EKRKind kind, const std::string& name) {
  char prefix[48];
  std::snprintf(prefix, sizeof prefix, "/krCoreLib-%u-%s-", unsigned(::geteuid()),
                kind == EKRKind::Memory ? "mem" : "lock");
  std::string result(prefix);
  std::string clean(name);
  for (char& c : clean) {
    if (c == '/' || c == '\0')
      c = '_';
  }
  if (result.size() + clean.size() <= kMaxObjectName)
    return result + clean;
  char hash[24];
  std::snprintf(hash, sizeof hash, "~%016llx", static_cast<unsigned long long>(HashName(name)));
  return result + clean.substr(0, kMaxObjectName - result.size() - 17) + hash;
}

bool SKRSharedMemory::Attach(const std::string& objectName, std::size_t size, bool create, bool readOnly,
                             void (*initialize)(void*), int& handle, SKRMemoryView& view) noexcept {
  handle = -1;
  view = SKRMemoryView();
  if (size == 0)
    return false;
  for (int attempt = 0; attempt < kAttachAttempts; ++attempt) {
    if (create) {
      int fd = ::shm_open(objectName.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
      if (fd >= 0) {
        // The creation mode passed the umask, which may have taken the
        // owner's own permissions away.
        (void)::fchmod(fd, 0600);
        // Exclusive while the segment is sized and initialised: others
        // attaching wait for the shared lock below.
        if (Flock(fd, LOCK_EX) != 0 || IsUnlinked(fd)) {
          // Another process found it unlocked and removed it as stale.
          ::close(fd);
          continue;
        }
        const bool writable = !readOnly || initialize != nullptr;
        if (::ftruncate(fd, off_t(size)) != 0 || !MapShared(fd, size, !writable, view)) {
          ::shm_unlink(objectName.c_str());
          ::close(fd);
          return false;
        }
        if (initialize != nullptr)
          initialize(view.m_pAddress);
        if (writable && readOnly)
          ::mprotect(view.m_pAddress, view.m_Length, PROT_READ);
        Flock(fd, LOCK_SH);  // lets the others in
        handle = fd;
        return true;
      }
      if (errno != EEXIST)
        return false;
    }
    // O_NONBLOCK: a pipe planted under the name must not make open wait;
    // it is refused below like everything that is not the user's own.
    int fd = ::shm_open(objectName.c_str(), (readOnly ? O_RDONLY : O_RDWR) | O_NONBLOCK | O_CLOEXEC, 0);
    if (fd < 0) {
      if (errno == ENOENT && create)
        continue;  // removed by its last user a moment ago
      return false;
    }
    // Another user's object, or one that others may read or write: its
    // owner could read and change the memory or hold its lock for good.
    // Refused, and neither locked nor removed.
    if (!SKROwnerOnly::Check(fd, S_IFREG)) {
      ::close(fd);
      return false;
    }
    if (Flock(fd, LOCK_EX | LOCK_NB) == 0) {
      // Nobody holds it: every user died, or its creator has not locked it
      // yet (and will notice and start again). Remove the stale name.
      if (!IsUnlinked(fd))
        ::shm_unlink(objectName.c_str());
      ::close(fd);
      if (!create)
        return false;
      continue;
    }
    // Waits only while a creator initialises or the last user removes it.
    if (Flock(fd, LOCK_SH) != 0) {
      ::close(fd);
      return false;
    }
    struct stat info {};
    if (::fstat(fd, &info) != 0) {
      ::close(fd);
      return false;
    }
    if (info.st_nlink == 0) {
      ::close(fd);
      if (!create)
        return false;
      continue;
    }
    if (info.st_size < off_t(size) || !MapShared(fd, size, readOnly, view)) {
      ::close(fd);
      return false;
    }
    handle = fd;
    return true;
  }
  return false;
}

void SKRSharedMemory::Detach(const std::string& objectName, int& handle, SKRMemoryView& view) noexcept {
  Unmap(view);
  if (handle < 0)
    return;
  // Only the last attachment can turn its shared lock exclusive.
  if (Flock(handle, LOCK_EX | LOCK_NB) == 0 && !IsUnlinked(handle))
    ::shm_unlink(objectName.c_str());
  ::close(handle);
  handle = -1;
}

int SKRSharedMemory::OpenFile(const char* path, bool readOnly, std::uint64_t& size) noexcept {
  size = 0;
  int fd;
  // O_NONBLOCK: a pipe is refused below instead of waiting in open.
  do
    fd = ::open(path, (readOnly ? O_RDONLY : O_RDWR) | O_CLOEXEC | O_NOCTTY | O_NONBLOCK);
  while (fd < 0 && errno == EINTR);
  if (fd < 0)
    return -1;
  if (!GetFileSize(fd, size)) {
    ::close(fd);
    return -1;
  }
  return fd;
}

bool SKRSharedMemory::GetFileSize(int fd, std::uint64_t& size) noexcept {
  size = 0;
  struct stat info {};
  if (fd < 0 || ::fstat(fd, &info) != 0 || !S_ISREG(info.st_mode) || info.st_size < 0)
    return false;
  size = std::uint64_t(info.st_size);
  return true;
}

bool SKRSharedMemory::MapFile(int fd, std::size_t size, std::size_t extra, bool readOnly,
                              SKRMemoryView& view) noexcept {
  view = SKRMemoryView();
  if (fd < 0 || size == 0)
    return false;
  const std::size_t page = PageSize();
  const std::size_t fileLength = RoundUp(size, page);
  const std::size_t total = RoundUp(size + extra, page);
  if (total == fileLength)
    return MapShared(fd, size, readOnly, view);
  // The extra bytes need pages beyond the file's last one, where a file
  // mapping would fault: reserve the whole range as private zero pages and
  // lay the file over its beginning.
  const int protection = readOnly ? PROT_READ : PROT_READ | PROT_WRITE;
  void* base = ::mmap(nullptr, total, protection, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (base == MAP_FAILED)
    return false;
  if (::mmap(base, size, protection, MAP_SHARED | MAP_FIXED, fd, 0) == MAP_FAILED) {
    ::munmap(base, total);
    return false;
  }
  view.m_pAddress = base;
  view.m_Length = total;
  return true;
}

bool SKRSharedMemory::Flush(const SKRMemoryView& view) noexcept {
  return view.m_pAddress == nullptr || ::msync(view.m_pAddress, view.m_Length, MS_SYNC) == 0;
}

void SKRSharedMemory::Unmap(SKRMemoryView& view) noexcept {
  if (view.m_pAddress != nullptr)
    ::munmap(view.m_pAddress, view.m_Length);
  view = SKRMemoryView();
}

int SKRSharedMemory::Duplicate(int fd) noexcept {
  return fd < 0 ? -1 : ::fcntl(fd, F_DUPFD_CLOEXEC, 0);
}

void SKRSharedMemory::Close(int& fd) noexcept {
  if (fd >= 0)
    ::close(fd);
  fd = -1;
}

SKRNamedMutex* SKRNamedMutex::Create(const std::string& name) noexcept {
  SKRNamedMutex* mutex = new (std::nothrow) SKRNamedMutex();
  if (mutex == nullptr)
    return nullptr;
  bool ok;
  if (name.empty()) {
    void* memory = ::mmap(nullptr, sizeof(SKRMutexBlock), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    ok = memory != MAP_FAILED;
    if (ok) {
      InitializeMutex(memory);
      mutex->m_View.m_pAddress = memory;
      mutex->m_View.m_Length = RoundUp(sizeof(SKRMutexBlock), PageSize());
    }
  } else {
    try {
      mutex->m_Name = SKRSharedMemory::MakeObjectName(SKRSharedMemory::EKRKind::Lock, name);
    } catch (...) {
      delete mutex;
      return nullptr;
    }
    ok = SKRSharedMemory::Attach(mutex->m_Name, sizeof(SKRMutexBlock), true, false, &InitializeMutex,
                                 mutex->m_hSegment, mutex->m_View);
  }
  if (!ok) {
    delete mutex;
    return nullptr;
  }
  return mutex;
}

SKRNamedMutex::~SKRNamedMutex() {
  if (m_hSegment >= 0)
    SKRSharedMemory::Detach(m_Name, m_hSegment, m_View);
  else
    SKRSharedMemory::Unmap(m_View);
}

SKRNamedMutex::EKRWait SKRNamedMutex::Lock(int timeoutMs) noexcept {
  pthread_mutex_t* mutex = &static_cast<SKRMutexBlock*>(m_View.m_pAddress)->m_Mutex;
  int result;
  if (timeoutMs < 0) {
    result = pthread_mutex_lock(mutex);
  } else if (timeoutMs == 0) {
    result = pthread_mutex_trylock(mutex);
  } else {
    timespec deadline {};
    clock_gettime(CLOCK_MONOTONIC, &deadline);
    deadline.tv_sec += timeoutMs / 1000;
    deadline.tv_nsec += long(timeoutMs % 1000) * 1000000L;
    if (deadline.tv_nsec >= 1000000000L) {
      deadline.tv_sec += 1;
      deadline.tv_nsec -= 1000000000L;
    }
    result = pthread_mutex_clocklock(mutex, CLOCK_MONOTONIC, &deadline);
  }
  switch (result) {
  case 0:
    return EKRWait::Acquired;
  case EOWNERDEAD:
    // Its holder died: the data it guarded may be half-written, but the
    // lock itself is ours now.
    pthread_mutex_consistent(mutex);
    return EKRWait::Acquired;
  case EBUSY:
  case ETIMEDOUT:
    return EKRWait::TimedOut;
  default:
    return EKRWait::Failed;
  }
}

void SKRNamedMutex::Unlock() noexcept {
  pthread_mutex_unlock(&static_cast<SKRMutexBlock*>(m_View.m_pAddress)->m_Mutex);
}
