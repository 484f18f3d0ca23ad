#include <krCoreLib/system/CKRThread.h>

#include "KRThreadTestSupport.h"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <vector>

using krtest::CFunctionThread;
using krtest::CGate;
using krtest::kGenerousSteps;

namespace {

// Runs until "stop" arrives, then ends with `exitCode`.
CFunctionThread::Body UntilStop(unsigned long exitCode) {
  return [exitCode](CFunctionThread& self) -> unsigned long {
    for (;;) {
      int command = KRTHREAD_CMD_NONE;
      self.WaitForNotification(command, KRTHREAD_INFINITE);
      if (command == KRTHREAD_CMD_STOP)
        return exitCode;
    }
  };
}

}  // namespace

TEST(CKRThread, RunsItsHandlerAndStartsAgainAfterItEnded) {
  std::atomic<int> runs{0};
  CGate release;
  CFunctionThread thread([&](CFunctionThread&) -> unsigned long {
    const int run = ++runs;
    EXPECT_TRUE(release.Wait());
    return 10 + static_cast<unsigned long>(run);
  });
  // Below the platform minimum: raised to it, not refused.
  thread.SetStackSize(1);
  EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_IDLE);
  EXPECT_EQ(thread.GetExitCode(), 0u);
  EXPECT_EQ(thread.GetHandle(), nullptr);

  thread.Start();
  EXPECT_EQ(thread.IsAlive(), 1);
  EXPECT_NE(thread.GetHandle(), nullptr);
  EXPECT_NE(thread.GetID(), 0u);
  EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_STARTED);
  EXPECT_EQ(thread.GetExitCode(), KRTHREAD_STILL_ACTIVE);
  EXPECT_EQ(thread.IsCurrentThread(), 0);
  release.Open();
  unsigned long exitCode = 0;
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 11u);
  EXPECT_EQ(thread.GetExitCode(), 11u);
  EXPECT_EQ(thread.IsAlive(), 0);
  EXPECT_EQ(thread.GetHandle(), nullptr);
  EXPECT_EQ(thread.GetID(), 0u);
  EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_IDLE);

  // The object outlives its runs.
  thread.Start();
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 12u);
  EXPECT_EQ(runs.load(), 2);
}

TEST(CKRThread, StartOnARunningThreadThrowsAlreadyStarted) {
  CFunctionThread thread(UntilStop(3));
  thread.Start();
  const void* handle = thread.GetHandle();
  try {
    thread.Start();
    ADD_FAILURE() << "Start on a running thread did not throw";
  } catch (CKRThreadException* exception) {
    EXPECT_EQ(exception->GetType(), KRTHREAD_ERROR_ALREADY_STARTED);
    EXPECT_EQ(exception->GetErrorMsg(), L"Thread is already started!");
    EXPECT_EQ(exception->GetThread(), &thread);
    exception->Delete();
  }
  // The running thread is not disturbed.
  EXPECT_EQ(thread.GetHandle(), handle);
  unsigned long exitCode = 0;
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 3u);
  EXPECT_EQ(CKRThreadException::GetLastSystemErrorMsg(11), L"Resource temporarily unavailable");
}

TEST(CKRThread, RepeatedCommandsAreQueuedOnceAndImmediateOnesGoFirst) {
  CGate posted;
  std::vector<int> received;
  CFunctionThread thread([&](CFunctionThread& self) -> unsigned long {
    EXPECT_TRUE(posted.Wait());
    self.HandleCommandImmediately(KRTHREAD_CMD_RESET);
    for (;;) {
      int command = KRTHREAD_CMD_NONE;
      self.WaitForNotification(command, 0);
      if (command == KRTHREAD_CMD_TIMEOUT)
        return 0;
      received.push_back(command);
    }
  });
  EXPECT_EQ(thread.PostCommand(KRTHREAD_CMD_PAUSE), 0) << "not running";
  thread.Start();
  EXPECT_EQ(thread.PostCommand(KRTHREAD_CMD_PAUSE), 1);
  EXPECT_EQ(thread.Pause(), 1);
  EXPECT_EQ(thread.Continue(), 1);
  EXPECT_EQ(thread.Run(), 1);
  EXPECT_EQ(thread.Run(), 1);
  EXPECT_EQ(thread.PostCommand(KRTHREAD_CMD_NONE), 1);
  EXPECT_EQ(thread.Reset(), 1);
  posted.Open();
  unsigned long exitCode = 1;
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  // "stop" may or may not have been taken before the queue ran dry.
  if (!received.empty() && received.back() == KRTHREAD_CMD_STOP)
    received.pop_back();
  EXPECT_EQ(received, (std::vector<int>{KRTHREAD_CMD_RESET, KRTHREAD_CMD_STARTED, KRTHREAD_CMD_PAUSE,
                                        KRTHREAD_CMD_CONTINUE, KRTHREAD_CMD_RUN, KRTHREAD_CMD_RESET}));

  // ResetCommands empties the queue; without notification nothing is
  // queued and the handler is told so at once.
  CGate cleared;
  std::vector<int> afterReset;
  CFunctionThread resetting([&](CFunctionThread& self) -> unsigned long {
    EXPECT_TRUE(cleared.Wait());
    int command = KRTHREAD_CMD_NONE;
    self.WaitForNotification(command, 0);
    afterReset.push_back(command);
    return 0;
  });
  resetting.Start();
  resetting.Run();
  resetting.ResetCommands();
  cleared.Open();
  // Waits for the end without queueing "stop".
  ASSERT_EQ(resetting.WaitForActivityStatus(KRTHREAD_STATUS_IDLE, kGenerousSteps), 1);
  EXPECT_EQ(resetting.IsAlive(), 0);
  EXPECT_EQ(afterReset, (std::vector<int>{KRTHREAD_CMD_TIMEOUT}));

  int withoutNotification = -1;
  CGate ran;
  CFunctionThread plain(
      [&](CFunctionThread& self) -> unsigned long {
        EXPECT_TRUE(ran.Wait());
        self.WaitForNotification(withoutNotification, KRTHREAD_INFINITE);
        return 0;
      },
      0);
  plain.Start();
  EXPECT_EQ(plain.Run(), 1);
  ran.Open();
  ASSERT_EQ(plain.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(withoutNotification, KRTHREAD_CMD_NONE);
}

TEST(CKRThread, StopWithoutAReactingHandlerReportsStillActive) {
  CGate release;
  CFunctionThread thread([&](CFunctionThread&) -> unsigned long {
    EXPECT_TRUE(release.Wait());
    return 8;
  });
  unsigned long exitCode = 1;
  // Not running: success with the last exit code.
  EXPECT_EQ(thread.Stop(exitCode, 0), 1);
  EXPECT_EQ(exitCode, 0u);

  thread.Start();
  EXPECT_EQ(thread.Stop(exitCode, 0), 0);
  EXPECT_EQ(exitCode, KRTHREAD_STILL_ACTIVE);
  // One step of waiting: the handler cannot end before the gate opens.
  EXPECT_EQ(thread.Stop(exitCode, 1), 0);
  EXPECT_EQ(exitCode, KRTHREAD_STILL_ACTIVE);
  EXPECT_EQ(thread.IsAlive(), 1);
  release.Open();
  EXPECT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 8u);
}

TEST(CKRThread, StopWithAReactingHandlerEndsTheThread) {
  CFunctionThread thread(UntilStop(42));
  thread.Start();
  unsigned long exitCode = 0;
  EXPECT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 42u);
  EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_IDLE);

  // Stop called by the handler on its own thread queues "stop" and
  // returns at once.
  std::atomic<int> ownStop{-1};
  CFunctionThread self([&](CFunctionThread& me) -> unsigned long {
    unsigned long code = 0;
    ownStop = me.Stop(code, kGenerousSteps);
    int command = KRTHREAD_CMD_NONE;
    me.WaitForNotification(command, KRTHREAD_INFINITE);
    return static_cast<unsigned long>(command);
  });
  self.Start();
  ASSERT_EQ(self.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(ownStop.load(), 0);
  // "started" came first.
  EXPECT_EQ(exitCode, static_cast<unsigned long>(KRTHREAD_CMD_STARTED));
}

TEST(CKRThread, KillEndsAWaitingThreadUnwindingItsStack) {
  std::atomic<int> unwound{0};
  struct SUnwind {
    std::atomic<int>& m_Count;
    ~SUnwind() { ++m_Count; }
  };
  CFunctionThread thread([&](CFunctionThread& self) -> unsigned long {
    SUnwind unwind{unwound};
    for (;;) {
      int command = KRTHREAD_CMD_NONE;
      self.WaitForNotification(command, KRTHREAD_INFINITE);   // ignores every command
    }
  });
  thread.Kill(5);   // not running: nothing happens
  EXPECT_EQ(thread.m_KillCount.load(), 0);

  for (unsigned long run = 1; run <= 2; ++run) {
    SCOPED_TRACE(run);
    thread.Start();
    thread.Kill(70 + run);
    EXPECT_EQ(thread.IsAlive(), 0);
    EXPECT_EQ(thread.GetExitCode(), 70 + run);
    EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_IDLE);
    EXPECT_EQ(thread.GetHandle(), nullptr);
    EXPECT_EQ(thread.m_KillCount.load(), static_cast<int>(run));
    EXPECT_EQ(unwound.load(), static_cast<int>(run));
  }

  // A handler may kill its own thread: it ends at once.
  std::atomic<bool> after{false};
  CFunctionThread suicidal([&](CFunctionThread& self) -> unsigned long {
    self.Kill(9);
    after = true;
    return 1;
  });
  suicidal.Start();
  unsigned long exitCode = 0;
  ASSERT_EQ(suicidal.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 9u);
  EXPECT_FALSE(after.load());
  // OnKill runs on the ending thread, just after the run ended.
  EXPECT_TRUE(krtest::WaitUntil([&] { return suicidal.m_KillCount.load() == 1; }));
}

TEST(CKRThread, ActivityStatusFollowsTheRun) {
  CGate started, finish;
  CFunctionThread thread([&](CFunctionThread& self) -> unsigned long {
    EXPECT_TRUE(started.Wait());
    self.SetActivityStatus(5);
    EXPECT_TRUE(finish.Wait());
    return 0;
  });
  EXPECT_EQ(thread.WaitForActivityStatus(KRTHREAD_STATUS_IDLE, 0), 1);
  thread.Start();
  EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_STARTED);
  EXPECT_EQ(thread.WaitForActivityStatus(5, 0), 0);
  started.Open();
  EXPECT_EQ(thread.WaitForActivityStatus(5, kGenerousSteps), 1);
  EXPECT_EQ(thread.WaitForActivityStatus(6, 0), 0);
  finish.Open();
  // The end of the run sets status 1.
  EXPECT_EQ(thread.WaitForActivityStatus(KRTHREAD_STATUS_IDLE, kGenerousSteps), 1);
  EXPECT_EQ(thread.IsAlive(), 0);
  // A status that cannot come any more is not waited for.
  EXPECT_EQ(thread.WaitForActivityStatus(5, KRTHREAD_INFINITE), 0);
}

TEST(CKRThread, MembersOfASynchronicityGroupExcludeEachOther) {
  constexpr int kRounds = 2000;
  std::atomic<int> inside{0};
  std::atomic<bool> overlapped{false};
  long long shared = 0;
  auto body = [&](CFunctionThread& self) -> unsigned long {
    for (int i = 0; i < kRounds; ++i) {
      self.Lock();
      self.Lock();   // recursive
      if (inside.fetch_add(1) != 0)
        overlapped = true;
      shared = shared + 1;
      inside.fetch_sub(1);
      self.Unlock();
      self.Unlock();
    }
    return 0;
  };
  CFunctionThread first(body), second(body);
  first.SetSynchronicity(1, L"counter");
  second.SetSynchronicity(1, L"counter");
  CKRString name;
  EXPECT_EQ(first.GetSynchronicity(&name), 1);
  EXPECT_EQ(name, L"counter");
  first.Start();
  second.Start();
  unsigned long exitCode = 0;
  ASSERT_EQ(first.Stop(exitCode, kGenerousSteps), 1);
  ASSERT_EQ(second.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_FALSE(overlapped.load());
  EXPECT_EQ(shared, 2LL * kRounds);

  // Another group's lock is another lock.
  CGate holding, otherLocked;
  CFunctionThread holder([&](CFunctionThread& self) -> unsigned long {
    self.Lock();
    holding.Open();
    EXPECT_TRUE(otherLocked.Wait());
    self.Unlock();
    return 0;
  });
  CFunctionThread other([&](CFunctionThread& self) -> unsigned long {
    self.Lock();
    otherLocked.Open();
    self.Unlock();
    return 0;
  });
  holder.SetSynchronicity(1, L"one");
  other.SetSynchronicity(1, L"two");
  holder.Start();
  ASSERT_TRUE(holding.Wait());
  other.Start();
  EXPECT_TRUE(otherLocked.Wait());
  ASSERT_EQ(holder.Stop(exitCode, kGenerousSteps), 1);
  ASSERT_EQ(other.Stop(exitCode, kGenerousSteps), 1);
}

TEST(CKRThread, ARunEndingInsideItsGroupLockReleasesIt) {
  krtest::CDebugRecorder recorder;
  CGate locked;
  // One member returns holding the lock, one is killed holding it.
  CFunctionThread returning([&](CFunctionThread& self) -> unsigned long {
    self.Lock();
    return 0;
  });
  CFunctionThread killed([&](CFunctionThread& self) -> unsigned long {
    self.Lock();
    locked.Open();
    for (;;) {
      int command = KRTHREAD_CMD_NONE;
      self.WaitForNotification(command, KRTHREAD_INFINITE);
    }
  });
  std::atomic<int> entered{0};
  CFunctionThread next([&](CFunctionThread& self) -> unsigned long {
    self.Lock();
    ++entered;
    self.Unlock();
    return 0;
  });
  for (CFunctionThread* thread : {&returning, &killed, &next})
    thread->SetSynchronicity(1, L"left behind");
  // `next` stays a member throughout, so the group lives on between runs.
  CGate nextMayLock;
  CFunctionThread member([&](CFunctionThread&) -> unsigned long {
    EXPECT_TRUE(nextMayLock.Wait());
    return 0;
  });
  member.SetSynchronicity(1, L"left behind");
  member.Start();

  unsigned long exitCode = 0;
  returning.Start();
  ASSERT_EQ(returning.Stop(exitCode, kGenerousSteps), 1);
  next.Start();
  ASSERT_EQ(next.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(entered.load(), 1);

  killed.Start();
  ASSERT_TRUE(locked.Wait());
  killed.Kill(1);
  next.Start();
  ASSERT_EQ(next.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(entered.load(), 2);
  nextMayLock.Open();
  ASSERT_EQ(member.Stop(exitCode, kGenerousSteps), 1);
  // Each ending thread reports it, just after its run ended.
  EXPECT_TRUE(krtest::WaitUntil([&] { return recorder.Texts().size() == 2; }));
}

TEST(CKRThread, TheProcessLockExcludesOtherThreadsWhileItExists) {
  unsigned long exitCode = 0;
  std::atomic<bool> acquired{false};
  CGate mayUnlock;
  CFunctionThread contender([&](CFunctionThread&) -> unsigned long {
    CKRThread::ProcessLock();
    acquired = true;
    EXPECT_TRUE(mayUnlock.Wait());
    CKRThread::ProcessUnlock();
    return 0;
  });

  // Closed: locking does nothing, so nobody waits.
  CKRThread::ProcessLock();
  contender.Start();
  mayUnlock.Open();
  ASSERT_EQ(contender.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_TRUE(acquired.load());
  CKRThread::ProcessUnlock();   // holds nothing: ignored

  CKRThread::OpenProcessLocking();
  CKRThread::OpenProcessLocking();   // once is enough
  CKRThread::ProcessLock();
  CKRThread::ProcessLock();
  acquired = false;
  CGate mayUnlockAgain;
  CFunctionThread second([&](CFunctionThread&) -> unsigned long {
    CKRThread::ProcessUnlock();   // not held by this thread: ignored
    CKRThread::ProcessLock();
    acquired = true;
    EXPECT_TRUE(mayUnlockAgain.Wait());
    CKRThread::ProcessUnlock();
    return 0;
  });
  second.Start();
  CKRThread::ProcessUnlock();
  // Still held once by this thread.
  EXPECT_FALSE(acquired.load());
  CKRThread::ProcessUnlock();
  EXPECT_TRUE(krtest::WaitUntil([&] { return acquired.load(); }));
  // Closing while another thread holds it: that thread still unlocks.
  CKRThread::CloseProcessLocking();
  mayUnlockAgain.Open();
  ASSERT_EQ(second.Stop(exitCode, kGenerousSteps), 1);
}

TEST(CKRThread, PrioritiesMapToTheScheduler) {
  CFunctionThread thread(UntilStop(0));
  EXPECT_EQ(thread.SetPriority(KRTHREAD_PRIORITY_LOWEST), 0) << "not running";
  EXPECT_EQ(thread.GetPriority(), KRTHREAD_PRIORITY_ERROR);
  thread.Start();
  EXPECT_NE(thread.GetPriority(), KRTHREAD_PRIORITY_ERROR);
  // The lowest priority needs no privileges, whatever the process's own.
  EXPECT_EQ(thread.SetPriority(KRTHREAD_PRIORITY_IDLE), 1);
  EXPECT_EQ(thread.GetPriority(), KRTHREAD_PRIORITY_IDLE);
  EXPECT_EQ(thread.SetPriority(7), 0) << "no such level";
  EXPECT_EQ(thread.GetPriority(), KRTHREAD_PRIORITY_IDLE);
  unsigned long exitCode = 1;
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
}

namespace {

// A thread class without a destructor of its own: the base's destructor
// deals with a thread still running. The handler takes what it needs from
// the object first and then touches it no more, since the object may go
// while it runs.
class CBareThread : public CKRThread {
public:
  // Without `block` the handler deletes its own object and returns.
  CBareThread(CGate& entered, CGate* block, std::atomic<bool>* deleted = nullptr)
      : m_Entered(entered), m_pBlock(block), m_pDeleted(deleted) {}
  ~CBareThread() override {
    if (m_pDeleted != nullptr)
      *m_pDeleted = true;
  }

protected:
  unsigned long ThreadHandler() override {
    CGate& entered = m_Entered;
    CGate* block = m_pBlock;
    if (block == nullptr) {
      delete this;
      entered.Open();
      return 4;
    }
    entered.Open();
    block->WaitToBeKilled();
    return 0;
  }

private:
  CGate& m_Entered;
  CGate* m_pBlock;
  std::atomic<bool>* m_pDeleted;
};

}  // namespace

TEST(CKRThread, DestroyingTheObjectEndsOrLeavesItsThreadSafely) {
  krtest::CDebugRecorder recorder;
  CGate entered, never;
  {
    CBareThread running(entered, &never);
    running.SetSynchronicity(1, L"destroyed");
    running.Start();
    ASSERT_TRUE(entered.Wait());
  }   // killed by the base destructor, which reports it
  ASSERT_EQ(recorder.Texts().size(), 1u);
  EXPECT_NE(recorder.Texts()[0].find(L"killed"), std::wstring::npos);

  // A handler may delete its own object and return: the ending run touches
  // the object no more (the sanitizer build checks).
  std::atomic<bool> deleted{false};
  CGate deletedItself;
  auto* selfDeleting = new CBareThread(deletedItself, nullptr, &deleted);
  selfDeleting->Start();
  EXPECT_TRUE(deletedItself.Wait());
  EXPECT_TRUE(deleted.load());
}
