#include <krCoreLib/system/CKRProgressTaskThread.h>

#include "KRThreadTestSupport.h"

#include <gtest/gtest.h>

#include <atomic>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

using krtest::CGate;
using krtest::kGenerousSteps;

namespace {

// Writes every notification as a line.
class CRecordingObserver : public IKRProgressTaskObserver {
public:
  void Start(CKRString title, int taskCount) override {
    Add(CKRString::Formatted(L"start %s %d", title.GetString(), taskCount));
  }
  void StartNextTask(CKRString name, int subTaskCount) override {
    Add(CKRString::Formatted(L"task %s %d", name.GetString(), subTaskCount));
  }
  void StartNextSubTask(CKRString name) override { Add(L"sub " + name); }
  void TaskNameChange(CKRString name) override { Add(L"task name " + name); }
  void SubTaskNameChange(CKRString name) override { Add(L"sub name " + name); }
  void Finish() override { Add(L"finish"); }
  int IsCanceled() override { return 0; }
  void Error(CKRString text) override { Add(L"error " + text); }

  std::vector<std::wstring> Lines() {
    std::lock_guard<std::mutex> lock(m_Mutex);
    return m_Lines;
  }

private:
  void Add(const CKRString& line) {
    std::lock_guard<std::mutex> lock(m_Mutex);
    m_Lines.push_back(line.str());
  }
  std::mutex m_Mutex;
  std::vector<std::wstring> m_Lines;
};

// A task that reports two tasks and, when told to, waits inside Run until
// it is cancelled.
class CTestTask : public IKRProgressTask {
public:
  explicit CTestTask(bool waitForCancel = false) : m_WaitForCancel(waitForCancel) {}

  void Run(IKRProgressTaskObserver* observer) override {
    ++m_Runs;
    m_pObserver = observer;
    observer->Start(L"survey", 2);
    observer->StartNextTask(L"read", 1);
    observer->StartNextSubTask(L"points");
    observer->TaskNameChange(L"reading");
    observer->SubTaskNameChange(L"points 1-10");
    observer->StartNextTask(L"check", 0);
    m_Running.Open();
    if (m_WaitForCancel) {
      std::unique_lock<std::mutex> lock(m_Mutex);
      if (!m_Signal.wait_for(lock, krtest::kGenerous, [this] { return m_Canceled; }))
        observer->Error(L"never cancelled");
    }
    observer->Finish();
    m_Finished = true;
  }
  void Cancel() override {
    {
      std::lock_guard<std::mutex> lock(m_Mutex);
      m_Canceled = true;
    }
    m_Signal.notify_all();
    ++m_Cancels;
  }

  std::atomic<int> m_Runs{0};
  std::atomic<int> m_Cancels{0};
  std::atomic<bool> m_Finished{false};
  IKRProgressTaskObserver* m_pObserver = nullptr;
  CGate m_Running;

private:
  bool m_WaitForCancel;
  std::mutex m_Mutex;
  std::condition_variable m_Signal;
  bool m_Canceled = false;
};

}  // namespace

TEST(CKRProgressTaskThread, RunsTheTaskOnceAndReportsThroughTheObserver) {
  CRecordingObserver observer;
  CTestTask task;
  CKRProgressTaskThread thread(&task, &observer);
  EXPECT_EQ(thread.GetTask(), &task);
  EXPECT_EQ(thread.GetUsesNotification(), 1);
  thread.Start();
  // Stop queues "stop" behind "started"; the task runs all the same, and
  // the thread ends when it has.
  unsigned long exitCode = 1;
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 0u);
  EXPECT_EQ(task.m_Runs.load(), 1);
  EXPECT_EQ(task.m_pObserver, &observer);
  EXPECT_EQ(observer.Lines(), (std::vector<std::wstring>{L"start survey 2", L"task read 1", L"sub points",
                                                         L"task name reading", L"sub name points 1-10",
                                                         L"task check 0", L"finish"}));
  EXPECT_EQ(task.m_Cancels.load(), 0);

  // Runs again when started again.
  thread.Start();
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(task.m_Runs.load(), 2);
}

TEST(CKRProgressTaskThread, CancelTaskEndsARunningTaskThatIgnoresCommands) {
  CRecordingObserver observer;
  CTestTask task(true);
  CKRProgressTaskThread thread(&task, &observer);
  thread.Start();
  ASSERT_TRUE(task.m_Running.Wait());
  EXPECT_EQ(thread.WaitForActivityStatus(KRTHREAD_STATUS_TASK_RUNNING, 0), 1);
  // While the task runs, commands are not read.
  EXPECT_EQ(thread.Pause(), 1);
  unsigned long exitCode = 1;
  EXPECT_EQ(thread.Stop(exitCode, 0), 0);
  EXPECT_EQ(exitCode, KRTHREAD_STILL_ACTIVE);
  EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_TASK_RUNNING);

  EXPECT_TRUE(thread.CancelTask());
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 0u);
  EXPECT_TRUE(task.m_Finished.load());
  EXPECT_EQ(observer.Lines().back(), L"finish");
  EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_IDLE);
}

TEST(CKRProgressTaskThread, DestroyingTheThreadCancelsARunningTask) {
  CRecordingObserver observer;
  CTestTask task(true);
  {
    CKRProgressTaskThread thread(&task, &observer);
    thread.Start();
    ASSERT_TRUE(task.m_Running.Wait());
  }
  EXPECT_EQ(task.m_Cancels.load(), 1);
  EXPECT_TRUE(task.m_Finished.load());
}

TEST(CKRProgressTaskThread, WithoutATaskTheThreadEndsAtOnce) {
  CKRProgressTaskThread thread(nullptr, nullptr);
  EXPECT_FALSE(thread.CancelTask());
  thread.Start();
  unsigned long exitCode = 1;
  ASSERT_EQ(thread.Stop(exitCode, kGenerousSteps), 1);
  EXPECT_EQ(exitCode, 0u);
}
