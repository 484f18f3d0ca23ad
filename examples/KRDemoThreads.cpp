// Threads: a long task run on a progress-task thread that reports its
// progress line by line, a second run cancelled from the main thread, and a
// reader/writer lock shared by worker threads.
#include "KRDemo.h"

#include <condition_variable>
#include <mutex>
#include <vector>

namespace {

// Prints each notification of the task as a line. The calls come from the
// task's thread; printing is all this observer does with them.
class CKRDemoProgressPrinter : public IKRProgressTaskObserver {
public:
  void Start(CKRString title, int taskCount) override {
    m_TaskCount = taskCount;
    Print(CKRString::Formatted(L"   start    \"%s\", %d tasks\n", title.GetString(), taskCount));
  }
  void StartNextTask(CKRString name, int subTaskCount) override {
    ++m_Task;
    Print(CKRString::Formatted(L"   task %d/%d %s (%d steps)\n", m_Task, m_TaskCount, name.GetString(), subTaskCount));
  }
  void StartNextSubTask(CKRString name) override { Print(L"      step  " + name + L"\n"); }
  void TaskNameChange(CKRString name) override { Print(L"   renamed  " + name + L"\n"); }
  void SubTaskNameChange(CKRString name) override { Print(L"      now   " + name + L"\n"); }
  void Finish() override { Print(L"   finish\n"); }
  int IsCanceled() override { return 0; }
  void Error(CKRString text) override { Print(L"   error    " + text + L"\n"); }

private:
  int m_TaskCount = 0;
  int m_Task = 0;
};

// Imports a survey: three files, each read in a few steps. Cancel ends it
// between two steps.
class CKRDemoImportTask : public IKRProgressTask {
public:
  // With `holdAfterFirstStep`, the task waits after its first step until it
  // is cancelled (so that the demo can show a cancellation).
  explicit CKRDemoImportTask(bool holdAfterFirstStep = false) : m_HoldAfterFirstStep(holdAfterFirstStep) {}

  void Run(IKRProgressTaskObserver* observer) override {
    const std::vector<std::vector<const wchar_t*>> files = {
        {L"header", L"stations"}, {L"header", L"points 1-500", L"points 501-812"}, {L"header", L"lines"}};
    const wchar_t* names[] = {L"site.svy", L"points.svy", L"lines.svy"};
    observer->Start(L"Importing survey", static_cast<int>(files.size()));
    for (std::size_t file = 0; file < files.size(); ++file) {
      observer->StartNextTask(names[file], static_cast<int>(files[file].size()));
      for (const wchar_t* step : files[file]) {
        if (IsCancelled()) {
          observer->Error(L"import cancelled");
          observer->Finish();
          return;
        }
        observer->StartNextSubTask(step);
        if (m_HoldAfterFirstStep)
          WaitForCancel();
      }
    }
    observer->TaskNameChange(L"checking");
    observer->SubTaskNameChange(L"812 points, 3 lines");
    observer->Finish();
  }

  void Cancel() override {
    std::lock_guard<std::mutex> lock(m_Mutex);
    m_Cancelled = true;
    m_Signal.notify_all();
  }

  // True once the task has reached the point where it holds.
  bool WaitUntilHolding() {
    std::unique_lock<std::mutex> lock(m_Mutex);
    m_Signal.wait(lock, [this] { return m_Holding; });
    return true;
  }

private:
  bool IsCancelled() {
    std::lock_guard<std::mutex> lock(m_Mutex);
    return m_Cancelled;
  }
  void WaitForCancel() {
    std::unique_lock<std::mutex> lock(m_Mutex);
    m_Holding = true;
    m_Signal.notify_all();
    m_Signal.wait(lock, [this] { return m_Cancelled; });
  }

  bool m_HoldAfterFirstStep;
  std::mutex m_Mutex;
  std::condition_variable m_Signal;
  bool m_Cancelled = false;
  bool m_Holding = false;
};

// A worker that adds to a shared tally under the writer lock, and another
// that reads it under the reader lock.
class CKRDemoTallyThread : public CKRThread {
public:
  CKRDemoTallyThread(CKRReaderWriterLock& lock, long long& tally, bool writes)
      : m_Lock(lock), m_Tally(tally), m_Writes(writes) {}
  ~CKRDemoTallyThread() override {
    unsigned long exitCode = 0;
    Stop(exitCode);
  }
  long long m_Consistent = 0;

protected:
  unsigned long ThreadHandler() override {
    for (int i = 0; i < 1000; ++i) {
      if (m_Writes) {
        m_Lock.AcquireWriterLock();
        m_Tally += 2;
        m_Lock.ReleaseWriterLock();
      } else {
        m_Lock.AcquireReaderLock();
        m_Lock.AcquireReaderLock();   // recursive: this lock allows it
        m_Consistent += (m_Tally % 2 == 0) ? 1 : 0;
        m_Lock.ReleaseReaderLock();
        m_Lock.ReleaseReaderLock();
      }
    }
    return m_Writes ? 1 : 2;
  }

private:
  CKRReaderWriterLock& m_Lock;
  long long& m_Tally;
  bool m_Writes;
};

}  // namespace

void KRDemoThreads() {
  Print(L"1. A progress task runs on its own thread and reports to an observer:\n");
  {
    CKRDemoProgressPrinter printer;
    CKRDemoImportTask task;
    CKRProgressTaskThread thread(&task, &printer);
    thread.Start();
    // The thread ends when the task has run; its status then returns to 1.
    thread.WaitForActivityStatus(KRTHREAD_STATUS_IDLE, KRTHREAD_INFINITE);
    Print(CKRString::Formatted(L"   thread ended with exit code %lu\n", thread.GetExitCode()));
  }

  Print(L"\n2. The main thread cancels a running task (a progress dialog's cancel button):\n");
  {
    CKRDemoProgressPrinter printer;
    CKRDemoImportTask task(true);
    CKRProgressTaskThread thread(&task, &printer);
    thread.Start();
    task.WaitUntilHolding();
    Print(CKRString::Formatted(L"   activity status while the task runs: %d\n", thread.GetActivityStatus()));
    const bool cancelled = thread.CancelTask();
    unsigned long exitCode = 0;
    const int stopped = thread.Stop(exitCode);
    Print(CKRString::Formatted(L"   CancelTask() -> %d, Stop() -> %d, exit code %lu\n", cancelled ? 1 : 0, stopped,
                               exitCode));
  }

  Print(L"\n3. Worker threads share a tally through a reader/writer lock:\n");
  {
    CKRReaderWriterLock lock;
    long long tally = 0;
    CKRDemoTallyThread writer(lock, tally, true), reader(lock, tally, false);
    writer.Start();
    reader.Start();
    unsigned long writerCode = 0, readerCode = 0;
    writer.Stop(writerCode);
    reader.Stop(readerCode);
    Print(CKRString::Formatted(L"   tally %lld after 1000 writes of 2; the reader saw an even tally %lld of 1000 "
                               L"times; exit codes %lu and %lu\n",
                               tally, reader.m_Consistent, writerCode, readerCode));
  }
}
