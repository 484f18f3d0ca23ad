// Kill points: the places where a thread started by CKRThread ends when
// CKRThread::Kill has asked it to. Private to the library.
//
// Kill never cancels a thread from outside (the unwinding of a cancellation
// through the library's noexcept functions would end the process). It
// raises the run's kill request and wakes the thread if it waits at a kill
// point; the thread then throws SKRThreadKilled from that point, its stack
// unwinds (destructors run, locks held in RAII objects are released) and
// CKRThread's thread entry catches it. On threads that CKRThread did not
// start, nothing is ever pending and the waits are plain waits.
#pragma once

#include <condition_variable>
#include <stop_token>

// Thrown at a kill point of a thread whose kill is pending.
struct SKRThreadKilled {};

struct SKRKillPoint {
  // The calling thread's kill request; one that can never be raised on
  // threads CKRThread did not start.
  static std::stop_token Token() noexcept;
  [[noreturn]] static void Throw();
  // Throws SKRThreadKilled when the calling thread's kill is pending.
  static void Check() {
    if (Token().stop_requested())
      Throw();
  }

  // Waits on `signal` (with `lock` held) until `ready()`; a pending kill
  // throws, also one raised while it waits.
  template <class TLock, class TReady>
  static void Wait(std::condition_variable_any& signal, TLock& lock, TReady ready) {
    const std::stop_token token = Token();
    if (token.stop_requested() || !signal.wait(lock, token, ready))
      Throw();
  }

  // As Wait, at most until `deadline`; returns `ready()`.
  template <class TLock, class TTime, class TReady>
  static bool WaitUntil(std::condition_variable_any& signal, TLock& lock, const TTime& deadline, TReady ready) {
    const std::stop_token token = Token();
    if (token.stop_requested())
      Throw();
    const bool got = signal.wait_until(lock, token, deadline, ready);
    if (!got && token.stop_requested())
      Throw();
    return got;
  }
};
