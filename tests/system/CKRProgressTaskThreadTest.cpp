#include <krCoreLib/system/CKRProgressTaskThread.h>

#include "KRThreadTestSupport.h"

using namespace krtest;

namespace {

// The thread only hands the observer to the task: recording the start and
// the end shows that it arrives.
class CRecordingObserver : public IKRProgressTaskObserver, public CRecords<std::wstring> {
public:
  void Start(CKRString title, int) override { Add((L"start " + title).str()); }
  void StartNextTask(CKRString, int) override {}
  void StartNextSubTask(CKRString) override {}
  void TaskNameChange(CKRString) override {}
  void SubTaskNameChange(CKRString) override {}
  void Finish() override { Add(L"finish"); }
  int IsCanceled() override { return 0; }
  void Error(CKRString text) override { Add((L"error " + text).str()); }
};

// Reports its start and end and, when told to, waits inside Run until
// cancelled.
class CTestTask : public IKRProgressTask {
public:
  explicit CTestTask(bool waitForCancel = false) : m_WaitForCancel(waitForCancel) {}

  void Run(IKRProgressTaskObserver* observer) override {
    ++m_Runs;
    observer->Start(L"survey", 2);
    m_Running.Open();
    if (m_WaitForCancel && !m_Canceled.Wait())
      observer->Error(L"never cancelled");
    observer->Finish();
    m_Finished = true;
  }
  void Cancel() override {
    ++m_Cancels;
    m_Canceled.Open();
  }

  std::atomic<int> m_Runs{0};
  std::atomic<int> m_Cancels{0};
  std::atomic<bool> m_Finished{false};
  CGate m_Running;

private:
  bool m_WaitForCancel;
  CGate m_Canceled;
};

}  // namespace

TEST(CKRProgressTaskThread, RunsTheTaskAndCancelTaskEndsIt) {
  CRecordingObserver observer;
  CTestTask task;
  CKRProgressTaskThread thread(&task, &observer);
  // Stop queues "stop" behind "started"; the task runs all the same, and
  // the thread ends when it has.
  EXPECT_EQ(Ran(thread), 0u);
  EXPECT_EQ(task.m_Runs.load(), 1);
  EXPECT_EQ(observer.WaitFor(), (std::vector<std::wstring>{L"start survey", L"finish"}));
  EXPECT_EQ(task.m_Cancels.load(), 0);
  EXPECT_NE(Ran(thread), kNotStopped);
  EXPECT_EQ(task.m_Runs.load(), 2) << "runs again when started again";
  CKRProgressTaskThread empty(nullptr, nullptr);   // without a task it ends at once
  EXPECT_FALSE(empty.CancelTask());
  EXPECT_NE(Ran(empty), kNotStopped);

  // A task that waits inside Run until cancelled.
  CTestTask waiting(true);
  CKRProgressTaskThread cancelled(&waiting, &observer);
  cancelled.Start();
  ASSERT_TRUE(waiting.m_Running.Wait());
  EXPECT_EQ(cancelled.WaitForActivityStatus(KRTHREAD_STATUS_TASK_RUNNING, 0), 1);
  // While the task runs, commands are not read.
  unsigned long exitCode = 1;
  EXPECT_EQ(cancelled.Stop(exitCode, 0), 0);
  EXPECT_EQ(exitCode, KRTHREAD_STILL_ACTIVE);
  EXPECT_EQ(cancelled.GetActivityStatus(), KRTHREAD_STATUS_TASK_RUNNING);

  EXPECT_TRUE(cancelled.CancelTask());
  EXPECT_EQ(Stopped(cancelled), 0u);
  EXPECT_TRUE(waiting.m_Finished.load());
  EXPECT_EQ(observer.WaitFor().back(), L"finish");

  CTestTask another(true);
  {
    CKRProgressTaskThread destroyed(&another, &observer);
    destroyed.Start();
    ASSERT_TRUE(another.m_Running.Wait());
  }
  EXPECT_EQ(another.m_Cancels.load(), 1) << "destroying the thread cancels the task";
  EXPECT_TRUE(another.m_Finished.load());
}
