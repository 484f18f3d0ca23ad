// SKRNativeThread: the few operating-system calls the thread component
// makes, behind plain integers so that no platform type reaches the rest of
// the library. Private to the library.
#pragma once

#include <cstdint>

#include <krCoreLib/core/CKRString.h>

struct SKRNativeThread {
  using Entry = void* (*)(void* argument);

  // Starts a detached thread running entry(argument) with at least
  // `stackSize` bytes of stack (0: the platform default; sizes below the
  // platform minimum are raised to it). Returns 0 and the thread's handle,
  // or the error number.
  static int Create(Entry entry, void* argument, unsigned long stackSize, std::uintptr_t& handle);

  // True when `handle` is the calling thread.
  static bool IsCurrent(std::uintptr_t handle);

  // The kernel's ID of the calling thread (as shown by ps and debuggers).
  static unsigned long CurrentThreadID();

  // The scheduler's nice value (-20 .. 19) of a thread by kernel ID. Set
  // returns 0 or the error number (raising the priority needs privileges);
  // Get returns 0 and the value, or the error number.
  static int SetNice(unsigned long threadID, int nice);
  static int GetNice(unsigned long threadID, int& nice);

  // The system's text for an error number ("No such file or directory").
  static CKRString ErrorText(unsigned long code);
};
