// CKRThread and CKRThreadException: worker threads driven by a command
// queue, with an activity status, named synchronicity groups and a
// process-wide lock.
//
// A host derives from CKRThread and implements ThreadHandler(), the body of
// the thread; its result is the thread's exit code (an exception leaving it
// ends the process, as on any thread). Start() runs it on a new
// thread; the object outlives any number of runs. A thread that uses
// notification (SetUsesNotification) receives commands through a queue:
// Start queues "started", Run/Pause/Continue/Reset/Stop queue theirs, and the
// handler takes them with WaitForNotification.
//
// Thread safety: every operation may be called from any thread. One
// process-wide lock serialises the bookkeeping of all thread objects; it is
// never held while an operation waits (for a command, a status, a thread's
// end) and is left before an exception is thrown.
//
// Failures are thrown as pointers to new CKRThreadException objects; the
// catcher deletes them (Delete()).
//
// Times: WaitForNotification takes milliseconds; Stop, Kill's time-out and
// WaitForActivityStatus take a count of 100-millisecond steps and return as
// soon as the outcome is known. KRTHREAD_INFINITE (and anything above it)
// waits without limit.
//
// Killing: Kill never cuts a thread off from outside. It asks the thread to
// end, and the thread ends at its next kill point, unwinding its stack
// (destructors run, locks held in RAII objects are released). The kill
// points are: WaitForNotification (before it takes a command, so a stream
// of commands cannot keep a thread alive, and while it waits, with or
// without time-out), Lock, ProcessLock, the waits of the reader/writer
// locks, Stop and WaitForActivityStatus called on the thread, and
// KillPoint(). To be killable a handler reaches a kill point every so often
// (a handler that computes or blocks in other calls for long calls
// KillPoint() between steps) and lets the unwinding pass: a catch (...)
// must rethrow, and a kill point must not be reached inside a noexcept
// function (the unwinding would end the process there, as any exception
// does). Library calls that are not kill points (file input and output, for
// instance) always run to their end.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <memory>
#include <optional>

class CKRThread;

// Commands of the queue.
enum _EKRThreadCommands : int {
  KRTHREAD_CMD_NONE = 0,      // never queued
  KRTHREAD_CMD_TIMEOUT = 1,   // a wait for a command timed out (never queued)
  KRTHREAD_CMD_STARTED = 2,   // queued by Start
  KRTHREAD_CMD_RUN = 3,
  KRTHREAD_CMD_PAUSE = 4,
  KRTHREAD_CMD_CONTINUE = 5,
  KRTHREAD_CMD_RESET = 6,
  KRTHREAD_CMD_STOP = 7,
};

// Activity statuses set by the library; handlers use further values (the
// progress-task thread uses 2 running, 3 paused, 4 continued).
enum _EKRThreadActivity : int {
  KRTHREAD_STATUS_STARTED = 0,   // right after a successful Start
  KRTHREAD_STATUS_IDLE = 1,      // at construction and after the thread ended
};

// Priority levels for SetPriority/GetPriority, mapped to the scheduler's
// nice values 19, 10, 5, 0, -5, -10 and -20.
enum _EKRThreadPriority : int {
  KRTHREAD_PRIORITY_IDLE = -15,
  KRTHREAD_PRIORITY_LOWEST = -2,
  KRTHREAD_PRIORITY_BELOW_NORMAL = -1,
  KRTHREAD_PRIORITY_NORMAL = 0,
  KRTHREAD_PRIORITY_ABOVE_NORMAL = 1,
  KRTHREAD_PRIORITY_HIGHEST = 2,
  KRTHREAD_PRIORITY_TIME_CRITICAL = 15,
  KRTHREAD_PRIORITY_ERROR = 0x7FFFFFFF,   // GetPriority of a thread not running
};

// Exit code reported while the thread runs.
KRCORELIB_LOCAL inline constexpr unsigned long KRTHREAD_STILL_ACTIVE = 259;
// Wait without limit.
KRCORELIB_LOCAL inline constexpr unsigned long KRTHREAD_INFINITE = 0xFFFFFFFF;

// Error types of CKRThreadException.
enum _EKRThreadErrors : int {
  KRTHREAD_ERROR_ALREADY_STARTED = 2,
  KRTHREAD_ERROR_TERMINATE_FAILED = 3,
  KRTHREAD_ERROR_EVENT_FAILED = 4,
  KRTHREAD_ERROR_CREATE_FAILED = 5,   // creating the thread or posting a command
};

class KRCORELIB_API CKRThreadException {
public:
  CKRThreadException(CKRThread* thread, const CKRString& message, int type);
  virtual ~CKRThreadException();

  // The thread object concerned (not owned).
  CKRThread* GetThread() const noexcept { return m_pThread; }
  const CKRString& GetErrorMsg() const noexcept { return m_ErrorMsg; }
  // One of _EKRThreadErrors.
  int GetType() const noexcept { return m_Type; }

  // The system's text for an error number, for example "Resource
  // temporarily unavailable"; unknown numbers give "Unknown error N".
  static CKRString GetLastSystemErrorMsg(unsigned long code);

  // Ends the exception object; the catcher calls it.
  void Delete() { delete this; }

private:
  CKRThread* m_pThread;
  CKRString m_ErrorMsg;
  int m_Type;
};

// One run of a thread object (private to the library).
struct SKRThreadRun;
// A named synchronicity group (private to the library).
struct SKRThreadSynchronicity;

class KRCORELIB_API CKRThread {
public:
  static constexpr const wchar_t* s_strERROR_THREAD_ALREADY_STARTED = L"Thread is already started!";

  // `owner` and `param` are kept for the handler (GetOwnerParams).
  explicit CKRThread(void* owner = nullptr, long param = 0);
  CKRThread(const CKRThread&) = delete;
  CKRThread& operator=(const CKRThread&) = delete;
  // A thread still running when its object is destroyed is killed (and the
  // fact reported on CKRDebugOutput); derived classes should stop their
  // thread in their own destructor, while their part of the object exists
  // (KillBeforeDestruction). A handler may delete its own object and then
  // return at once.
  virtual ~CKRThread();

  void SetOwnerParams(void* owner, long param);
  void GetOwnerParams(void*& owner, long& param) const;

  // Kept for callers; threads on this platform have no security
  // descriptor, so the pointer is not used.
  void SetAttributes(void* attributes);
  void* GetAttributes() const;
  // Stack size of the next runs in bytes; 0 (the default) takes the
  // platform's; small sizes are raised to what the platform accepts (at
  // least 64 KiB).
  void SetStackSize(unsigned long stackSize);
  unsigned long GetStackSize() const;

  // With `enable` nonzero the next runs join the synchronicity group
  // `name`: while they run, Lock() excludes every other member of the group.
  void SetSynchronicity(int enable, const CKRString& name);
  int GetSynchronicity(CKRString* name = nullptr) const;

  // Nonzero when the thread is driven by commands.
  int GetUsesNotification() const;

  // Opaque handle and kernel thread ID of the running thread; null/0 when
  // not running.
  void* GetHandle() const;
  unsigned long GetID() const;

  // Starts the thread; when Start returns the thread exists, its ID is
  // known, the activity status is 0 and "started" is queued. Throws type 2
  // ("Thread is already started!") when it runs, 5 when the system refuses
  // to create a thread.
  void Start();
  // Queues "stop" and waits at most `timeout` 100-ms steps for the thread to
  // end. Returns 1 when it is not running (`exitCode` its exit code), else 0
  // (`exitCode` KRTHREAD_STILL_ACTIVE). Called from the thread itself, it
  // only queues the command and returns 0.
  int Stop(unsigned long& exitCode, unsigned long timeout = KRTHREAD_INFINITE);
  // Ends a running thread at its next kill point (see above) and waits at
  // most the kill time-out for that; then the exit code is `exitCode` and
  // OnKill() is called. When the thread has not ended in time, throws type
  // 3 ("The thread has not reached a kill point in time."): the kill stays
  // pending, and the thread ends with `exitCode` at the kill point it
  // reaches next; a later Kill waits for that end again (and calls OnKill
  // when it sees it). Called from the thread itself it ends the thread at
  // once, by unwinding from the call. Nothing for a thread that is not
  // running. `flag` is not used.
  void Kill(unsigned long exitCode = 0xFFFFFFFF, int flag = 0);
  // How long Kill waits, in 100-ms steps; kKillTimeoutSteps (5 seconds)
  // at construction, KRTHREAD_INFINITE waits without limit.
  static constexpr unsigned long kKillTimeoutSteps = 50;
  void SetKillTimeout(unsigned long timeout);
  unsigned long GetKillTimeout() const;
  // A kill point for handlers and the code they call (a long computation,
  // the Run of a progress task): ends the calling thread here when Kill has
  // asked it to; nothing otherwise, and nothing on threads that CKRThread
  // did not start.
  static void KillPoint();

  // Queue the command. Return 0 when the thread is not running, else 1.
  int Run();
  int Pause();
  int Continue();
  int Reset();
  // Appends `command` unless it is 0, the thread does not use notification,
  // or it equals the last queued command. 0 when the thread is not running,
  // else 1.
  int PostCommand(int command);
  // Empties the queue.
  void ResetCommands();

  int IsAlive() const;
  // Nonzero when called on the object's running thread.
  int IsCurrentThread() const;
  // The last exit code, KRTHREAD_STILL_ACTIVE while running, 0 before the
  // first run.
  unsigned long GetExitCode() const;
  int GetActivityStatus() const;
  // Waits at most `timeout` 100-ms steps until the activity status equals
  // `status`, or the thread is not running; answers whether it equals it.
  int WaitForActivityStatus(int status, unsigned long timeout);

  // One of _EKRThreadPriority. Returns 0 when the thread is not running,
  // the level is unknown, or the system refuses (raising the priority needs
  // privileges), else 1.
  int SetPriority(int priority);
  // The level nearest to the thread's scheduler priority, or
  // KRTHREAD_PRIORITY_ERROR when the thread is not running.
  int GetPriority() const;

  // The process lock: a recursive lock shared by the whole process that
  // exists between OpenProcessLocking and CloseProcessLocking; ProcessLock
  // does nothing while it does not exist. ProcessUnlock releases one hold of
  // the calling thread and ignores calls from threads that hold none.
  static void OpenProcessLocking();
  static void ProcessLock();
  static void ProcessUnlock();
  static void CloseProcessLocking();

protected:
  // For destructors: kills a running thread (not the calling one) as Kill
  // does and, when it has not ended within the kill time-out, reports that
  // on CKRDebugOutput and waits for its end without limit, since the
  // object must outlive the handler that runs on it. A handler that never
  // reaches a kill point keeps the destructor waiting.
  void KillBeforeDestruction();

  // The body of the thread; the result is its exit code.
  virtual unsigned long ThreadHandler() = 0;
  // Called after Kill has ended the thread (on the thread that called Kill).
  virtual void OnKill();

  // Threads driven by commands set this before Start.
  void SetUsesNotification(int usesNotification);
  // Takes the first queued command; when there is none, waits at most
  // `timeout` milliseconds for one and yields KRTHREAD_CMD_TIMEOUT when none
  // came. Yields KRTHREAD_CMD_NONE at once without notification.
  void WaitForNotification(int& command, unsigned long timeout);
  // Puts `command` at the front of the queue, without signalling; only
  // while the thread runs and uses notification.
  void HandleCommandImmediately(int command);
  void SetActivityStatus(int status);
  // Enter and leave the synchronicity group of the running thread
  // (recursive; nothing without a group). A run that ends while its thread
  // still holds the group releases it.
  void Lock();
  void Unlock();

private:
  friend struct SKRThreadRun;
  static void* ThreadEntry(void* argument);
  std::optional<CKRString> EndRun(unsigned long exitCode);
  static void ReportReleasedGroup(const std::optional<CKRString>& group);
  void JoinSynchronicity();
  void LeaveSynchronicity();
  int PostCommandLocked(int command);

  void* m_pOwner;
  long m_OwnerParam;
  int m_UsesNotification;
  int m_Synchronicity;
  CKRString m_SynchronicityName;
  std::shared_ptr<SKRThreadSynchronicity> m_pSynchronicityEntry;
  void* m_pAttributes;
  unsigned long m_StackSize;
  std::uintptr_t m_Handle;
  unsigned long m_ThreadID;
  // Signalled when a command is queued (the notification event). Waits on
  // both signals are kill points.
  std::condition_variable_any m_CommandSignal;
  // Signalled when the activity status changes or a run ends.
  std::condition_variable_any m_StateSignal;
  unsigned long m_KillTimeout;
  unsigned long m_ExitCode;
  int m_ActivityStatus;
  std::deque<int> m_CommandQueue;
  std::shared_ptr<SKRThreadRun> m_pRun;
};
