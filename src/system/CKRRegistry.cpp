#include <krCoreLib/system/CKRRegistry.h>

#include "core/KRUtf16.h"

#include <cstring>
#include <string>
#include <type_traits>

namespace {

constexpr std::uint32_t kAllAccess = KRKEY_ALL_ACCESS;

// Reads a value whole: its size first, then its bytes. KRERROR_MORE_DATA
// for a value beyond CKRRegistry::kMaxValueSize (never allocated).
long ReadValue(HKEY key, const wchar_t* name, std::uint32_t& type, std::string& bytes) {
  // A value that grows between the two calls is asked again (a few times).
  for (int attempt = 0; attempt < 4; ++attempt) {
    std::uint32_t size = 0;
    long status = KRRegQueryValueEx(key, name, &type, nullptr, &size);
    if (status != KRERROR_SUCCESS)
      return status;
    if (size > CKRRegistry::kMaxValueSize)
      return KRERROR_MORE_DATA;
    bytes.assign(size, '\0');
    status = KRRegQueryValueEx(key, name, &type, reinterpret_cast<std::uint8_t*>(bytes.data()), &size);
    if (status == KRERROR_SUCCESS) {
      bytes.resize(size);
      return status;
    }
    if (status != KRERROR_MORE_DATA)
      return status;
  }
  return KRERROR_MORE_DATA;
}

// A stored text: up to its first null, or all of it when it has none.
CKRString DecodeText(const std::string& bytes) {
  std::wstring text;
  SKRUtf16::DecodeTerminated(bytes.data(), bytes.size(), text);
  return CKRString(std::move(text));
}

// Appends the UTF-16 form of `text` and a null unit, as little-endian bytes.
void AppendEncoded(const CKRString& text, std::string& bytes) {
  SKRUtf16::EncodeTerminated(text.str(), bytes);
}

bool HasNull(const CKRString& text) {
  return text.str().find(L'\0') != std::wstring::npos;
}

long WriteBytes(HKEY key, const wchar_t* name, std::uint32_t type, const std::string& bytes) {
  return KRRegSetValueEx(key, name, type, reinterpret_cast<const std::uint8_t*>(bytes.data()),
                         std::uint32_t(bytes.size()));
}

// Closes a key when it goes out of scope.
class CKRKeyCloser {
public:
  explicit CKRKeyCloser(HKEY key) noexcept : m_hKey(key) {}
  ~CKRKeyCloser() {
    if (m_hKey != nullptr)
      KRRegCloseKey(m_hKey);
  }
  CKRKeyCloser(const CKRKeyCloser&) = delete;
  CKRKeyCloser& operator=(const CKRKeyCloser&) = delete;

private:
  HKEY m_hKey;
};

// Whether `name` is a braced GUID as GetCString writes it; its value in `guid`.
bool ParseBracedGuid(const wchar_t* name, std::size_t length, CKRGuid& guid) {
  if (length != 38 || name[0] != L'{' || name[37] != L'}')
    return false;
  return guid.ReadCString(CKRString(name, length)) && guid.IsValid();
}

// The names of the values of `key` (null: none could be listed).
bool ValueNames(HKEY key, std::vector<CKRString>& names) {
  std::uint32_t count = 0;
  std::uint32_t longest = 0;
  if (KRRegQueryInfoKey(key, nullptr, nullptr, &count, &longest, nullptr) != KRERROR_SUCCESS)
    return false;
  std::vector<wchar_t> buffer(std::size_t(longest) + 1);
  for (std::uint32_t index = 0;; ++index) {
    auto length = std::uint32_t(buffer.size());
    const long status = KRRegEnumValue(key, index, buffer.data(), &length, nullptr, nullptr, nullptr);
    if (status == KRERROR_NO_MORE_ITEMS)
      return true;
    if (status == KRERROR_MORE_DATA) {  // a longer name arrived meanwhile
      buffer.resize(std::size_t(length) + 1);
      --index;
      continue;
    }
    if (status != KRERROR_SUCCESS)
      return false;
    names.emplace_back(buffer.data(), length);
  }
}

// Sets `value` to the default, then to the stored 32 bits (sign-extended for
// signed types) when `get` reads them.
template <class T, class Get>
_EKRRegistryErrors ReadNumber(T& value, T defaultValue, Get get) {
  value = defaultValue;
  std::uint32_t number = 0;
  const _EKRRegistryErrors result = get(number);
  if (result == KRREGISTRY_SUCCESS)
    value = std::is_signed_v<T> ? T(std::int32_t(number)) : T(number);
  return result;
}

}  // namespace

CKRRegistry::CKRRegistry(const wchar_t* company, const wchar_t* application, HKEY root) {
  Initialize(company, application, root);
}

CKRRegistry::~CKRRegistry() {
  CloseKeys();
}

void CKRRegistry::CloseKeys() noexcept {
  for (HKEY* key : {&m_hApplicationKey, &m_hCompanyKey, &m_hSoftwareKey}) {
    if (*key != nullptr)
      KRRegCloseKey(*key);
    *key = nullptr;
  }
}

_EKRRegistryErrors CKRRegistry::Initialize(const wchar_t* company, const wchar_t* application, HKEY root) {
  CloseKeys();
  if (KRRegOpenKeyEx(root, L"SOFTWARE", 0, KRKEY_READ, &m_hSoftwareKey) != KRERROR_SUCCESS) {
    m_hSoftwareKey = nullptr;
    return m_eState = KRREGISTRY_NO_SOFTWARE_KEY;
  }
  if (company == nullptr || company[0] == L'\0' ||
      KRRegCreateKeyEx(m_hSoftwareKey, company, KRREG_OPTION_NON_VOLATILE, kAllAccess, &m_hCompanyKey, nullptr) !=
          KRERROR_SUCCESS) {
    m_hCompanyKey = nullptr;
    return m_eState = KRREGISTRY_NO_COMPANY_KEY;
  }
  if (application == nullptr || application[0] == L'\0' ||
      KRRegCreateKeyEx(m_hCompanyKey, application, KRREG_OPTION_NON_VOLATILE, kAllAccess, &m_hApplicationKey,
                       nullptr) != KRERROR_SUCCESS) {
    m_hApplicationKey = nullptr;
    return m_eState = KRREGISTRY_NO_APPLICATION_KEY;
  }
  return m_eState = KRREGISTRY_SUCCESS;
}

_EKRRegistryErrors CKRRegistry::OpenSection(const wchar_t* section, HKEY key, HKEY& opened) const {
  opened = nullptr;
  if (m_hApplicationKey == nullptr || m_hCompanyKey == nullptr || m_hSoftwareKey == nullptr)
    return KRREGISTRY_NOT_INITIALIZED;
  const HKEY base = key != nullptr ? key : m_hApplicationKey;
  if (KRRegCreateKeyEx(base, section, KRREG_OPTION_NON_VOLATILE, kAllAccess, &opened, nullptr) != KRERROR_SUCCESS) {
    opened = nullptr;
    return KRREGISTRY_FAILED;
  }
  return KRREGISTRY_SUCCESS;
}

_EKRRegistryErrors CKRRegistry::ReadEntry(const wchar_t* section, const wchar_t* entry, HKEY key,
                                          std::uint32_t type, std::string& bytes) const {
  HKEY opened = nullptr;
  const _EKRRegistryErrors result = OpenSection(section, key, opened);
  if (result != KRREGISTRY_SUCCESS)
    return result;
  CKRKeyCloser closer(opened);
  std::uint32_t stored = 0;
  if (ReadValue(opened, entry, stored, bytes) != KRERROR_SUCCESS)
    return KRREGISTRY_FAILED;
  return stored == type ? KRREGISTRY_SUCCESS : KRREGISTRY_WRONG_TYPE;
}

_EKRRegistryErrors CKRRegistry::WriteEntry(const wchar_t* section, const wchar_t* entry, HKEY key,
                                           std::uint32_t type, const std::string& bytes) const {
  HKEY opened = nullptr;
  const _EKRRegistryErrors result = OpenSection(section, key, opened);
  if (result != KRREGISTRY_SUCCESS)
    return result;
  CKRKeyCloser closer(opened);
  return WriteBytes(opened, entry, type, bytes) == KRERROR_SUCCESS ? KRREGISTRY_SUCCESS : KRREGISTRY_FAILED;
}

_EKRRegistryErrors CKRRegistry::GetNumber(const wchar_t* section, const wchar_t* entry, std::uint32_t& number,
                                          HKEY key) const {
  std::string bytes;
  const _EKRRegistryErrors result = ReadEntry(section, entry, key, KRREG_DWORD, bytes);
  if (result != KRREGISTRY_SUCCESS)
    return result;
  if (bytes.size() != 4)
    return KRREGISTRY_FAILED;
  number = std::uint32_t(std::uint8_t(bytes[0])) | std::uint32_t(std::uint8_t(bytes[1])) << 8 |
           std::uint32_t(std::uint8_t(bytes[2])) << 16 | std::uint32_t(std::uint8_t(bytes[3])) << 24;
  return KRREGISTRY_SUCCESS;
}

_EKRRegistryErrors CKRRegistry::PutNumber(const wchar_t* section, const wchar_t* entry, std::uint32_t number,
                                          HKEY key) const {
  const char bytes[4] = {char(number), char(number >> 8), char(number >> 16), char(number >> 24)};
  return WriteEntry(section, entry, key, KRREG_DWORD, std::string(bytes, 4));
}

_EKRRegistryErrors CKRRegistry::GetRegValue(const wchar_t* section, const wchar_t* entry, int& value,
                                            int defaultValue, HKEY key) {
  return ReadNumber(value, defaultValue, [&](std::uint32_t& number) { return GetNumber(section, entry, number, key); });
}

_EKRRegistryErrors CKRRegistry::GetRegValue(const wchar_t* section, const wchar_t* entry, long& value,
                                            long defaultValue, HKEY key) {
  return ReadNumber(value, defaultValue, [&](std::uint32_t& number) { return GetNumber(section, entry, number, key); });
}

_EKRRegistryErrors CKRRegistry::GetRegValue(const wchar_t* section, const wchar_t* entry, unsigned long& value,
                                            unsigned long defaultValue, HKEY key) {
  return ReadNumber(value, defaultValue, [&](std::uint32_t& number) { return GetNumber(section, entry, number, key); });
}

_EKRRegistryErrors CKRRegistry::PutRegValue(const wchar_t* section, const wchar_t* entry, int value, HKEY key) {
  return PutNumber(section, entry, std::uint32_t(value), key);
}

_EKRRegistryErrors CKRRegistry::PutRegValue(const wchar_t* section, const wchar_t* entry, long value, HKEY key) {
  // Type 4 holds 32 bits; a wider number would read back as another one.
  if (value < INT32_MIN || value > INT32_MAX)
    return KRREGISTRY_FAILED;
  return PutNumber(section, entry, std::uint32_t(std::int32_t(value)), key);
}

_EKRRegistryErrors CKRRegistry::PutRegValue(const wchar_t* section, const wchar_t* entry, unsigned long value,
                                            HKEY key) {
  if (value > UINT32_MAX)
    return KRREGISTRY_FAILED;
  return PutNumber(section, entry, std::uint32_t(value), key);
}

_EKRRegistryErrors CKRRegistry::GetRegValue(const wchar_t* section, const wchar_t* entry, CKRString& value,
                                            const CKRString& defaultValue, HKEY key) {
  value = defaultValue;
  std::string bytes;
  const _EKRRegistryErrors result = ReadEntry(section, entry, key, KRREG_SZ, bytes);
  if (result == KRREGISTRY_SUCCESS)
    value = DecodeText(bytes);
  return result;
}

_EKRRegistryErrors CKRRegistry::PutRegValue(const wchar_t* section, const wchar_t* entry, const CKRString& value,
                                            HKEY key) {
  if (HasNull(value))
    return KRREGISTRY_FAILED;
  std::string bytes;
  AppendEncoded(value, bytes);
  return WriteEntry(section, entry, key, KRREG_SZ, bytes);
}

_EKRRegistryErrors CKRRegistry::GetRegValue(const wchar_t* section, const wchar_t* entry,
                                            std::vector<CKRString>& value, HKEY key) {
  value.clear();
  std::string bytes;
  const _EKRRegistryErrors result = ReadEntry(section, entry, key, KRREG_MULTI_SZ, bytes);
  if (result != KRREGISTRY_SUCCESS)
    return result;
  // Strings up to the empty one that ends the list; a last string without
  // its null still counts.
  for (std::size_t start = 0; start + 1 < bytes.size();) {
    std::wstring text;
    start += SKRUtf16::DecodeTerminated(bytes.data() + start, bytes.size() - start, text);
    if (text.empty())
      break;
    value.push_back(CKRString(std::move(text)));
  }
  return KRREGISTRY_SUCCESS;
}

_EKRRegistryErrors CKRRegistry::PutRegValue(const wchar_t* section, const wchar_t* entry,
                                            const std::vector<CKRString>& value, HKEY key) {
  // An empty string, or one with a null, would end the list early on reading.
  std::string bytes;
  for (const CKRString& text : value) {
    if (text.IsEmpty() || HasNull(text))
      return KRREGISTRY_FAILED;
    AppendEncoded(text, bytes);
  }
  bytes.append(2, '\0');
  if (bytes.size() > kMaxValueSize)
    return KRREGISTRY_FAILED;
  return WriteEntry(section, entry, key, KRREG_MULTI_SZ, bytes);
}

_EKRRegistryErrors CKRRegistry::OpenMapKey(const wchar_t* section, const wchar_t* entry, HKEY key, bool create,
                                           HKEY& map) const {
  map = nullptr;
  HKEY opened = nullptr;
  const _EKRRegistryErrors result = OpenSection(section, key, opened);
  if (result != KRREGISTRY_SUCCESS)
    return result;
  CKRKeyCloser closer(opened);
  if (entry == nullptr || entry[0] == L'\0')
    return KRREGISTRY_FAILED;
  const long status = create ? KRRegCreateKeyEx(opened, entry, KRREG_OPTION_NON_VOLATILE, kAllAccess, &map, nullptr)
                             : KRRegOpenKeyEx(opened, entry, 0, kAllAccess, &map);
  if (status != KRERROR_SUCCESS) {
    map = nullptr;
    return KRREGISTRY_FAILED;
  }
  return KRREGISTRY_SUCCESS;
}

_EKRRegistryErrors CKRRegistry::GetRegValue(const wchar_t* section, const wchar_t* entry,
                                            std::map<CKRGuid, CKRString>& value, HKEY key) {
  value.clear();
  HKEY map = nullptr;
  const _EKRRegistryErrors result = OpenMapKey(section, entry, key, false, map);
  if (result != KRREGISTRY_SUCCESS)
    return result;
  CKRKeyCloser mapCloser(map);
  std::vector<CKRString> names;
  if (!ValueNames(map, names))
    return KRREGISTRY_FAILED;
  for (const CKRString& name : names) {
    CKRGuid guid;
    std::uint32_t type = 0;
    std::string bytes;
    if (!ParseBracedGuid(name.GetString(), name.size(), guid) ||
        ReadValue(map, name.GetString(), type, bytes) != KRERROR_SUCCESS || type != KRREG_SZ)
      continue;
    value[guid] = DecodeText(bytes);
  }
  return KRREGISTRY_SUCCESS;
}

_EKRRegistryErrors CKRRegistry::PutRegValue(const wchar_t* section, const wchar_t* entry,
                                            const std::map<CKRGuid, CKRString>& value, HKEY key) {
  for (const auto& [guid, text] : value)
    if (HasNull(text))
      return KRREGISTRY_FAILED;
  HKEY map = nullptr;
  const _EKRRegistryErrors result = OpenMapKey(section, entry, key, true, map);
  if (result != KRREGISTRY_SUCCESS)
    return result;
  CKRKeyCloser mapCloser(map);
  // Listed first, deleted after: deleting while listing would skip values.
  std::vector<CKRString> names;
  if (!ValueNames(map, names))
    return KRREGISTRY_FAILED;
  for (const CKRString& name : names) {
    CKRGuid guid;
    if (ParseBracedGuid(name.GetString(), name.size(), guid) &&
        KRRegDeleteValue(map, name.GetString()) != KRERROR_SUCCESS)
      return KRREGISTRY_FAILED;
  }
  for (const auto& [guid, text] : value) {
    std::string bytes;
    AppendEncoded(text, bytes);
    if (WriteBytes(map, guid.GetCString().GetString(), KRREG_SZ, bytes) != KRERROR_SUCCESS)
      return KRREGISTRY_FAILED;
  }
  return KRREGISTRY_SUCCESS;
}

int CKRRegistry::Save() {
  return 1;
}

int CKRRegistry::Load() {
  return 1;
}
