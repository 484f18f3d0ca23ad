// The operating-system side of single-instance detection: the user's
// runtime folder, a lock file held for the life of a process, and local
// (AF_UNIX) stream sockets carrying short text lines between the instances.
//
// Every folder, lock file and socket peer is accepted only when it belongs
// to the effective user and nobody else may use it, checked on the
// descriptor in use. Every descriptor is close-on-exec and non-blocking
// once made; waits are bounded by the time-outs given and can be cut short
// through a wake event. Nothing here throws.
#pragma once

#include <cstddef>
#include <string>

struct SKRInstanceChannel {
  // Opens the user's runtime folder: $XDG_RUNTIME_DIR when it names a
  // directory of the user's that nobody else may enter, otherwise a private
  // folder "krCoreLib-<uid>" made (mode 0700) in $TMPDIR or /tmp. Returns
  // its descriptor (the caller closes it) and its path in `folder`, or -1
  // when neither is usable (for instance a folder of that name owned by
  // someone else, or open to others).
  static int OpenRuntimeFolder(std::string& folder);
  // The login session: $XDG_SESSION_ID, or "nosession" when it is not set.
  static std::string GetSessionName();
  static int GetProcessID() noexcept;
  // Longest socket path the system accepts (the size of sun_path less its
  // terminator).
  static std::size_t GetMaxSocketPath() noexcept;

  enum class EKRLock { Acquired, HeldElsewhere, Failed };
  // Takes an exclusive lock on the file `name` in the folder open as
  // `folderFd` (created mode 0600 when missing, never through a symbolic
  // link). A file that is not a regular file of the user's, accessible to
  // nobody else, fails. Acquired: `handle` holds it until closed, and the
  // kernel drops it when the process ends.
  static EKRLock TryLockFile(int folderFd, const std::string& name, int& handle) noexcept;

  // A listening socket at `path`, replacing a stale socket file left there;
  // -1 on failure. Its backlog is the largest the system allows.
  static int Listen(const std::string& path) noexcept;
  // A socket connected to `path` within `timeoutMs` milliseconds (waiting
  // while the listener's backlog is full); -1 when nobody listens there, or
  // not in time.
  static int Connect(const std::string& path, int timeoutMs) noexcept;
  // A connection waiting at the listener, without waiting for one: its
  // socket, -1 when there is none, -2 on a failure that persists (out of
  // descriptors, for instance).
  static int AcceptPending(int listener) noexcept;
  // True when the peer runs as the same user as this process.
  static bool IsPeerSameUser(int fd) noexcept;

  // Most descriptors WaitForInput takes at once.
  static constexpr std::size_t kMaxWaitDescriptors = 256;
  enum class EKRWait { Ready, TimedOut, Woken, Failed };
  // Waits up to `timeoutMs` (-1: without limit) until one of the `count`
  // descriptors has input (or was closed by its peer) or `wakeFd` is
  // signalled; negative descriptors are skipped. `ready` receives one flag
  // per descriptor. Failed for more than kMaxWaitDescriptors.
  static EKRWait WaitForInput(const int* fds, std::size_t count, int wakeFd, int timeoutMs, bool* ready) noexcept;
  enum class EKRRead { Open, Closed };
  // Appends what has arrived on `fd` to `data`, without waiting. Closed:
  // the peer ended the stream, an error, or `data` would exceed `maxBytes`.
  static EKRRead ReceiveAvailable(int fd, std::string& data, std::size_t maxBytes) noexcept;

  // Sends `line` and a line feed within `timeoutMs` milliseconds (0: only
  // what the socket takes at once).
  static bool SendLine(int fd, const std::string& line, int timeoutMs) noexcept;
  // Receives one line (without its line feed) of at most `maxLength` bytes
  // within `timeoutMs`; false on time-out, end of stream or an overlong
  // line. Takes nothing from the socket beyond the line feed.
  static bool ReceiveLine(int fd, int timeoutMs, std::size_t maxLength, std::string& line) noexcept;

  // Waits up to `timeoutMs` for the wake event; true when it is signalled.
  static bool WaitForWakeEvent(int wakeFd, int timeoutMs) noexcept;
  // An event that makes WaitForInput return.
  static int CreateWakeEvent() noexcept;
  static void SignalWakeEvent(int fd) noexcept;

  static void Close(int& fd) noexcept;
  static void RemoveFile(const std::string& path) noexcept;
};
