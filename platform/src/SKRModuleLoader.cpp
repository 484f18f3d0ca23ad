#include "SKRModuleLoader.h"

#include <dlfcn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <map>
#include <mutex>
#include <tuple>

namespace {

// The exit status of a trial child that went through all its files (a file
// the loader refuses is reported as such, and the real load repeats the
// refusal in this process with the loader's text), and of one in which the
// loader let a module's exception through. 75 and 76 are outside the range
// the shell and the C runtime use for their own failures.
constexpr int kTrialLoaded = 75;
constexpr int kTrialThrew = 76;

using FileIdentity = std::tuple<dev_t, ino_t, off_t, long long, long long>;

struct SKRTrials {
  std::mutex m_Lock;
  // File identity -> empty text when the trial load succeeded (or the
  // loader refused the file), otherwise the reason the trial ended.
  std::map<FileIdentity, std::string> m_Verdicts;
};

SKRTrials& Trials() {
  static SKRTrials s_Trials;
  return s_Trials;
}

std::string LoaderText() {
  const char* text = dlerror();
  return text != nullptr ? std::string(text) : std::string("unknown loader error");
}

// The identity of a regular file, or false for anything else.
bool IdentityOf(const char* path, FileIdentity& identity) {
  struct stat info {};
  if (stat(path, &info) != 0 || !S_ISREG(info.st_mode))
    return false;
  identity = FileIdentity{info.st_dev, info.st_ino, info.st_size, static_cast<long long>(info.st_mtim.tv_sec),
                          static_cast<long long>(info.st_mtim.tv_nsec)};
  return true;
}

// What one trial child reports per file: its index and whether the loader
// took it.
struct SKRTrialReport {
  int m_Index;
  int m_Loaded;
};

// Writes all of a report (a pipe write of this size is atomic).
void Report(int pipe, int index, int loaded) {
  const SKRTrialReport report{index, loaded};
  while (write(pipe, &report, sizeof report) < 0 && errno == EINTR) {
  }
}

// Tries `paths[first..]` in one child process, which loads them in order
// and reports each. Returns the index after the last file reported; when
// the child ended before reporting them all, `reason` says how and the file
// at the returned index is the one it ended on. -1 when no child could be
// started.
int TryInChild(const std::vector<const char*>& paths, std::size_t first, std::string& reason) {
  int channel[2];
  if (pipe(channel) != 0)
    return -1;
  const pid_t child = fork();
  if (child < 0) {
    close(channel[0]);
    close(channel[1]);
    return -1;
  }
  if (child == 0) {
    close(channel[0]);
    // Whether a module's exception ends the process or comes out of the
    // loader depends on how the module was built: neither may get past here.
    try {
      for (std::size_t i = first; i < paths.size(); ++i)
        Report(channel[1], static_cast<int>(i), dlopen(paths[i], RTLD_NOW | RTLD_LOCAL) != nullptr ? 1 : 0);
    } catch (...) {
      _exit(kTrialThrew);
    }
    _exit(kTrialLoaded);
  }
  close(channel[1]);
  std::size_t next = first;
  SKRTrialReport report{};
  for (;;) {
    const ssize_t got = read(channel[0], &report, sizeof report);
    if (got < 0 && errno == EINTR)
      continue;
    if (got != static_cast<ssize_t>(sizeof report))
      break;
    next = static_cast<std::size_t>(report.m_Index) + 1;
  }
  close(channel[0]);
  int status = 0;
  pid_t ended;
  do
    ended = waitpid(child, &status, 0);
  while (ended < 0 && errno == EINTR);
  reason.clear();
  if (next < paths.size()) {
    if (ended >= 0 && WIFEXITED(status) && WEXITSTATUS(status) == kTrialThrew)
      reason = ": the module's initialisation threw an exception";
    else if (ended >= 0 && WIFSIGNALED(status))
      reason = ": the module's initialisation ended abnormally (signal " + std::to_string(WTERMSIG(status)) + ")";
    else if (ended >= 0 && WIFEXITED(status))
      reason = ": the module's initialisation ended the process (exit status " + std::to_string(WEXITSTATUS(status)) + ")";
    else
      reason = ": the module's initialisation did not complete";
  }
  return static_cast<int>(next);
}

// Tries the files without a verdict and enters theirs; the caller holds
// the lock.
void TryUnknown(SKRTrials& trials, const std::vector<std::string>& paths) {
  std::vector<const char*> unknown;
  std::vector<FileIdentity> identities;
  for (const std::string& path : paths) {
    FileIdentity identity;
    if (IdentityOf(path.c_str(), identity) && trials.m_Verdicts.count(identity) == 0 &&
        std::find(identities.begin(), identities.end(), identity) == identities.end()) {
      unknown.push_back(path.c_str());
      identities.push_back(identity);
    }
  }
  std::size_t first = 0;
  while (first < unknown.size()) {
    std::string reason;
    const int next = TryInChild(unknown, first, reason);
    if (next < 0)
      return;  // no trial possible: the loads go ahead as they would without one
    for (std::size_t i = first; i < static_cast<std::size_t>(next); ++i)
      trials.m_Verdicts.emplace(identities[i], std::string());
    first = static_cast<std::size_t>(next);
    if (first < unknown.size()) {
      trials.m_Verdicts.emplace(identities[first], unknown[first] + reason);
      ++first;
    }
  }
}

}  // namespace

void SKRModuleLoader::TryAll(const std::vector<std::string>& paths) {
  SKRTrials& trials = Trials();
  std::lock_guard<std::mutex> hold(trials.m_Lock);
  TryUnknown(trials, paths);
}

void* SKRModuleLoader::Load(const char* path, std::string& error) {
  error.clear();
  if (path == nullptr || *path == '\0') {
    error = "empty module path";
    return nullptr;
  }
  FileIdentity identity;
  if (IdentityOf(path, identity)) {
    SKRTrials& trials = Trials();
    std::lock_guard<std::mutex> hold(trials.m_Lock);
    TryUnknown(trials, {path});
    const auto known = trials.m_Verdicts.find(identity);
    if (known != trials.m_Verdicts.end() && !known->second.empty()) {
      error = known->second;
      return nullptr;
    }
  }
  dlerror();
  void* module = nullptr;
  try {
    module = dlopen(path, RTLD_NOW | RTLD_LOCAL);
  } catch (...) {
    // Only when no trial could run or the file changed since: the module is
    // refused, and the loader may be left in a state no later load trusts.
    error = std::string(path) + ": the module's initialisation threw an exception";
    return nullptr;
  }
  if (module == nullptr)
    error = LoaderText();
  return module;
}

void* SKRModuleLoader::FindExport(void* module, const char* name, std::string& error) {
  error.clear();
  if (module == nullptr || name == nullptr) {
    error = "no module";
    return nullptr;
  }
  dlerror();
  void* address = dlsym(module, name);
  if (address == nullptr) {
    const char* text = dlerror();
    // A symbol may legitimately have the address null only in theory; a
    // function never does.
    error = text != nullptr ? std::string(text) : std::string(name) + ": the export has no address";
  }
  return address;
}

void SKRModuleLoader::Unload(void* module) noexcept {
  if (module != nullptr)
    dlclose(module);
}

void SKRModuleLoader::ForgetTrials() noexcept {
  SKRTrials& trials = Trials();
  std::lock_guard<std::mutex> hold(trials.m_Lock);
  trials.m_Verdicts.clear();
}
