#include <krCoreLib/system/CKRProgressTaskThread.h>

CKRProgressTaskThread::CKRProgressTaskThread(IKRProgressTask* task, IKRProgressTaskObserver* observer)
    : m_pTask(task), m_pObserver(observer) {
  SetUsesNotification(1);
}

CKRProgressTaskThread::~CKRProgressTaskThread() {
  // A handler that deletes its own object leaves the run to the base.
  if (!IsAlive() || IsCurrentThread())
    return;
  // The handler belongs to this class, so the thread must end while this
  // part of the object still exists: cancel, wait 50 steps of 100 ms, kill.
  CancelTask();
  unsigned long exitCode = 0;
  if (Stop(exitCode, 50) == 0)
    KillBeforeDestruction();
}

bool CKRProgressTaskThread::CancelTask() {
  if (m_pTask == nullptr)
    return false;
  m_pTask->Cancel();
  return true;
}

unsigned long CKRProgressTaskThread::ThreadHandler() {
  if (m_pTask == nullptr)
    return 0;
  for (;;) {
    int command = KRTHREAD_CMD_NONE;
    WaitForNotification(command, KRTHREAD_INFINITE);
    const bool paused = GetActivityStatus() == KRTHREAD_STATUS_TASK_PAUSED;
    switch (command) {
      case KRTHREAD_CMD_TIMEOUT:
      case KRTHREAD_CMD_STARTED:
        if (!paused)
          HandleCommandImmediately(KRTHREAD_CMD_RUN);
        break;
      case KRTHREAD_CMD_RUN:
        if (!paused) {
          SetActivityStatus(KRTHREAD_STATUS_TASK_RUNNING);
          m_pTask->Run(m_pObserver);
          return 0;
        }
        break;
      case KRTHREAD_CMD_PAUSE:
        if (!paused)
          SetActivityStatus(KRTHREAD_STATUS_TASK_PAUSED);
        break;
      case KRTHREAD_CMD_CONTINUE:
        if (paused) {
          SetActivityStatus(KRTHREAD_STATUS_TASK_CONTINUED);
          HandleCommandImmediately(KRTHREAD_CMD_RUN);
        }
        break;
      case KRTHREAD_CMD_STOP:
        m_pTask->Cancel();
        return 0;
      default:   // reset and unknown commands
        break;
    }
  }
}
