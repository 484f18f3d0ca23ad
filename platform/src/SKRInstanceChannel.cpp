#include "SKRInstanceChannel.h"

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
#include <sys/un.h>
#include <unistd.h>

namespace {

using SKRClock = std::chrono::steady_clock;

// A directory of this user that nobody else may enter: the only kind of
// folder in which a socket or lock file of ours cannot be taken over.
bool IsPrivateFolder(const char* path) noexcept {
  struct stat info {};
  return ::lstat(path, &info) == 0 && S_ISDIR(info.st_mode) && info.st_uid == ::geteuid() &&
         (info.st_mode & 077) == 0;
}

bool MakeAddress(const std::string& path, sockaddr_un& address) noexcept {
  address = sockaddr_un();
  address.sun_family = AF_UNIX;
  if (path.empty() || path.size() >= sizeof address.sun_path)
    return false;
  std::memcpy(address.sun_path, path.c_str(), path.size() + 1);
  return true;
}

// Milliseconds left until `deadline`, at least 0.
int Remaining(SKRClock::time_point deadline) noexcept {
  const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(deadline - SKRClock::now()).count();
  return left > 0 ? int(left) : 0;
}

// Waits until `fd` is ready for `events`; false on time-out, error or a
// signalled wake event.
bool WaitFor(int fd, short events, int wakeFd, SKRClock::time_point deadline) noexcept {
  for (;;) {
    pollfd fds[2] = {{fd, events, 0}, {wakeFd, POLLIN, 0}};
    const int count = ::poll(fds, wakeFd >= 0 ? 2 : 1, Remaining(deadline));
    if (count < 0 && errno == EINTR)
      continue;
    if (count <= 0)
      return false;
    if (wakeFd >= 0 && (fds[1].revents & POLLIN) != 0)
      return false;
    return (fds[0].revents & (events | POLLHUP | POLLERR)) != 0;
  }
}

}  // namespace

bool SKRInstanceChannel::GetRuntimeFolder(std::string& folder) {
  const char* runtime = std::getenv("XDG_RUNTIME_DIR");
  if (runtime != nullptr && runtime[0] == '/' && IsPrivateFolder(runtime)) {
    folder = runtime;
    return true;
  }
  const char* temporary = std::getenv("TMPDIR");
  std::string path = (temporary != nullptr && temporary[0] == '/') ? temporary : "/tmp";
  path += "/krCoreLib-" + std::to_string(::geteuid());
  if (::mkdir(path.c_str(), 0700) != 0 && errno != EEXIST)
    return false;
  if (!IsPrivateFolder(path.c_str()))
    return false;
  folder = path;
  return true;
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

SKRInstanceChannel::EKRLock SKRInstanceChannel::TryLockFile(const std::string& path, int& handle) noexcept {
  handle = -1;
  const int fd = ::open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NOCTTY | O_NONBLOCK, 0600);
  if (fd < 0)
    return EKRLock::Failed;
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
  if (::bind(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 || ::listen(fd, 8) != 0) {
    ::close(fd);
    return -1;
  }
  return fd;
}

int SKRInstanceChannel::Connect(const std::string& path) noexcept {
  sockaddr_un address;
  if (!MakeAddress(path, address))
    return -1;
  const int fd = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
  if (fd < 0)
    return -1;
  int result;
  do
    result = ::connect(fd, reinterpret_cast<const sockaddr*>(&address), sizeof address);
  while (result != 0 && errno == EINTR);
  if (result != 0) {
    ::close(fd);
    return -1;
  }
  return fd;
}

int SKRInstanceChannel::Accept(int listener, int wakeFd) noexcept {
  pollfd fds[2] = {{listener, POLLIN, 0}, {wakeFd, POLLIN, 0}};
  const int count = ::poll(fds, wakeFd >= 0 ? 2 : 1, -1);
  if (count < 0)
    return -1;
  if (wakeFd >= 0 && (fds[1].revents & POLLIN) != 0)
    return -2;
  if ((fds[0].revents & POLLIN) == 0)
    return -1;
  return ::accept4(listener, nullptr, nullptr, SOCK_CLOEXEC | SOCK_NONBLOCK);
}

bool SKRInstanceChannel::IsPeerSameUser(int fd) noexcept {
  ucred credentials {};
  socklen_t length = sizeof credentials;
  return ::getsockopt(fd, SOL_SOCKET, SO_PEERCRED, &credentials, &length) == 0 &&
         credentials.uid == ::geteuid();
}

bool SKRInstanceChannel::SendLine(int fd, const std::string& line, int timeoutMs) noexcept {
  const auto deadline = SKRClock::now() + std::chrono::milliseconds(timeoutMs);
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
    if (sent < 0 && (errno == EAGAIN || errno == EWOULDBLOCK) && WaitFor(fd, POLLOUT, -1, deadline))
      continue;
    return false;
  }
  return true;
}

bool SKRInstanceChannel::ReceiveLine(int fd, int wakeFd, int timeoutMs, std::size_t maxLength,
                                     std::string& line) noexcept {
  const auto deadline = SKRClock::now() + std::chrono::milliseconds(timeoutMs);
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
    if (got < 0 && (errno == EAGAIN || errno == EWOULDBLOCK) && WaitFor(fd, POLLIN, wakeFd, deadline))
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
