// The operating-system side of single-instance detection: the user's
// runtime folder, a lock file held for the life of a process, and local
// (AF_UNIX) stream sockets carrying short text lines between the instances.
//
// Every descriptor is close-on-exec and non-blocking; waits are bounded by
// the time-outs given and can be cut short through a wake event. Nothing
// here throws.
#pragma once

#include <cstddef>
#include <string>

struct SKRInstanceChannel {
  // The user's runtime folder: $XDG_RUNTIME_DIR when it names a directory
  // of the user's that nobody else may enter, otherwise a private folder
  // "krCoreLib-<uid>" made (mode 0700) in $TMPDIR or /tmp. False when
  // neither is usable (for instance a folder of that name owned by someone
  // else).
  static bool GetRuntimeFolder(std::string& folder);
  // The login session: $XDG_SESSION_ID, or "nosession" when it is not set.
  static std::string GetSessionName();
  static int GetProcessID() noexcept;
  // Longest socket path the system accepts (the size of sun_path less its
  // terminator).
  static std::size_t GetMaxSocketPath() noexcept;

  enum class EKRLock { Acquired, HeldElsewhere, Failed };
  // Takes an exclusive lock on the file (created mode 0600 when missing,
  // never through a symbolic link). Acquired: `handle` holds it until
  // closed, and the kernel drops it when the process ends.
  static EKRLock TryLockFile(const std::string& path, int& handle) noexcept;

  // A listening socket at `path`, replacing a stale socket file left there;
  // -1 on failure.
  static int Listen(const std::string& path) noexcept;
  // A socket connected to `path`; -1 when nobody listens there.
  static int Connect(const std::string& path) noexcept;
  // Waits for the next connection: its socket, -1 for a failed attempt
  // (wait again), -2 when `wakeFd` was signalled.
  static int Accept(int listener, int wakeFd) noexcept;
  // True when the peer runs as the same user as this process.
  static bool IsPeerSameUser(int fd) noexcept;

  // Sends `line` and a line feed within `timeoutMs` milliseconds.
  static bool SendLine(int fd, const std::string& line, int timeoutMs) noexcept;
  // Receives one line (without its line feed) of at most `maxLength` bytes
  // within `timeoutMs`; false on time-out, end of stream, an overlong line,
  // or a signalled `wakeFd` (-1 for none).
  static bool ReceiveLine(int fd, int wakeFd, int timeoutMs, std::size_t maxLength, std::string& line) noexcept;

  // Waits up to `timeoutMs` for the wake event; true when it is signalled.
  static bool WaitForWakeEvent(int wakeFd, int timeoutMs) noexcept;
  // An event that makes Accept and ReceiveLine return.
  static int CreateWakeEvent() noexcept;
  static void SignalWakeEvent(int fd) noexcept;

  static void Close(int& fd) noexcept;
  static void RemoveFile(const std::string& path) noexcept;
};
