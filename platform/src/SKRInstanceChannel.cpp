#include "SKRInstanceChannel.h"

#include "SKROwnerOnly.h"

#include <cerrno>
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/file.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/un.h>
#include <unistd.h>

namespace {

using SKRClock = std::chrono::steady_clock;

// A directory of this user that nobody else may enter (the only kind of
// folder in which a socket or lock file of ours cannot be taken over),
// opened without following a symbolic link; -1 for anything else.
int OpenPrivateFolder(const char* path) noexcept {
  const int fd = ::open(path, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (fd >= 0 && !SKROwnerOnly::Check(fd, S_IFDIR)) {
    ::close(fd);
    return -1;
  }
  return fd;
}

bool MakeAddress(const std::string& path, sockaddr_un& address) noexcept {
  address = sockaddr_un();
  address.sun_family = AF_UNIX;
  if (path.empty() || path.size() >= sizeof address.sun_path)
    return false;
  std::memcpy(address.sun_path, path.c_str(), path.size() + 1);
  return true;
}

SKRClock::time_point Deadline(int timeoutMs) noexcept {
  return SKRClock::now() + std::chrono::milliseconds(timeoutMs > 0 ? timeoutMs : 0);
}

// Milliseconds left until `deadline`, at least 0.
int Remaining(SKRClock::time_point deadline) noexcept {
  const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - SKRClock::now()).count();
  return left > 0 ? int(left) : 0;
}

// Waits until `fd` is ready for `events`; false on time-out or error.
bool WaitFor(int fd, short events, SKRClock::time_point deadline) noexcept {
  for (;;) {
    pollfd entry = {fd, events, 0};
    const int count = ::poll(&entry, 1, Remaining(deadline));
    if (count < 0 && errno == EINTR)
      continue;
    return count > 0 && (entry.revents & (events | POLLHUP | POLLERR)) != 0;
  }
}

bool SetNonBlocking(int fd) noexcept {
  const int flags = ::fcntl(fd, F_GETFL);
  return flags >= 0 && ::fcntl(fd, F_SETFL, flags | O_NONBLOCK) == 0;
}

}  // namespace

int SKRInstanceChannel::OpenRuntimeFolder(std::string& folder) {
  const char* runtime = std::getenv("XDG_RUNTIME_DIR");
  std::string path;
  int fd = -1;
  if (runtime != nullptr && runtime[0] == '/') {
    path = runtime;
    fd = OpenPrivateFolder(path.c_str());
  }
  if (fd < 0) {
    const char* temporary = std::getenv("TMPDIR");
    path = (temporary != nullptr && temporary[0] == '/') ? temporary : "/tmp";
    path += "/krCoreLib-" + std::to_string(::geteuid());
    if (::mkdir(path.c_str(), 0700) != 0 && errno != EEXIST)
      return -1;
    fd = OpenPrivateFolder(path.c_str());
    if (fd < 0)
      return -1;
  }
  folder.swap(path);
  return fd;
}

std::string SKRInstanceChannel::GetSessionName() {
  const char* session = std::getenv("XDG_SESSION_ID");
  return (session != nullptr && session[0] != '\0') ? std::string(session) : std::string("nosession");
}

int SKRInstanceChannel::GetProcessID() noexcept {
  return int(::getpid());
}

std::size_t SKRInstanceChannel::GetMaxSocketPath() noexcept {
  return sizeof(sockaddr_un::sun_path) - 1;
}

SKRInstanceChannel::EKRLock SKRInstanceChannel::TryLockFile(int folderFd, const std::string& name,
                                                            int& handle) noexcept {
  handle = -1;
  const int fd =
      ::openat(folderFd, name.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NOCTTY | O_NONBLOCK, 0600);
  if (fd < 0)
    return EKRLock::Failed;
  if (!SKROwnerOnly::Check(fd, S_IFREG)) {
    ::close(fd);
    return EKRLock::Failed;
  }
  int result;
  do
    result = ::flock(fd, LOCK_EX | LOCK_NB);
  while (result != 0 && errno == EINTR);
  if (result == 0) {
    handle = fd;
    return EKRLock::Acquired;
  }
  const bool held = errno == EWOULDBLOCK;
  ::close(fd);
  return held ? EKRLock::HeldElsewhere : EKRLock::Failed;
}

int SKRInstanceChannel::Listen(const std::string& path) noexcept {
  sockaddr_un address;
  if (!MakeAddress(path, address))
    return -1;
  const int fd = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
  if (fd < 0)
    return -1;
  ::unlink(path.c_str());
  // SOMAXCONN: the system's limit (net.core.somaxconn cuts it further), so
  // that instances started together wait in the backlog, not outside.
  if (::bind(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
      ::listen(fd, SOMAXCONN) != 0) {
    ::close(fd);
    return -1;
  }
  return fd;
}

int SKRInstanceChannel::Connect(const std::string& path, int timeoutMs) noexcept {
  sockaddr_un address;
  if (!MakeAddress(path, address))
    return -1;
  // Blocking while it connects: a local connect to a listener whose backlog
  // is full then waits for room, up to the socket's send time-out, where a
  // non-blocking one would fail at once.
  const int fd = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (fd < 0)
    return -1;
  const auto deadline = Deadline(timeoutMs);
  for (;;) {
    // At least 1 ms: a time-out of 0 would wait without limit.
    const int left = Remaining(deadline) > 0 ? Remaining(deadline) : 1;
    const timeval limit = {left / 1000, (left % 1000) * 1000};
    if (::setsockopt(fd, SOL_SOCKET, SO_SNDTIMEO, &limit, sizeof limit) != 0)
      break;
    if (::connect(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0)
      return SetNonBlocking(fd) ? fd : (::close(fd), -1);
    // Interrupted while waiting for room: still unconnected, so try again.
    if (errno != EINTR || Remaining(deadline) == 0)
      break;
  }
  ::close(fd);
  return -1;
}

int SKRInstanceChannel::AcceptPending(int listener) noexcept {
  for (;;) {
    const int fd = ::accept4(listener, nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK);
    if (fd >= 0)
      return fd;
    // A connection that was given up before it was taken: look at the next.
    if (errno == EINTR || errno == ECONNABORTED)
      continue;
    return (errno == EAGAIN || errno == EWOULDBLOCK) ? -1 : -2;
  }
}

bool SKRInstanceChannel::IsPeerSameUser(int fd) noexcept {
  ucred credentials {};
  socklen_t length = sizeof credentials;
  return ::getsockopt(fd, SOL_SOCKET, SO_PEERCRED, &credentials, &length) == 0 &&
         credentials.uid == ::geteuid();
}

SKRInstanceChannel::EKRWait SKRInstanceChannel::WaitForInput(const int* fds, std::size_t count, int wakeFd,
                                                              int timeoutMs, bool* ready) noexcept {
  if (count > kMaxWaitDescriptors)
    return EKRWait::Failed;
  const auto deadline = Deadline(timeoutMs);
  pollfd entries[kMaxWaitDescriptors + 1];
  for (std::size_t i = 0; i < count; ++i)
    entries[i] = {fds[i], POLLIN, 0};  // poll skips negative descriptors
  entries[count] = {wakeFd, POLLIN, 0};
  int result;
  do
    result = ::poll(entries, count + 1, timeoutMs < 0 ? -1 : Remaining(deadline));
  while (result < 0 && errno == EINTR);
  if (result < 0)
    return EKRWait::Failed;
  if ((entries[count].revents & POLLIN) != 0)
    return EKRWait::Woken;
  for (std::size_t i = 0; i < count; ++i)
    ready[i] = (entries[i].revents & (POLLIN | POLLHUP | POLLERR)) != 0;
  return result == 0 ? EKRWait::TimedOut : EKRWait::Ready;
}

SKRInstanceChannel::EKRRead SKRInstanceChannel::ReceiveAvailable(int fd, std::string& data,
                                                                 std::size_t maxBytes) noexcept {
  char buffer[256];
  for (;;) {
    const ssize_t got = ::recv(fd, buffer, sizeof buffer, 0);
    if (got > 0) {
      if (data.size() + std::size_t(got) > maxBytes)
        return EKRRead::Closed;
      try {
        data.append(buffer, std::size_t(got));
      } catch (...) {
        return EKRRead::Closed;
      }
      continue;
    }
    if (got < 0 && errno == EINTR)
      continue;
    return (got < 0 && (errno == EAGAIN || errno == EWOULDBLOCK)) ? EKRRead::Open : EKRRead::Closed;
  }
}

bool SKRInstanceChannel::SendLine(int fd, const std::string& line, int timeoutMs) noexcept {
  const auto deadline = Deadline(timeoutMs);
  std::string text;
  try {
    text = line + '\n';
  } catch (...) {
    return false;
  }
  std::size_t done = 0;
  while (done < text.size()) {
    const ssize_t sent = ::send(fd, text.data() + done, text.size() - done, MSG_NOSIGNAL);
    if (sent > 0) {
      done += std::size_t(sent);
      continue;
    }
    if (sent < 0 && errno == EINTR)
      continue;
    if (sent < 0 && (errno == EAGAIN || errno == EWOULDBLOCK) && WaitFor(fd, POLLOUT, deadline))
      continue;
    return false;
  }
  return true;
}

bool SKRInstanceChannel::ReceiveLine(int fd, int timeoutMs, std::size_t maxLength, std::string& line) noexcept {
  const auto deadline = Deadline(timeoutMs);
  line.clear();
  // Byte by byte: the lines are a few bytes long, and nothing after the
  // line feed may be taken from the socket.
  for (;;) {
    char c;
    const ssize_t got = ::recv(fd, &c, 1, 0);
    if (got == 1) {
      if (c == '\n')
        return true;
      if (line.size() >= maxLength)
        return false;
      line += c;
      continue;
    }
    if (got < 0 && errno == EINTR)
      continue;
    if (got < 0 && (errno == EAGAIN || errno == EWOULDBLOCK) && WaitFor(fd, POLLIN, deadline))
      continue;
    return false;
  }
}

bool SKRInstanceChannel::WaitForWakeEvent(int wakeFd, int timeoutMs) noexcept {
  pollfd fds[1] = {{wakeFd, POLLIN, 0}};
  return ::poll(fds, 1, timeoutMs) > 0 && (fds[0].revents & POLLIN) != 0;
}

int SKRInstanceChannel::CreateWakeEvent() noexcept {
  return ::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
}

void SKRInstanceChannel::SignalWakeEvent(int fd) noexcept {
  const std::uint64_t one = 1;
  if (fd >= 0)
    (void)!::write(fd, &one, sizeof one);
}

void SKRInstanceChannel::Close(int& fd) noexcept {
  if (fd >= 0)
    ::close(fd);
  fd = -1;
}

void SKRInstanceChannel::RemoveFile(const std::string& path) noexcept {
  ::unlink(path.c_str());
}
