#include <krCoreLib/system/CKRSingleAppInstance.h>

#include "KRFilesScratch.h"

namespace {

// A scratch folder as the runtime and temporary folder of the tests, never
// the user's own; the environment is put back afterwards.
class CKRScratchRuntime : public CKRFilesScratch {
public:
  static constexpr const char* kNames[] = {"XDG_RUNTIME_DIR", "XDG_SESSION_ID", "TMPDIR"};
  CKRScratchRuntime() {
    for (const char* name : kNames) {
      const char* value = std::getenv(name);
      m_Saved.push_back(value != nullptr ? std::optional<std::string>(value) : std::nullopt);
    }
    ::mkdir(Native("run").c_str(), 0700);
    ::setenv("XDG_RUNTIME_DIR", Native("run").c_str(), 1);
    ::setenv("XDG_SESSION_ID", "test", 1);
    ::setenv("TMPDIR", Native().c_str(), 1);
  }
  ~CKRScratchRuntime() {
    for (std::size_t i = 0; i < m_Saved.size(); ++i)
      m_Saved[i] ? ::setenv(kNames[i], m_Saved[i]->c_str(), 1) : ::unsetenv(kNames[i]);
  }

private:
  std::vector<std::optional<std::string>> m_Saved;
};

CKRString UniqueID(const wchar_t* what) {
  return CKRString::Formatted(L"krFilesTestApp-%s-%d-%u", what, int(::getpid()), KRTestSeed());
}

// Whether a second instance, in a child process started in `folder`, finds
// the first.
bool DetectedInChild(const CKRString& id, std::vector<const char*> arguments = {}, const std::string& folder = "") {
  return KRRunInChild([&] {
           if (!folder.empty() && ::chdir(folder.c_str()) != 0)
             return 10;
           arguments.insert(arguments.begin(), "app");
           return CKRSingleAppInstance::DetectAppInstance(id.GetString(), int(arguments.size()), arguments.data()) ? 0 : 1;
         }) == 0;
}

// What the running instance's listener was asked: an empty file name for an
// activation without one.
class CKRRequests {
public:
  void Add(const CKRString& file) {
    const std::lock_guard<std::mutex> lock(m_Mutex);
    m_Requests.push_back(file);
    m_Changed.notify_all();
  }
  std::vector<CKRString> WaitFor(std::size_t count) {
    std::unique_lock<std::mutex> lock(m_Mutex);
    m_Changed.wait_for(lock, std::chrono::seconds(60), [&] { return m_Requests.size() >= count; });
    return m_Requests;
  }

private:
  std::mutex m_Mutex;
  std::condition_variable m_Changed;
  std::vector<CKRString> m_Requests;
};

}  // namespace

TEST(CKRSingleAppInstance, SecondProcessFindsTheFirstAndHandsItAFile) {
  CKRScratchRuntime scratch;
  const CKRString id = UniqueID(L"handover");
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr)) << "the first instance";

  // Each activation comes with the file it hands over, if any.
  CKRRequests requests;
  int activations = 0;
  CKRSingleAppInstanceListener listener;
  ASSERT_TRUE(listener.Start(
      id.GetString(), [&] { requests.Add(CKRString::Formatted(L"activation %d", ++activations)); },
      [&](const CKRString& file) { requests.Add(file); }));
  EXPECT_FALSE(listener.Start(id.GetString(), nullptr, nullptr)) << "already started";

  // Started in another folder with a relative name; then an absolute name,
  // one that is not UTF-8 (not handed over, as it cannot be exactly), none.
  scratch.MakeFolder("elsewhere");
  EXPECT_TRUE(DetectedInChild(id, {"-n", "docs/plan \xC3\xA9.txt", "second.txt"}, scratch.Native("elsewhere")));
  EXPECT_TRUE(DetectedInChild(id, {"/data/model.kr"}));
  EXPECT_TRUE(DetectedInChild(id, {"/data/bad\xFF.kr"}));
  EXPECT_TRUE(DetectedInChild(id));
  const CKRString relative = scratch.Wide("elsewhere/docs/plan \xC3\xA9.txt");
  EXPECT_EQ(requests.WaitFor(6), (std::vector<CKRString>{L"activation 1", relative, L"activation 2", L"/data/model.kr",
                                                         L"activation 3", L"activation 4"}));

  listener.Stop();
  EXPECT_FALSE(listener.IsRunning());
  EXPECT_TRUE(DetectedInChild(id)) << "still running, though no longer listening";
}

TEST(CKRSingleAppInstance, TheLockEndsWithItsProcess) {
  CKRScratchRuntime scratch;
  // Separators and a length beyond a socket address: still one instance.
  const CKRString id = UniqueID(L"a/b\\c") + CKRString(300, L'x');
  EXPECT_FALSE(DetectedInChild(id)) << "a first instance that ends";
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr)) << "free again";
  EXPECT_TRUE(DetectedInChild(id));
  EXPECT_EQ(KRRunInChild([&] {   // only the holder of the lock may listen
              CKRSingleAppInstanceListener listener;
              return listener.Start(id.GetString(), nullptr, nullptr) ? 1 : 0;
            }),
            0);
}

TEST(CKRSingleAppInstance, BadIDsAndFoldersDetectNothing) {
  CKRScratchRuntime scratch;
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(nullptr, 0, nullptr));
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(L"", 0, nullptr));
  CKRSingleAppInstanceListener listener;
  EXPECT_FALSE(listener.Start(L"", nullptr, nullptr));

  // Without a runtime folder of its own the user gets a private one in the
  // temporary folder ...
  ::unsetenv("XDG_RUNTIME_DIR");
  const CKRString id = UniqueID(L"fallback");
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr));
  EXPECT_TRUE(DetectedInChild(id));
  const std::string privateName = "krCoreLib-" + std::to_string(::geteuid());
  struct stat info {};
  ASSERT_EQ(::lstat(scratch.Native(privateName).c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 0777, 0700u);

  // ... and a folder of that name that is not private is not used.
  scratch.MakeFolder("tmp2");
  scratch.MakeLink(scratch.Native("run"), "tmp2/" + privateName);
  ::setenv("TMPDIR", scratch.Native("tmp2").c_str(), 1);
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(UniqueID(L"unsafe").GetString(), 0, nullptr));
  EXPECT_FALSE(listener.Start(UniqueID(L"unsafe").GetString(), nullptr, nullptr));
}
