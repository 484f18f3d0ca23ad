// Observables: delivery along the observation's type chain, queued and never
// re-entrant; registration changes during a pass; released observers and
// observations; an adapter without a listener.
#include <krCoreLib/objectmodel/CKRTypeSystem.h>

#include "KRFrameworkTestObjects.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>

namespace {

using Log = std::vector<std::string>;
constexpr CKRGuid kRepository = CKRGuid::Literal("{6A000000-0000-4000-8000-0000000000F0}");
constexpr CKRGuid kBase = CKRObservation::TypeID;
constexpr CKRGuid kA = CKRTestObservationA::TypeID;
constexpr CKRGuid kB = CKRTestObservationB::TypeID;

class CKRObservableTest : public testing::Test {
protected:
  void SetUp() override {
    CKRTypeSystem::Initialize(kRepository);
    m_pSubject = NewObject<CKRTestObservable>(CKRTestObservable::GetCKRTestObservableType());
  }
  void TearDown() override {
    for (CKRTestObserver* observer : m_Observers)
      if (observer != nullptr)
        observer->Release();
    m_pSubject->Release();
  }

  CKRTestObserver* Observer(const char* name) {
    auto* observer = NewObject<CKRTestObserver>(CKRTestObserver::GetCKRTestObserverType());
    observer->m_Name = name;
    observer->m_pLog = &m_Log;
    m_Observers.push_back(observer);
    return observer;
  }
  // Forgets an observer the test released itself.
  void Released(CKRTestObserver* observer) { std::replace(m_Observers.begin(), m_Observers.end(), observer, (CKRTestObserver*)nullptr); }

  // An observation of type A or B with a label.
  CKRTestObservationA* A(const char* label, IKRObjectType* type = CKRTestObservationA::GetCKRTestObservationAType()) {
    auto* a = NewObject<CKRTestObservationA>(type);
    a->m_Label = label;
    return a;
  }
  CKRTestObservationA* B(const char* label) { return A(label, CKRTestObservationB::GetCKRTestObservationBType()); }
  CKRObservation* Plain() { return NewObject<CKRObservation>(CKRObservation::GetCKRObservationType()); }

  CKRTestObservable* m_pSubject = nullptr;
  std::vector<CKRTestObserver*> m_Observers;
  Log m_Log;
};

}  // namespace

// Most derived type first, then each ancestor to CKRObservation; within a
// type in registration order; once per registration.
TEST_F(CKRObservableTest, DeliveryFollowsTheTypeChain) {
  CKRTestObserver* onBase = Observer("base");
  CKRTestObserver* onA = Observer("a");
  CKRTestObserver* onB = Observer("b");
  CKRTestObserver* onBoth = Observer("both");
  EXPECT_EQ(m_pSubject->AddObserver(onBase, kBase), 1);
  EXPECT_EQ(m_pSubject->AddObserver(onA, kA), 1);
  EXPECT_EQ(m_pSubject->AddObserver(onB, kB), 1);
  EXPECT_EQ(m_pSubject->AddObserver(onBoth, kA), 1);
  EXPECT_EQ(m_pSubject->AddObserver(onBoth, kBase), 1);
  EXPECT_EQ(m_pSubject->AddObserver(onA, kA), 0);  // once per type
  EXPECT_EQ(m_pSubject->AddObserver(nullptr, kA), 0);
  m_pSubject->NotifyObservers(B("1"));
  m_pSubject->NotifyObservers(A("2"));
  m_pSubject->NotifyObservers(Plain());
  m_pSubject->NotifyObservers(nullptr);
  EXPECT_EQ(m_Log, (Log{"b:1", "a:1", "both:1", "base:1", "both:1", "a:2", "both:2", "base:2", "both:2", "base:plain",
                        "both:plain"}));
  EXPECT_EQ(m_pSubject->GetObserver(onA->GetInstanceID(), kB), nullptr);
  EXPECT_EQ(m_pSubject->RemoveObserver(onB, kB), 1);
  EXPECT_EQ(m_pSubject->GetObserver(onB->GetInstanceID(), kB), nullptr);
  EXPECT_EQ(m_pSubject->RemoveObserver(onB, kB), 1);  // nothing registered there: a no-op
}

// Observations raised by observers wait for the current one to reach
// everybody and are delivered in order in the same pass, without nesting.
TEST_F(CKRObservableTest, ObservationsRaisedDuringAPassWaitTheirTurn) {
  CKRTestObserver* raiser = Observer("raiser");
  CKRTestObserver* listener = Observer("listener");
  int raised = 0;
  raiser->m_Hook = [&](CKRObservation*) {
    if (raised < 100) {
      ++raised;
      m_pSubject->NotifyObservers(A(std::to_string(raised).c_str()));
    }
  };
  m_pSubject->AddObserver(raiser, kBase);
  m_pSubject->AddObserver(listener, kBase);
  CKRTestObserver::s_MaxDepth = 0;
  m_pSubject->NotifyObservers(A("0"));
  ASSERT_EQ(m_Log.size(), 202u);
  for (int i = 0; i <= 100; ++i) {
    EXPECT_EQ(m_Log[2 * i], "raiser:" + std::to_string(i));
    EXPECT_EQ(m_Log[2 * i + 1], "listener:" + std::to_string(i));
  }
  EXPECT_EQ(CKRTestObserver::s_MaxDepth, 1);
  EXPECT_EQ(CKRTestObservationA::GetCKRTestObservationAType()->GetInstanceCount(), 0);  // all auto-released
}

// Additions and removals during a pass take effect when it ends, under the
// observation type the call named.
TEST_F(CKRObservableTest, RegistrationChangesWaitForTheEndOfThePass) {
  CKRTestObserver* leaver = Observer("leaver");
  CKRTestObserver* late = Observer("late");
  CKRTestObserver* other = Observer("other");
  m_pSubject->AddObserver(leaver, kBase);
  m_pSubject->AddObserver(other, kBase);
  leaver->m_Hook = [&](CKRObservation*) {
    m_pSubject->RemoveObserver(leaver, kBase);
    m_pSubject->AddObserver(late, kA);
    // Removed and added back within the pass: the removal is cancelled.
    m_pSubject->RemoveObserver(other, kBase);
    EXPECT_EQ(m_pSubject->AddObserver(other, kBase), 0);
  };
  CKRTestObservationA* first = A("1");
  first->SetAutoRelease(0);
  m_pSubject->NotifyObservers(first);
  m_pSubject->NotifyObservers(A("2"));
  m_pSubject->NotifyObservers(Plain());
  EXPECT_EQ(m_Log, (Log{"leaver:1", "other:1", "late:2", "other:2", "other:plain"}));
  EXPECT_EQ(first->GetType()->GetInstance(first->GetInstanceID()), first);  // not auto-released
  first->Release();
  // A lock held by the class defers registrations and queues observations.
  m_Log.clear();
  m_pSubject->SetObserversLocked(1);
  m_pSubject->AddObserver(leaver, kBase);
  m_pSubject->NotifyObservers(A("3"));
  EXPECT_TRUE(m_Log.empty());
  m_pSubject->SetObserversLocked(0);
  m_pSubject->NotifyObservers(nullptr);
  EXPECT_EQ(m_Log, (Log{"late:3", "other:3", "leaver:3"}));
}

// An observer released while registered is never called again, also when
// another observer releases it in the middle of a pass, and the observable
// and observers may end in either order.
TEST_F(CKRObservableTest, ReleasedObserversAreForgotten) {
  CKRTestObserver* killer = Observer("killer");
  CKRTestObserver* victim = Observer("victim");
  CKRTestObserver* survivor = Observer("survivor");
  for (CKRTestObserver* observer : {killer, victim, survivor})
    m_pSubject->AddObserver(observer, kBase);
  m_pSubject->AddObserver(victim, kA);
  killer->m_Hook = [&](CKRObservation*) {
    if (victim != nullptr) {
      victim->Release();
      Released(victim);
      victim = nullptr;
    }
  };
  m_pSubject->NotifyObservers(A("1"));
  m_pSubject->NotifyObservers(A("2"));
  // The victim hears A under its own type first, then never again.
  EXPECT_EQ(m_Log, (Log{"victim:1", "killer:1", "survivor:1", "killer:2", "survivor:2"}));
  survivor->Release();  // outside a pass
  Released(survivor);
  // An adapter without a listener ignores what it hears.
  auto* adapter = NewObject<CKRObserverAdapter>(CKRObserverAdapter::GetCKRObserverAdapterType());
  m_pSubject->AddObserver(adapter, kBase);
  m_pSubject->NotifyObservers(Plain());
  EXPECT_EQ(m_Log.size(), 6u);
  // The observable ends first; its observers are released afterwards.
  m_pSubject->Release();
  m_pSubject = NewObject<CKRTestObservable>(CKRTestObservable::GetCKRTestObservableType());
  adapter->Release();
}
