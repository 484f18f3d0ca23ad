#include <krCoreLib/storage/registry/CKRRegistrySerializer.h>

#include <krCoreLib/storage/registry/CKRRegistryTypeManifest.h>

#include "KRRegistryArchive.h"
#include "core/KRUtf16.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <string>

KR_IMPLEMENT_OBJECT_TYPE(CKRRegistrySerializer, CKRDocument)

namespace {

// A value that changes between asking for its size and reading it is asked
// for again; a few rounds settle any writer that is not rewriting it
// without pause.
constexpr int kQueryRounds = 4;
// Key names in the store are far shorter; a name that does not fit this
// many characters is skipped rather than read into an ever larger buffer.
constexpr std::uint32_t kLongestKeyName = 32767;

// The predefined root keys are fixed handle values, never opened or closed.
bool IsPredefined(HKEY key) {
  const auto value = reinterpret_cast<std::uintptr_t>(key);
  return value >= 0x80000000u && value <= 0x80000006u;
}

std::vector<std::uint8_t> Utf16Bytes(const CKRString& text) {
  std::vector<std::uint8_t> bytes;
  SKRUtf16::EncodeTerminated(text.str(), bytes);
  return bytes;
}

// The text up to the first null character, or all of it; an odd last byte
// is no character.
CKRString TextOfBytes(const std::vector<std::uint8_t>& bytes) {
  std::wstring text;
  SKRUtf16::DecodeTerminated(bytes.data(), bytes.size(), text);
  return CKRString(std::move(text));
}

}  // namespace

int CKRRegistrySerializer::OnBeforeRelease() {
  CloseRegistry();
  return CKRDocument::OnBeforeRelease();
}

void CKRRegistrySerializer::ReplaceCurrentKey(HKEY key, bool owned) {
  if (m_hCurrentKey != nullptr && m_OwnsCurrentKey && m_hCurrentKey != key && !IsPredefined(m_hCurrentKey))
    KRRegCloseKey(m_hCurrentKey);
  m_hCurrentKey = key;
  m_OwnsCurrentKey = owned && key != nullptr && !IsPredefined(key);
}

int CKRRegistrySerializer::OpenCurrent(HKEY base, const CKRString& path, bool create) {
  if (base == nullptr) {
    m_LastResult = KRERROR_INVALID_HANDLE;
    ReplaceCurrentKey(nullptr, false);
    return 0;
  }
  HKEY key = nullptr;
  m_LastResult = create ? KRRegCreateKeyEx(base, path.GetString(), KRREG_OPTION_VOLATILE, KRKEY_ALL_ACCESS, &key,
                                           nullptr)
                        : KRRegOpenKeyEx(base, path.GetString(), 0, KRKEY_ALL_ACCESS, &key);
  // The new key is opened before the old one is closed: `base` may be it.
  ReplaceCurrentKey(m_LastResult == KRERROR_SUCCESS ? key : nullptr, true);
  return m_LastResult == KRERROR_SUCCESS ? 1 : 0;
}

int CKRRegistrySerializer::OpenStored(const CKRString& subPath, bool create) {
  if (m_hRootKey == nullptr || m_Location.IsEmpty()) {
    m_LastResult = KRERROR_INVALID_HANDLE;
    ReplaceCurrentKey(nullptr, false);
    return 0;
  }
  return OpenCurrent(m_hRootKey, subPath.IsEmpty() ? m_Location : m_Location + L"\\" + subPath, create);
}

CKRString CKRRegistrySerializer::GetTypeKeyPath(CKRGuid typeID) const {
  return m_Location + L"\\" + typeID.GetCString();
}

CKRString CKRRegistrySerializer::GetObjectKeyPath(CKRGuid typeID, CKRGuid instanceID) const {
  return GetTypeKeyPath(typeID) + L"\\" + instanceID.GetCString();
}

int CKRRegistrySerializer::SetLocation(HKEY root, const CKRString& path) {
  if (root == nullptr || path.IsEmpty())
    return 0;
  ReplaceCurrentKey(root, false);
  m_hRootKey = root;
  m_Location = path;
  return 1;
}

int CKRRegistrySerializer::Open() {
  // A location that does not exist yet holds nothing to load; any other
  // failure (no location, a store that cannot be read) fails.
  if (OpenStored(CKRString(), false) == 0)
    return m_LastResult == KRERROR_FILE_NOT_FOUND ? CKRDocument::Open() : 0;
  CKRRegistryStringList names;
  EnumerateSubKeys(names);
  for (const CKRString& name : names) {
    CKRGuid typeID;
    if (!typeID.ReadCString(name) || typeID.IsNull())
      continue;
    if (auto* manifest = dynamic_cast<CKRRegistryTypeManifest*>(CreateTypeManifest(typeID, nullptr)))
      manifest->LoadFieldStreams();
  }
  // The manifests opened their own keys: the location is current again.
  OpenStored(CKRString(), false);
  return CKRDocument::Open();
}

int CKRRegistrySerializer::OpenRegistry(HKEY root, const CKRString& path) {
  m_Location = path;
  m_hRootKey = root;
  return OpenCurrent(root, path, false);
}

int CKRRegistrySerializer::CreateKey(HKEY root, const CKRString& path) {
  return OpenCurrent(root, path, true);
}

int CKRRegistrySerializer::VerifyKey(HKEY root, const CKRString& path) {
  return OpenCurrent(root, path, false);
}

int CKRRegistrySerializer::VerifyKey(const CKRString& path) {
  return OpenCurrent(m_hCurrentKey, path, false);
}

int CKRRegistrySerializer::VerifyValue(const CKRString& name) {
  if (m_hCurrentKey == nullptr) {
    m_LastResult = KRERROR_INVALID_HANDLE;
    return 0;
  }
  m_LastResult = KRRegQueryValueEx(m_hCurrentKey, name.GetString(), nullptr, nullptr, nullptr);
  return m_LastResult == KRERROR_SUCCESS ? 1 : 0;
}

int CKRRegistrySerializer::CloseRegistry() {
  ReplaceCurrentKey(nullptr, false);
  return 1;
}

int CKRRegistrySerializer::DeleteValue(const CKRString& name) {
  if (m_hCurrentKey == nullptr) {
    m_LastResult = KRERROR_INVALID_HANDLE;
    return 0;
  }
  m_LastResult = KRRegDeleteValue(m_hCurrentKey, name.GetString());
  return m_LastResult == KRERROR_SUCCESS ? 1 : 0;
}

int CKRRegistrySerializer::DeleteValueKey(HKEY root, const CKRString& path) {
  if (root == nullptr || path.IsEmpty()) {
    m_LastResult = KRERROR_INVALID_HANDLE;
    return 0;
  }
  m_LastResult = KRRegDeleteKey(root, path.GetString());
  return m_LastResult == KRERROR_SUCCESS ? 1 : 0;
}

int CKRRegistrySerializer::EnumerateSubKeys(CKRRegistryStringList& list) {
  if (m_hCurrentKey == nullptr) {
    m_LastResult = KRERROR_INVALID_HANDLE;
    return static_cast<int>(list.size());
  }
  std::uint32_t longest = 0;
  m_LastResult = KRRegQueryInfoKey(m_hCurrentKey, nullptr, &longest, nullptr, nullptr, nullptr);
  std::wstring name(std::min(std::max<std::uint32_t>(longest, 79), kLongestKeyName) + 1, L'\0');
  for (std::uint32_t index = 0;;) {
    auto length = static_cast<std::uint32_t>(name.size());
    m_LastResult = KRRegEnumKeyEx(m_hCurrentKey, index, name.data(), &length);
    if (m_LastResult == KRERROR_MORE_DATA) {
      // A longer name arrived since the size was asked: grow once, or
      // skip a name too long for any buffer.
      if (name.size() <= kLongestKeyName) {
        name.assign(kLongestKeyName + 1, L'\0');
        continue;
      }
      ++index;
      continue;
    }
    if (m_LastResult != KRERROR_SUCCESS)
      break;
    list.emplace_back(name.data(), std::min<std::size_t>(length, name.size()));
    ++index;
  }
  if (m_LastResult == KRERROR_NO_MORE_ITEMS)
    m_LastResult = KRERROR_SUCCESS;
  return static_cast<int>(list.size());
}

int CKRRegistrySerializer::SetValue(const CKRString& name, std::uint32_t type, const std::vector<std::uint8_t>& bytes) {
  if (m_hCurrentKey == nullptr) {
    m_LastResult = KRERROR_INVALID_HANDLE;
    return 0;
  }
  if (bytes.size() > std::numeric_limits<std::uint32_t>::max())
    return 0;
  m_LastResult = KRRegSetValueEx(m_hCurrentKey, name.GetString(), type, bytes.data(),
                                 static_cast<std::uint32_t>(bytes.size()));
  m_LastValueType = type;
  m_LastValueSize = static_cast<std::uint32_t>(bytes.size());
  return m_LastResult == KRERROR_SUCCESS ? 1 : 0;
}

bool CKRRegistrySerializer::QueryValue(const CKRString& name, std::uint32_t type, std::vector<std::uint8_t>& bytes) {
  if (m_hCurrentKey == nullptr) {
    m_LastResult = KRERROR_INVALID_HANDLE;
    return false;
  }
  for (int round = 0; round < kQueryRounds; ++round) {
    std::uint32_t storedType = KRREG_NONE;
    std::uint32_t size = 0;
    m_LastResult = KRRegQueryValueEx(m_hCurrentKey, name.GetString(), &storedType, nullptr, &size);
    m_LastValueType = storedType;
    m_LastValueSize = size;
    if (m_LastResult != KRERROR_SUCCESS || storedType != type || size > KRREG_MAX_VALUE_SIZE)
      return false;
    // The store tells the size of what it holds: the buffer is never
    // larger than the value.
    std::vector<std::uint8_t> data(size);
    std::uint32_t read = size;
    m_LastResult = KRRegQueryValueEx(m_hCurrentKey, name.GetString(), &storedType, data.data(), &read);
    if (m_LastResult == KRERROR_MORE_DATA)
      continue;
    m_LastValueType = storedType;
    m_LastValueSize = read;
    if (m_LastResult != KRERROR_SUCCESS || storedType != type || read > size)
      return false;
    data.resize(read);
    bytes.swap(data);
    return true;
  }
  return false;
}

int CKRRegistrySerializer::Write(const CKRString& name, int value) {
  return Write(name, static_cast<unsigned long>(static_cast<std::uint32_t>(value)));
}

int CKRRegistrySerializer::Write(const CKRString& name, unsigned long value) {
  if (value > std::numeric_limits<std::uint32_t>::max())
    return 0;
  const auto number = static_cast<std::uint32_t>(value);
  return SetValue(name, KRREG_DWORD,
                  {static_cast<std::uint8_t>(number), static_cast<std::uint8_t>(number >> 8),
                   static_cast<std::uint8_t>(number >> 16), static_cast<std::uint8_t>(number >> 24)});
}

int CKRRegistrySerializer::Write(const CKRString& name, const CKRString& text) {
  const int written = SetValue(name, KRREG_SZ, Utf16Bytes(text));
  m_LastValueSize /= 2;
  return written;
}

int CKRRegistrySerializer::Read(const CKRString& name, unsigned long& value) {
  std::vector<std::uint8_t> bytes;
  if (!QueryValue(name, KRREG_DWORD, bytes) || bytes.size() != 4)
    return 0;
  value = static_cast<unsigned long>(bytes[0]) | (static_cast<unsigned long>(bytes[1]) << 8) |
          (static_cast<unsigned long>(bytes[2]) << 16) | (static_cast<unsigned long>(bytes[3]) << 24);
  return 1;
}

int CKRRegistrySerializer::Read(const CKRString& name, int& value) {
  unsigned long number = 0;
  if (Read(name, number) == 0)
    return 0;
  value = static_cast<int>(static_cast<std::uint32_t>(number));
  return 1;
}

int CKRRegistrySerializer::Read(const CKRString& name, CKRString& text) {
  std::vector<std::uint8_t> bytes;
  if (!QueryValue(name, KRREG_SZ, bytes))
    return 0;
  text = TextOfBytes(bytes);
  return 1;
}

template <typename T>
int CKRRegistrySerializer::WriteNumbers(const CKRString& name, const std::vector<T>& numbers) {
  bool ok = false;
  const std::vector<std::uint8_t> bytes = SKRRegistryArchive::EncodeNumbers(numbers, ok);
  return ok ? SetValue(name, KRREG_BINARY, bytes) : 0;
}

template <typename T>
int CKRRegistrySerializer::ReadNumbers(const CKRString& name, std::vector<T>& numbers) {
  std::vector<std::uint8_t> bytes;
  return QueryValue(name, KRREG_BINARY, bytes) && SKRRegistryArchive::DecodeNumbers(bytes, numbers) ? 1 : 0;
}

int CKRRegistrySerializer::WriteStrings(const CKRString& name, const std::vector<CKRString>& strings) {
  bool ok = false;
  const std::vector<std::uint8_t> bytes = SKRRegistryArchive::EncodeStrings(strings, ok);
  return ok ? SetValue(name, KRREG_BINARY, bytes) : 0;
}

int CKRRegistrySerializer::ReadStrings(const CKRString& name, std::vector<CKRString>& strings) {
  std::vector<std::uint8_t> bytes;
  return QueryValue(name, KRREG_BINARY, bytes) && SKRRegistryArchive::DecodeStrings(bytes, strings) ? 1 : 0;
}

int CKRRegistrySerializer::Write(const CKRString& name, const CKRRegistryByteArray& bytes) {
  return WriteNumbers(name, bytes);
}
int CKRRegistrySerializer::Write(const CKRString& name, const CKRRegistryWordArray& numbers) {
  return WriteNumbers(name, numbers);
}
int CKRRegistrySerializer::Write(const CKRString& name, const CKRRegistryDWordArray& numbers) {
  return WriteNumbers(name, numbers);
}
int CKRRegistrySerializer::Write(const CKRString& name, const CKRRegistryStringArray& strings) {
  return WriteStrings(name, strings);
}
int CKRRegistrySerializer::Write(const CKRString& name, const CKRRegistryStringList& strings) {
  return WriteStrings(name, std::vector<CKRString>(strings.begin(), strings.end()));
}

int CKRRegistrySerializer::Write(const CKRString& name, const CKRScreenRect& rect) {
  return WriteNumbers(name, CKRRegistryDWordArray{static_cast<std::uint32_t>(rect.top),
                                                  static_cast<std::uint32_t>(rect.bottom),
                                                  static_cast<std::uint32_t>(rect.left),
                                                  static_cast<std::uint32_t>(rect.right), 0});
}

int CKRRegistrySerializer::Write(const CKRString& name, const CKRScreenPoint& point) {
  return WriteNumbers(name, CKRRegistryDWordArray{static_cast<std::uint32_t>(point.x),
                                                  static_cast<std::uint32_t>(point.y), 0, 0, 0});
}

int CKRRegistrySerializer::Read(const CKRString& name, CKRRegistryByteArray& bytes) {
  return ReadNumbers(name, bytes);
}
int CKRRegistrySerializer::Read(const CKRString& name, CKRRegistryWordArray& numbers) {
  return ReadNumbers(name, numbers);
}
int CKRRegistrySerializer::Read(const CKRString& name, CKRRegistryDWordArray& numbers) {
  return ReadNumbers(name, numbers);
}
int CKRRegistrySerializer::Read(const CKRString& name, CKRRegistryStringArray& strings) {
  return ReadStrings(name, strings);
}

int CKRRegistrySerializer::Read(const CKRString& name, CKRRegistryStringList& strings) {
  std::vector<CKRString> read;
  if (ReadStrings(name, read) == 0)
    return 0;
  strings.assign(std::make_move_iterator(read.begin()), std::make_move_iterator(read.end()));
  return 1;
}

int CKRRegistrySerializer::Read(const CKRString& name, CKRScreenRect& rect) {
  CKRRegistryDWordArray numbers;
  if (ReadNumbers(name, numbers) == 0 || numbers.size() < 4)
    return 0;
  rect.top = static_cast<int>(numbers[0]);
  rect.bottom = static_cast<int>(numbers[1]);
  rect.left = static_cast<int>(numbers[2]);
  rect.right = static_cast<int>(numbers[3]);
  return 1;
}

int CKRRegistrySerializer::Read(const CKRString& name, CKRScreenPoint& point) {
  CKRRegistryDWordArray numbers;
  if (ReadNumbers(name, numbers) == 0 || numbers.size() < 2)
    return 0;
  point.x = static_cast<int>(numbers[0]);
  point.y = static_cast<int>(numbers[1]);
  return 1;
}

CKRTypeManifest* CKRRegistrySerializer::CreateTypeManifest(CKRGuid typeID, IKRObjectType* manifestType) {
  if (manifestType != nullptr)
    return CKRDocument::CreateTypeManifest(typeID, manifestType);
  CKRTypeManifest* manifest =
      CKRDocument::CreateTypeManifest(typeID, CKRRegistryTypeManifest::GetCKRRegistryTypeManifestType());
  // Made by the manifest type of this store: its class.
  if (manifest != nullptr)
    static_cast<CKRRegistryTypeManifest*>(manifest)->SetSerializer(this);
  return manifest;
}
