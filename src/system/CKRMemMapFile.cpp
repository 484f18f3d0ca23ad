#include <krCoreLib/system/CKRMemMapFile.h>

#include "KRNativePath.h"
#include "SKRSharedMemory.h"

#include <cstring>
#include <string>

namespace {

// Two zero bytes: the terminator of a wide text in the host's string type.
constexpr std::size_t kTerminatorBytes = 2;
// Mapped files and blocks are counted in 32 bits.
constexpr std::uint64_t kMaxMappedSize = 0xFFFFFFFFull;

// The name of the lock that guards a mapping (in the namespace of locks,
// which mapping names cannot reach).
constexpr const wchar_t* kLockSuffix = L"MUTEX";

}  // namespace

CKRMemMapFile::~CKRMemMapFile() {
  UnMap();
}

CKRString CKRMemMapFile::MakeMappingName(const wchar_t* name) {
  CKRString result(name);
  for (wchar_t& c : result.str()) {
    if (c == L'\\' || c == L'/')
      c = L'_';
  }
  result.MakeUpper();
  return result;
}

int CKRMemMapFile::MapFile(const wchar_t* path, bool readOnly, unsigned int shareMode, bool appendTerminator,
                           bool mappingNameFromPath, bool sparse) {
  (void)shareMode;
  (void)sparse;
  UnMap();
  try {
    std::string native;
    if (!SKRNativePath::ToNative(path, native))
      return 0;
    std::uint64_t size = 0;
    m_hFile = SKRSharedMemory::OpenFile(native.c_str(), readOnly, size);
    if (m_hFile < 0)
      return 0;
    m_bReadOnly = readOnly;
    m_bAppendTerminator = appendTerminator;
    if (mappingNameFromPath)
      m_Name = MakeMappingName(path);
    return MapDescriptor(m_hFile, size);
  } catch (...) {
    UnMap();
    return 0;
  }
}

int CKRMemMapFile::MapHandle(int fileDescriptor, bool readOnly, bool appendTerminator) {
  UnMap();
  std::uint64_t size = 0;
  if (!SKRSharedMemory::GetFileSize(fileDescriptor, size))
    return 0;
  m_hFile = SKRSharedMemory::Duplicate(fileDescriptor);
  if (m_hFile < 0)
    return 0;
  m_bReadOnly = readOnly;
  m_bAppendTerminator = appendTerminator;
  return MapDescriptor(m_hFile, size);
}

int CKRMemMapFile::MapDescriptor(int fileDescriptor, std::uint64_t fileSize) {
  SKRMemoryView view;
  if (fileSize == 0 || fileSize > kMaxMappedSize ||
      !SKRSharedMemory::MapFile(fileDescriptor, std::size_t(fileSize), m_bAppendTerminator ? kTerminatorBytes : 0,
                                m_bReadOnly, view)) {
    UnMap();
    return 0;
  }
  m_pView = view.m_pAddress;
  m_ViewLength = view.m_Length;
  m_dwSize = std::uint32_t(fileSize);
  // The terminator lies in zero memory beyond the file's data; writing it
  // keeps the promise even where another mapping scribbled there.
  if (m_bAppendTerminator && !m_bReadOnly)
    std::memset(static_cast<unsigned char*>(m_pView) + m_dwSize, 0, kTerminatorBytes);
  if (!CreateMutex()) {
    UnMap();
    return 0;
  }
  return 1;
}

int CKRMemMapFile::MapMemory(const wchar_t* name, std::uint32_t size, bool readOnly) {
  return AttachMemory(name, size, true, readOnly);
}

int CKRMemMapFile::MapExistingMemory(const wchar_t* name, std::uint32_t size, bool readOnly) {
  return AttachMemory(name, size, false, readOnly);
}

int CKRMemMapFile::AttachMemory(const wchar_t* name, std::uint32_t size, bool create, bool readOnly) {
  UnMap();
  if (name == nullptr || *name == L'\0' || size == 0)
    return 0;
  try {
    m_Name = MakeMappingName(name);
    m_bReadOnly = readOnly;
    // A name without an exact UTF-8 form would share its object with every
    // name that differs only where conversion replaced characters.
    std::string utf8;
    if (!SKRNativePath::ToUtf8(m_Name.str(), utf8)) {
      UnMap();
      return 0;
    }
    m_ObjectName = SKRSharedMemory::MakeObjectName(SKRSharedMemory::EKRKind::Memory, utf8);
    SKRMemoryView view;
    if (!SKRSharedMemory::Attach(m_ObjectName, size, create, readOnly, nullptr, m_hMapping, view)) {
      UnMap();
      return 0;
    }
    m_pView = view.m_pAddress;
    m_ViewLength = view.m_Length;
    m_dwSize = size;
    if (!CreateMutex()) {
      UnMap();
      return 0;
    }
    return 1;
  } catch (...) {
    UnMap();
    return 0;
  }
}

bool CKRMemMapFile::CreateMutex() {
  // An unnamed mapping gets an unnamed lock. Names were checked (paths by
  // their conversion, memory names above), so the conversion is exact.
  m_pMutex = SKRNamedMutex::Create(m_Name.IsEmpty() ? std::string() : (m_Name + kLockSuffix).ToUtf8());
  return m_pMutex != nullptr;
}

void* CKRMemMapFile::Open(int timeoutMs) {
  if (m_pView == nullptr)
    return nullptr;
  if (m_bOpen)
    return m_pView;
  if (!m_bReadOnly) {
    if (m_pMutex == nullptr || m_pMutex->Lock(timeoutMs) != SKRNamedMutex::EKRWait::Acquired)
      return nullptr;
  }
  m_bOpen = true;
  return m_pView;
}

void CKRMemMapFile::Close() {
  if (!m_bOpen)
    return;
  if (!m_bReadOnly && m_pMutex != nullptr)
    m_pMutex->Unlock();
  m_bOpen = false;
}

int CKRMemMapFile::Flush() {
  if (m_pView == nullptr)
    return 0;
  if (m_hFile < 0)
    return 1;  // shared memory has no file to write to
  SKRMemoryView view;
  view.m_pAddress = m_pView;
  view.m_Length = m_ViewLength;
  return SKRSharedMemory::Flush(view) ? 1 : 0;
}

void CKRMemMapFile::UnMap() {
  Close();
  SKRMemoryView view;
  view.m_pAddress = m_pView;
  view.m_Length = m_ViewLength;
  if (m_pView != nullptr && m_hFile >= 0 && !m_bReadOnly)
    SKRSharedMemory::Flush(view);
  if (m_hMapping >= 0)
    SKRSharedMemory::Detach(m_ObjectName, m_hMapping, view);
  else
    SKRSharedMemory::Unmap(view);
  SKRSharedMemory::Close(m_hFile);
  delete m_pMutex;
  m_pMutex = nullptr;
  m_pView = nullptr;
  m_ViewLength = 0;
  m_bReadOnly = true;
  m_bAppendTerminator = false;
  m_Name.Empty();
  m_ObjectName.clear();
  m_dwSize = 0;
}
