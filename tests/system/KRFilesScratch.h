// Helpers of the file, path and shared-memory tests: a scratch folder that
// is unique to the test process and removed with everything in it, and a
// few direct system calls to prepare what the library must cope with.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <system_error>

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

class CKRFilesScratch {
public:
  CKRFilesScratch() {
    std::string pattern = (std::filesystem::temp_directory_path() / "krfiles-XXXXXX").string();
    if (::mkdtemp(pattern.data()) != nullptr)
      m_Root = pattern;
  }
  ~CKRFilesScratch() {
    std::error_code error;
    // Give back permissions the tests took away, so that everything goes.
    for (auto it = std::filesystem::recursive_directory_iterator(m_Root, error);
         !error && it != std::filesystem::recursive_directory_iterator(); it.increment(error)) {
      if (it->is_directory(error) && !it->is_symlink(error))
        ::chmod(it->path().c_str(), 0700);
    }
    std::filesystem::remove_all(m_Root, error);
  }
  CKRFilesScratch(const CKRFilesScratch&) = delete;
  CKRFilesScratch& operator=(const CKRFilesScratch&) = delete;

  bool IsValid() const { return !m_Root.empty(); }
  // The native path of a name inside the folder ("" for the folder itself).
  std::string Native(const std::string& name = "") const { return name.empty() ? m_Root : m_Root + "/" + name; }
  // The same as a wide path.
  CKRString Wide(const std::string& name = "") const { return CKRString::FromUtf8(Native(name)); }

  void WriteFile(const std::string& name, const std::string& content) const {
    const int fd = ::open(Native(name).c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    ASSERT_GE(fd, 0) << name;
    ASSERT_EQ(::write(fd, content.data(), content.size()), ssize_t(content.size()));
    ::close(fd);
  }
  void MakeFolder(const std::string& name) const { ASSERT_EQ(::mkdir(Native(name).c_str(), 0755), 0) << name; }
  void MakeLink(const std::string& target, const std::string& name) const {
    ASSERT_EQ(::symlink(target.c_str(), Native(name).c_str()), 0) << name;
  }
  void MakePipe(const std::string& name) const { ASSERT_EQ(::mkfifo(Native(name).c_str(), 0600), 0) << name; }

private:
  std::string m_Root;
};

// Number of open descriptors of this process: a failure must leave it as
// it was.
inline int KROpenDescriptorCount() {
  int count = 0;
  if (DIR* dir = ::opendir("/proc/self/fd")) {
    while (::readdir(dir) != nullptr)
      ++count;
    ::closedir(dir);
  }
  return count;
}

// Starts `body` in a forked child, which ends with _exit(body()), running
// no destructors of the parent's objects. Returns the child's ID, or -1.
template <typename Body>
pid_t KRStartChild(Body body) {
  const pid_t child = ::fork();
  if (child == 0)
    ::_exit(body());
  return child;
}

// Waits for a child: its exit status, or -1 when it did not exit normally.
inline int KRWaitChild(pid_t child) {
  if (child < 0)
    return -1;
  int status = 0;
  while (::waitpid(child, &status, 0) < 0) {
    if (errno != EINTR)
      return -1;
  }
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

// Runs `body` in a forked child and returns its exit status.
template <typename Body>
int KRRunInChild(Body body) {
  return KRWaitChild(KRStartChild(body));
}

// Runs one (usually disabled) test of `program`, a copy of this test
// program, in a fresh process and returns its exit status: 0 when it
// passed. Its output goes nowhere.
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

// True when file permissions bind this process (they do not for root).
inline bool KRPermissionsApply() {
  return ::geteuid() != 0;
}
