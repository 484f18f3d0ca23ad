#include <krCoreLib/system/CKRThread.h>

#include <krCoreLib/core/CKRDebugOutput.h>

#include "SKRKillPoint.h"
#include "SKRNativeThread.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <mutex>
#include <optional>
#include <thread>
#include <vector>

// How the pieces fit:
//
// - One process-wide mutex (InternalThreadSynchronization) guards the bookkeeping of every
//   thread object. Waits (for a command, a status, the end of a run) go
//   through condition variables bound to it, so it is never held while
//   waiting.
// - Each Start creates an SKRThreadRun shared by the object and its thread.
//   The thread does its final bookkeeping through it; when the object goes
//   away first (a handler that deletes its own object), the run forgets the
//   object and the thread touches nothing more.
// - Threads are detached: nothing needs to join them, and a run is over
//   once its bookkeeping is done, which is what Stop and Kill wait for.
// - Kill raises the run's kill request (a stop source) and waits, bounded,
//   for the run to end. The thread sees the request at its next kill point
//   (SKRKillPoint): every wait in this component and in the reader/writer
//   locks is one, woken by the request. It throws SKRThreadKilled there,
//   unwinds its stack, so destructors run and locks held in RAII objects
//   are released, and ThreadEntry catches it; the run guard then does the
//   same bookkeeping as for a handler that returned. Nothing cancels a
//   thread from outside: code between kill points, the library's own file
//   input and output included, always runs to its end.

namespace {

std::mutex& InternalThreadSynchronization() {
  static std::mutex lock;
  return lock;
}

using SKRClock = std::chrono::steady_clock;

// The deadline `steps` 100-ms steps from now; none for KRTHREAD_INFINITE
// and above.
std::optional<SKRClock::time_point> StepsDeadline(unsigned long steps) {
  if (steps >= KRTHREAD_INFINITE)
    return std::nullopt;
  return SKRClock::now() + std::chrono::milliseconds(static_cast<long long>(steps) * 100);
}

// Waits on `signal` until `ready`, at most `steps` 100-ms steps
// (KRTHREAD_INFINITE and above: without limit); a kill point. Returns
// `ready()`.
template <class TReady>
bool WaitSteps(std::unique_lock<std::mutex>& lock, std::condition_variable_any& signal, unsigned long steps,
               TReady ready) {
  const std::optional<SKRClock::time_point> deadline = StepsDeadline(steps);
  if (!deadline) {
    SKRKillPoint::Wait(signal, lock, ready);
    return true;
  }
  return SKRKillPoint::WaitUntil(signal, lock, *deadline, ready);
}

// A recursive lock whose waits are kill points. Used for the synchronicity
// groups and the process lock.
class SKRRecursiveWaitLock {
public:
  void Lock() {
    std::unique_lock<std::mutex> guard(m_Mutex);
    const std::thread::id self = std::this_thread::get_id();
    if (m_Depth > 0 && m_Owner == self) {
      ++m_Depth;
      return;
    }
    SKRKillPoint::Wait(m_Released, guard, [this] { return m_Depth == 0; });
    m_Owner = self;
    m_Depth = 1;
  }

  // Releases one hold of the calling thread; false when it holds none.
  bool Unlock() {
    std::lock_guard<std::mutex> guard(m_Mutex);
    if (m_Depth == 0 || m_Owner != std::this_thread::get_id())
      return false;
    if (--m_Depth == 0)
      Free();
    return true;
  }

  // Releases every hold of the calling thread; returns how many there were.
  int UnlockAll() {
    std::lock_guard<std::mutex> guard(m_Mutex);
    if (m_Depth == 0 || m_Owner != std::this_thread::get_id())
      return 0;
    const int depth = m_Depth;
    m_Depth = 0;
    Free();
    return depth;
  }

private:
  void Free() {
    m_Owner = std::thread::id();
    // All waiters re-check: a waiter that was killed must not swallow the
    // only wake-up.
    m_Released.notify_all();
  }

  std::mutex m_Mutex;
  std::condition_variable_any m_Released;
  std::thread::id m_Owner;
  int m_Depth = 0;
};

struct SKRProcessLock {
  SKRRecursiveWaitLock m_Lock;
  std::atomic<bool> m_Open{false};
};

// Never destroyed: detached threads may still use it while the process
// exits.
SKRProcessLock& ProcessLockObject() {
  static SKRProcessLock* processLock = new SKRProcessLock();
  return *processLock;
}

// Priority levels and the nice values they stand for.
struct SKRPriorityLevel {
  int m_Level;
  int m_Nice;
};
constexpr SKRPriorityLevel kPriorityLevels[] = {
    {KRTHREAD_PRIORITY_IDLE, 19},          {KRTHREAD_PRIORITY_LOWEST, 10}, {KRTHREAD_PRIORITY_BELOW_NORMAL, 5},
    {KRTHREAD_PRIORITY_NORMAL, 0},         {KRTHREAD_PRIORITY_ABOVE_NORMAL, -5},
    {KRTHREAD_PRIORITY_HIGHEST, -10},      {KRTHREAD_PRIORITY_TIME_CRITICAL, -20},
};

}  // namespace

struct SKRThreadSynchronicity {
  CKRString m_Name;
  SKRRecursiveWaitLock m_Lock;
  int m_MemberCount = 0;
};

namespace {

// The synchronicity groups with members; guarded by InternalThreadSynchronization. Never
// destroyed, like the process lock.
std::vector<std::shared_ptr<SKRThreadSynchronicity>>& SynchronicityList() {
  static auto* list = new std::vector<std::shared_ptr<SKRThreadSynchronicity>>();
  return *list;
}

}  // namespace

struct SKRThreadRun {
  explicit SKRThreadRun(CKRThread* thread) : m_pThread(thread) {}

  // Ends the run (from its own thread, when the handler returned or was
  // cancelled), unless Kill or the destructor already did.
  void Finish(unsigned long exitCode) {
    std::optional<CKRString> releasedGroup;
    {
      std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
      if (m_pThread != nullptr)
        releasedGroup = m_pThread->EndRun(exitCode);
    }
    CKRThread::ReportReleasedGroup(releasedGroup);
  }

  // The object while the run belongs to it; null once the run is over or
  // the object is gone. Guarded by InternalThreadSynchronization, as are the fields below.
  CKRThread* m_pThread;
  bool m_Started = false;
  bool m_Ended = false;
  bool m_Killed = false;
  bool m_OnKillCalled = false;
  unsigned long m_KillExitCode = 0;
  // Raised by Kill; the thread's kill points watch it. Thread-safe itself.
  std::stop_source m_KillSource;
  // Signalled when the thread has started and when the run has ended.
  std::condition_variable m_Changed;
};

namespace {

// The run of the calling thread, while it runs a handler.
thread_local SKRThreadRun* t_pCurrentRun = nullptr;

// Finishes the run however the handler leaves: by returning or by the
// unwinding of a kill.
class SKRRunGuard {
public:
  explicit SKRRunGuard(std::shared_ptr<SKRThreadRun> run) : m_pRun(std::move(run)) {}
  SKRRunGuard(const SKRRunGuard&) = delete;
  SKRRunGuard& operator=(const SKRRunGuard&) = delete;
  ~SKRRunGuard() {
    t_pCurrentRun = nullptr;
    m_pRun->Finish(m_ExitCode);
  }

  unsigned long m_ExitCode = 0xFFFFFFFF;

private:
  std::shared_ptr<SKRThreadRun> m_pRun;
};

}  // namespace

// ---- kill points ---------------------------------------------------------------

std::stop_token SKRKillPoint::Token() noexcept {
  return t_pCurrentRun != nullptr ? t_pCurrentRun->m_KillSource.get_token() : std::stop_token();
}

void SKRKillPoint::Throw() {
  throw SKRThreadKilled();
}

// ---- CKRThreadException ------------------------------------------------------

CKRThreadException::CKRThreadException(CKRThread* thread, const CKRString& message, int type)
    : m_pThread(thread), m_ErrorMsg(message), m_Type(type) {}

CKRThreadException::~CKRThreadException() = default;

CKRString CKRThreadException::GetLastSystemErrorMsg(unsigned long code) {
  return SKRNativeThread::ErrorText(code);
}

// ---- CKRThread -----------------------------------------------------------------

CKRThread::CKRThread(void* owner, long param)
    : m_pOwner(owner),
      m_OwnerParam(param),
      m_UsesNotification(0),
      m_Synchronicity(0),
      m_pAttributes(nullptr),
      m_StackSize(0),
      m_Handle(0),
      m_ThreadID(0),
      m_KillTimeout(kKillTimeoutSteps),
      m_ExitCode(0),
      m_ActivityStatus(KRTHREAD_STATUS_IDLE) {}

CKRThread::~CKRThread() {
  std::unique_lock<std::mutex> lock(InternalThreadSynchronization());
  if (!m_pRun)
    return;
  if (SKRNativeThread::IsCurrent(m_Handle)) {
    // The handler deletes its own object: the run goes on without it and
    // touches it no more.
    const std::optional<CKRString> releasedGroup = EndRun(0);
    lock.unlock();
    ReportReleasedGroup(releasedGroup);
    return;
  }
  lock.unlock();
  CKRDebugOutput::Printf(L"CKRThread: a thread object was destroyed while its thread was running; the thread is "
                         L"killed.\n");
  KillBeforeDestruction();
}

void CKRThread::KillBeforeDestruction() {
  std::shared_ptr<SKRThreadRun> run;
  {
    std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
    if (!m_pRun || SKRNativeThread::IsCurrent(m_Handle))
      return;
    run = m_pRun;
  }
  try {
    Kill(0xFFFFFFFF, 0);
    return;
  } catch (CKRThreadException* exception) {
    exception->Delete();
  }
  CKRDebugOutput::Printf(L"CKRThread: a thread to be destroyed has not reached a kill point in time; waiting for "
                         L"it to end.\n");
  std::unique_lock<std::mutex> lock(InternalThreadSynchronization());
  run->m_Changed.wait(lock, [&run] { return run->m_Ended; });
}

void CKRThread::SetOwnerParams(void* owner, long param) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  m_pOwner = owner;
  m_OwnerParam = param;
}

void CKRThread::GetOwnerParams(void*& owner, long& param) const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  owner = m_pOwner;
  param = m_OwnerParam;
}

void CKRThread::SetAttributes(void* attributes) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  m_pAttributes = attributes;
}

void* CKRThread::GetAttributes() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return m_pAttributes;
}

void CKRThread::SetStackSize(unsigned long stackSize) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  m_StackSize = stackSize;
}

unsigned long CKRThread::GetStackSize() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return m_StackSize;
}

void CKRThread::SetSynchronicity(int enable, const CKRString& name) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  m_Synchronicity = enable != 0 ? 1 : 0;
  m_SynchronicityName = name;
}

int CKRThread::GetSynchronicity(CKRString* name) const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  if (name != nullptr)
    *name = m_SynchronicityName;
  return m_Synchronicity;
}

int CKRThread::GetUsesNotification() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return m_UsesNotification;
}

void CKRThread::SetUsesNotification(int usesNotification) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  m_UsesNotification = usesNotification != 0 ? 1 : 0;
}

void* CKRThread::GetHandle() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return reinterpret_cast<void*>(m_Handle);
}

unsigned long CKRThread::GetID() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return m_ThreadID;
}

void CKRThread::Start() {
  std::unique_lock<std::mutex> lock(InternalThreadSynchronization());
  if (m_pRun) {
    lock.unlock();
    throw new CKRThreadException(this, s_strERROR_THREAD_ALREADY_STARTED, KRTHREAD_ERROR_ALREADY_STARTED);
  }
  m_Handle = 0;
  m_ThreadID = 0;
  m_ActivityStatus = KRTHREAD_STATUS_IDLE;
  m_CommandQueue.clear();
  // The notification event is a condition variable that exists with the
  // object, so there is nothing to create here that could fail.
  auto run = std::make_shared<SKRThreadRun>(this);
  auto* argument = new std::shared_ptr<SKRThreadRun>(run);
  JoinSynchronicity();
  std::uintptr_t handle = 0;
  const int error = SKRNativeThread::Create(&CKRThread::ThreadEntry, argument, m_StackSize, handle);
  if (error != 0) {
    delete argument;
    LeaveSynchronicity();
    lock.unlock();
    throw new CKRThreadException(this, CKRThreadException::GetLastSystemErrorMsg(static_cast<unsigned long>(error)),
                                 KRTHREAD_ERROR_CREATE_FAILED);
  }
  // The new thread waits for InternalThreadSynchronization before it runs
  // the handler, so the handler sees the run complete: handle, "started"
  // queued, status 0.
  m_Handle = handle;
  m_pRun = run;
  PostCommandLocked(KRTHREAD_CMD_STARTED);
  m_ActivityStatus = KRTHREAD_STATUS_STARTED;
  m_StateSignal.notify_all();
  // Wait until the thread has published its ID (the lock is left while
  // waiting).
  run->m_Changed.wait(lock, [&run] { return run->m_Started || run->m_Ended; });
}

void* CKRThread::ThreadEntry(void* argument) {
  auto* passed = static_cast<std::shared_ptr<SKRThreadRun>*>(argument);
  std::shared_ptr<SKRThreadRun> run = std::move(*passed);
  delete passed;

  SKRRunGuard guard(run);
  CKRThread* thread = nullptr;
  {
    std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
    thread = run->m_pThread;
    if (thread == nullptr)
      return nullptr;
    thread->m_ThreadID = SKRNativeThread::CurrentThreadID();
    run->m_Started = true;
    run->m_Changed.notify_all();
  }
  t_pCurrentRun = run.get();
  try {
    SKRKillPoint::Check();  // killed before the handler began
    guard.m_ExitCode = thread->ThreadHandler();
  } catch (const SKRThreadKilled&) {
    // The run ends with the kill's exit code (EndRun).
  }
  return nullptr;
}

// Ends the run: called with InternalThreadSynchronization held, on the
// run's own thread (by the run guard, or by Kill and the destructor called
// from that thread). Returns the name of the synchronicity group whose lock
// the thread still held (and that is released now), for a report made after
// the internal lock is left; nothing otherwise.
std::optional<CKRString> CKRThread::EndRun(unsigned long exitCode) {
  std::shared_ptr<SKRThreadRun> run = std::move(m_pRun);
  std::optional<CKRString> releasedGroup;
  if (m_pSynchronicityEntry && m_pSynchronicityEntry->m_Lock.UnlockAll() != 0)
    releasedGroup = m_pSynchronicityEntry->m_Name;
  LeaveSynchronicity();
  m_Handle = 0;
  m_ThreadID = 0;
  m_ActivityStatus = KRTHREAD_STATUS_IDLE;
  m_CommandQueue.clear();
  m_ExitCode = (run && run->m_Killed) ? run->m_KillExitCode : exitCode;
  if (run) {
    run->m_pThread = nullptr;
    run->m_Ended = true;
    run->m_Changed.notify_all();
  }
  m_StateSignal.notify_all();
  return releasedGroup;
}

void CKRThread::ReportReleasedGroup(const std::optional<CKRString>& group) {
  if (group)
    CKRDebugOutput::Printf(L"CKRThread: a thread ended holding the lock of synchronicity group \"%s\"; it is "
                           L"released.\n",
                           group->GetString());
}

void CKRThread::JoinSynchronicity() {
  if (m_Synchronicity == 0)
    return;
  auto& list = SynchronicityList();
  const auto at = std::find_if(list.begin(), list.end(),
                               [this](const auto& entry) { return entry->m_Name == m_SynchronicityName; });
  if (at != list.end()) {
    m_pSynchronicityEntry = *at;
  } else {
    m_pSynchronicityEntry = std::make_shared<SKRThreadSynchronicity>();
    m_pSynchronicityEntry->m_Name = m_SynchronicityName;
    list.push_back(m_pSynchronicityEntry);
  }
  ++m_pSynchronicityEntry->m_MemberCount;
}

void CKRThread::LeaveSynchronicity() {
  if (!m_pSynchronicityEntry)
    return;
  if (--m_pSynchronicityEntry->m_MemberCount == 0) {
    auto& list = SynchronicityList();
    list.erase(std::remove(list.begin(), list.end(), m_pSynchronicityEntry), list.end());
  }
  m_pSynchronicityEntry.reset();
}

int CKRThread::Stop(unsigned long& exitCode, unsigned long timeout) {
  std::unique_lock<std::mutex> lock(InternalThreadSynchronization());
  if (!m_pRun) {
    exitCode = m_ExitCode;
    return 1;
  }
  PostCommandLocked(KRTHREAD_CMD_STOP);
  // A thread cannot wait for its own end.
  if (!SKRNativeThread::IsCurrent(m_Handle))
    WaitSteps(lock, m_StateSignal, timeout, [this] { return !m_pRun; });
  exitCode = m_pRun ? KRTHREAD_STILL_ACTIVE : m_ExitCode;
  return m_pRun ? 0 : 1;
}

void CKRThread::Kill(unsigned long exitCode, int) {
  std::unique_lock<std::mutex> lock(InternalThreadSynchronization());
  const std::shared_ptr<SKRThreadRun> run = m_pRun;
  if (!run)
    return;
  if (!run->m_Killed) {
    m_CommandQueue.clear();
    run->m_Killed = true;
    run->m_KillExitCode = exitCode;
  }
  if (SKRNativeThread::IsCurrent(m_Handle)) {
    // The thread ends itself: its run ends now, and the unwinding from here
    // takes it out of its handler.
    run->m_OnKillCalled = true;
    const std::optional<CKRString> releasedGroup = EndRun(exitCode);
    lock.unlock();
    run->m_KillSource.request_stop();
    ReportReleasedGroup(releasedGroup);
    OnKill();
    SKRKillPoint::Throw();
  }
  const unsigned long timeout = m_KillTimeout;
  // Wakes the thread if it waits at a kill point. Raised outside the
  // internal lock, which a woken thread needs.
  lock.unlock();
  run->m_KillSource.request_stop();
  lock.lock();
  const std::optional<SKRClock::time_point> deadline = StepsDeadline(timeout);
  const auto ended = [&run] { return run->m_Ended; };
  if (deadline)
    run->m_Changed.wait_until(lock, *deadline, ended);
  else
    run->m_Changed.wait(lock, ended);
  if (!run->m_Ended) {
    lock.unlock();
    throw new CKRThreadException(this, L"The thread has not reached a kill point in time.",
                                 KRTHREAD_ERROR_TERMINATE_FAILED);
  }
  // One OnKill per kill, by the first caller to see the end.
  const bool callOnKill = !run->m_OnKillCalled;
  run->m_OnKillCalled = true;
  lock.unlock();
  if (callOnKill)
    OnKill();
}

void CKRThread::SetKillTimeout(unsigned long timeout) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  m_KillTimeout = timeout;
}

unsigned long CKRThread::GetKillTimeout() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return m_KillTimeout;
}

void CKRThread::KillPoint() {
  SKRKillPoint::Check();
}

void CKRThread::OnKill() {}

int CKRThread::Run() {
  return PostCommand(KRTHREAD_CMD_RUN);
}

int CKRThread::Pause() {
  return PostCommand(KRTHREAD_CMD_PAUSE);
}

int CKRThread::Continue() {
  return PostCommand(KRTHREAD_CMD_CONTINUE);
}

int CKRThread::Reset() {
  return PostCommand(KRTHREAD_CMD_RESET);
}

int CKRThread::PostCommand(int command) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return PostCommandLocked(command);
}

int CKRThread::PostCommandLocked(int command) {
  if (!m_pRun)
    return 0;
  if (command == KRTHREAD_CMD_NONE || m_UsesNotification == 0)
    return 1;
  if (!m_CommandQueue.empty() && m_CommandQueue.back() == command)
    return 1;
  m_CommandQueue.push_back(command);
  m_CommandSignal.notify_one();
  return 1;
}

void CKRThread::ResetCommands() {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  m_CommandQueue.clear();
}

void CKRThread::HandleCommandImmediately(int command) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  if (m_pRun && m_UsesNotification != 0 && command != KRTHREAD_CMD_NONE)
    m_CommandQueue.push_front(command);
}

void CKRThread::WaitForNotification(int& command, unsigned long timeout) {
  // A kill point before anything else: a thread that always finds a
  // command queued is killable all the same.
  SKRKillPoint::Check();
  std::unique_lock<std::mutex> lock(InternalThreadSynchronization());
  if (m_UsesNotification == 0) {
    command = KRTHREAD_CMD_NONE;
    return;
  }
  const auto ready = [this] { return !m_CommandQueue.empty(); };
  if (timeout >= KRTHREAD_INFINITE) {
    SKRKillPoint::Wait(m_CommandSignal, lock, ready);
  } else if (!SKRKillPoint::WaitUntil(m_CommandSignal, lock, SKRClock::now() + std::chrono::milliseconds(timeout),
                                      ready)) {
    command = KRTHREAD_CMD_TIMEOUT;
    return;
  }
  command = m_CommandQueue.front();
  m_CommandQueue.pop_front();
}

int CKRThread::IsAlive() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return m_pRun ? 1 : 0;
}

int CKRThread::IsCurrentThread() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return (m_pRun && SKRNativeThread::IsCurrent(m_Handle)) ? 1 : 0;
}

unsigned long CKRThread::GetExitCode() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return m_pRun ? KRTHREAD_STILL_ACTIVE : m_ExitCode;
}

int CKRThread::GetActivityStatus() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  return m_ActivityStatus;
}

void CKRThread::SetActivityStatus(int status) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  m_ActivityStatus = status;
  m_StateSignal.notify_all();
}

int CKRThread::WaitForActivityStatus(int status, unsigned long timeout) {
  std::unique_lock<std::mutex> lock(InternalThreadSynchronization());
  WaitSteps(lock, m_StateSignal, timeout, [&] { return m_ActivityStatus == status || !m_pRun; });
  return m_ActivityStatus == status ? 1 : 0;
}

int CKRThread::SetPriority(int priority) {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  if (!m_pRun)
    return 0;
  const auto level = std::find_if(std::begin(kPriorityLevels), std::end(kPriorityLevels),
                                  [priority](const SKRPriorityLevel& entry) { return entry.m_Level == priority; });
  if (level == std::end(kPriorityLevels))
    return 0;
  return SKRNativeThread::SetNice(m_ThreadID, level->m_Nice) == 0 ? 1 : 0;
}

int CKRThread::GetPriority() const {
  std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
  int nice = 0;
  if (!m_pRun || SKRNativeThread::GetNice(m_ThreadID, nice) != 0)
    return KRTHREAD_PRIORITY_ERROR;
  const auto nearest = std::min_element(std::begin(kPriorityLevels), std::end(kPriorityLevels),
                                        [nice](const SKRPriorityLevel& a, const SKRPriorityLevel& b) {
                                          return std::abs(a.m_Nice - nice) < std::abs(b.m_Nice - nice);
                                        });
  return nearest->m_Level;
}

void CKRThread::Lock() {
  std::shared_ptr<SKRThreadSynchronicity> group;
  {
    std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
    group = m_pSynchronicityEntry;
  }
  if (group)
    group->m_Lock.Lock();
}

void CKRThread::Unlock() {
  std::shared_ptr<SKRThreadSynchronicity> group;
  {
    std::lock_guard<std::mutex> lock(InternalThreadSynchronization());
    group = m_pSynchronicityEntry;
  }
  if (group)
    group->m_Lock.Unlock();
}

void CKRThread::OpenProcessLocking() {
  ProcessLockObject().m_Open.store(true);
}

void CKRThread::ProcessLock() {
  SKRProcessLock& processLock = ProcessLockObject();
  if (processLock.m_Open.load())
    processLock.m_Lock.Lock();
}

void CKRThread::ProcessUnlock() {
  ProcessLockObject().m_Lock.Unlock();
}

void CKRThread::CloseProcessLocking() {
  ProcessLockObject().m_Open.store(false);
}
