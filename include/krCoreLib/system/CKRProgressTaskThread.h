// IKRProgressTask, IKRProgressTaskObserver and CKRProgressTaskThread: a
// long task run on a worker thread that reports its progress to an observer
// (typically a progress display, which may cancel it).
//
// The thread starts the task as soon as it has started, unless a "pause"
// reaches it first; it ends when the task's Run returns. Commands are read
// only before the task runs: while Run executes, Cancel (CancelTask) is the
// way to end it early, and how quickly that happens is the task's business.
#pragma once

#include <krCoreLib/system/CKRThread.h>

// Activity statuses of a progress-task thread.
enum _EKRProgressTaskActivity : int {
  KRTHREAD_STATUS_TASK_RUNNING = 2,
  KRTHREAD_STATUS_TASK_PAUSED = 3,
  KRTHREAD_STATUS_TASK_CONTINUED = 4,
};

// Receives the progress of a task. Its operations are called on the task's
// thread; an implementation that drives a window hands them over to the
// window's thread. Texts are passed by value.
class KRCORELIB_API IKRProgressTaskObserver {
public:
  // The work begins; a task count below 1 means the amount of work is
  // unknown (busy display).
  virtual void Start(CKRString title, int taskCount) = 0;
  // The next task begins (overall progress advances by one); a sub-task
  // count below 1 means its amount of work is unknown.
  virtual void StartNextTask(CKRString name, int subTaskCount) = 0;
  virtual void StartNextSubTask(CKRString name) = 0;
  virtual void TaskNameChange(CKRString name) = 0;
  virtual void SubTaskNameChange(CKRString name) = 0;
  // The work has ended.
  virtual void Finish() = 0;
  // Nonzero when the user has cancelled.
  virtual int IsCanceled() = 0;
  // An error to show.
  virtual void Error(CKRString text) = 0;

protected:
  ~IKRProgressTaskObserver() = default;
};

class KRCORELIB_API IKRProgressTask {
public:
  // Performs the whole task on the progress thread and reports through
  // `observer` (which may be null when the thread was given none).
  virtual void Run(IKRProgressTaskObserver* observer) = 0;
  // Asks a running task to stop; may be called from any thread.
  virtual void Cancel() = 0;
  // A third operation of the interface that the library never calls; the
  // default does nothing.
  virtual void Reserved() {}

protected:
  ~IKRProgressTask() = default;
};

class KRCORELIB_API CKRProgressTaskThread : public CKRThread {
public:
  // Owns neither the task nor the observer; both must outlive the run. A
  // null task gives a thread that ends at once with exit code 0.
  CKRProgressTaskThread(IKRProgressTask* task, IKRProgressTaskObserver* observer);
  // A running task is cancelled and waited for (at most 5 seconds, then
  // the thread is killed; a task that ignores Cancel must reach a kill
  // point, CKRThread::KillPoint, or the destructor waits for its end).
  ~CKRProgressTaskThread() override;

  IKRProgressTask* GetTask() const noexcept { return m_pTask; }
  IKRProgressTaskObserver* GetObserver() const noexcept { return m_pObserver; }

protected:
  unsigned long ThreadHandler() override;

public:
  // Calls the task's Cancel from the calling thread; true, or false when
  // there is no task.
  virtual bool CancelTask();

private:
  IKRProgressTask* m_pTask;
  IKRProgressTaskObserver* m_pObserver;
};
