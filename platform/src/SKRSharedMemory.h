// Memory shared between processes: named shared-memory segments, views of
// files, and a named lock, for the memory-mapped files of the system
// services.
//
// Named objects live in the system's shared-memory namespace under
// "/krCoreLib-<uid>-<kind>-<name>": each user has names of its own, and each
// kind of object (memory, locks) a namespace of its own that names of the
// other kind cannot reach. The namespace is open to every user, so an
// object is used only when it belongs to the effective user and nobody else
// may use it (checked on its descriptor); any other object of the name is
// refused and left alone. Objects are created accessible to their owner
// only. A segment lives while some process has it attached,
// as named kernel objects do elsewhere: every attachment holds a shared
// advisory lock on the segment, and the last one to detach (the one that
// can turn its lock exclusive) removes the name. The kernel drops the locks
// of a process that dies, so a segment whose users all died is found stale
// and replaced by a fresh one. Nothing here throws; no descriptor or view is
// left behind on any failure.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

// An address range mapped into this process.
struct SKRMemoryView {
  void* m_pAddress = nullptr;
  std::size_t m_Length = 0;  // bytes mapped, a multiple of the page size
};

struct SKRSharedMemory {
  enum class EKRKind { Memory, Lock };

  // The shared-memory object name of a kind for a name (UTF-8, any bytes;
  // "/" and NUL become "_"). Names too long for the namespace keep a
  // readable prefix and end in a hash of the whole name.
  static std::string MakeObjectName(EKRKind kind, const std::string& name);

  // Attaches to the named segment, creating it with `size` zero bytes when
  // `create` is set and it does not exist, and maps `size` bytes (read-only
  // when asked). An existing segment smaller than `size`, or one that is
  // not the user's own (see above), is refused. The
  // creator runs `initialize` on the new memory before anyone else can map
  // it. `handle` receives the descriptor that holds the attachment.
  static bool Attach(const std::string& objectName, std::size_t size, bool create, bool readOnly,
                     void (*initialize)(void* memory), int& handle, SKRMemoryView& view) noexcept;
  // Unmaps and detaches; removes the name when this was the last
  // attachment. Resets `handle` and `view`.
  static void Detach(const std::string& objectName, int& handle, SKRMemoryView& view) noexcept;

  // Opens an existing regular file for mapping; -1 for anything else.
  // `size` receives the file size.
  static int OpenFile(const char* path, bool readOnly, std::uint64_t& size) noexcept;
  // Maps the first `size` bytes of the open file shared, followed by
  // `extra` bytes of private zeros that never reach the file.
  static bool MapFile(int fd, std::size_t size, std::size_t extra, bool readOnly, SKRMemoryView& view) noexcept;
  // Writes the mapped pages of a file back; true for a view of no file.
  static bool Flush(const SKRMemoryView& view) noexcept;
  static void Unmap(SKRMemoryView& view) noexcept;
  // The size of the regular file open as `fd`; false for anything else.
  static bool GetFileSize(int fd, std::uint64_t& size) noexcept;
  // A duplicate of a descriptor the caller keeps, or -1.
  static int Duplicate(int fd) noexcept;
  static void Close(int& fd) noexcept;
};

// A lock shared by every process that names it alike: a robust, recursive
// process-shared mutex in its own small segment (of the kind Lock). A holder that dies
// releases it (the next waiter takes it over); the thread that took it
// releases it. An unnamed lock lives in memory shared with forked children.
class SKRNamedMutex {
public:
  enum class EKRWait { Acquired, TimedOut, Failed };

  // Null when the lock cannot be created or opened. `name` is given to
  // MakeObjectName with the kind Lock; an empty name gives an unnamed lock.
  static SKRNamedMutex* Create(const std::string& name) noexcept;
  ~SKRNamedMutex();
  SKRNamedMutex(const SKRNamedMutex&) = delete;
  SKRNamedMutex& operator=(const SKRNamedMutex&) = delete;

  // Waits up to `timeoutMs` milliseconds; a negative time-out waits without
  // limit, 0 only tries.
  EKRWait Lock(int timeoutMs) noexcept;
  void Unlock() noexcept;

private:
  SKRNamedMutex() = default;
  std::string m_Name;
  int m_hSegment = -1;
  SKRMemoryView m_View;
};
