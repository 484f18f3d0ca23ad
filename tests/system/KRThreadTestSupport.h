// What the thread and lock tests share: bounded waits on conditions, gates,
// helper threads that run steps on request, and a recorder of debug output.
//
// Nothing here sleeps for an outcome: every wait is for a condition and has
// a generous limit that fails the test instead of hanging it.
#pragma once

#include <krCoreLib/core/CKRDebugOutput.h>
#include <krCoreLib/system/CKRThread.h>

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace krtest {

// Long enough for a loaded 2-core machine; only broken code reaches it.
inline constexpr std::chrono::seconds kGenerous{20};
// The same limit in CKRThread's 100-ms steps.
inline constexpr unsigned long kGenerousSteps = 200;

// Polls `condition` until it holds; false when `limit` passed first. Used
// for states that are visible only through polling (a lock's counts).
template <class TCondition>
bool WaitUntil(TCondition condition, std::chrono::milliseconds limit = kGenerous) {
  const auto end = std::chrono::steady_clock::now() + limit;
  for (int round = 0; !condition(); ++round) {
    if (std::chrono::steady_clock::now() > end)
      return condition();
    if (round < 64)
      std::this_thread::yield();
    else
      std::this_thread::sleep_for(std::chrono::microseconds(100));   // a polling interval, not a wait for an outcome
  }
  return true;
}

// A one-way gate: closed until Open; Wait returns true once it is open.
class CGate {
public:
  // Notifies under the lock: a waiter may destroy the gate as soon as it
  // returns.
  void Open() {
    std::lock_guard<std::mutex> lock(m_Mutex);
    m_Open = true;
    m_Signal.notify_all();
  }
  bool Wait(std::chrono::milliseconds limit = kGenerous) {
    std::unique_lock<std::mutex> lock(m_Mutex);
    return m_Signal.wait_for(lock, limit, [this] { return m_Open; });
  }
  // Only for a thread that the test kills while it waits here. (Without a
  // time limit: a thread killed inside a timed wait trips a false report of
  // the address sanitizer of this compiler while the stack unwinds.)
  void WaitToBeKilled() {
    std::unique_lock<std::mutex> lock(m_Mutex);
    m_Signal.wait(lock, [this] { return m_Open; });
  }
  bool IsOpen() {
    std::lock_guard<std::mutex> lock(m_Mutex);
    return m_Open;
  }

private:
  std::mutex m_Mutex;
  std::condition_variable m_Signal;
  bool m_Open = false;
};

// A helper thread that runs steps posted by the test, one after the other,
// so that the test decides which thread holds what. A step that never ends
// (a deadlock) fails the test; the process is then ended because the stuck
// thread cannot be joined.
class CActor {
public:
  CActor() : m_Thread([this] { Loop(); }) {}
  CActor(const CActor&) = delete;
  CActor& operator=(const CActor&) = delete;
  ~CActor() {
    Post(nullptr);
    if (!m_Idle.Wait()) {
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
      m_Steps.push_back({std::move(step), done});
    }
    m_Signal.notify_one();
    return done;
  }
  // Runs `step` and waits for it; false when it did not end in time.
  bool Do(std::function<void()> step) { return Post(std::move(step))->Wait(); }

private:
  struct SStep {
    std::function<void()> m_Run;
    std::shared_ptr<CGate> m_Done;
  };
  void Loop() {
    for (;;) {
      SStep step;
      {
        std::unique_lock<std::mutex> lock(m_Mutex);
        m_Signal.wait(lock, [this] { return !m_Steps.empty(); });
        step = std::move(m_Steps.front());
        m_Steps.pop_front();
      }
      if (!step.m_Run) {
        m_Idle.Open();
        return;
      }
      step.m_Run();
      step.m_Done->Open();
    }
  }

  std::mutex m_Mutex;
  std::condition_variable m_Signal;
  std::deque<SStep> m_Steps;
  CGate m_Idle;
  std::thread m_Thread;
};

// Records CKRDebugOutput texts while it exists.
class CDebugRecorder {
public:
  CDebugRecorder() : m_Previous(CKRDebugOutput::SetHandler(&Record, this)) {}
  ~CDebugRecorder() { CKRDebugOutput::SetHandler(m_Previous); }
  CDebugRecorder(const CDebugRecorder&) = delete;
  CDebugRecorder& operator=(const CDebugRecorder&) = delete;

  std::vector<std::wstring> Texts() {
    std::lock_guard<std::mutex> lock(m_Mutex);
    return m_Texts;
  }

private:
  static void Record(const wchar_t* text, void* context) {
    auto* self = static_cast<CDebugRecorder*>(context);
    std::lock_guard<std::mutex> lock(self->m_Mutex);
    self->m_Texts.emplace_back(text);
  }

  CKRDebugOutput::Handler m_Previous;
  std::mutex m_Mutex;
  std::vector<std::wstring> m_Texts;
};

// A thread object whose handler is given by the test, with the protected
// operations a handler uses made reachable.
class CFunctionThread : public CKRThread {
public:
  using Body = std::function<unsigned long(CFunctionThread&)>;

  explicit CFunctionThread(Body body, int usesNotification = 1) : m_Body(std::move(body)) {
    SetUsesNotification(usesNotification);
  }
  ~CFunctionThread() override {
    // The handler is this class's: end the thread while it exists.
    if (IsAlive() && !IsCurrentThread())
      Kill(0xFFFFFFFF, 0);
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

}  // namespace krtest
