// CReaderWriterLockNonReentrance and CKRReaderWriterLock: reader/writer
// locks that prefer writers.
//
// Many readers may hold a lock at once, a writer holds it alone. Once a
// writer holds or waits, new readers wait until no writer is left, so a
// stream of readers never starves a writer; readers are not served in any
// particular order. Neither lock has a time-out.
//
// CReaderWriterLockNonReentrance is not recursive: a thread that holds the
// lock and asks for it again may wait for itself forever (a nested write
// request always does, a nested read request does once a writer waits).
// CKRReaderWriterLock is recursive per thread and lets a reader become the
// writer (upgrade: it gives up its read hold while it waits, so another
// writer may come first) and a writer keep reading after it stops writing
// (downgrade).
//
// A release by a thread that does not hold the lock in that mode is ignored
// and reported on CKRDebugOutput; the lock stays consistent. A thread killed
// while it waits for a lock (CKRThread::Kill) leaves the lock as if it had
// never asked; holds of a killed or ended thread are not given back.
//
// Thread safety: all operations may be called from any thread. A lock may
// be destroyed only when no thread holds it, waits for it or is still inside
// one of its operations.
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <mutex>

// The state both locks share, with read-only counts for diagnostics and
// tests (they change at any moment unless the caller arranged otherwise).
class KRCORELIB_API CKRReaderWriterLockState {
public:
  CKRReaderWriterLockState(const CKRReaderWriterLockState&) = delete;
  CKRReaderWriterLockState& operator=(const CKRReaderWriterLockState&) = delete;

  // Threads holding read access (a recursive reader counts once).
  int GetReaderCount() const noexcept;
  // Writers holding or waiting (an upgrading reader counts as a writer).
  int GetWriterCount() const noexcept;
  // Readers waiting for the writers to leave.
  int GetWaitingReaderCount() const noexcept;

protected:
  CKRReaderWriterLockState();
  ~CKRReaderWriterLockState();

  // The bare operations, for one hold each; callers keep track of which
  // holds a thread has. Internal to the library (not exported).
  KRCORELIB_LOCAL void LockRead();
  KRCORELIB_LOCAL void UnlockRead();
  KRCORELIB_LOCAL void LockWrite();
  KRCORELIB_LOCAL void UnlockWrite();
  // The calling thread's one read hold becomes a write hold (may wait).
  KRCORELIB_LOCAL void UpgradeToWrite();
  // The calling thread's write hold becomes a read hold (never waits).
  KRCORELIB_LOCAL void DowngradeToRead();

  // Identifies this lock among all locks ever made (the per-thread record
  // of holds is keyed by it, so a new lock at an old address is distinct).
  std::uint64_t GetSerial() const noexcept { return m_Serial; }

private:
  KRCORELIB_LOCAL void LockReadSlow();
  KRCORELIB_LOCAL void WakeWriter();
  KRCORELIB_LOCAL void LockWriteSlow();
  KRCORELIB_LOCAL void WaitForWriteAccess(std::unique_lock<std::mutex>& lock);

  // Readers holding (low 32 bits), writers holding or waiting (bits 32 to
  // 62) and whether a writer holds (bit 63). Readers take and leave the
  // lock with one atomic operation while no writer is about; waiting and
  // waking go through m_Mutex and the two signals.
  alignas(64) std::atomic<std::uint64_t> m_State;
  // Read by every operation, so kept off the line that m_State's writes
  // move between processors.
  alignas(64) const std::uint64_t m_Serial;
  mutable std::mutex m_Mutex;
  // Waits on them are kill points (CKRThread::Kill).
  std::condition_variable_any m_ReaderSignal;
  std::condition_variable_any m_WriterSignal;
  std::atomic<int> m_WaitingReaders;
};

class KRCORELIB_API CReaderWriterLockNonReentrance : public CKRReaderWriterLockState {
public:
  CReaderWriterLockNonReentrance() = default;
  ~CReaderWriterLockNonReentrance() = default;

  // Waits while a writer holds or waits.
  void AcquireReaderLock();
  void ReleaseReaderLock();
  // Waits while readers or another writer hold the lock.
  void AcquireWriterLock();
  void ReleaseWriterLock();
};

class KRCORELIB_API CKRReaderWriterLock : public CKRReaderWriterLockState {
public:
  CKRReaderWriterLock() = default;
  ~CKRReaderWriterLock() = default;

  // A thread that already holds the lock (reading or writing) gets another
  // read hold at once; otherwise it waits while a writer holds or waits.
  void AcquireReaderLock();
  // Gives back one read hold.
  void ReleaseReaderLock();
  // A writer gets another write hold at once; a reader gives up its read
  // access, waits until the other readers have left and writes (its read
  // holds count on); a thread holding nothing waits like any writer.
  void AcquireWriterLock();
  // Gives back one write hold; after the last one a thread that still has
  // read holds reads on, and waiting readers may join it.
  void ReleaseWriterLock();
};
