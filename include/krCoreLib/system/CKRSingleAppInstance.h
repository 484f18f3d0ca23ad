// CKRSingleAppInstance: detecting a running instance of the application and
// handing it the file to open; CKRSingleAppInstanceListener: the running
// instance's side, which the host starts.
//
// The road between two instances of an application ID:
//  - the first instance holds a lock file "krCoreLib-<ID>-<session>.lock"
//    (the session is the login session, $XDG_SESSION_ID; a name too long
//    for a socket address becomes a hash of it) in the user's runtime
//    folder for its whole life; the kernel drops it when the process ends;
//  - its listener accepts local connections on the socket
//    "krCoreLib-<ID>-<session>.sock" beside that file;
//  - a later instance finds the lock taken, connects and sends the line
//    "krCoreLibCI"; the running instance answers "krCoreLibCI" and is asked
//    to come to the front;
//  - when the later instance's command line names a file, it writes the
//    file name (absolute, as wide text with its terminator) into shared
//    memory named by the application ID (CKRMemMapFile::MapMemory), holding
//    its lock, and sends "krCoreLibFP <length in characters>"; the running
//    instance reads the name (MapExistingMemory) and answers "krCoreLibFP"
//    ("krCoreLibFP -" when it could not read it).
// The runtime folder is $XDG_RUNTIME_DIR, or a private folder
// "krCoreLib-<uid>" in $TMPDIR or /tmp when that is not set or is not a
// folder of the user's that nobody else may enter.
//
// Security: folders, lock files and shared memory are used only when they
// belong to the effective user and nobody else may use them (a folder or
// file another user planted makes detection fail, or the hand-over, as
// stated below); each side talks only to a peer that runs as the same user.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <functional>
#include <memory>

// What became of the file named on a later instance's command line.
enum _EKRHandOver : int {
  KRHANDOVER_NONE = 0,        // no file to hand over, or no running instance
  KRHANDOVER_DELIVERED = 1,   // the running instance has read the file name
  KRHANDOVER_FAILED = 2,      // the file could not be handed over
};

class KRCORELIB_API CKRSingleAppInstance {
public:
  // Longest file name handed over, in characters (the system's path limit).
  static constexpr int kMaxFileNameLength = 4096;
  // Longest time DetectAppInstance waits for a running instance, in
  // milliseconds, for everything together (connecting, its answers, the
  // lock of the shared memory that carries the file name).
  static constexpr int kDetectTimeoutMs = 10000;

  // True when another instance of the application is running in this
  // user's session. The first caller in a session takes the instance lock
  // and keeps it for the life of the process (a later call in the same
  // process returns false again). A later instance asks the running one to
  // come to the front and, when its command line (argc and argv as main
  // received them, UTF-8) names a file, hands it that file; it returns true
  // even when the running instance does not listen or answer. The file is
  // the first argument after the program that does not start with "-"; a
  // relative name is made absolute against the current directory.
  //
  // `handOver` (when not null) tells what became of that file: DELIVERED
  // once the running instance has read its name, FAILED when it could not
  // be handed over (no listener, no answer within kDetectTimeoutMs, a name
  // that is not UTF-8 or longer than kMaxFileNameLength, shared memory that
  // is not the user's own), NONE when there was no file or the result is
  // false. A host that gets FAILED opens the file itself or tells the user.
  //
  // An empty or null application ID, or no usable runtime folder, gives
  // false.
  static bool DetectAppInstance(const wchar_t* applicationID, int argc, const char* const* argv,
                                _EKRHandOver* handOver = nullptr);
};

// The running instance's side: answers "krCoreLibCI" and "krCoreLibFP" on
// its own thread and calls the host's handlers there (the host passes the
// work on to its main thread as it needs; handlers should return quickly,
// as later instances wait for the answers meanwhile). Handlers must not
// Stop the listener that calls them. Many later instances are served at
// once: one that is slow or silent delays no other, and is let go when it
// has sent nothing for kDetectTimeoutMs.
class KRCORELIB_API CKRSingleAppInstanceListener {
public:
  // Asked to come to the front.
  using ActivateHandler = std::function<void()>;
  // Asked to open a file.
  using OpenFileHandler = std::function<void(const CKRString& fileName)>;

  CKRSingleAppInstanceListener();
  // Stops.
  ~CKRSingleAppInstanceListener();
  CKRSingleAppInstanceListener(const CKRSingleAppInstanceListener&) = delete;
  CKRSingleAppInstanceListener& operator=(const CKRSingleAppInstanceListener&) = delete;

  // Starts listening for later instances of the application. Takes the
  // instance lock when this process does not hold it yet; false when
  // another process holds it, when the ID is empty, when already started,
  // or when no socket can be made. Either handler may be empty.
  bool Start(const wchar_t* applicationID, ActivateHandler onActivate, OpenFileHandler onOpenFile);
  // Stops listening and waits for the listener's thread; nothing when not
  // started.
  void Stop();
  bool IsRunning() const noexcept;

private:
  struct SKRState;
  std::unique_ptr<SKRState> m_pState;
};
