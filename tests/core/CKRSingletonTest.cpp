#include <krCoreLib/core/CKRSingleton.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <latch>
#include <string>
#include <thread>
#include <vector>

#include <unistd.h>

namespace {

using Strings = std::vector<std::string>;

// Creations ("+N") and destructions ("-N") in the order they happen. It needs
// no lock: singletons are created under the singleton lock, and the tests
// release them from one thread at a time.
Strings& Events() {
  static Strings events;
  return events;
}

// All tests share one process: each starts with no singletons and an empty
// event list, and leaves no singletons behind even when an assertion fails.
class CSingletonScope {
public:
  CSingletonScope() {
    EXPECT_EQ(CKRSingleton::GetCount(), 0) << "an earlier test left singletons behind";
    Events().clear();
  }
  ~CSingletonScope() { CKRSingleton::ReleaseAll(); }
};

// An intermediate singleton base with its own release slot.
class CRecordingBase : public CKRSingleton {
protected:
  void Release() override {
    Events().push_back("Release");
    CKRSingleton::Release();
  }
};

// Its release ends it and then creates 'P', of the same size: the allocator
// may place 'P' where the released singleton was.
class CReplacingBase : public CKRSingleton {
protected:
  void Release() override;
};

// 'U' creates 'D' in its constructor and looks at it in its destructor; 'L'
// creates 'C' while it is released; 'J' waits for a thread that asks for 'B'.
template <char Name, class TBase = CKRSingleton>
class CNamed : public CKRSingletonT<CNamed<Name, TBase>, TBase> {
  friend class CKRSingletonT<CNamed<Name, TBase>, TBase>;

protected:
  CNamed() {
    if constexpr (Name == 'U')
      CNamed<'D'>::GetInstance();
    Events().push_back(std::string("+") + Name);
  }
  ~CNamed() override {
    Events().push_back(std::string("-") + Name);
    if constexpr (Name == 'U')
      Events().push_back(CNamed<'D'>::HasInstance() ? "D alive" : "D gone");
    if constexpr (Name == 'L')
      CNamed<'C'>::GetInstance();
    if constexpr (Name == 'J')
      std::thread([] { CNamed<'B'>::GetInstance(); }).join();
  }
};

using CA = CNamed<'A'>;
using CB = CNamed<'B'>;
using CC = CNamed<'C'>;
using CRecorded = CNamed<'R', CRecordingBase>;

void CReplacingBase::Release() {
  CKRSingleton::Release();
  CNamed<'P'>::GetInstance();
}

// Reports its release on standard error, for tests that end the process
// (after the event list is gone).
class CExitReporter : public CKRSingletonT<CExitReporter> {
  friend class CKRSingletonT<CExitReporter>;
  ~CExitReporter() override { std::fputs("released at exit\n", stderr); }
};

}  // namespace

TEST(CKRSingleton, GetInstanceCreatesOnceAndReleaseInstanceEndsIt) {
  CSingletonScope scope;
  CA::ReleaseInstance();  // nothing to release
  CA* first = CA::GetInstance();
  ASSERT_NE(first, nullptr);
  EXPECT_EQ(CA::GetInstance(), first);
  CB::GetInstance();
  CRecorded::GetInstance();
  EXPECT_EQ(CKRSingleton::GetCount(), 3);
  CA::ReleaseInstance();
  CRecorded::ReleaseInstance();
  EXPECT_TRUE(!CA::HasInstance() && !CRecorded::HasInstance() && CB::HasInstance());
  EXPECT_EQ(CKRSingleton::GetCount(), 1);
  EXPECT_NE(CA::GetInstance(), nullptr);  // a fresh instance
  EXPECT_EQ(Events(), Strings({"+A", "+B", "+R", "-A", "Release", "-R", "+A"}));
}

TEST(CKRSingleton, ReleaseAllReleasesInCreationOrder) {
  CSingletonScope scope;
  struct Case {
    const char* what;
    void (*create)();
    Strings expected;
  };
  const Case cases[] = {
      {"creation order", [] { CB::GetInstance(), CC::GetInstance(), CA::GetInstance(); },
       {"+B", "+C", "+A", "-B", "-C", "-A"}},
      {"a re-created singleton counts from its new creation",
       [] { CA::GetInstance(), CB::GetInstance(), CA::ReleaseInstance(), CA::GetInstance(); },
       {"+A", "+B", "-A", "+A", "-B", "-A"}},
      // The user began its construction first, so it goes first and can still use its dependency.
      {"constructor creates its dependency", [] { CNamed<'U'>::GetInstance(); }, {"+D", "+U", "-U", "D alive", "-D"}},
      {"created during ReleaseAll", [] { CNamed<'L'>::GetInstance(), CA::GetInstance(); },
       {"+L", "+A", "-L", "+C", "-A", "-C"}},
      {"derived Release slot", [] { CRecorded::GetInstance(); }, {"+R", "Release", "-R"}},
      {"created during ReleaseAll where the released one was", [] { CNamed<'Q', CReplacingBase>::GetInstance(); },
       {"+Q", "-Q", "+P", "-P"}},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    Events().clear();
    c.create();
    CKRSingleton::ReleaseAll();
    EXPECT_EQ(Events(), c.expected);
    EXPECT_EQ(CKRSingleton::GetCount(), 0);
    EXPECT_FALSE(CA::HasInstance() || CC::HasInstance() || CNamed<'P'>::HasInstance());
  }
}

TEST(CKRSingleton, ConcurrentGetInstanceCreatesOneInstance) {
  CSingletonScope scope;
  constexpr int kThreads = 8;
  for (int round = 0; round < 50; ++round) {
    SCOPED_TRACE(round);
    Events().clear();
    std::vector<CA*> seen(kThreads, nullptr);
    std::latch start(kThreads);
    {
      std::vector<std::jthread> threads;
      for (int t = 0; t < kThreads; ++t)
        threads.emplace_back([&, t] {
          start.arrive_and_wait();
          seen[t] = CA::GetInstance();
        });
    }
    EXPECT_EQ(Events(), Strings{"+A"});
    ASSERT_NE(seen[0], nullptr);
    EXPECT_EQ(std::count(seen.begin(), seen.end(), seen[0]), kThreads);
    CKRSingleton::ReleaseAll();
  }
}

// The host's last call at exit: from an exit handler registered before the
// first singleton existed (a fresh process, so that nothing else created the
// registry earlier), and with a destructor that waits for a thread asking for
// a singleton (which must not wait for the releasing thread's lock).
TEST(CKRSingleton, ReleaseAllIsSafeAsTheLastCallAtExit) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(
      {
        std::atexit([] { CKRSingleton::ReleaseAll(); });
        CExitReporter::GetInstance();
        std::exit(0);
      },
      testing::ExitedWithCode(0), "released at exit");
  EXPECT_EXIT(
      {
        alarm(20);  // a deadlock ends the child with SIGALRM
        CNamed<'J'>::GetInstance();
        CKRSingleton::ReleaseAll();
        std::exit(CKRSingleton::GetCount() == 0 && !CB::HasInstance() ? 0 : 1);
      },
      testing::ExitedWithCode(0), "");
}
