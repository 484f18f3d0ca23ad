#include "SKRFiles.h"

#include <atomic>
#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstring>
#include <dirent.h>
#include <fcntl.h>
#include <new>
#include <sys/stat.h>
#include <unistd.h>

namespace {

// Retries a system call interrupted by a signal.
template <typename Call>
auto Retry(Call call) {
  for (;;) {
    const auto result = call();
    if (result >= 0 || errno != EINTR)
      return result;
  }
}

// Opens a regular file of at most `maxSize` bytes for reading; its size in
// `size`. The kind and size are checked on the descriptor, and the open
// never waits for the writer of a pipe (O_NONBLOCK, cleared again once the
// file is known to be regular). -1 on failure.
int OpenRegular(const char* path, std::uint64_t maxSize, std::size_t& size) noexcept {
  const int fd = Retry([&] { return ::open(path, O_RDONLY | O_CLOEXEC | O_NOCTTY | O_NONBLOCK); });
  if (fd < 0)
    return -1;
  struct stat info {};
  const int status = ::fcntl(fd, F_GETFL);
  if (::fstat(fd, &info) != 0 || !S_ISREG(info.st_mode) || info.st_size < 0 ||
      std::uint64_t(info.st_size) > maxSize || status < 0 || ::fcntl(fd, F_SETFL, status & ~O_NONBLOCK) != 0) {
    ::close(fd);
    return -1;
  }
  size = std::size_t(info.st_size);
  return fd;
}

// Closes a descriptor and reports whether it closed cleanly. An interrupted
// close has still released the descriptor on Linux; it must not be retried.
bool CloseChecked(int fd) noexcept {
  const int result = ::close(fd);
  return result == 0 || errno == EINTR;
}

bool ReadFully(int fd, unsigned char* data, std::size_t size) noexcept {
  std::size_t done = 0;
  while (done < size) {
    const ssize_t got = Retry([&] { return ::read(fd, data + done, size - done); });
    if (got <= 0)
      return false;  // error, or the file shrank under us
    done += std::size_t(got);
  }
  return true;
}

bool WriteFully(int fd, const unsigned char* data, std::size_t size) noexcept {
  std::size_t done = 0;
  while (done < size) {
    const ssize_t put = Retry([&] { return ::write(fd, data + done, size - done); });
    if (put <= 0)
      return false;
    done += std::size_t(put);
  }
  return true;
}

// Whether the directory open as `fd` is the root of the whole tree (as this
// process sees it) or of a mounted file system. Neither can be removed, and
// below a mount point lies another file system: both are left alone. In
// doubt (the parent cannot be looked at) the answer is yes.
bool IsRootOrMountPoint(int fd) noexcept {
  struct stat self {}, parent {};
  if (::fstat(fd, &self) != 0 || ::fstatat(fd, "..", &parent, 0) != 0)
    return true;
  // The root is its own parent; a file system mounted elsewhere has a
  // parent on another device.
  if (self.st_dev != parent.st_dev || self.st_ino == parent.st_ino)
    return true;
  // A bind mount of a folder of the same file system shows only here.
  struct statx extended {};
  return ::statx(fd, "", AT_EMPTY_PATH | AT_SYMLINK_NOFOLLOW, 0, &extended) == 0 &&
         (extended.stx_attributes_mask & STATX_ATTR_MOUNT_ROOT) != 0 &&
         (extended.stx_attributes & STATX_ATTR_MOUNT_ROOT) != 0;
}

// Empties the directory open as `dirFd`. Entries are read in one pass into
// memory first, so that removing them does not disturb the listing, and the
// listing's own descriptor is closed before descending.
bool ClearDirectory(int dirFd, int depth, int maxDepth) noexcept {
  std::vector<std::string> names;
  {
    const int listFd = ::openat(dirFd, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (listFd < 0)
      return false;
    DIR* dir = ::fdopendir(listFd);
    if (dir == nullptr) {
      ::close(listFd);
      return false;
    }
    try {
      while (const dirent* entry = ::readdir(dir)) {
        if (std::strcmp(entry->d_name, ".") != 0 && std::strcmp(entry->d_name, "..") != 0)
          names.emplace_back(entry->d_name);
      }
    } catch (...) {
      ::closedir(dir);
      return false;
    }
    ::closedir(dir);
  }

  bool ok = true;
  for (const std::string& name : names) {
    struct stat info {};
    if (::fstatat(dirFd, name.c_str(), &info, AT_SYMLINK_NOFOLLOW) != 0) {
      ok = ok && errno == ENOENT;  // removed meanwhile by someone else
      continue;
    }
    if (!S_ISDIR(info.st_mode)) {
      // Files, symbolic links (the link, never its target) and special
      // files. Write permission on the file itself is not needed.
      if (::unlinkat(dirFd, name.c_str(), 0) != 0 && errno != ENOENT)
        ok = false;
      continue;
    }
    if (depth + 1 > maxDepth) {
      ok = false;
      continue;
    }
    // O_NOFOLLOW: a directory swapped for a link since fstatat is refused,
    // so the walk never leaves the tree it was given.
    const int flags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
    int subFd = ::openat(dirFd, name.c_str(), flags);
    if (subFd < 0 && errno == EACCES && ::fchmodat(dirFd, name.c_str(), 0700, 0) == 0)
      subFd = ::openat(dirFd, name.c_str(), flags);
    if (subFd < 0) {
      ok = false;
      continue;
    }
    if (IsRootOrMountPoint(subFd)) {
      ::close(subFd);
      ok = false;
      continue;
    }
    // Entries of a directory its owner may not write cannot be removed:
    // clear that restriction, as the directory goes anyway.
    if ((info.st_mode & S_IRWXU) != S_IRWXU)
      (void)::fchmod(subFd, 0700);
    const bool subOk = ClearDirectory(subFd, depth + 1, maxDepth);
    ::close(subFd);
    if (!subOk || ::unlinkat(dirFd, name.c_str(), AT_REMOVEDIR) != 0)
      ok = false;
  }
  return ok;
}

// Translates a C stdio mode into open flags; false for an unknown mode.
bool ModeToFlags(const char* mode, int& flags) noexcept {
  if (mode == nullptr)
    return false;
  int access = 0;
  switch (mode[0]) {
  case 'r': access = O_RDONLY; flags = 0; break;
  case 'w': access = O_WRONLY; flags = O_CREAT | O_TRUNC; break;
  case 'a': access = O_WRONLY; flags = O_CREAT | O_APPEND; break;
  default: return false;
  }
  for (const char* c = mode + 1; *c != '\0'; ++c) {
    switch (*c) {
    case '+': access = O_RDWR; break;
    case 'x': flags |= O_EXCL; break;
    case 'b':
    case 't':
    case 'e': break;
    default: return false;
    }
  }
  flags |= access | O_CLOEXEC | O_NOCTTY;
  return true;
}

}  // namespace

SKRFiles::EKRKind SKRFiles::GetKind(const char* path) noexcept {
  struct stat info {};
  if (::stat(path, &info) != 0)
    return EKRKind::Missing;
  if (S_ISREG(info.st_mode))
    return EKRKind::File;
  if (S_ISDIR(info.st_mode))
    return EKRKind::Directory;
  return EKRKind::Other;
}

bool SKRFiles::IsEnterableDirectory(const char* path) noexcept {
  return GetKind(path) == EKRKind::Directory && ::faccessat(AT_FDCWD, path, X_OK, AT_EACCESS) == 0;
}

bool SKRFiles::GetCurrentDirectory(std::string& path) {
  char buffer[PATH_MAX];
  if (::getcwd(buffer, sizeof buffer) == nullptr)
    return false;
  path.assign(buffer);
  return true;
}

bool SKRFiles::GetExecutablePath(std::string& path) {
  char buffer[PATH_MAX];
  const ssize_t length = ::readlink("/proc/self/exe", buffer, sizeof buffer);
  // A result that fills the buffer may have been cut short.
  if (length <= 0 || std::size_t(length) >= sizeof buffer)
    return false;
  path.assign(buffer, std::size_t(length));
  return true;
}

int SKRFiles::MakeDirectory(const char* path) noexcept {
  return ::mkdir(path, 0777) == 0 ? 0 : errno;
}

bool SKRFiles::RemoveTree(const char* path, int maxDepth) noexcept {
  // The directory is reached as an entry of its parent, which stays open,
  // so that the folder emptied is the one removed, whatever happens to the
  // path meanwhile (its parts may even be removed with the tree).
  const char* slash = std::strrchr(path, '/');
  const char* name = slash != nullptr ? slash + 1 : path;
  // "X/." and "p/c/.." name a folder through itself or a child, not as an
  // entry of its parent: it could be emptied but never removed (and
  // "p/c/.." would empty p). Refused, as is "/" (no name at all).
  if (*name == '\0' || std::strcmp(name, ".") == 0 || std::strcmp(name, "..") == 0)
    return false;
  int parentFd = AT_FDCWD;
  if (slash != nullptr) {
    char parent[PATH_MAX];
    const std::size_t length = slash == path ? 1 : std::size_t(slash - path);
    if (length >= sizeof parent)
      return false;
    std::memcpy(parent, path, length);
    parent[length] = '\0';
    parentFd = ::open(parent, O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (parentFd < 0)
      return false;
  }
  bool removed = false;
  struct stat info {};
  if (::fstatat(parentFd, name, &info, AT_SYMLINK_NOFOLLOW) == 0 && S_ISDIR(info.st_mode)) {
    const int fd = ::openat(parentFd, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    // The root in any spelling, and mount points: rmdir would refuse them
    // after everything inside was gone. Refused before anything is touched.
    if (fd >= 0 && !IsRootOrMountPoint(fd)) {
      const bool cleared = ClearDirectory(fd, 0, maxDepth);
      ::close(fd);
      removed = cleared && ::unlinkat(parentFd, name, AT_REMOVEDIR) == 0;
    } else if (fd >= 0) {
      ::close(fd);
    }
  }
  if (parentFd != AT_FDCWD)
    ::close(parentFd);
  return removed;
}

bool SKRFiles::ListDirectory(const char* path, std::vector<std::string>& names) {
  const int fd = ::open(path, O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (fd < 0)
    return false;
  DIR* dir = ::fdopendir(fd);
  if (dir == nullptr) {
    ::close(fd);
    return false;
  }
  try {
    while (const dirent* entry = ::readdir(dir))
      names.emplace_back(entry->d_name);
  } catch (...) {
    ::closedir(dir);
    throw;
  }
  ::closedir(dir);
  return true;
}

bool SKRFiles::ReadWholeFile(const char* path, std::uint64_t maxSize, unsigned char*& data,
                             std::size_t& size) noexcept {
  data = nullptr;
  size = 0;
  std::size_t length = 0;
  const int fd = OpenRegular(path, maxSize, length);
  if (fd < 0)
    return false;
  unsigned char* buffer = new (std::nothrow) unsigned char[length > 0 ? length : 1];
  if (buffer == nullptr) {
    ::close(fd);
    return false;
  }
  const bool read = ReadFully(fd, buffer, length);
  if (!CloseChecked(fd) || !read) {
    delete[] buffer;
    return false;
  }
  data = buffer;
  size = length;
  return true;
}

bool SKRFiles::WriteWholeFile(const char* path, const void* data, std::size_t size, bool append) noexcept {
  const int flags = O_WRONLY | O_CLOEXEC | O_NOCTTY | O_NONBLOCK | (append ? O_APPEND : 0);
  int fd = -1;
  // Open an existing file first; create only with O_EXCL, which refuses a
  // dangling link instead of creating its target. Twice, in case another
  // process creates or removes the file in between.
  for (int attempt = 0; attempt < 2 && fd < 0; ++attempt) {
    fd = Retry([&] { return ::open(path, flags); });
    if (fd < 0 && errno == ENOENT)
      fd = Retry([&] { return ::open(path, flags | O_CREAT | O_EXCL, 0666); });
    if (fd < 0 && errno != EEXIST && errno != ENOENT)
      return false;
  }
  if (fd < 0)
    return false;
  struct stat info {};
  bool ok = ::fstat(fd, &info) == 0 && S_ISREG(info.st_mode);
  if (ok && !append)
    ok = ::ftruncate(fd, 0) == 0;
  if (ok)
    ok = WriteFully(fd, static_cast<const unsigned char*>(data), size);
  return CloseChecked(fd) && ok;
}

std::FILE* SKRFiles::OpenStream(const char* path, const char* mode) noexcept {
  int flags = 0;
  if (!ModeToFlags(mode, flags))
    return nullptr;
  const int fd = Retry([&] { return ::open(path, flags | O_NONBLOCK, 0666); });
  if (fd < 0)
    return nullptr;
  // Back to blocking transfers now that the open itself cannot wait.
  const int status = ::fcntl(fd, F_GETFL);
  if (status < 0 || ::fcntl(fd, F_SETFL, status & ~O_NONBLOCK) != 0) {
    ::close(fd);
    return nullptr;
  }
  // fdopen takes the same letters; the creation flags are already applied.
  std::string streamMode(1, mode[0]);
  if (std::strchr(mode, '+') != nullptr)
    streamMode += '+';
  std::FILE* stream = ::fdopen(fd, streamMode.c_str());
  if (stream == nullptr)
    ::close(fd);
  return stream;
}

std::FILE* SKRFiles::OpenRegularFileForReading(const char* path, std::uint64_t maxSize) noexcept {
  std::size_t size = 0;
  const int fd = OpenRegular(path, maxSize, size);
  if (fd < 0)
    return nullptr;
  std::FILE* stream = ::fdopen(fd, "rb");
  if (stream == nullptr)
    ::close(fd);
  return stream;
}

bool SKRReplacementFile::Begin(const char* path) noexcept {
  Abandon();
  m_Failed = false;
  struct stat target {};
  const bool exists = ::stat(path, &target) == 0;
  if (exists && !S_ISREG(target.st_mode))
    return false;
  try {
    m_Target = path;
    // Names unique to this process and call; O_EXCL refuses anything that
    // is already there (a stale file, a planted link).
    static std::atomic<unsigned> s_Counter{0};
    for (int attempt = 0; attempt < 16 && m_Fd < 0; ++attempt) {
      char suffix[64];
      std::snprintf(suffix, sizeof suffix, ".%ld.%u.tmp", long(::getpid()), s_Counter.fetch_add(1));
      m_Temporary = m_Target + suffix;
      m_Fd = Retry([&] { return ::open(m_Temporary.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC | O_NOCTTY, 0666); });
      if (m_Fd < 0 && errno != EEXIST)
        break;
    }
  } catch (...) {
    return false;
  }
  if (m_Fd < 0)
    return false;
  if (exists)
    (void)::fchmod(m_Fd, target.st_mode & 07777);
  return true;
}

bool SKRReplacementFile::Write(const void* data, std::size_t size) noexcept {
  if (m_Fd < 0 || m_Failed)
    return false;
  if (!WriteFully(m_Fd, static_cast<const unsigned char*>(data), size))
    m_Failed = true;
  return !m_Failed;
}

bool SKRReplacementFile::Commit() noexcept {
  if (m_Fd < 0)
    return false;
  bool ok = !m_Failed && Retry([&] { return ::fsync(m_Fd); }) == 0;
  ok = CloseChecked(m_Fd) && ok;
  m_Fd = -1;
  ok = ok && ::rename(m_Temporary.c_str(), m_Target.c_str()) == 0;
  if (!ok) {
    ::unlink(m_Temporary.c_str());
    m_Temporary.clear();
    return false;
  }
  m_Temporary.clear();
  // The rename itself reaches the disk with the folder's entry.
  const std::size_t slash = m_Target.rfind('/');
  const std::string folder = slash == std::string::npos ? "." : (slash == 0 ? "/" : m_Target.substr(0, slash));
  const int folderFd = ::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (folderFd >= 0) {
    (void)Retry([&] { return ::fsync(folderFd); });
    ::close(folderFd);
  }
  return true;
}

void SKRReplacementFile::Abandon() noexcept {
  if (m_Fd >= 0) {
    ::close(m_Fd);
    m_Fd = -1;
  }
  if (!m_Temporary.empty()) {
    ::unlink(m_Temporary.c_str());
    m_Temporary.clear();
  }
}
