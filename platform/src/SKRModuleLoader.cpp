#include "SKRModuleLoader.h"

#include <dlfcn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <map>
#include <mutex>
#include <tuple>

namespace {

// The exit status of a trial child whose load succeeded; any other end of
// the child (a signal, exit from a module's constructor, a failed load)
// is told apart from it. 75 is outside the range the shell and the C
// runtime use for their own failures.
constexpr int kTrialLoaded = 75;
// The exit status of a trial child whose loader refused the file: the real
// load repeats the refusal in this process and reports the loader's text.
constexpr int kTrialRefused = 76;

using FileIdentity = std::tuple<dev_t, ino_t, off_t, long long, long long>;

struct SKRTrials {
  std::mutex m_Lock;
  // File identity -> empty text when the trial load succeeded, otherwise
  // the reason it failed.
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

// Runs the loader on `path` in a child process. True when the child loaded
// the file or its loader refused it (then the real load reports the text);
// false with `error` set when the child ended any other way.
bool TryInChild(const char* path, std::string& error) {
  const pid_t child = fork();
  if (child < 0)
    return true;  // no trial possible: the load goes ahead as it would without one
  if (child == 0) {
    void* module = dlopen(path, RTLD_NOW | RTLD_LOCAL);
    _exit(module != nullptr ? kTrialLoaded : kTrialRefused);
  }
  int status = 0;
  pid_t ended;
  do
    ended = waitpid(child, &status, 0);
  while (ended < 0 && errno == EINTR);
  if (ended < 0)
    return true;
  if (WIFEXITED(status) && (WEXITSTATUS(status) == kTrialLoaded || WEXITSTATUS(status) == kTrialRefused))
    return true;
  error = path;
  if (WIFSIGNALED(status))
    error += ": the module's initialisation ended abnormally (signal " + std::to_string(WTERMSIG(status)) + ")";
  else
    error += ": the module's initialisation ended the process (exit status " +
             std::to_string(WEXITSTATUS(status)) + ")";
  return false;
}

}  // namespace

void* SKRModuleLoader::Load(const char* path, std::string& error) {
  error.clear();
  if (path == nullptr || *path == '\0') {
    error = "empty module path";
    return nullptr;
  }
  struct stat info {};
  if (stat(path, &info) == 0 && S_ISREG(info.st_mode)) {
    const FileIdentity identity{info.st_dev, info.st_ino, info.st_size, static_cast<long long>(info.st_mtim.tv_sec),
                                static_cast<long long>(info.st_mtim.tv_nsec)};
    SKRTrials& trials = Trials();
    std::lock_guard<std::mutex> hold(trials.m_Lock);
    auto known = trials.m_Verdicts.find(identity);
    if (known == trials.m_Verdicts.end()) {
      std::string reason;
      const bool good = TryInChild(path, reason);
      known = trials.m_Verdicts.emplace(identity, good ? std::string() : reason).first;
    }
    if (!known->second.empty()) {
      error = known->second;
      return nullptr;
    }
  }
  dlerror();
  void* module = dlopen(path, RTLD_NOW | RTLD_LOCAL);
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
