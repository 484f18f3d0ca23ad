#include "SKRNativeThread.h"

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <climits>
#include <cstring>
#include <pthread.h>
#include <sys/resource.h>
#include <type_traits>
#include <unistd.h>

// pthread_t is an integer on this platform, so it travels as one.
static_assert(std::is_integral_v<pthread_t> && sizeof(pthread_t) <= sizeof(std::uintptr_t));

namespace {

pthread_t ToNative(std::uintptr_t handle) {
  return static_cast<pthread_t>(handle);
}

}  // namespace

int SKRNativeThread::Create(Entry entry, void* argument, unsigned long stackSize, std::uintptr_t& handle) {
  pthread_attr_t attributes;
  int error = pthread_attr_init(&attributes);
  if (error != 0)
    return error;
  error = pthread_attr_setdetachstate(&attributes, PTHREAD_CREATE_DETACHED);
  // The platform refuses stacks below its minimum, stacks that are not whole
  // pages, and stacks too small for the process's thread-local storage (a
  // limit known only when the thread is created). Small requests are
  // therefore raised to 64 KiB, whole pages, and doubled while the platform
  // refuses them, up to 16 MiB.
  constexpr std::size_t kSmallest = 64 * 1024;
  constexpr std::size_t kLargest = 16 * 1024 * 1024;
  std::size_t size = 0;
  if (error == 0 && stackSize != 0) {
    const long page = sysconf(_SC_PAGESIZE) > 0 ? sysconf(_SC_PAGESIZE) : 4096;
    const std::size_t minimum = std::max(kSmallest, static_cast<std::size_t>(PTHREAD_STACK_MIN));
    size = std::max(minimum, static_cast<std::size_t>(stackSize));
    size = (size + std::size_t(page) - 1) / std::size_t(page) * std::size_t(page);
  }
  pthread_t thread{};
  for (;;) {
    if (error == 0 && size != 0)
      error = pthread_attr_setstacksize(&attributes, size);
    if (error == 0)
      error = pthread_create(&thread, &attributes, entry, argument);
    if (error != EINVAL || size == 0 || size >= kLargest)
      break;
    size *= 2;
    error = 0;
  }
  pthread_attr_destroy(&attributes);
  if (error == 0)
    handle = static_cast<std::uintptr_t>(thread);
  return error;
}

bool SKRNativeThread::IsCurrent(std::uintptr_t handle) {
  return pthread_equal(pthread_self(), ToNative(handle)) != 0;
}

unsigned long SKRNativeThread::CurrentThreadID() {
  return static_cast<unsigned long>(gettid());
}

int SKRNativeThread::SetNice(unsigned long threadID, int nice) {
  // On Linux PRIO_PROCESS with a thread ID changes that one thread.
  if (setpriority(PRIO_PROCESS, static_cast<id_t>(threadID), nice) != 0)
    return errno;
  return 0;
}

int SKRNativeThread::GetNice(unsigned long threadID, int& nice) {
  // -1 is also a valid nice value: errno tells the two apart.
  errno = 0;
  const int value = getpriority(PRIO_PROCESS, static_cast<id_t>(threadID));
  if (value == -1 && errno != 0)
    return errno;
  nice = value;
  return 0;
}

CKRString SKRNativeThread::ErrorText(unsigned long code) {
  char buffer[256] = {};
  const int number = code > static_cast<unsigned long>(INT_MAX) ? INT_MAX : static_cast<int>(code);
  // The GNU strerror_r returns either the buffer or a static text.
  const char* text = strerror_r(number, buffer, sizeof buffer);
  return CKRString::FromUtf8(text != nullptr ? text : "");
}
