// File and directory services of the operating system, for the path and
// file helpers of the system services.
//
// Paths are UTF-8 byte strings that the caller has already checked: not
// empty, free of NUL bytes and within the system's path limit. Nothing here
// throws; failures leave errno set by the failing call. Every descriptor
// opened here is close-on-exec, and none is left open on any failure.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

struct SKRFiles {
  enum class EKRKind { Missing, File, Directory, Other };

  // What the path names, following symbolic links; a dangling link is
  // Missing.
  static EKRKind GetKind(const char* path) noexcept;
  // A directory the process may enter (search permission for its effective
  // user), found without changing the current directory.
  static bool IsEnterableDirectory(const char* path) noexcept;

  // The current directory; false when it cannot be read (removed, or longer
  // than the path limit).
  static bool GetCurrentDirectory(std::string& path);
  // The full file name of the running program.
  static bool GetExecutablePath(std::string& path);

  // Creates one directory; 0 on success, else the errno value.
  static int MakeDirectory(const char* path) noexcept;

  // Removes the directory and everything below it. Symbolic links are
  // removed, never followed, and mount points are not entered: nothing
  // outside the given directory is touched. Refused before anything is
  // touched: a path that is itself a symbolic link, a path whose last
  // component is "." or ".." (or "/", which has none), the root directory
  // and the root of a mounted file system. Keeps going after a failure and
  // reports it at the end. `maxDepth` bounds the nesting it descends into
  // (each level holds one descriptor).
  static bool RemoveTree(const char* path, int maxDepth) noexcept;

  // The raw names of the directory's entries ("." and ".." included), in
  // the order the file system returns them.
  static bool ListDirectory(const char* path, std::vector<std::string>& names);

  // Reads a whole regular file into a new[]-allocated buffer of its size
  // (at least one byte is allocated, so an empty file gives a valid
  // buffer). Refuses anything but a regular file (no waiting on a pipe or a
  // device), files larger than `maxSize`, a short read and a failing close.
  // On failure `data` is null and `size` 0.
  static bool ReadWholeFile(const char* path, std::uint64_t maxSize, unsigned char*& data,
                            std::size_t& size) noexcept;
  // Writes (truncating) or appends the bytes to a regular file, creating it
  // when missing. Never creates a file through a dangling symbolic link and
  // never writes to a pipe, a device or a directory. True when every byte
  // was written and the file closed cleanly.
  static bool WriteWholeFile(const char* path, const void* data, std::size_t size, bool append) noexcept;

  // fopen with the C modes ("r", "w", "a", "+", "x", "b"), close-on-exec,
  // without waiting in open for the other end of a pipe. Null on failure or
  // for a mode it does not know.
  static std::FILE* OpenStream(const char* path, const char* mode) noexcept;
  // Opens a regular file of at most `maxSize` bytes for reading. The kind
  // and size are checked on the opened descriptor, so a name swapped for a
  // pipe, a device or a directory after a check by name is refused too.
  // Null on failure.
  static std::FILE* OpenRegularFileForReading(const char* path, std::uint64_t maxSize) noexcept;
};

// A file that replaces another one whole or not at all: written under a
// temporary name in the target's folder, then flushed to the disk and
// renamed over the target, so that a failed or interrupted save never
// leaves the target half-written or truncated (the old file stays as it
// was). A new file gets the permissions 0666 less the umask, a replaced one
// keeps its own. Destroying the object before Commit removes the temporary
// file. One object per save; not thread-safe.
class SKRReplacementFile {
public:
  SKRReplacementFile() = default;
  ~SKRReplacementFile() { Abandon(); }
  SKRReplacementFile(const SKRReplacementFile&) = delete;
  SKRReplacementFile& operator=(const SKRReplacementFile&) = delete;

  // Creates the temporary file beside `path`. False when the target exists
  // and is not a regular file (a directory, a device), or the folder does
  // not take a new file.
  bool Begin(const char* path) noexcept;
  // Appends bytes; a failure is remembered and makes Commit fail.
  bool Write(const void* data, std::size_t size) noexcept;
  // Syncs and closes the temporary file, renames it over the target and
  // syncs the folder. False, with the target untouched and the temporary
  // file removed, when any write or step failed.
  bool Commit() noexcept;
  // Removes the temporary file (nothing when none is open).
  void Abandon() noexcept;

private:
  int m_Fd = -1;
  bool m_Failed = false;
  std::string m_Target;
  std::string m_Temporary;
};
