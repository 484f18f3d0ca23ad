#include <krCoreLib/core/CKRSingleton.h>

#include <gtest/gtest.h>

#include <atomic>
#include <latch>
#include <string>
#include <thread>
#include <vector>

namespace {

// Creations ("+Name") and destructions ("-Name") in the order they happen.
// Singletons are created and released under the singleton lock, so the
// vector needs no lock of its own.
std::vector<std::string>& Events() {
  static std::vector<std::string> events;
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
  CSingletonScope(const CSingletonScope&) = delete;
  CSingletonScope& operator=(const CSingletonScope&) = delete;
};

template <char Name>
class CNamed : public CKRSingletonT<CNamed<Name>, CKRSingleton> {
  friend class CKRSingletonT<CNamed<Name>, CKRSingleton>;

protected:
  CNamed() { Events().push_back(std::string("+") + Name); }
  ~CNamed() override { Events().push_back(std::string("-") + Name); }
};

using CA = CNamed<'A'>;
using CB = CNamed<'B'>;
using CC = CNamed<'C'>;

// Depends on CDependency: creates it in its constructor and uses it in its
// destructor.
class CDependency : public CKRSingletonT<CDependency, CKRSingleton> {
  friend class CKRSingletonT<CDependency, CKRSingleton>;

protected:
  CDependency() { Events().push_back("+Dependency"); }
  ~CDependency() override { Events().push_back("-Dependency"); }
};

class CUser : public CKRSingletonT<CUser, CKRSingleton> {
  friend class CKRSingletonT<CUser, CKRSingleton>;

protected:
  CUser() {
    CDependency::GetInstance();
    Events().push_back("+User");
  }
  ~CUser() override {
    Events().push_back(CDependency::HasInstance() ? "-User (dependency alive)" : "-User (dependency gone)");
  }
};

// Creates a singleton while it is being released.
class CLateCreator : public CKRSingletonT<CLateCreator, CKRSingleton> {
  friend class CKRSingletonT<CLateCreator, CKRSingleton>;

protected:
  CLateCreator() { Events().push_back("+LateCreator"); }
  ~CLateCreator() override {
    Events().push_back("-LateCreator");
    CC::GetInstance();
  }
};

// An intermediate singleton base with its own release slot.
class CRecordingBase : public CKRSingleton {
protected:
  CRecordingBase() = default;
  void Release() override {
    Events().push_back("Release");
    CKRSingleton::Release();
  }
};

class CRecorded : public CKRSingletonT<CRecorded, CRecordingBase> {
  friend class CKRSingletonT<CRecorded, CRecordingBase>;

protected:
  CRecorded() { Events().push_back("+Recorded"); }
  ~CRecorded() override { Events().push_back("-Recorded"); }
};

class CShared : public CKRSingletonT<CShared, CKRSingleton> {
  friend class CKRSingletonT<CShared, CKRSingleton>;

public:
  static inline std::atomic<int> s_Constructions{0};

protected:
  CShared() { ++s_Constructions; }
};

using Strings = std::vector<std::string>;

}  // namespace

TEST(CKRSingleton, GetInstanceCreatesOnce) {
  CSingletonScope scope;
  EXPECT_FALSE(CA::HasInstance());
  EXPECT_TRUE(Events().empty()) << "HasInstance must not create";

  CA* first = CA::GetInstance();
  ASSERT_NE(first, nullptr);
  EXPECT_TRUE(CA::HasInstance());
  EXPECT_EQ(CA::GetInstance(), first);
  EXPECT_EQ(CKRSingleton::GetCount(), 1);
  EXPECT_EQ(Events(), Strings({"+A"}));
}

TEST(CKRSingleton, ReleaseInstanceEndsTheInstance) {
  CSingletonScope scope;
  CA::ReleaseInstance();  // nothing to release
  EXPECT_TRUE(Events().empty());

  CA::GetInstance();
  CB::GetInstance();
  EXPECT_EQ(CKRSingleton::GetCount(), 2);
  CA::ReleaseInstance();
  EXPECT_FALSE(CA::HasInstance());
  EXPECT_TRUE(CB::HasInstance());
  EXPECT_EQ(CKRSingleton::GetCount(), 1);

  // A later GetInstance creates a fresh instance.
  EXPECT_NE(CA::GetInstance(), nullptr);
  EXPECT_EQ(CKRSingleton::GetCount(), 2);
  EXPECT_EQ(Events(), Strings({"+A", "+B", "-A", "+A"}));
}

TEST(CKRSingleton, ReleaseAllReleasesInCreationOrder) {
  CSingletonScope scope;
  CB::GetInstance();
  CC::GetInstance();
  CA::GetInstance();
  CKRSingleton::ReleaseAll();
  EXPECT_EQ(Events(), Strings({"+B", "+C", "+A", "-B", "-C", "-A"}));
  EXPECT_EQ(CKRSingleton::GetCount(), 0);
  EXPECT_FALSE(CA::HasInstance());
  EXPECT_FALSE(CB::HasInstance());
  EXPECT_FALSE(CC::HasInstance());

  // A re-created singleton counts from its new creation.
  Events().clear();
  CA::GetInstance();
  CB::GetInstance();
  CA::ReleaseInstance();
  CA::GetInstance();
  CKRSingleton::ReleaseAll();
  EXPECT_EQ(Events(), Strings({"+A", "+B", "-A", "+A", "-B", "-A"}));

  CKRSingleton::ReleaseAll();  // nothing left: no effect
  EXPECT_EQ(CKRSingleton::GetCount(), 0);
}

TEST(CKRSingleton, ConstructorMayCreateItsDependency) {
  CSingletonScope scope;
  CUser::GetInstance();
  EXPECT_TRUE(CDependency::HasInstance());
  EXPECT_EQ(CKRSingleton::GetCount(), 2);

  // The user began its construction first, so it is released first and can
  // still use its dependency.
  CKRSingleton::ReleaseAll();
  EXPECT_EQ(Events(), Strings({"+Dependency", "+User", "-User (dependency alive)", "-Dependency"}));
  EXPECT_EQ(CKRSingleton::GetCount(), 0);
}

TEST(CKRSingleton, SingletonCreatedDuringReleaseAllIsReleasedToo) {
  CSingletonScope scope;
  CLateCreator::GetInstance();
  CA::GetInstance();
  CKRSingleton::ReleaseAll();
  EXPECT_EQ(Events(), Strings({"+LateCreator", "+A", "-LateCreator", "+C", "-A", "-C"}));
  EXPECT_EQ(CKRSingleton::GetCount(), 0);
  EXPECT_FALSE(CC::HasInstance());
}

TEST(CKRSingleton, DerivedReleaseIsCalled) {
  CSingletonScope scope;
  CRecorded::GetInstance();
  CRecorded::ReleaseInstance();
  EXPECT_FALSE(CRecorded::HasInstance());
  CRecorded::GetInstance();
  CKRSingleton::ReleaseAll();
  EXPECT_FALSE(CRecorded::HasInstance());
  EXPECT_EQ(Events(), Strings({"+Recorded", "Release", "-Recorded", "+Recorded", "Release", "-Recorded"}));
  EXPECT_EQ(CKRSingleton::GetCount(), 0);
}

TEST(CKRSingleton, ConcurrentGetInstanceCreatesOneInstance) {
  CSingletonScope scope;
  constexpr int kThreads = 8;
  constexpr int kRounds = 50;
  for (int round = 0; round < kRounds; ++round) {
    SCOPED_TRACE(round);
    CShared::s_Constructions = 0;
    std::vector<CShared*> seen(kThreads, nullptr);
    std::latch start(kThreads);
    {
      std::vector<std::jthread> threads;
      for (int t = 0; t < kThreads; ++t)
        threads.emplace_back([&, t] {
          start.arrive_and_wait();
          seen[t] = CShared::GetInstance();
        });
    }
    EXPECT_EQ(CShared::s_Constructions.load(), 1);
    ASSERT_NE(seen[0], nullptr);
    for (CShared* instance : seen)
      EXPECT_EQ(instance, seen[0]);
    EXPECT_EQ(CKRSingleton::GetCount(), 1);
    CKRSingleton::ReleaseAll();
  }
}
