// CKRSingleAppInstance: detecting a running instance of the application and
// handing it the file to open; CKRSingleAppInstanceListener: the running
// instance's side, which the host starts.
//
// The road between two instances of an application ID:
//  - the first instance holds a lock file named "<ID>-<session>" (the login
//    session, $XDG_SESSION_ID) in the user's runtime folder for its whole
//    life; the kernel drops it when the process ends;
//  - its listener accepts local connections on a socket beside that file;
//  - a later instance finds the lock taken, connects and sends the line
//    "krCoreLibCI"; the running instance answers "krCoreLibCI" and is asked
//    to come to the front;
//  - when the later instance's command line names a file, it writes the
//    file name (absolute, as wide text with its terminator) into shared
//    memory named by the application ID (CKRMemMapFile::MapMemory) and
//    sends "krCoreLibFP <length in characters>"; the running instance reads
//    the name (MapExistingMemory) and answers "krCoreLibFP".
// The runtime folder is $XDG_RUNTIME_DIR, or a private folder
// "krCoreLib-<uid>" in $TMPDIR or /tmp when that is not set.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <functional>
#include <memory>

class KRCORELIB_API CKRSingleAppInstance {
public:
  // Longest file name handed over, in characters (the system's path limit).
  static constexpr int kMaxFileNameLength = 4096;

  // True when another instance of the application is running in this
  // user's session. The first caller in a session takes the instance lock
  // and keeps it for the life of the process (a later call in the same
  // process returns false again). A later instance asks the running one to
  // come to the front and, when its command line (argc and argv as main
  // received them, UTF-8) names a file, hands it that file; it returns true
  // even when the running instance does not answer. The file is the first
  // argument after the program that does not start with "-"; a relative
  // name is made absolute against the current directory. An empty or null
  // application ID, or no usable runtime folder, gives false. Waits at most
  // a few seconds for a running instance that does not answer.
  static bool DetectAppInstance(const wchar_t* applicationID, int argc, const char* const* argv);
};

// The running instance's side: answers "krCoreLibCI" and "krCoreLibFP" on
// its own thread and calls the host's handlers there (the host passes the
// work on to its main thread as it needs). Handlers must not Stop the
// listener that calls them.
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
