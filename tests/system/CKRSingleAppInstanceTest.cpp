#include <krCoreLib/system/CKRSingleAppInstance.h>

#include "KRFilesScratch.h"
#include "KRThreadTestSupport.h"

#include <sys/socket.h>
#include <sys/un.h>

namespace {

std::string PrivateFolderName() {
  return "krCoreLib-" + std::to_string(::geteuid());
}

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

  // Makes "tmp2" the temporary folder: the path of the private folder in it.
  std::string UseOtherTemporaryFolder() const {
    ::mkdir(Native("tmp2").c_str(), 0755);
    ::setenv("TMPDIR", Native("tmp2").c_str(), 1);
    return "tmp2/" + PrivateFolderName();
  }

private:
  std::vector<std::optional<std::string>> m_Saved;
};

// What a second instance, in a child process started in `folder`, finds:
// kNotDetected, or what became of its file (_EKRHandOver).
constexpr int kNotDetected = -1;
int DetectInChild(const CKRString& id, std::vector<const char*> arguments = {}, const std::string& folder = "") {
  const int status = KRRunInChild([&] {
    if (!folder.empty() && ::chdir(folder.c_str()) != 0)
      return 10;
    arguments.insert(arguments.begin(), "app");
    _EKRHandOver handOver = KRHANDOVER_FAILED;
    const bool detected =
        CKRSingleAppInstance::DetectAppInstance(id.GetString(), int(arguments.size()), arguments.data(), &handOver);
    return detected ? int(handOver) : 20 + int(handOver);
  });
  return status == 20 ? kNotDetected : status;
}

// What the running instance's listener was asked.
using CKRRequests = krtest::CRecords<CKRString>;

}  // namespace

TEST(CKRSingleAppInstance, SecondProcessFindsTheFirstWhileItLivesAndHandsItAFile) {
  CKRScratchRuntime scratch;
  const CKRString id = KRUniqueName(L"handover");
  _EKRHandOver handOver = KRHANDOVER_FAILED;
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr, &handOver)) << "the first";
  EXPECT_EQ(handOver, KRHANDOVER_NONE);

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
  scratch.Make({"elsewhere/"});
  EXPECT_EQ(DetectInChild(id, {"-n", "docs/plan \xC3\xA9.txt", "second.txt"}, scratch.Native("elsewhere")),
            KRHANDOVER_DELIVERED);
  EXPECT_EQ(DetectInChild(id, {"/data/model.kr"}), KRHANDOVER_DELIVERED);
  EXPECT_EQ(DetectInChild(id, {"/data/bad\xFF.kr"}), KRHANDOVER_FAILED);
  EXPECT_EQ(DetectInChild(id), KRHANDOVER_NONE);
  const CKRString relative = scratch.Wide("elsewhere/docs/plan \xC3\xA9.txt");
  EXPECT_EQ(requests.WaitFor(6), (std::vector<CKRString>{L"activation 1", relative, L"activation 2", L"/data/model.kr",
                                                         L"activation 3", L"activation 4"}));

  listener.Stop();
  EXPECT_FALSE(listener.IsRunning());
  EXPECT_EQ(DetectInChild(id), KRHANDOVER_NONE) << "still running, though no longer listening";
  EXPECT_EQ(DetectInChild(id, {"/data/model.kr"}), KRHANDOVER_FAILED);

  // The lock ends with its process; separators and a length beyond a socket
  // address still make one instance.
  const CKRString other = KRUniqueName(L"a/b\\c") + CKRString(300, L'x');
  EXPECT_EQ(DetectInChild(other), kNotDetected) << "a first instance that ends";
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(other.GetString(), 0, nullptr)) << "free again";
  EXPECT_EQ(DetectInChild(other), KRHANDOVER_NONE);
  // Only the holder of the lock may listen.
  EXPECT_EQ(KRRunInChild([&] { return CKRSingleAppInstanceListener().Start(other.GetString(), nullptr, nullptr); }), 0);
}

// Fifty instances started at once, while four connections that never say
// anything are held open: every file name arrives.
TEST(CKRSingleAppInstance, ManyInstancesAtOnceAllHandOverTheirFiles) {
  CKRScratchRuntime scratch;
  const CKRString id = KRUniqueName(L"many");
  CKRRequests requests;
  CKRSingleAppInstanceListener listener;
  ASSERT_TRUE(listener.Start(id.GetString(), nullptr, [&](const CKRString& file) { requests.Add(file); }));

  const std::string socketPath = scratch.Native("run/krCoreLib-") + id.ToUtf8() + "-test.sock";
  sockaddr_un address{AF_UNIX, {}};
  ASSERT_LT(socketPath.size(), sizeof address.sun_path);
  std::memcpy(address.sun_path, socketPath.c_str(), socketPath.size() + 1);
  std::vector<int> silent;
  for (int i = 0; i < 4; ++i) {
    const int fd = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    ASSERT_EQ(::connect(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0) << socketPath;
    silent.push_back(fd);
  }

  constexpr int kInstances = 50;
  int start[2];
  ASSERT_EQ(::pipe(start), 0);
  std::vector<pid_t> children;
  std::vector<CKRString> expected;
  for (int i = 0; i < kInstances; ++i) {
    const std::string file = "/data/file-" + std::to_string(i) + ".kr";
    expected.push_back(CKRString::FromUtf8(file));
    children.push_back(KRStartChild([&] {
      char byte = 0;
      ::close(start[1]);
      if (::read(start[0], &byte, 1) != 0)   // released all together
        return 10;
      const char* arguments[] = {"app", file.c_str()};
      _EKRHandOver handOver = KRHANDOVER_NONE;
      if (!CKRSingleAppInstance::DetectAppInstance(id.GetString(), 2, arguments, &handOver))
        return 11;
      return int(handOver);
    }));
  }
  ::close(start[0]);
  ::close(start[1]);
  for (const pid_t child : children)
    EXPECT_EQ(KRWaitChild(child), KRHANDOVER_DELIVERED);
  std::vector<CKRString> received = requests.WaitFor(kInstances, std::chrono::seconds(60));
  std::sort(received.begin(), received.end());
  std::sort(expected.begin(), expected.end());
  EXPECT_EQ(received, expected);
  for (const int fd : silent)
    ::close(fd);
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
  const CKRString id = KRUniqueName(L"fallback");
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(id.GetString(), 0, nullptr));
  EXPECT_EQ(DetectInChild(id), KRHANDOVER_NONE);
  struct stat info {};
  ASSERT_EQ(::lstat(scratch.Native(PrivateFolderName()).c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 0777, 0700u);

  // ... and a folder of that name that is not private is not used: a link,
  // or one open to others (one of another user: next test).
  const std::string unsafe = scratch.UseOtherTemporaryFolder();
  scratch.MakeLink(scratch.Native("run"), unsafe);
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(KRUniqueName(L"unsafe").GetString(), 0, nullptr));
  EXPECT_FALSE(listener.Start(KRUniqueName(L"unsafe").GetString(), nullptr, nullptr));
  ::unlink(scratch.Native(unsafe).c_str());
  scratch.Make({unsafe + "/"});
  ::chmod(scratch.Native(unsafe).c_str(), 0770);
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(KRUniqueName(L"open").GetString(), 0, nullptr));
}

// What another user owns is never used: shared memory planted under the
// application ID (the file name is not written into it, and the hand-over
// is reported failed), a private folder of that user, a runtime folder of
// that user (passed over for the private one).
TEST(CKRSingleAppInstance, WhatAnotherUserOwnsIsNotUsed) {
  if (!KRCanActAsAnotherUser())
    GTEST_SKIP() << "needs root to act as a second user";
  CKRScratchRuntime scratch;
  const CKRString id = KRUniqueName(L"planted id");
  const std::vector<std::string> objects = KRSharedObjectsOf(id);   // the block and its lock
  ASSERT_EQ(objects.size(), 2u);
  {
    CKRRequests requests;
    CKRSingleAppInstanceListener listener;
    ASSERT_TRUE(listener.Start(
        id.GetString(), [&] { requests.Add(L"activation"); }, [&](const CKRString& file) { requests.Add(file); }));
    CKRPlantedObjects planted(objects);
    ASSERT_TRUE(planted.IsPlanted());
    EXPECT_EQ(DetectInChild(id, {"/data/secret.kr"}), KRHANDOVER_FAILED);
    EXPECT_EQ(DetectInChild(id), KRHANDOVER_NONE);
    EXPECT_EQ(requests.WaitFor(2), (std::vector<CKRString>{L"activation", L"activation"})) << "no file arrived";
  }

  ::unsetenv("XDG_RUNTIME_DIR");
  const std::string unsafe = scratch.UseOtherTemporaryFolder();
  ::mkdir(scratch.Native(unsafe).c_str(), 0700);
  ASSERT_EQ(::chown(scratch.Native(unsafe).c_str(), kKRAnotherUser, kKRAnotherUser), 0);
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(KRUniqueName(L"other's").GetString(), 0, nullptr));
  ASSERT_EQ(::chown(scratch.Native("run").c_str(), kKRAnotherUser, kKRAnotherUser), 0);
  ::setenv("XDG_RUNTIME_DIR", scratch.Native("run").c_str(), 1);
  ::setenv("TMPDIR", scratch.Native().c_str(), 1);
  EXPECT_FALSE(CKRSingleAppInstance::DetectAppInstance(KRUniqueName(L"passed over").GetString(), 0, nullptr));
  EXPECT_EQ(DetectInChild(KRUniqueName(L"passed over")), KRHANDOVER_NONE) << "found in the private folder";
}
