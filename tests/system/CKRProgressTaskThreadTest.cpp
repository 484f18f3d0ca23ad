#include <krCoreLib/system/CKRProgressTaskThread.h>

#include "KRThreadTestSupport.h"

using krtest::CGate;
using krtest::kNotStopped;
using krtest::Stopped;

namespace {

// The thread only hands the observer to the task: recording the start and
// the end shows that it arrives.
class CRecordingObserver : public IKRProgressTaskObserver {
public:
  void Start(CKRString title, int) override { Add(L"start " + title); }
  void StartNextTask(CKRString, int) override {}
  void StartNextSubTask(CKRString) override {}
  void TaskNameChange(CKRString) override {}
  void SubTaskNameChange(CKRString) override {}
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

TEST(CKRProgressTaskThread, RunsTheTaskOnceAndReportsThroughTheObserver) {
  CRecordingObserver observer;
  CTestTask task;
  CKRProgressTaskThread thread(&task, &observer);
  thread.Start();
  // Stop queues "stop" behind "started"; the task runs all the same, and
  // the thread ends when it has.
  EXPECT_EQ(Stopped(thread), 0u);
  EXPECT_EQ(task.m_Runs.load(), 1);
  EXPECT_EQ(observer.Lines(), (std::vector<std::wstring>{L"start survey", L"finish"}));
  EXPECT_EQ(task.m_Cancels.load(), 0);
  thread.Start();
  EXPECT_NE(Stopped(thread), kNotStopped);
  EXPECT_EQ(task.m_Runs.load(), 2) << "runs again when started again";
  CKRProgressTaskThread empty(nullptr, nullptr);   // without a task it ends at once
  EXPECT_FALSE(empty.CancelTask());
  empty.Start();
  EXPECT_NE(Stopped(empty), kNotStopped);
}

TEST(CKRProgressTaskThread, CancelTaskEndsARunningTaskThatIgnoresCommands) {
  CRecordingObserver observer;
  CTestTask task(true);
  CKRProgressTaskThread thread(&task, &observer);
  thread.Start();
  ASSERT_TRUE(task.m_Running.Wait());
  EXPECT_EQ(thread.WaitForActivityStatus(KRTHREAD_STATUS_TASK_RUNNING, 0), 1);
  // While the task runs, commands are not read.
  unsigned long exitCode = 1;
  EXPECT_EQ(thread.Stop(exitCode, 0), 0);
  EXPECT_EQ(exitCode, KRTHREAD_STILL_ACTIVE);
  EXPECT_EQ(thread.GetActivityStatus(), KRTHREAD_STATUS_TASK_RUNNING);

  EXPECT_TRUE(thread.CancelTask());
  EXPECT_EQ(Stopped(thread), 0u);
  EXPECT_TRUE(task.m_Finished.load());
  EXPECT_EQ(observer.Lines().back(), L"finish");

  CTestTask another(true);
  {
    CKRProgressTaskThread destroyed(&another, &observer);
    destroyed.Start();
    ASSERT_TRUE(another.m_Running.Wait());
  }
  EXPECT_EQ(another.m_Cancels.load(), 1) << "destroying the thread cancels the task";
  EXPECT_TRUE(another.m_Finished.load());
}
