// Helpers of the file, path and shared-memory tests: a scratch folder with
// ways to fill it, and direct system calls to prepare what the library must
// cope with.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/system/CKRMemMapFile.h>
#include <krCoreLib/system/CKRSystem.h>

#include "KRScratchFolder.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cmath>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <optional>
#include <random>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

#include <fcntl.h>
#include <grp.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

class CKRFilesScratch : public CKRScratchFolder {
public:
  // The path of a name inside the folder ("" for the folder itself).
  std::string Native(const std::string& name = "") const { return name.empty() ? Root() : Path(name); }
  CKRString Wide(const std::string& name = "") const { return CKRString::FromUtf8(Native(name)); }

  void WriteFile(const std::string& name, const std::string& content) const {
    const int fd = ::open(Native(name).c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    ASSERT_GE(fd, 0) << name;
    ASSERT_EQ(::write(fd, content.data(), content.size()), ssize_t(content.size()));
    ::close(fd);
  }
  void MakeLink(const std::string& target, const std::string& name) const {
    ASSERT_EQ(::symlink(target.c_str(), Native(name).c_str()), 0) << name;
  }
  void MakePipe(const std::string& name) const { ASSERT_EQ(::mkfifo(Native(name).c_str(), 0600), 0) << name; }
  // A sparse file of `size` bytes.
  void MakeSparse(const std::string& name, off_t size) const {
    WriteFile(name, "");
    std::filesystem::resize_file(Native(name), std::uintmax_t(size));
  }
  // Makes each entry with the folders above it: a folder where the name ends
  // in "/", else a file holding its own name.
  void Make(std::initializer_list<std::string> names) const {
    for (const std::string& name : names) {
      std::filesystem::create_directories(std::filesystem::path(Native(name)).parent_path());
      if (name.back() != '/')
        WriteFile(name, name);
    }
  }
};

// Paths every file service must refuse, made inside `scratch`.
inline std::vector<std::pair<const char*, CKRString>> KRBadPaths(const CKRFilesScratch& scratch) {
  scratch.Make({"bad-folder/"});
  scratch.MakePipe("bad-pipe");
  scratch.MakeLink(scratch.Native("bad-gone"), "bad-dangling");
  return {{"empty", CKRString()},
          {"overlong", scratch.Wide() + L"/" + CKRString(5000, L'a')},
          {"lone surrogate", CKRString(L"/tmp/") + wchar_t(0xD800)},
          {"missing folder", scratch.Wide("no/such/file")},
          {"directory", scratch.Wide("bad-folder")},
          {"pipe without a writer", scratch.Wide("bad-pipe")},
          {"dangling link", scratch.Wide("bad-dangling")}};
}

// A name no other test process uses at the same time.
inline CKRString KRUniqueName(const wchar_t* what) {
  return CKRString::Formatted(L"krFilesTest-%s-%d-%u", what, int(::getpid()), KRTestSeed());
}

// A file's content through CKRSystem::Load.
inline std::string KRLoadText(const CKRString& path) {
  unsigned char* buffer = nullptr;
  std::size_t size = 0;
  if (!CKRSystem::Load(path.GetString(), buffer, size))
    return "<unreadable>";
  std::string text(reinterpret_cast<char*>(buffer), size);
  delete[] buffer;
  return text;
}

// Number of open descriptors of this process (with the one that lists them).
inline int KROpenDescriptorCount() {
  using std::filesystem::directory_iterator;
  return int(std::distance(directory_iterator("/proc/self/fd"), directory_iterator()));
}

// Starts `body` in a forked child that ends with _exit(body()); -1 on failure.
template <typename Body>
pid_t KRStartChild(Body body) {
  const pid_t child = ::fork();
  if (child == 0)
    ::_exit(body());
  return child;
}

// Waits for a child: its exit status, or -1 when it did not exit normally.
inline int KRWaitChild(pid_t child) {
  int status = -1;
  while (child > 0 && ::waitpid(child, &status, 0) < 0 && errno == EINTR) {
  }
  return child > 0 && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

// Runs `body` in a forked child and returns its exit status.
template <typename Body>
int KRRunInChild(Body body) {
  return KRWaitChild(KRStartChild(body));
}

// Runs one (usually disabled) test of `program`, a copy of this program, in
// a fresh process: 0 when it passed.
inline int KRRunTestProgram(const std::string& program, const char* test) {
  const std::string filter = std::string("--gtest_filter=") + test;
  return KRRunInChild([&] {
    const char* arguments[] = {program.c_str(), "--gtest_also_run_disabled_tests", filter.c_str(), nullptr};
    const int null = ::open("/dev/null", O_WRONLY | O_CLOEXEC);
    ::dup2(null, 1);
    ::execv(program.c_str(), const_cast<char* const*>(arguments));
    return 99;
  });
}

// The second user of the tests that need one: "nobody" (65534), which owns
// nothing of the tests.
inline constexpr uid_t kKRAnotherUser = 65534;
// Whether a forked child can become that user: only root can, and only for
// others do file permissions bind.
inline bool KRCanActAsAnotherUser() {
  return ::geteuid() == 0;
}
// Makes the calling (forked, single-threaded) process that user for good.
inline bool KRBecomeAnotherUser() {
  const gid_t group = 65534;
  return ::setgroups(0, nullptr) == 0 && ::setresgid(group, group, group) == 0 &&
         ::setresuid(kKRAnotherUser, kKRAnotherUser, kKRAnotherUser) == 0;
}

// The system's paths of the shared memory named `name` and of its lock:
// what appears in the shared-memory folder while it is mapped.
inline std::vector<std::string> KRSharedObjectsOf(const CKRString& name) {
  std::vector<std::string> paths;
  CKRMemMapFile probe;
  if (probe.MapMemory(name.GetString(), 8) != 1)
    return paths;
  const std::string part = CKRMemMapFile::MakeMappingName(name.GetString()).ToUtf8();
  for (const auto& entry : std::filesystem::directory_iterator("/dev/shm")) {
    if (entry.path().filename().string().find(part) != std::string::npos)
      paths.push_back(entry.path().string());
  }
  return paths;
}

// Shared-memory objects that the second user plants under the given paths,
// open to everyone and kept in use (locked, as live objects are) until the
// planter is destroyed, which removes them.
class CKRPlantedObjects {
public:
  explicit CKRPlantedObjects(std::vector<std::string> paths) : m_Paths(std::move(paths)) {
    int planted[2], release[2];
    if (::pipe(planted) != 0 || ::pipe(release) != 0)
      return;
    m_Child = KRStartChild([&] {
      ::close(planted[0]);
      ::close(release[1]);
      if (!KRBecomeAnotherUser())
        return 1;
      for (const std::string& path : m_Paths) {
        const int fd = ::open(path.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
        if (fd < 0 || ::fchmod(fd, 0666) != 0 || ::ftruncate(fd, 1 << 16) != 0 || ::flock(fd, LOCK_SH) != 0)
          return 2;
      }
      char byte = 0;
      return ::write(planted[1], "!", 1) == 1 && ::read(release[0], &byte, 1) == 0 ? 0 : 3;
    });
    ::close(planted[1]);
    ::close(release[0]);
    m_Release = release[1];
    char byte = 0;
    m_Planted = m_Child > 0 && ::read(planted[0], &byte, 1) == 1;
    ::close(planted[0]);
  }
  ~CKRPlantedObjects() {
    ::close(m_Release);
    EXPECT_EQ(KRWaitChild(m_Child), 0) << "the planter";
    for (const std::string& path : m_Paths)
      ::unlink(path.c_str());
  }
  CKRPlantedObjects(const CKRPlantedObjects&) = delete;
  CKRPlantedObjects& operator=(const CKRPlantedObjects&) = delete;
  bool IsPlanted() const { return m_Planted; }

private:
  std::vector<std::string> m_Paths;
  pid_t m_Child = -1;
  int m_Release = -1;
  bool m_Planted = false;
};
