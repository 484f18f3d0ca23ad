// The test every shared object of the system services passes before it is
// used: it belongs to the effective user, and nobody else may use it.
#pragma once

#include <sys/stat.h>
#include <unistd.h>

struct SKROwnerOnly {
  // True when `fd` is open on an object of the file type `type` (S_IFREG,
  // S_IFDIR) owned by the effective user, without permissions for its group
  // or for others. Checked on the descriptor, so that what was checked is
  // what is used, whatever happens to the name meanwhile.
  static bool Check(int fd, mode_t type) noexcept {
    struct stat info {};
    return ::fstat(fd, &info) == 0 && (info.st_mode & S_IFMT) == type && info.st_uid == ::geteuid() &&
           (info.st_mode & 077) == 0;
  }
};
