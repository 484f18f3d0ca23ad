// What the thread and lock tests share: bounded waits on conditions, gates,
// helper threads that run steps on request, records of what other threads
// report (debug output among them).
// Every wait is for a condition, with a limit that fails the test instead
// of hanging it.
#pragma once

#include <krCoreLib/core/CKRDebugOutput.h>
#include <krCoreLib/system/CKRThread.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <deque>
#include <functional>
#include <latch>
#include <memory>
#include <mutex>
#include <numeric>
#include <random>
#include <string>
#include <thread>
#include <vector>

namespace krtest {

// Long enough for a loaded 2-core machine; only broken code reaches it.
inline constexpr std::chrono::seconds kGenerous{20};
// The same limit in CKRThread's 100-ms steps.
inline constexpr unsigned long kGenerousSteps = 200;

// Polls `condition` (for states visible only by polling, such as a lock's
// counts); false when the limit passed first.
template <class TCondition>
bool WaitUntil(TCondition condition) {
  const auto end = std::chrono::steady_clock::now() + kGenerous;
  for (int round = 0; !condition(); ++round) {
    if (std::chrono::steady_clock::now() > end)
      return condition();
    if (round < 64)
      std::this_thread::yield();
    else
      std::this_thread::sleep_for(std::chrono::microseconds(100));   // a polling interval
  }
  return true;
}

// What other threads report, in the order it came.
template <class T>
class CRecords {
public:
  // Notifies under the lock: a waiter may destroy the records once it returns.
  void Add(T item) {
    std::lock_guard<std::mutex> lock(m_Mutex);
    m_Items.push_back(std::move(item));
    m_Changed.notify_all();
  }
  // Everything so far, once there are `count` items or the limit passed.
  std::vector<T> WaitFor(std::size_t count = 0, std::chrono::seconds limit = kGenerous) {
    std::unique_lock<std::mutex> lock(m_Mutex);
    m_Changed.wait_for(lock, limit, [&] { return m_Items.size() >= count; });
    return m_Items;
  }

private:
  std::mutex m_Mutex;
  std::condition_variable m_Changed;
  std::vector<T> m_Items;
};

// A one-way gate: closed until Open.
class CGate : CRecords<bool> {
public:
  void Open() { Add(true); }
  bool Wait() { return !WaitFor(1).empty(); }
};

// A helper thread that runs the test's steps in order, so that the test
// decides which thread holds what. A step that never ends fails the test
// and ends the process, since the stuck thread cannot be joined.
class CActor {
public:
  CActor() : m_Thread([this] { Loop(); }) {}
  ~CActor() {
    if (!Do(nullptr)) {
      std::fputs("CActor: a step did not end; the test cannot continue\n", stderr);
      std::abort();
    }
    m_Thread.join();
  }
  // Queues `step` and returns a gate that opens when it has run.
  std::shared_ptr<CGate> Post(std::function<void()> step) {
    auto done = std::make_shared<CGate>();
    {
      std::lock_guard<std::mutex> lock(m_Mutex);
      m_Steps.emplace_back(std::move(step), done);
    }
    m_Signal.notify_one();
    return done;
  }
  bool Do(std::function<void()> step) { return Post(std::move(step))->Wait(); }

private:
  void Loop() {
    for (bool more = true; more;) {
      std::pair<std::function<void()>, std::shared_ptr<CGate>> step;
      {
        std::unique_lock<std::mutex> lock(m_Mutex);
        m_Signal.wait(lock, [this] { return !m_Steps.empty(); });
        step = std::move(m_Steps.front());
        m_Steps.pop_front();
      }
      more = static_cast<bool>(step.first);
      if (more)
        step.first();
      step.second->Open();
    }
  }
  std::mutex m_Mutex;
  std::condition_variable m_Signal;
  std::deque<std::pair<std::function<void()>, std::shared_ptr<CGate>>> m_Steps;
  std::thread m_Thread;
};

// Records CKRDebugOutput texts while it exists.
class CDebugRecorder : public CRecords<std::wstring> {
public:
  CDebugRecorder() : m_Previous(CKRDebugOutput::SetHandler(&Record, this)) {}
  ~CDebugRecorder() { CKRDebugOutput::SetHandler(m_Previous); }
  std::vector<std::wstring> Texts() { return WaitFor(); }

private:
  static void Record(const wchar_t* text, void* context) { static_cast<CDebugRecorder*>(context)->Add(text); }
  CKRDebugOutput::Handler m_Previous;
};

// A thread whose handler the test gives, with the protected operations a
// handler uses made reachable.
class CFunctionThread : public CKRThread {
public:
  using Body = std::function<unsigned long(CFunctionThread&)>;
  explicit CFunctionThread(Body body, int usesNotification = 1) : m_Body(std::move(body)) {
    SetUsesNotification(usesNotification);
  }
  ~CFunctionThread() override {
    // The handler is this class's: end the thread while it exists.
    KillBeforeDestruction();
  }
  using CKRThread::HandleCommandImmediately;
  using CKRThread::Lock;
  using CKRThread::SetActivityStatus;
  using CKRThread::Unlock;
  using CKRThread::WaitForNotification;

  std::atomic<int> m_KillCount{0};

protected:
  unsigned long ThreadHandler() override { return m_Body(*this); }
  void OnKill() override { ++m_KillCount; }

private:
  Body m_Body;
};

// Stops `thread`, waiting long enough: its exit code, or kNotStopped.
inline constexpr unsigned long kNotStopped = 0xDEADu;
inline unsigned long Stopped(CKRThread& thread) {
  unsigned long exitCode = 0;
  return thread.Stop(exitCode, kGenerousSteps) == 1 ? exitCode : kNotStopped;
}

// Starts `thread` and stops it: its exit code, or kNotStopped.
inline unsigned long Ran(CKRThread& thread) {
  thread.Start();
  return Stopped(thread);
}

// Ignores every command, forever: only Kill ends it.
[[noreturn]] inline void IgnoreCommands(CFunctionThread& self, unsigned long timeout = KRTHREAD_INFINITE) {
  for (int command = KRTHREAD_CMD_NONE;;)
    self.WaitForNotification(command, timeout);
}

}  // namespace krtest
