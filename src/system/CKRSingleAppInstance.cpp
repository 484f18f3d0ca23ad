#include <krCoreLib/system/CKRSingleAppInstance.h>

#include <krCoreLib/system/CKRMemMapFile.h>
#include <krCoreLib/system/CKRPathHelper.h>

#include "KRNativePath.h"
#include "SKRInstanceChannel.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cwchar>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

// The two instances talk in text lines over a local socket: the messages
// "krCoreLibCI" (are you the running instance?) and "krCoreLibFP <n>" (open
// the file whose name of n characters is in the shared memory named by the
// application ID), each answered with its own name.

namespace {

using SKRClock = std::chrono::steady_clock;

constexpr const char* kProbeMessage = "krCoreLibCI";
constexpr const char* kFileMessage = "krCoreLibFP";
constexpr const char* kFileRefused = "krCoreLibFP -";
// Longest line either side accepts; the messages are a few bytes long.
constexpr std::size_t kMaxLine = 64;
// Later instances the listener serves at once; more wait in the socket's
// backlog until one is done. Well below the descriptors one wait takes.
constexpr std::size_t kMaxClients = 128;
static_assert(kMaxClients + 1 <= SKRInstanceChannel::kMaxWaitDescriptors);
// How long the listener waits for a failing accept to recover (out of
// descriptors, for instance) before it tries again.
constexpr int kAcceptRetryMs = 100;
// The shared block that carries a file name: the longest name and its
// terminator, so that blocks of every hand-over have the same size.
constexpr std::uint32_t kHandOverBytes =
    std::uint32_t((CKRSingleAppInstance::kMaxFileNameLength + 1) * sizeof(wchar_t));

// The files of one application ID: the runtime folder (open, checked), the
// lock file's name in it, and the socket's path.
struct SKRInstancePaths {
  SKRInstancePaths() = default;
  SKRInstancePaths(const SKRInstancePaths&) = delete;
  SKRInstancePaths& operator=(const SKRInstancePaths&) = delete;
  ~SKRInstancePaths() { SKRInstanceChannel::Close(m_hFolder); }

  int m_hFolder = -1;
  std::string m_LockName;
  std::string m_LockPath;  // identifies the lock among those this process holds
  std::string m_Socket;
};

bool OpenInstancePaths(const wchar_t* applicationID, SKRInstancePaths& paths) {
  if (applicationID == nullptr || *applicationID == L'\0')
    return false;
  std::string folder;
  paths.m_hFolder = SKRInstanceChannel::OpenRuntimeFolder(folder);
  if (paths.m_hFolder < 0)
    return false;
  // The instance name: the application ID scoped to the login session.
  std::string name = "krCoreLib-" + CKRString::ToUtf8(applicationID) + "-" + SKRInstanceChannel::GetSessionName();
  for (char& c : name) {
    if (c == '/' || c == '\0')
      c = '_';
  }
  if (folder.size() + 1 + name.size() + 5 > SKRInstanceChannel::GetMaxSocketPath()) {
    // Too long for a socket address: a hash of the name (FNV-1a, 64 bits)
    // names the same files in every process.
    std::uint64_t hash = 0xcbf29ce484222325ull;
    for (const unsigned char c : name)
      hash = (hash ^ c) * 0x100000001b3ull;
    char digits[32];
    std::snprintf(digits, sizeof digits, "krCoreLib-%016llx", static_cast<unsigned long long>(hash));
    name = digits;
    if (folder.size() + 1 + name.size() + 5 > SKRInstanceChannel::GetMaxSocketPath())
      return false;
  }
  paths.m_LockName = name + ".lock";
  paths.m_LockPath = folder + "/" + paths.m_LockName;
  paths.m_Socket = folder + "/" + name + ".sock";
  return true;
}

// The instance locks this process holds, kept for its whole life. A forked
// child inherits the table but not the locks' ownership: entries record the
// process that took them.
struct SKRHeldLock {
  std::string m_Path;
  int m_hFile;
  int m_ProcessID;
};

struct SKRInstanceRegistry {
  std::mutex m_Mutex;
  std::vector<SKRHeldLock> m_Locks;
};

SKRInstanceRegistry& GetRegistry() {
  static SKRInstanceRegistry s_Registry;
  return s_Registry;
}

enum class EKRInstanceLock { Mine, Other, Failed };

EKRInstanceLock AcquireInstanceLock(const SKRInstancePaths& paths) {
  SKRInstanceRegistry& registry = GetRegistry();
  const std::lock_guard<std::mutex> guard(registry.m_Mutex);
  const int processID = SKRInstanceChannel::GetProcessID();
  for (const SKRHeldLock& held : registry.m_Locks) {
    if (held.m_ProcessID == processID && held.m_Path == paths.m_LockPath)
      return EKRInstanceLock::Mine;
  }
  int handle = -1;
  switch (SKRInstanceChannel::TryLockFile(paths.m_hFolder, paths.m_LockName, handle)) {
  case SKRInstanceChannel::EKRLock::Acquired:
    try {
      registry.m_Locks.push_back({paths.m_LockPath, handle, processID});
    } catch (...) {
      SKRInstanceChannel::Close(handle);
      return EKRInstanceLock::Failed;
    }
    return EKRInstanceLock::Mine;
  case SKRInstanceChannel::EKRLock::HeldElsewhere:
    return EKRInstanceLock::Other;
  case SKRInstanceChannel::EKRLock::Failed:
    break;
  }
  return EKRInstanceLock::Failed;
}

// Whether the command line names a file: the first argument after the
// program that is not an option. `file` receives it made absolute, or stays
// empty when it has no exact wide form (it is not valid UTF-8).
bool FindFileArgument(int argc, const char* const* argv, CKRString& file) {
  if (argv == nullptr)
    return false;
  for (int i = 1; i < argc; ++i) {
    const char* argument = argv[i];
    if (argument == nullptr || argument[0] == '-' || argument[0] == '\0')
      continue;
    if (!SKRNativePath::FromNative(argument, file)) {
      file.Empty();
      return true;
    }
    if (file.GetAt(0) != L'/') {
      // The running instance has a current directory of its own.
      const CKRString directory = CKRPathHelper::GetCurrentWorkingDirectory();
      if (!directory.IsEmpty())
        file = CKRPathHelper::AddSlash(directory.GetString()) + file;
    }
    return true;
  }
  return false;
}

int Remaining(SKRClock::time_point deadline) {
  const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - SKRClock::now()).count();
  return left > 0 ? int(left) : 0;
}

// Writes the file name into the shared block and tells the running
// instance. The block's lock is held until the running instance has
// answered, so that two later instances never overwrite each other's name.
// True when the running instance read it.
bool HandOverFile(int connection, const wchar_t* applicationID, const CKRString& file,
                  SKRClock::time_point deadline) {
  if (file.IsEmpty() || file.GetLength() > CKRSingleAppInstance::kMaxFileNameLength)
    return false;
  CKRMemMapFile block;
  if (block.MapMemory(applicationID, kHandOverBytes, false) == 0)
    return false;
  auto* text = static_cast<wchar_t*>(block.Open(Remaining(deadline)));
  if (text == nullptr)
    return false;
  std::wmemcpy(text, file.GetString(), file.size());
  text[file.size()] = L'\0';
  std::string reply;
  const bool read =
      SKRInstanceChannel::SendLine(connection, std::string(kFileMessage) + " " + std::to_string(file.size()),
                                   Remaining(deadline)) &&
      SKRInstanceChannel::ReceiveLine(connection, Remaining(deadline), kMaxLine, reply) && reply == kFileMessage;
  block.Close();
  return read;
}

// The length in "krCoreLibFP <n>", or -1 when the line is anything else.
int ParseFileMessage(const std::string& line) {
  const std::string prefix = std::string(kFileMessage) + " ";
  if (line.compare(0, prefix.size(), prefix) != 0 || line.size() == prefix.size() || line.size() > prefix.size() + 5)
    return -1;
  int length = 0;
  for (std::size_t i = prefix.size(); i < line.size(); ++i) {
    if (line[i] < '0' || line[i] > '9')
      return -1;
    length = length * 10 + (line[i] - '0');
  }
  return length <= CKRSingleAppInstance::kMaxFileNameLength ? length : -1;
}

}  // namespace

bool CKRSingleAppInstance::DetectAppInstance(const wchar_t* applicationID, int argc, const char* const* argv,
                                             _EKRHandOver* handOver) {
  if (handOver != nullptr)
    *handOver = KRHANDOVER_NONE;
  bool running = false;
  bool hasFile = false;
  bool delivered = false;
  try {
    SKRInstancePaths paths;
    if (!OpenInstancePaths(applicationID, paths) || AcquireInstanceLock(paths) != EKRInstanceLock::Other)
      return false;
    running = true;
    CKRString file;
    hasFile = FindFileArgument(argc, argv, file);
    const auto deadline = SKRClock::now() + std::chrono::milliseconds(kDetectTimeoutMs);
    int connection = SKRInstanceChannel::Connect(paths.m_Socket, Remaining(deadline));
    // Only an instance of the same user is asked anything.
    if (connection >= 0 && SKRInstanceChannel::IsPeerSameUser(connection)) {
      std::string reply;
      const bool found = SKRInstanceChannel::SendLine(connection, kProbeMessage, Remaining(deadline)) &&
                         SKRInstanceChannel::ReceiveLine(connection, Remaining(deadline), kMaxLine, reply) &&
                         reply == kProbeMessage;
      if (found && hasFile)
        delivered = HandOverFile(connection, applicationID, file, deadline);
    }
    SKRInstanceChannel::Close(connection);
  } catch (...) {
    // Out of memory: what was learnt stands.
  }
  if (handOver != nullptr && running && hasFile)
    *handOver = delivered ? KRHANDOVER_DELIVERED : KRHANDOVER_FAILED;
  return running;
}

struct CKRSingleAppInstanceListener::SKRState {
  // A later instance being served.
  struct SKRClient {
    int m_hSocket;
    std::string m_Input;                // received, not yet a whole line
    SKRClock::time_point m_Deadline;    // let go when nothing came by then
  };

  CKRString m_ApplicationID;
  std::string m_SocketPath;
  int m_hListener = -1;
  int m_hWake = -1;
  ActivateHandler m_OnActivate;
  OpenFileHandler m_OnOpenFile;
  std::vector<SKRClient> m_Clients;
  std::thread m_Thread;

  ~SKRState() {
    for (SKRClient& client : m_Clients)
      SKRInstanceChannel::Close(client.m_hSocket);
    SKRInstanceChannel::Close(m_hListener);
    SKRInstanceChannel::Close(m_hWake);
  }

  // One thread serves every client, waiting for whichever speaks first, so
  // that a slow or silent client holds up nobody else.
  void Run() {
    int fds[kMaxClients + 1];
    bool ready[kMaxClients + 1];
    SKRClock::time_point acceptAgain = SKRClock::now();
    for (;;) {
      // The listener is left out while the clients are at their limit, or
      // for a moment after accepting failed.
      const bool pausing = SKRClock::now() < acceptAgain;
      const bool accepting = m_Clients.size() < kMaxClients && !pausing;
      fds[0] = accepting ? m_hListener : -1;
      SKRClock::time_point wakeUp = pausing ? acceptAgain : SKRClock::time_point::max();
      for (std::size_t i = 0; i < m_Clients.size(); ++i) {
        fds[i + 1] = m_Clients[i].m_hSocket;
        wakeUp = std::min(wakeUp, m_Clients[i].m_Deadline);
      }
      const int timeoutMs = wakeUp == SKRClock::time_point::max() ? -1 : Remaining(wakeUp);
      switch (SKRInstanceChannel::WaitForInput(fds, m_Clients.size() + 1, m_hWake, timeoutMs, ready)) {
      case SKRInstanceChannel::EKRWait::Woken:
        return;
      case SKRInstanceChannel::EKRWait::Failed:
        if (SKRInstanceChannel::WaitForWakeEvent(m_hWake, kAcceptRetryMs))
          return;
        continue;
      case SKRInstanceChannel::EKRWait::TimedOut:
      case SKRInstanceChannel::EKRWait::Ready:
        break;
      }
      // Clients first (their flags follow the current list), then new ones.
      // A client is let go when it is done, misbehaves or has said nothing
      // whole in time (a line dribbled out byte by byte included).
      std::size_t kept = 0;
      for (std::size_t i = 0; i < m_Clients.size(); ++i) {
        SKRClient& client = m_Clients[i];
        const bool keep = (!ready[i + 1] || Serve(client)) && SKRClock::now() < client.m_Deadline;
        if (!keep)
          SKRInstanceChannel::Close(client.m_hSocket);
        else if (kept++ != i)
          m_Clients[kept - 1] = std::move(client);
      }
      m_Clients.resize(kept);
      if (accepting && ready[0])
        acceptAgain = AcceptClients();
    }
  }

  // Takes the connections waiting at the listener; returns when to accept
  // again (at once, unless accepting failed).
  SKRClock::time_point AcceptClients() {
    while (m_Clients.size() < kMaxClients) {
      int client = SKRInstanceChannel::AcceptPending(m_hListener);
      if (client == -1)
        break;
      if (client == -2)
        return SKRClock::now() + std::chrono::milliseconds(kAcceptRetryMs);
      if (!SKRInstanceChannel::IsPeerSameUser(client)) {
        SKRInstanceChannel::Close(client);
        continue;
      }
      try {
        m_Clients.push_back({client, std::string(), IdleDeadline()});
      } catch (...) {
        SKRInstanceChannel::Close(client);
        return SKRClock::now() + std::chrono::milliseconds(kAcceptRetryMs);
      }
    }
    return SKRClock::now();
  }

  static SKRClock::time_point IdleDeadline() {
    return SKRClock::now() + std::chrono::milliseconds(CKRSingleAppInstance::kDetectTimeoutMs);
  }

  // Reads what the client sent and answers its whole lines; false when the
  // client is done with or misbehaved.
  bool Serve(SKRClient& client) {
    // A line and its line feed, and no more: a client waits for each answer.
    if (SKRInstanceChannel::ReceiveAvailable(client.m_hSocket, client.m_Input, kMaxLine + 1) ==
        SKRInstanceChannel::EKRRead::Closed)
      return false;
    for (std::size_t feed; (feed = client.m_Input.find('\n')) != std::string::npos;) {
      const std::string line = client.m_Input.substr(0, feed);
      client.m_Input.erase(0, feed + 1);
      client.m_Deadline = IdleDeadline();
      if (!Answer(client.m_hSocket, line))
        return false;
    }
    return true;
  }

  // Answers one line without waiting (the answer fits in the socket's
  // buffer unless the client ignores the answers it asked for).
  bool Answer(int client, const std::string& line) {
    if (line == kProbeMessage) {
      if (!SKRInstanceChannel::SendLine(client, kProbeMessage, 0))
        return false;
      Call([this] {
        if (m_OnActivate)
          m_OnActivate();
      });
      return true;
    }
    const int length = ParseFileMessage(line);
    if (length < 0)
      return false;
    CKRString fileName;
    const bool read = ReadFileName(length, fileName);
    if (!SKRInstanceChannel::SendLine(client, read ? kFileMessage : kFileRefused, 0))
      return false;
    if (read) {
      Call([&] {
        if (m_OnOpenFile)
          m_OnOpenFile(fileName);
      });
    }
    return true;
  }

  bool ReadFileName(int length, CKRString& fileName) {
    // Only the name's characters and its terminator are mapped and read:
    // never beyond the size the block was found to have.
    CKRMemMapFile block;
    if (block.MapExistingMemory(m_ApplicationID.GetString(), std::uint32_t((length + 1) * sizeof(wchar_t)), true) == 0)
      return false;
    const auto* text = static_cast<const wchar_t*>(block.Open(0));
    // Exactly `length` characters and the terminator, nothing shorter.
    if (text == nullptr || text[length] != L'\0' || std::wcslen(text) != std::size_t(length))
      return false;
    fileName = CKRString(text, std::size_t(length));
    return true;
  }

  // The host's handler must not end the listener's thread.
  template <typename Handler>
  static void Call(Handler handler) {
    try {
      handler();
    } catch (...) {
    }
  }
};

CKRSingleAppInstanceListener::CKRSingleAppInstanceListener() = default;

CKRSingleAppInstanceListener::~CKRSingleAppInstanceListener() {
  Stop();
}

bool CKRSingleAppInstanceListener::Start(const wchar_t* applicationID, ActivateHandler onActivate,
                                         OpenFileHandler onOpenFile) {
  if (m_pState)
    return false;
  try {
    SKRInstancePaths paths;
    if (!OpenInstancePaths(applicationID, paths) || AcquireInstanceLock(paths) != EKRInstanceLock::Mine)
      return false;
    auto state = std::make_unique<SKRState>();
    state->m_ApplicationID = applicationID;
    state->m_SocketPath = paths.m_Socket;
    state->m_OnActivate = std::move(onActivate);
    state->m_OnOpenFile = std::move(onOpenFile);
    state->m_Clients.reserve(kMaxClients);
    state->m_hWake = SKRInstanceChannel::CreateWakeEvent();
    if (state->m_hWake < 0)
      return false;
    // We hold the instance lock, so a socket file found there is stale.
    state->m_hListener = SKRInstanceChannel::Listen(paths.m_Socket);
    if (state->m_hListener < 0)
      return false;
    try {
      state->m_Thread = std::thread([raw = state.get()] { raw->Run(); });
    } catch (...) {
      SKRInstanceChannel::RemoveFile(paths.m_Socket);
      return false;
    }
    m_pState = std::move(state);
    return true;
  } catch (...) {
    return false;
  }
}

void CKRSingleAppInstanceListener::Stop() {
  if (!m_pState)
    return;
  SKRInstanceChannel::SignalWakeEvent(m_pState->m_hWake);
  if (m_pState->m_Thread.joinable())
    m_pState->m_Thread.join();
  SKRInstanceChannel::RemoveFile(m_pState->m_SocketPath);
  m_pState.reset();
}

bool CKRSingleAppInstanceListener::IsRunning() const noexcept {
  return m_pState != nullptr;
}
