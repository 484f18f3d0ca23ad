#include <krCoreLib/system/CKRSingleAppInstance.h>

#include "KRFilesScratch.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

namespace {

// Sets environment variables for the length of a test and puts back what
// was there.
class CKREnvironmentGuard {
public:
  ~CKREnvironmentGuard() {
    for (auto it = m_Saved.rbegin(); it != m_Saved.rend(); ++it) {
      if (it->second)
        ::setenv(it->first.c_str(), it->second->c_str(), 1);
      else
        ::unsetenv(it->first.c_str());
    }
  }
  void Set(const char* name, const std::string& value) {
    Save(name);
    ::setenv(name, value.c_str(), 1);
  }
  void Unset(const char* name) {
    Save(name);
    ::unsetenv(name);
  }

private:
  void Save(const char* name) {
    const char* value = std::getenv(name);
    m_Saved.emplace_back(name, value != nullptr ? std::optional<std::string>(value) : std::nullopt);
  }
  std::vector<std::pair<std::string, std::optional<std::string>>> m_Saved;
};

// The runtime folder of the tests: inside the scratch folder, never the
// user's own.
void UseScratchRuntime(const CKRFilesScratch& scratch, CKREnvironmentGuard& environment) {
  ASSERT_EQ(::mkdir(scratch.Native("run").c_str(), 0700), 0);
  environment.Set("XDG_RUNTIME_DIR", scratch.Native("run"));
  environment.Set("XDG_SESSION_ID", "test");
  environment.Set("TMPDIR", scratch.Native());
}

CKRString UniqueID(const wchar_t* what) {
  return CKRString::Formatted(L"krFilesTestApp-%s-%d-%u", what, int(::getpid()), KRTestSeed());
}

// What the running instance's listener was asked, for the test to wait on.
struct SKRRequests {
  std::mutex m_Mutex;
  std::condition_variable m_Changed;
  int m_Activations = 0;
  std::vector<CKRString> m_Files;

  // Waits until `done` holds; the limit only keeps a broken build from
  // hanging the suite.
  template <typename Predicate>
  bool WaitUntil(Predicate done) {
    std::unique_lock<std::mutex> lock(m_Mutex);
    return m_Changed.wait_for(lock, std::chrono::seconds(60), done);
  }
};

}  // namespace

TEST(CKRSingleAppInstance, SecondProcessFindsTheFirstAndHandsItAFile) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  CKREnvironmentGuard environment;
  UseScratchRuntime(scratch, environment);
  const CKRString id = UniqueID(L"handover");

  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr)) << "the first instance";
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr)) << "still, in the same process";

  SKRRequests requests;
  CKRSingleAppInstanceListener listener;
  ASSERT_TRUE(listener.Start(
      id.GetString(),
      [&] {
        const std::lock_guard<std::mutex> lock(requests.m_Mutex);
        ++requests.m_Activations;
        requests.m_Changed.notify_all();
      },
      [&](const CKRString& file) {
        const std::lock_guard<std::mutex> lock(requests.m_Mutex);
        requests.m_Files.push_back(file);
        requests.m_Changed.notify_all();
      }));
  EXPECT_TRUE(listener.IsRunning());
  EXPECT_FALSE(listener.Start(id.GetString(), nullptr, nullptr)) << "already started";

  // A second instance started in another folder with a relative file name.
  scratch.MakeFolder("elsewhere");
  const std::string folder = scratch.Native("elsewhere");
  const int status = KRRunInChild([&] {
    if (::chdir(folder.c_str()) != 0)
      return 10;
    const char* arguments[] = {"app", "-n", "docs/plan \xC3\xA9.txt", "second.txt", nullptr};
    return CKRSingleAppInstance::DetectAppInstance(id.GetString(), 4, arguments) ? 0 : 1;
  });
  EXPECT_EQ(status, 0) << "the second instance found the first";
  ASSERT_TRUE(requests.WaitUntil([&] { return !requests.m_Files.empty(); }));
  {
    const std::lock_guard<std::mutex> lock(requests.m_Mutex);
    EXPECT_EQ(requests.m_Activations, 1);
    ASSERT_EQ(requests.m_Files.size(), 1u);
    EXPECT_EQ(requests.m_Files[0], scratch.Wide("elsewhere/docs/plan \xC3\xA9.txt"));
  }

  // Another one, with an absolute name, and one without any.
  EXPECT_EQ(KRRunInChild([&] {
              const char* arguments[] = {"app", "/data/model.kr"};
              return CKRSingleAppInstance::DetectAppInstance(id.GetString(), 2, arguments) ? 0 : 1;
            }),
            0);
  EXPECT_EQ(KRRunInChild([&] { return CKRSingleAppInstance::DetectAppInstance(id.GetString(), 1, nullptr) ? 0 : 1; }),
            0);
  // A name that is not UTF-8 cannot be handed over exactly: it is not.
  EXPECT_EQ(KRRunInChild([&] {
              const char* arguments[] = {"app", "/data/bad\xFF.kr"};
              return CKRSingleAppInstance::DetectAppInstance(id.GetString(), 2, arguments) ? 0 : 1;
            }),
            0);
  ASSERT_TRUE(requests.WaitUntil([&] { return requests.m_Activations == 4; }));
  {
    const std::lock_guard<std::mutex> lock(requests.m_Mutex);
    ASSERT_EQ(requests.m_Files.size(), 2u);
    EXPECT_EQ(requests.m_Files[1], L"/data/model.kr");
  }

  listener.Stop();
  EXPECT_FALSE(listener.IsRunning());
  // Still running, though no longer listening.
  EXPECT_EQ(KRRunInChild([&] { return CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr) ? 0 : 1; }),
            0);
}

TEST(CKRSingleAppInstance, TheLockEndsWithItsProcess) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  CKREnvironmentGuard environment;
  UseScratchRuntime(scratch, environment);
  // Separators and a length beyond a socket address: still one instance.
  const CKRString id = UniqueID(L"a/b\\c") + CKRString(300, L'x');

  // A child that is the first instance and ends.
  EXPECT_EQ(KRRunInChild([&] { return CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr) ? 1 : 0; }),
            0);
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr)) << "free again";
  EXPECT_EQ(KRRunInChild([&] { return CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr) ? 0 : 1; }),
            0);
  // Only the holder of the lock may listen.
  EXPECT_EQ(KRRunInChild([&] {
              CKRSingleAppInstanceListener listener;
              return listener.Start(id.GetString(), nullptr, nullptr) ? 1 : 0;
            }),
            0);
  // Another application ID is another application.
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(UniqueID(L"other").GetString(), 0, nullptr));
}

TEST(CKRSingleAppInstance, BadIDsAndFoldersDetectNothing) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  CKREnvironmentGuard environment;
  UseScratchRuntime(scratch, environment);
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(nullptr, 0, nullptr));
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(L"", 0, nullptr));
  CKRSingleAppInstanceListener listener;
  EXPECT_FALSE(listener.Start(L"", nullptr, nullptr));
  EXPECT_FALSE(listener.IsRunning());
  listener.Stop();

  // Without a runtime folder of its own the user gets a private one in the
  // temporary folder ...
  environment.Unset("XDG_RUNTIME_DIR");
  const CKRString id = UniqueID(L"fallback");
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr));
  EXPECT_EQ(KRRunInChild([&] { return CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr) ? 0 : 1; }),
            0);
  struct stat info {};
  ASSERT_EQ(::lstat(scratch.Native("krCoreLib-" + std::to_string(::geteuid())).c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 0777, 0700u);

  // ... and a folder of that name that is not private is not used.
  scratch.MakeFolder("tmp2");
  scratch.MakeFolder("tmp2/target");
  scratch.MakeLink(scratch.Native("tmp2/target"), "tmp2/krCoreLib-" + std::to_string(::geteuid()));
  environment.Set("TMPDIR", scratch.Native("tmp2"));
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(UniqueID(L"unsafe").GetString(), 0, nullptr));
  EXPECT_FALSE(listener.Start(UniqueID(L"unsafe").GetString(), nullptr, nullptr));
}
