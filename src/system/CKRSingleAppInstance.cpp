#include <krCoreLib/system/CKRSingleAppInstance.h>

#include <krCoreLib/system/CKRMemMapFile.h>
#include <krCoreLib/system/CKRPathHelper.h>

#include "KRNativePath.h"
#include "SKRInstanceChannel.h"

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

constexpr const char* kProbeMessage = "krCoreLibCI";
constexpr const char* kFileMessage = "krCoreLibFP";
// Longest line either side accepts; the messages are a few bytes long.
constexpr std::size_t kMaxLine = 64;
// How long a later instance waits for the running one to answer the probe.
// Generous, as only a hung instance makes it wait, and a busy one on a
// loaded machine must still be found.
constexpr int kProbeTimeoutMs = 2000;
// How long either side waits for the other during a hand-over.
constexpr int kHandOverTimeoutMs = 5000;
// The shared block that carries a file name: the longest name and its
// terminator, so that blocks of every hand-over have the same size.
constexpr std::uint32_t kHandOverBytes =
    std::uint32_t((CKRSingleAppInstance::kMaxFileNameLength + 1) * sizeof(wchar_t));

// The files of one application ID in the runtime folder.
struct SKRInstancePaths {
  std::string m_LockFile;
  std::string m_Socket;
};

bool MakeInstancePaths(const wchar_t* applicationID, SKRInstancePaths& paths) {
  if (applicationID == nullptr || *applicationID == L'\0')
    return false;
  std::string folder;
  if (!SKRInstanceChannel::GetRuntimeFolder(folder))
    return false;
  // The instance name: the application ID scoped to the login session.
  std::string name = CKRString::ToUtf8(applicationID) + "-" + SKRInstanceChannel::GetSessionName();
  for (char& c : name) {
    if (c == '/' || c == '\0')
      c = '_';
  }
  std::string base = folder + "/krCoreLib-" + name;
  if (base.size() + 5 > SKRInstanceChannel::GetMaxSocketPath()) {
    // Too long for a socket address: a hash of the name (FNV-1a, 64 bits)
    // names the same files in every process.
    std::uint64_t hash = 0xcbf29ce484222325ull;
    for (const unsigned char c : name)
      hash = (hash ^ c) * 0x100000001b3ull;
    char digits[24];
    std::snprintf(digits, sizeof digits, "%016llx", static_cast<unsigned long long>(hash));
    base = folder + "/krCoreLib-" + digits;
    if (base.size() + 5 > SKRInstanceChannel::GetMaxSocketPath())
      return false;
  }
  paths.m_LockFile = base + ".lock";
  paths.m_Socket = base + ".sock";
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

EKRInstanceLock AcquireInstanceLock(const std::string& path) {
  SKRInstanceRegistry& registry = GetRegistry();
  const std::lock_guard<std::mutex> guard(registry.m_Mutex);
  const int processID = SKRInstanceChannel::GetProcessID();
  for (const SKRHeldLock& held : registry.m_Locks) {
    if (held.m_ProcessID == processID && held.m_Path == path)
      return EKRInstanceLock::Mine;
  }
  int handle = -1;
  switch (SKRInstanceChannel::TryLockFile(path, handle)) {
  case SKRInstanceChannel::EKRLock::Acquired:
    try {
      registry.m_Locks.push_back({path, handle, processID});
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

// The file the command line asks to open: the first argument after the
// program that is not an option, made absolute. Empty when there is none or
// it is not valid UTF-8.
CKRString FindFileArgument(int argc, const char* const* argv) {
  if (argv == nullptr)
    return CKRString();
  for (int i = 1; i < argc; ++i) {
    const char* argument = argv[i];
    if (argument == nullptr || argument[0] == '-' || argument[0] == '\0')
      continue;
    CKRString file;
    if (!SKRNativePath::FromNative(argument, file))
      return CKRString();
    if (file.GetAt(0) != L'/') {
      // The running instance has a current directory of its own.
      const CKRString directory = CKRPathHelper::GetCurrentWorkingDirectory();
      if (!directory.IsEmpty())
        file = CKRPathHelper::AddSlash(directory.GetString()) + file;
    }
    return file;
  }
  return CKRString();
}

// Writes the file name into the shared block and tells the running
// instance. The block's lock is held until the running instance has
// answered, so that two later instances never overwrite each other's name.
void HandOverFile(int connection, const wchar_t* applicationID, const CKRString& file) {
  if (file.GetLength() > CKRSingleAppInstance::kMaxFileNameLength)
    return;
  CKRMemMapFile block;
  if (block.MapMemory(applicationID, kHandOverBytes, false) == 0)
    return;
  auto* text = static_cast<wchar_t*>(block.Open(kHandOverTimeoutMs));
  if (text == nullptr)
    return;
  std::wmemcpy(text, file.GetString(), file.size());
  text[file.size()] = L'\0';
  std::string reply;
  if (SKRInstanceChannel::SendLine(connection, std::string(kFileMessage) + " " + std::to_string(file.size()),
                                   kHandOverTimeoutMs))
    SKRInstanceChannel::ReceiveLine(connection, -1, kHandOverTimeoutMs, kMaxLine, reply);
  block.Close();
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

bool CKRSingleAppInstance::DetectAppInstance(const wchar_t* applicationID, int argc, const char* const* argv) {
  bool running = false;
  try {
    SKRInstancePaths paths;
    if (!MakeInstancePaths(applicationID, paths) || AcquireInstanceLock(paths.m_LockFile) != EKRInstanceLock::Other)
      return false;
    running = true;
    int connection = SKRInstanceChannel::Connect(paths.m_Socket);
    if (connection < 0)
      return true;  // running, but not listening
    std::string reply;
    const bool found = SKRInstanceChannel::SendLine(connection, kProbeMessage, kProbeTimeoutMs) &&
                       SKRInstanceChannel::ReceiveLine(connection, -1, kProbeTimeoutMs, kMaxLine, reply) &&
                       reply == kProbeMessage;
    if (found) {
      const CKRString file = FindFileArgument(argc, argv);
      if (!file.IsEmpty())
        HandOverFile(connection, applicationID, file);
    }
    SKRInstanceChannel::Close(connection);
  } catch (...) {
    // Out of memory: what was learnt stands.
  }
  return running;
}

struct CKRSingleAppInstanceListener::SKRState {
  CKRString m_ApplicationID;
  std::string m_SocketPath;
  int m_hListener = -1;
  int m_hWake = -1;
  ActivateHandler m_OnActivate;
  OpenFileHandler m_OnOpenFile;
  std::thread m_Thread;

  ~SKRState() {
    SKRInstanceChannel::Close(m_hListener);
    SKRInstanceChannel::Close(m_hWake);
  }

  void Run() {
    for (;;) {
      int client = SKRInstanceChannel::Accept(m_hListener, m_hWake);
      if (client == -2)
        return;
      if (client < 0) {
        // Out of descriptors, for instance: try again a little later rather
        // than spinning on a socket that stays ready.
        if (SKRInstanceChannel::WaitForWakeEvent(m_hWake, 100))
          return;
        continue;
      }
      if (SKRInstanceChannel::IsPeerSameUser(client))
        Serve(client);
      SKRInstanceChannel::Close(client);
    }
  }

  void Serve(int client) {
    std::string line;
    while (SKRInstanceChannel::ReceiveLine(client, m_hWake, kHandOverTimeoutMs, kMaxLine, line)) {
      if (line == kProbeMessage) {
        if (!SKRInstanceChannel::SendLine(client, kProbeMessage, kHandOverTimeoutMs))
          return;
        Call([this] {
          if (m_OnActivate)
            m_OnActivate();
        });
        continue;
      }
      const int length = ParseFileMessage(line);
      if (length < 0)
        return;
      CKRString fileName;
      const bool read = ReadFileName(length, fileName);
      if (!SKRInstanceChannel::SendLine(client, read ? kFileMessage : "krCoreLibFP -", kHandOverTimeoutMs))
        return;
      if (read) {
        Call([&] {
          if (m_OnOpenFile)
            m_OnOpenFile(fileName);
        });
      }
    }
  }

  bool ReadFileName(int length, CKRString& fileName) {
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
    if (!MakeInstancePaths(applicationID, paths) || AcquireInstanceLock(paths.m_LockFile) != EKRInstanceLock::Mine)
      return false;
    auto state = std::make_unique<SKRState>();
    state->m_ApplicationID = applicationID;
    state->m_SocketPath = paths.m_Socket;
    state->m_OnActivate = std::move(onActivate);
    state->m_OnOpenFile = std::move(onOpenFile);
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
