// CKRMemMapFile: a memory-mapped file or a block of named shared memory,
// guarded by a named lock shared between processes.
//
// Mapping names: the given name (for MapFile with mappingNameFromPath, the
// path) with every "\" and "/" replaced by "_" and its ASCII letters in upper
// case; the lock is named by the mapping name followed by "MUTEX", in a
// namespace of locks apart from the mappings' (a mapping named "fooMUTEX"
// never meets the lock of "foo"). A name with a character that has no UTF-8
// form (a lone surrogate, a value above U+10FFFF) is refused. Names are
// scoped to the user: processes of one user that use the same name share
// the memory and the lock. Named shared memory lives while some process has
// it mapped; a new block starts as zeros.
//
// Security: named memory and its lock are created accessible to their
// owner only, and an existing one is used only when it belongs to the
// effective user and nobody else may read or write it; one planted under
// the name by another user (or opened up to others) makes the mapping fail
// (0) and is left alone.
//
// Mapped files follow the platform's rule: when another process truncates
// a file while it is mapped, touching the view beyond the file's new end
// raises SIGBUS, which ends the process unless the host handles it. The
// library reads mapped memory only within the size it found when mapping;
// a host that maps files others may truncate must expect the signal.
//
// Writers bracket their access with Open and Close, which take and release
// the lock; a read-only mapping is opened without it. The lock belongs to
// the thread that opened: the same thread closes. A process that ends
// while holding it releases it (the next Open takes it over).
//
// Every mapping operation first unmaps what the object held, returns 1 on
// success and 0 on failure, and on failure holds nothing: no descriptor,
// view or lock is left behind. Nothing throws. An object is used from one
// thread at a time.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <cstddef>
#include <cstdint>
#include <string>

class SKRNamedMutex;

class KRCORELIB_API CKRMemMapFile {
public:
  CKRMemMapFile() noexcept = default;
  // Unmaps.
  ~CKRMemMapFile();
  CKRMemMapFile(const CKRMemMapFile&) = delete;
  CKRMemMapFile& operator=(const CKRMemMapFile&) = delete;

  // Maps an existing regular file, for reading only or for reading and
  // writing. Refused: a missing file, a directory or special file, an empty
  // file, and a file of 4 GiB or more. With appendTerminator two zero bytes
  // follow the data in memory (a wide-text terminator for the code that
  // reads it); they are not part of the file, which never grows. With
  // mappingNameFromPath the mapping (and its lock) is named by the path;
  // otherwise it is unnamed and its lock private to this process and its
  // forked children. shareMode is accepted for compatibility and has no
  // effect here (files cannot be locked against other programs' access);
  // sparse needs nothing here (every file may be sparse).
  int MapFile(const wchar_t* path, bool readOnly = false, unsigned int shareMode = 0,
              bool appendTerminator = false, bool mappingNameFromPath = true, bool sparse = false);
  // Creates (or attaches to the existing) named shared memory of `size`
  // bytes. An existing block smaller than `size` or not the user's own is
  // refused. An empty or invalid name or a size of 0 fails.
  int MapMemory(const wchar_t* name, std::uint32_t size, bool readOnly = false);
  // Attaches to existing named shared memory and maps `size` bytes of it;
  // fails when it does not exist, is smaller or is not the user's own.
  int MapExistingMemory(const wchar_t* name, std::uint32_t size, bool readOnly = false);
  // Maps the open regular file behind `fileDescriptor`, as MapFile does
  // (unnamed); the object maps its own duplicate, so the caller keeps and
  // closes the descriptor it passed.
  int MapHandle(int fileDescriptor, bool readOnly = true, bool appendTerminator = false);

  // The view: null without one. A read-only mapping is returned at once
  // without the lock; otherwise waits for the lock up to timeoutMs
  // milliseconds (-1: without limit, 0: only tries) and returns null when it
  // is not had in time. Opening an open object returns the view again.
  void* Open(int timeoutMs = -1);
  // Releases the lock when open.
  void Close();
  // Writes the changed pages of a mapped file back to it. 1 on success (and
  // for shared memory), 0 without a view or when writing fails.
  int Flush();
  // Releases the lock if held, flushes, and releases view, mapping, file
  // and lock; the object is then empty (read-only, no name, size 0).
  void UnMap();
  bool IsOpen() const noexcept { return m_bOpen; }

  void* GetView() const noexcept { return m_pView; }
  // Number of data bytes (the terminator not counted).
  std::uint32_t GetSize() const noexcept { return m_dwSize; }
  const CKRString& GetName() const noexcept { return m_Name; }
  bool IsReadOnly() const noexcept { return m_bReadOnly; }

  // The mapping name for a name or path, as described above.
  static CKRString MakeMappingName(const wchar_t* name);

private:
  int MapDescriptor(int fileDescriptor, std::uint64_t fileSize);
  // Maps named memory, creating it when `create` is set.
  int AttachMemory(const wchar_t* name, std::uint32_t size, bool create, bool readOnly);
  bool CreateMutex();

  int m_hFile = -1;             // the mapped file; -1 for shared memory
  int m_hMapping = -1;          // the shared-memory segment; -1 for a file
  bool m_bReadOnly = true;
  bool m_bAppendTerminator = false;
  void* m_pView = nullptr;
  std::size_t m_ViewLength = 0;  // bytes mapped, whole pages
  CKRString m_Name;
  std::string m_ObjectName;     // the system's name of the shared memory
  bool m_bOpen = false;
  SKRNamedMutex* m_pMutex = nullptr;
  std::uint32_t m_dwSize = 0;
};
