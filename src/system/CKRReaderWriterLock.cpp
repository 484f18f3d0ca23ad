#include <krCoreLib/system/CKRReaderWriterLock.h>

#include <krCoreLib/core/CKRDebugOutput.h>

#include "SKRKillPoint.h"

#include <algorithm>
#include <memory>
#include <vector>

// The state word holds everything a reader needs to decide alone: the
// readers holding, the writers holding or waiting, and whether a writer
// holds. While no writer holds or waits, a reader enters with one atomic
// addition and leaves with one atomic subtraction, as cheap as the
// platform's own reader/writer lock. (A reader that finds a writer takes its
// addition back; until then the reader count is one too high, which only
// delays the writer by that moment.)
//
// Everything else goes through m_Mutex and two condition variables, one for
// readers waiting for the writers to leave and one for writers waiting for
// the lock to be free. A waiter checks the state and goes to sleep under
// m_Mutex; whoever changes the state so that a waiter may go on takes
// m_Mutex (after or while making the change) before it signals, so no
// wake-up is lost:
//
//   - the last reader to leave while a writer is about signals a writer;
//   - a writer arriving at a busy lock counts itself under m_Mutex, so from
//     then on arriving readers wait;
//   - a writer leaving (or downgrading) does so under m_Mutex and signals
//     the next writer or, when none is left, the readers.
//
// A writer takes the lock without m_Mutex only when it is completely free.
//
// The waits are kill points (CKRThread::Kill): a thread killed while it
// waits undoes its own counting (the guards below) and passes on a wake-up
// it may have swallowed, so the lock stays as if it had never asked.
//
// Which thread holds what is kept per thread (SKRLockHolds): the
// non-reentrant lock uses it to refuse releases by threads that hold
// nothing, the recursive lock also for its recursion counts. Holds are few
// per thread, so a small array does.

namespace {

constexpr std::uint64_t kOneReader = 1;
constexpr std::uint64_t kReaderMask = 0xFFFFFFFFull;
constexpr std::uint64_t kOneWriter = 1ull << 32;
constexpr std::uint64_t kWriterMask = 0x7FFFFFFFull << 32;
constexpr std::uint64_t kWriterHolds = 1ull << 63;

constexpr std::uint64_t Readers(std::uint64_t state) {
  return state & kReaderMask;
}
constexpr std::uint64_t Writers(std::uint64_t state) {
  return (state & kWriterMask) >> 32;
}
constexpr bool WriterHolds(std::uint64_t state) {
  return (state & kWriterHolds) != 0;
}

std::uint64_t NextSerial() {
  static std::atomic<std::uint64_t> serial{0};
  return serial.fetch_add(1, std::memory_order_relaxed) + 1;
}

// ---- per-thread record of holds ------------------------------------------

struct SKRLockHold {
  std::uint64_t m_Serial;
  std::uint32_t m_Reads;
  std::uint32_t m_Writes;
};

// A thread's holds: a small array, and a heap array for threads that hold
// more locks at once than it takes. A record whose holds are all given back
// stays, empty, for the next time the thread takes the same lock (so a
// thread that takes and releases one lock over and over only counts), and
// is reused for another lock when space is needed.
struct SKRLockHolds {
  static constexpr int kInline = 16;

  SKRLockHold* Find(std::uint64_t serial) {
    // The most recently used record first.
    if (m_Inline[m_Last].m_Serial == serial) [[likely]]
      return &m_Inline[m_Last];
    for (int i = 0; i < m_Count; ++i)
      if (m_Inline[i].m_Serial == serial) {
        m_Last = i;
        return &m_Inline[i];
      }
    // The heap array is used only while the small one is full of holds.
    for (SKRLockHold& hold : m_Overflow)
      if (hold.m_Serial == serial)
        return &hold;
    return nullptr;
  }

  // The record of `serial`, made (empty) when there is none. Pointers stay
  // valid until the next call. May throw std::bad_alloc (a thread holding
  // more than kInline locks at once).
  SKRLockHold* Get(std::uint64_t serial) {
    if (SKRLockHold* hold = Find(serial))
      return hold;
    for (int i = 0; i < kInline; ++i)
      if (i >= m_Count || IsEmpty(m_Inline[i])) {
        m_Count = std::max(m_Count, i + 1);
        m_Inline[i] = {serial, 0, 0};
        m_Last = i;
        return &m_Inline[i];
      }
    for (SKRLockHold& hold : m_Overflow)
      if (IsEmpty(hold)) {
        hold = {serial, 0, 0};
        return &hold;
      }
    m_Overflow.push_back({serial, 0, 0});
    return &m_Overflow.back();
  }

  // After a release: an emptied record of the heap array goes, so that the
  // array does not outgrow the holds of the moment.
  void Tidy(SKRLockHold* hold) {
    if ((hold < m_Inline || hold >= m_Inline + kInline) && IsEmpty(*hold)) [[unlikely]] {
      *hold = m_Overflow.back();
      m_Overflow.pop_back();
    }
  }

  static bool IsEmpty(const SKRLockHold& hold) { return hold.m_Reads == 0 && hold.m_Writes == 0; }

  // Serial 0 belongs to no lock, so the zeroed array matches nothing.
  SKRLockHold m_Inline[kInline] = {};
  int m_Count = 0;
  int m_Last = 0;
  std::vector<SKRLockHold> m_Overflow;
};

// The calling thread's record, created on first use and freed when the
// thread ends. Every lock operation needs it; the library is built with TLS
// descriptors, which reach it nearly as fast as the initial-exec model
// would, without making the library impossible to load with dlopen (a
// module with initial-exec variables needs its whole thread-local block in
// the small static TLS reserve).
thread_local SKRLockHolds* t_pHolds = nullptr;
thread_local bool t_HoldsFreed = false;

[[gnu::noinline]] SKRLockHolds& CreateHolds() {
  if (t_HoldsFreed) {
    // A lock used by a thread-local destructor that runs after the record
    // was freed: a record for the rest of the thread's life, left to the
    // end of the thread (nothing of the thread runs after it to free it).
    t_pHolds = new SKRLockHolds();
    return *t_pHolds;
  }
  struct SKRHoldsOwner {
    SKRLockHolds m_Holds;
    ~SKRHoldsOwner() {
      t_pHolds = nullptr;
      t_HoldsFreed = true;
    }
  };
  thread_local SKRHoldsOwner owner;
  t_pHolds = &owner.m_Holds;
  return owner.m_Holds;
}

inline SKRLockHolds& Holds() {
  if (SKRLockHolds* holds = t_pHolds; holds != nullptr) [[likely]]
    return *holds;
  return CreateHolds();
}

void ReportUnheld(const wchar_t* lockClass, const wchar_t* operation, const wchar_t* mode) {
  CKRDebugOutput::Printf(L"%s::%s: the calling thread holds no %s lock; the call is ignored.\n", lockClass,
                         operation, mode);
}

}  // namespace

// ---- the shared state ----------------------------------------------------------

CKRReaderWriterLockState::CKRReaderWriterLockState() : m_State(0), m_Serial(NextSerial()), m_WaitingReaders(0) {}

CKRReaderWriterLockState::~CKRReaderWriterLockState() = default;

int CKRReaderWriterLockState::GetReaderCount() const noexcept {
  return static_cast<int>(Readers(m_State.load(std::memory_order_acquire)));
}

int CKRReaderWriterLockState::GetWriterCount() const noexcept {
  return static_cast<int>(Writers(m_State.load(std::memory_order_acquire)));
}

int CKRReaderWriterLockState::GetWaitingReaderCount() const noexcept {
  return m_WaitingReaders.load(std::memory_order_acquire);
}

[[gnu::always_inline]] inline void CKRReaderWriterLockState::LockRead() {
  // Optimistic: count this reader, then look. Contending readers never
  // retry, unlike with a compare-and-swap.
  const std::uint64_t state = m_State.fetch_add(kOneReader, std::memory_order_acquire);
  if (Writers(state) == 0) [[likely]]
    return;
  LockReadSlow();
}

// A writer holds or waits: take back the optimistic count and wait.
void CKRReaderWriterLockState::LockReadSlow() {
  std::unique_lock<std::mutex> lock(m_Mutex);
  // Taking the count back under m_Mutex may be what a waiting writer
  // needs.
  const std::uint64_t before = m_State.fetch_sub(kOneReader, std::memory_order_acq_rel);
  if (Readers(before) == 1 && Writers(before) != 0)
    m_WriterSignal.notify_one();
  m_WaitingReaders.fetch_add(1, std::memory_order_relaxed);
  struct SKRUncount {
    std::atomic<int>& m_Count;
    ~SKRUncount() { m_Count.fetch_sub(1, std::memory_order_relaxed); }
  } uncount{m_WaitingReaders};
  for (;;) {
    SKRKillPoint::Wait(m_ReaderSignal, lock,
                       [this] { return Writers(m_State.load(std::memory_order_relaxed)) == 0; });
    std::uint64_t state = m_State.load(std::memory_order_relaxed);
    if (Writers(state) == 0 && m_State.compare_exchange_weak(state, state + kOneReader, std::memory_order_acquire,
                                                             std::memory_order_relaxed))
      return;
  }
}

[[gnu::always_inline]] inline void CKRReaderWriterLockState::UnlockRead() {
  const std::uint64_t state = m_State.fetch_sub(kOneReader, std::memory_order_release);
  // The last reader lets a waiting writer in.
  if (Readers(state) == 1 && Writers(state) != 0) [[unlikely]]
    WakeWriter();
}

void CKRReaderWriterLockState::WakeWriter() {
  std::lock_guard<std::mutex> lock(m_Mutex);
  m_WriterSignal.notify_one();
}

void CKRReaderWriterLockState::LockWrite() {
  std::uint64_t free = 0;
  if (m_State.compare_exchange_strong(free, kOneWriter | kWriterHolds, std::memory_order_acquire,
                                      std::memory_order_relaxed))
    return;
  LockWriteSlow();
}

void CKRReaderWriterLockState::LockWriteSlow() {
  std::unique_lock<std::mutex> lock(m_Mutex);
  m_State.fetch_add(kOneWriter, std::memory_order_acq_rel);
  WaitForWriteAccess(lock);
}

// Called under m_Mutex by a writer already counted in the state; returns
// when it holds the lock.
void CKRReaderWriterLockState::WaitForWriteAccess(std::unique_lock<std::mutex>& lock) {
  // Undoes the counting when the wait is cut short by a kill (the
  // unwinding runs with m_Mutex held again).
  struct SKRUncount {
    CKRReaderWriterLockState& m_Lock;
    bool m_Done = false;
    ~SKRUncount() {
      if (m_Done)
        return;
      const std::uint64_t state = m_Lock.m_State.fetch_sub(kOneWriter, std::memory_order_acq_rel) - kOneWriter;
      if (Writers(state) == 0)
        m_Lock.m_ReaderSignal.notify_all();
      else if (Readers(state) == 0 && !WriterHolds(state))
        m_Lock.m_WriterSignal.notify_one();
    }
  } uncount{*this};
  const auto writable = [this] {
    const std::uint64_t state = m_State.load(std::memory_order_relaxed);
    return Readers(state) == 0 && !WriterHolds(state);
  };
  for (;;) {
    SKRKillPoint::Wait(m_WriterSignal, lock, writable);
    std::uint64_t state = m_State.load(std::memory_order_relaxed);
    if (Readers(state) == 0 && !WriterHolds(state) &&
        m_State.compare_exchange_weak(state, state | kWriterHolds, std::memory_order_acquire,
                                      std::memory_order_relaxed)) {
      uncount.m_Done = true;
      return;
    }
  }
}

void CKRReaderWriterLockState::UnlockWrite() {
  std::lock_guard<std::mutex> lock(m_Mutex);
  const std::uint64_t state =
      m_State.fetch_sub(kOneWriter | kWriterHolds, std::memory_order_acq_rel) - (kOneWriter | kWriterHolds);
  // The next writer goes first; only when none is left do the readers.
  if (Writers(state) != 0)
    m_WriterSignal.notify_one();
  else if (m_WaitingReaders.load(std::memory_order_relaxed) != 0)
    m_ReaderSignal.notify_all();
}

void CKRReaderWriterLockState::UpgradeToWrite() {
  std::unique_lock<std::mutex> lock(m_Mutex);
  // Give up the read hold and count as a writer in one step.
  m_State.fetch_add(kOneWriter - kOneReader, std::memory_order_acq_rel);
  WaitForWriteAccess(lock);
}

void CKRReaderWriterLockState::DowngradeToRead() {
  std::lock_guard<std::mutex> lock(m_Mutex);
  const std::uint64_t state = m_State.fetch_add(kOneReader - kOneWriter - kWriterHolds, std::memory_order_acq_rel) +
                              kOneReader - kOneWriter - kWriterHolds;
  // Waiting writers now wait for this reader; waiting readers join it when
  // no writer is left.
  if (Writers(state) == 0 && m_WaitingReaders.load(std::memory_order_relaxed) != 0)
    m_ReaderSignal.notify_all();
}

// ---- CReaderWriterLockNonReentrance ------------------------------------------

// The record of a lock is looked up (or made) before the thread asks for
// the lock, and the lock given back before the record is updated, so that
// little bookkeeping sits between the lock's atomic operations (which keeps
// contending readers fast). A wait cut short by a kill leaves the
// record as it was.

void CReaderWriterLockNonReentrance::AcquireReaderLock() {
  SKRLockHold* hold = Holds().Get(GetSerial());
  LockRead();
  ++hold->m_Reads;
}

void CReaderWriterLockNonReentrance::ReleaseReaderLock() {
  SKRLockHolds& holds = Holds();
  SKRLockHold* hold = holds.Find(GetSerial());
  if (hold == nullptr || hold->m_Reads == 0) {
    ReportUnheld(L"CReaderWriterLockNonReentrance", L"ReleaseReaderLock", L"read");
    return;
  }
  --hold->m_Reads;
  UnlockRead();
  holds.Tidy(hold);
}

void CReaderWriterLockNonReentrance::AcquireWriterLock() {
  SKRLockHold* hold = Holds().Get(GetSerial());
  if (!SKRLockHolds::IsEmpty(*hold))
    CKRDebugOutput::Printf(L"CReaderWriterLockNonReentrance::AcquireWriterLock: the calling thread holds the lock "
                           L"already and waits for itself.\n");
  LockWrite();
  ++hold->m_Writes;
}

void CReaderWriterLockNonReentrance::ReleaseWriterLock() {
  SKRLockHolds& holds = Holds();
  SKRLockHold* hold = holds.Find(GetSerial());
  if (hold == nullptr || hold->m_Writes == 0) {
    ReportUnheld(L"CReaderWriterLockNonReentrance", L"ReleaseWriterLock", L"write");
    return;
  }
  --hold->m_Writes;
  UnlockWrite();
  holds.Tidy(hold);
}

// ---- CKRReaderWriterLock -------------------------------------------------------

void CKRReaderWriterLock::AcquireReaderLock() {
  SKRLockHold* hold = Holds().Get(GetSerial());
  // Any hold (read or write) lets the thread read on without waiting.
  if (SKRLockHolds::IsEmpty(*hold))
    LockRead();
  ++hold->m_Reads;
}

void CKRReaderWriterLock::ReleaseReaderLock() {
  SKRLockHolds& holds = Holds();
  SKRLockHold* hold = holds.Find(GetSerial());
  if (hold == nullptr || hold->m_Reads == 0) {
    ReportUnheld(L"CKRReaderWriterLock", L"ReleaseReaderLock", L"read");
    return;
  }
  // Read holds of a writer do not count as readers of the lock.
  if (--hold->m_Reads == 0 && hold->m_Writes == 0) {
    UnlockRead();
    holds.Tidy(hold);
  }
}

void CKRReaderWriterLock::AcquireWriterLock() {
  SKRLockHold* hold = Holds().Get(GetSerial());
  if (hold->m_Writes == 0) {
    if (hold->m_Reads == 0) {
      LockWrite();
    } else {
      // Upgrade. Should the thread be killed while it waits, its read
      // access is gone already, so its read holds go too.
      try {
        UpgradeToWrite();
      } catch (...) {
        hold->m_Reads = 0;
        throw;
      }
    }
  }
  ++hold->m_Writes;
}

void CKRReaderWriterLock::ReleaseWriterLock() {
  SKRLockHolds& holds = Holds();
  SKRLockHold* hold = holds.Find(GetSerial());
  if (hold == nullptr || hold->m_Writes == 0) {
    ReportUnheld(L"CKRReaderWriterLock", L"ReleaseWriterLock", L"write");
    return;
  }
  if (--hold->m_Writes != 0)
    return;
  if (hold->m_Reads != 0) {
    DowngradeToRead();
    return;
  }
  UnlockWrite();
  holds.Tidy(hold);
}
