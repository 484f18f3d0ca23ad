#include <krCoreLib/system/CKRThread.h>

#include <krCoreLib/system/CKRSystem.h>

#include "KRThreadTestSupport.h"

#include <unistd.h>

using namespace krtest;

TEST(CKRThread, RunsItsHandlerAndStartsAgainAfterItEnded) {
  std::atomic<int> runs{0};
  CGate started[2], release[2];   // one of each per run
  CFunctionThread thread([&](CFunctionThread& self) -> unsigned long {
    const int run = ++runs;
    EXPECT_TRUE(started[run - 1].Wait());
    self.SetActivityStatus(5);
    EXPECT_TRUE(release[run - 1].Wait());
    return 10 + static_cast<unsigned long>(run);
  });
  thread.SetStackSize(1);   // below the platform minimum: raised to it
  EXPECT_EQ(thread.WaitForActivityStatus(KRTHREAD_STATUS_IDLE, 0), 1);
  for (unsigned long run = 1; run <= 2; ++run) {
    SCOPED_TRACE(run);
    thread.Start();
    EXPECT_EQ(thread.IsAlive(), 1);
    EXPECT_EQ(thread.GetExitCode(), KRTHREAD_STILL_ACTIVE);
    EXPECT_EQ(thread.WaitForActivityStatus(5, 0), 0);
    try {
      thread.Start();
      ADD_FAILURE() << "Start on a running thread did not throw";
    } catch (CKRThreadException* exception) {
      EXPECT_EQ(exception->GetType(), KRTHREAD_ERROR_ALREADY_STARTED);
      EXPECT_EQ(exception->GetErrorMsg(), L"Thread is already started!");
      exception->Delete();
    }
    started[run - 1].Open();
    EXPECT_EQ(thread.WaitForActivityStatus(5, kGenerousSteps), 1);
    // A handler that reads no commands is not stopped: at once, or in time.
    unsigned long exitCode = 1;
    EXPECT_EQ(thread.Stop(exitCode, run - 1), 0);
    EXPECT_EQ(exitCode, KRTHREAD_STILL_ACTIVE);
    release[run - 1].Open();
    EXPECT_EQ(thread.WaitForActivityStatus(KRTHREAD_STATUS_IDLE, kGenerousSteps), 1);
    EXPECT_EQ(thread.IsAlive(), 0);
    EXPECT_EQ(thread.GetExitCode(), 10 + run);
    EXPECT_EQ(thread.Stop(exitCode, 0), 1) << "not running: the last exit code";
    EXPECT_EQ(exitCode, 10 + run);
    // A status that cannot come any more is not waited for.
    EXPECT_EQ(thread.WaitForActivityStatus(5, KRTHREAD_INFINITE), 0);
  }
}

TEST(CKRThread, CommandsQueueOnceAndStopNeverWaitsOnItsOwnThread) {
  CGate posted;
  std::vector<int> received;
  CFunctionThread thread([&](CFunctionThread& self) -> unsigned long {
    EXPECT_TRUE(posted.Wait());
    self.HandleCommandImmediately(KRTHREAD_CMD_RESET);
    for (int command = KRTHREAD_CMD_NONE;;) {
      self.WaitForNotification(command, 0);
      if (command == KRTHREAD_CMD_TIMEOUT)
        return 0;
      received.push_back(command);
    }
  });
  EXPECT_EQ(thread.PostCommand(KRTHREAD_CMD_PAUSE), 0) << "not running";
  thread.Start();
  EXPECT_EQ(thread.PostCommand(KRTHREAD_CMD_PAUSE) + thread.Pause() + thread.Continue() + thread.Run() + thread.Run() +
                thread.Reset(),
            6);
  posted.Open();
  EXPECT_NE(Stopped(thread), kNotStopped);
  // "stop" may or may not have been taken before the queue ran dry.
  if (!received.empty() && received.back() == KRTHREAD_CMD_STOP)
    received.pop_back();
  EXPECT_EQ(received, (std::vector<int>{KRTHREAD_CMD_RESET, KRTHREAD_CMD_STARTED, KRTHREAD_CMD_PAUSE,
                                        KRTHREAD_CMD_CONTINUE, KRTHREAD_CMD_RUN, KRTHREAD_CMD_RESET}));

  // Stop ends a handler that reacts to it.
  CFunctionThread reacting([](CFunctionThread& self) -> unsigned long {
    for (int command = KRTHREAD_CMD_NONE; command != KRTHREAD_CMD_STOP;)
      self.WaitForNotification(command, KRTHREAD_INFINITE);
    return 42;
  });
  EXPECT_EQ(Ran(reacting), 42u);
  EXPECT_EQ(reacting.GetActivityStatus(), KRTHREAD_STATUS_IDLE);

  // Stop called by the handler on its own thread queues "stop" and returns.
  std::atomic<int> ownStop{-1};
  CFunctionThread self([&](CFunctionThread& me) -> unsigned long {
    unsigned long code = 0;
    ownStop = me.Stop(code, kGenerousSteps);
    int command = KRTHREAD_CMD_NONE;
    me.WaitForNotification(command, KRTHREAD_INFINITE);
    return static_cast<unsigned long>(command);
  });
  EXPECT_EQ(Ran(self), static_cast<unsigned long>(KRTHREAD_CMD_STARTED)) << "\"started\" came first";
  EXPECT_EQ(ownStop.load(), 0);
}

TEST(CKRThread, TheProcessLockExcludesAndKillEndsAThreadAtEachKillPoint) {
  // The process lock excludes other threads while it exists.
  CKRThread::ProcessUnlock();   // closed, and held by nobody: ignored
  CKRThread::OpenProcessLocking();
  CKRThread::OpenProcessLocking();   // once is enough
  CKRThread::ProcessLock();
  CKRThread::ProcessLock();
  std::atomic<bool> acquired{false};
  CGate mayUnlock;
  CFunctionThread other([&](CFunctionThread&) -> unsigned long {
    CKRThread::ProcessUnlock();   // not held by this thread: ignored
    CKRThread::ProcessLock();
    acquired = true;
    EXPECT_TRUE(mayUnlock.Wait());
    CKRThread::ProcessUnlock();
    return 0;
  });
  other.Start();
  CKRThread::ProcessUnlock();
  EXPECT_FALSE(acquired.load()) << "still held once by this thread";
  CKRThread::ProcessUnlock();
  EXPECT_TRUE(WaitUntil([&] { return acquired.load(); }));
  // Closing while another thread holds it: that thread still unlocks.
  CKRThread::CloseProcessLocking();
  mayUnlock.Open();
  EXPECT_NE(Stopped(other), kNotStopped);

  // The test thread holds the process lock throughout, so that taking it
  // waits (groups wait alike).
  CKRThread::OpenProcessLocking();
  CKRThread::ProcessLock();

  using Wait = std::function<void(CFunctionThread&)>;
  const std::pair<const char*, Wait> cases[] = {
      {"command wait", [](CFunctionThread& self) { IgnoreCommands(self); }},
      // A timed wait, which a cancellation could not end under the address
      // sanitizer.
      {"timed command wait", [](CFunctionThread& self) { IgnoreCommands(self, 60000); }},
      {"process lock", [](CFunctionThread&) { CKRThread::ProcessLock(); }},
      {"status wait", [](CFunctionThread& self) { self.WaitForActivityStatus(99, KRTHREAD_INFINITE); }},
      {"computing", [](CFunctionThread&) {
         for (;;)
           CKRThread::KillPoint();
       }},
  };
  std::atomic<int> unwound{0};
  struct SUnwind {
    std::atomic<int>& m_Count;
    ~SUnwind() { ++m_Count; }
  };
  unsigned long run = 0;
  for (const auto& [what, wait] : cases) {
    SCOPED_TRACE(what);
    ++run;
    CGate atKillPoint;
    CFunctionThread thread([&, wait = wait](CFunctionThread& self) -> unsigned long {
      SUnwind unwind{unwound};
      atKillPoint.Open();
      wait(self);
      return 1;
    });
    thread.Kill(5);   // not running: nothing happens
    thread.Start();
    ASSERT_TRUE(atKillPoint.Wait());
    thread.Kill(70 + run);
    EXPECT_EQ(thread.IsAlive(), 0);
    EXPECT_EQ(thread.GetExitCode(), 70 + run);
    EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_IDLE);
    EXPECT_EQ(thread.m_KillCount.load(), 1);
    EXPECT_EQ(unwound.load(), static_cast<int>(run));
  }
  CKRThread::ProcessUnlock();
  CKRThread::CloseProcessLocking();

  // A handler may kill its own thread: it ends at once.
  std::atomic<bool> after{false};
  CFunctionThread suicidal([&](CFunctionThread& self) -> unsigned long {
    self.Kill(9);
    after = true;
    return 1;
  });
  EXPECT_EQ(Ran(suicidal), 9u);
  EXPECT_FALSE(after.load());
  // OnKill runs on the ending thread, just after the run ended.
  EXPECT_TRUE(WaitUntil([&] { return suicidal.m_KillCount.load() == 1; }));
}

namespace {

// A thread class without a destructor of its own: the base's destructor
// deals with a thread still running. The handler takes what it needs
// before it lets the test go on to destroy the object, then reads a pipe
// (not a kill point) and waits for commands (one).
class CBareThread : public CKRThread {
public:
  CBareThread(CGate& entered, std::FILE* input) : m_Entered(entered), m_pInput(input) {
    SetUsesNotification(1);
    SetKillTimeout(1);
  }

protected:
  unsigned long ThreadHandler() override {
    std::FILE* input = m_pInput;
    m_Entered.Open();
    unsigned char byte = 0;
    CKRSystem::Read1(input, 1, &byte);
    for (int command = KRTHREAD_CMD_NONE;;)
      WaitForNotification(command, KRTHREAD_INFINITE);
  }

private:
  CGate& m_Entered;
  std::FILE* m_pInput;
};

}  // namespace

// Kill never cancels from outside: the library's input and output runs to
// its end, and a thread inside it that does not come out in time is
// reported, the process going on.
TEST(CKRThread, KillAndDestructionAreBoundedAndNeverEndTheProcess) {
  int channel[2];
  ASSERT_EQ(::pipe(channel), 0);
  std::FILE* input = ::fdopen(channel[0], "rb");
  ASSERT_NE(input, nullptr);
  CGate reading;
  std::atomic<int> bytesRead{-1};
  CFunctionThread reader([&](CFunctionThread& self) -> unsigned long {
    unsigned char byte = 0;
    reading.Open();
    bytesRead = static_cast<int>(CKRSystem::Read1(input, 1, &byte));   // waits for the pipe
    IgnoreCommands(self);
  });
  reader.SetKillTimeout(1);
  reader.Start();
  ASSERT_TRUE(reading.Wait());
  try {
    reader.Kill(5);
    ADD_FAILURE() << "a thread reading an empty pipe was killed";
  } catch (CKRThreadException* exception) {
    EXPECT_EQ(exception->GetType(), KRTHREAD_ERROR_TERMINATE_FAILED);
    exception->Delete();
  }
  EXPECT_EQ(reader.IsAlive(), 1);
  EXPECT_EQ(reader.m_KillCount.load(), 0);
  // Once the read is over, the pending kill ends the thread at its next
  // kill point, with the kill's exit code (and no OnKill, as no Kill saw
  // the end).
  ASSERT_EQ(::write(channel[1], "x", 1), 1);
  EXPECT_EQ(Stopped(reader), 5u);
  EXPECT_EQ(bytesRead.load(), 1) << "the read ran to its end";
  EXPECT_EQ(reader.m_KillCount.load(), 0);

  // Destroying a running object whose class has no destructor of its own
  // reports the kill that failed and waits for the read to end.
  CDebugRecorder recorder;
  // Feeds the read once the destructor has reported that it waits for it.
  std::thread feeder([&] {
    EXPECT_TRUE(WaitUntil([&] { return recorder.Texts().size() >= 2; }) && ::write(channel[1], "x", 1) == 1);
  });
  CGate entered;
  {
    CBareThread running(entered, input);
    running.SetSynchronicity(1, L"destroyed");
    running.Start();
    EXPECT_TRUE(entered.Wait());
  }
  feeder.join();
  const std::vector<std::wstring> texts = recorder.Texts();
  ASSERT_EQ(texts.size(), 2u);
  EXPECT_NE(texts[0].find(L"killed"), std::wstring::npos);
  EXPECT_NE(texts[1].find(L"waiting for it to end"), std::wstring::npos);
  std::fclose(input);
  ::close(channel[1]);

  // A stream of commands: the thread always finds one queued, yet ends.
  std::atomic<long> taken{0};
  CFunctionThread flooded([&](CFunctionThread& self) -> unsigned long {
    for (int command = KRTHREAD_CMD_NONE;; ++taken)
      self.WaitForNotification(command, KRTHREAD_INFINITE);
  });
  flooded.Start();
  std::atomic<bool> flooding{true}, floodEnded{false};
  std::thread flooder([&] {
    const auto end = std::chrono::steady_clock::now() + kGenerous;
    while (flooding.load() && std::chrono::steady_clock::now() < end) {
      flooded.Pause();
      flooded.Continue();
    }
    floodEnded = true;
  });
  EXPECT_TRUE(WaitUntil([&] { return taken.load() > 1000; }));
  flooded.Kill(9);
  EXPECT_FALSE(floodEnded.load()) << "Kill returned only when the commands stopped";
  flooding = false;
  flooder.join();
  EXPECT_EQ(flooded.GetExitCode(), 9u);
}

TEST(CKRThread, GroupMembersExcludeEachOtherAndARunEndingInsideTheLockReleasesIt) {
  CDebugRecorder recorder;
  constexpr int kRounds = 2000;
  std::atomic<int> inside{0};
  std::atomic<bool> overlapped{false};
  long long shared = 0;
  auto body = [&](CFunctionThread& self) -> unsigned long {
    for (int i = 0; i < kRounds; ++i) {
      self.Lock();
      self.Lock();   // recursive
      overlapped = overlapped || inside++ != 0;
      shared = shared + 1;
      --inside;
      self.Unlock();
      self.Unlock();
    }
    return 0;
  };
  CFunctionThread first(body), second(body);
  // One member returns holding the lock, one is killed holding it; `member`
  // stays in the group throughout, so the group lives on.
  CGate locked, memberMayEnd;
  CFunctionThread returning([&](CFunctionThread& self) -> unsigned long {
    self.Lock();
    return 0;
  });
  CFunctionThread killed([&](CFunctionThread& self) -> unsigned long {
    self.Lock();
    locked.Open();
    IgnoreCommands(self);
  });
  CFunctionThread member([&](CFunctionThread&) -> unsigned long { return memberMayEnd.Wait() ? 0 : 1; });
  for (CFunctionThread* thread : {&first, &second, &returning, &killed, &member})
    thread->SetSynchronicity(1, L"counter");
  member.Start();
  first.Start();
  second.Start();
  EXPECT_NE(Stopped(first), kNotStopped);
  EXPECT_NE(Stopped(second), kNotStopped);
  EXPECT_FALSE(overlapped.load());
  EXPECT_EQ(shared, 2LL * kRounds);

  EXPECT_NE(Ran(returning), kNotStopped);
  EXPECT_NE(Ran(first), kNotStopped);
  killed.Start();
  ASSERT_TRUE(locked.Wait());
  killed.Kill(1);
  EXPECT_NE(Ran(first), kNotStopped);
  EXPECT_EQ(shared, 4LL * kRounds);
  memberMayEnd.Open();
  EXPECT_NE(Stopped(member), kNotStopped);
  // Each thread ending inside the lock reports it, just after its run ended.
  EXPECT_TRUE(WaitUntil([&] { return recorder.Texts().size() == 2; }));
}
