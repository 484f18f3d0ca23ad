// The REGEDIT4 export of CKRRegistry.
#include <krCoreLib/system/CKRRegistry.h>

#include "KRNativePath.h"
#include "SKRFiles.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

namespace {

struct SKRRootName {
  HKEY m_hKey;
  const char* m_pName;
};

const SKRRootName kRootNames[] = {
    {HKEY_CLASSES_ROOT, "HKEY_CLASSES_ROOT"},       {HKEY_CURRENT_USER, "HKEY_CURRENT_USER"},
    {HKEY_LOCAL_MACHINE, "HKEY_LOCAL_MACHINE"},     {HKEY_USERS, "HKEY_USERS"},
    {HKEY_PERFORMANCE_DATA, "HKEY_PERFORMANCE_DATA"}, {HKEY_CURRENT_CONFIG, "HKEY_CURRENT_CONFIG"},
    {HKEY_DYN_DATA, "HKEY_DYN_DATA"},
};

// One byte per character: characters above U+00FF become "?".
void AppendNarrow(std::string& out, const wchar_t* text, std::size_t length) {
  for (std::size_t i = 0; i < length; ++i)
    out.push_back(std::uint32_t(text[i]) <= 0xFF ? char(text[i]) : '?');
}

// Printable in the 8-bit range: the Latin-1 graphic characters and space.
bool IsPrintable(char16_t c) {
  return (c >= 0x20 && c < 0x7F) || (c >= 0xA0 && c <= 0xFF);
}

const char kHex[] = "0123456789abcdef";

void AppendHexByte(std::string& out, std::uint8_t byte) {
  out.push_back(kHex[byte >> 4]);
  out.push_back(kHex[byte & 15]);
}

// Bytes as "xx,xx,...", the line continued after positions 16, 32, ...
void AppendBytes(std::string& out, const std::uint8_t* data, std::size_t size) {
  for (std::size_t i = 0; i < size; ++i) {
    AppendHexByte(out, data[i]);
    if (i + 1 < size) {
      out.push_back(',');
      if (i > 0 && i % 16 == 0)
        out.append("\\\r\n  ");
    }
  }
}

// The quoted text form of string data, when the data is a terminated UTF-16
// text of characters below U+0100 only; false otherwise.
bool AppendText(std::string& out, const std::uint8_t* data, std::size_t size) {
  if (size < 2 || size % 2 != 0 || data[size - 1] != 0 || data[size - 2] != 0)
    return false;
  std::string text = "\"";
  for (std::size_t i = 0; i + 2 < size; i += 2) {
    if (data[i + 1] != 0 || data[i] == 0)  // above U+00FF, or a null inside
      return false;
    const auto c = char16_t(data[i]);
    if (c == u'"' || c == u'\\') {
      text.push_back('\\');
      text.push_back(char(c));
    } else if (IsPrintable(c)) {
      text.push_back(char(c));
    } else {
      text.push_back('\\');
      AppendHexByte(text, std::uint8_t(c));
    }
  }
  out.append(text);
  out.push_back('"');
  return true;
}

void AppendValue(std::string& out, const wchar_t* name, std::size_t nameLength, std::uint32_t type,
                 const std::uint8_t* data, std::size_t size) {
  // A value name is quoted as a text is: a quote or a backslash in it would
  // otherwise end the name early for whoever reads the file.
  out.push_back('"');
  for (std::size_t i = 0; i < nameLength; ++i) {
    if (name[i] == L'"' || name[i] == L'\\')
      out.push_back('\\');
    AppendNarrow(out, name + i, 1);
  }
  out.append("\"=");
  if (type == KRREG_SZ && AppendText(out, data, size)) {
  } else if (type == KRREG_DWORD && size == 4) {
    out.append("dword:");
    for (int i = 3; i >= 0; --i)
      AppendHexByte(out, data[i]);
  } else {
    if (type == KRREG_BINARY) {
      out.append("hex:");
    } else {
      char prefix[24];
      std::snprintf(prefix, sizeof prefix, "hex(%x):", unsigned(type));
      out.append(prefix);
    }
    AppendBytes(out, data, size);
  }
  out.append("\r\n");
}

class CKRRegistryExport {
public:
  bool Begin(const char* path) { return m_File.Begin(path); }
  bool Commit() { return Flush() && m_File.Commit(); }

  void Append(const char* text) { m_Text.append(text); }

  // Writes the key `name` below `parent` and everything below it.
  bool WriteKey(const std::string& parentPath, HKEY parent, const wchar_t* name, std::size_t nameLength, int depth) {
    if (depth > CKRRegistry::kMaxExportDepth)
      return false;
    HKEY key = nullptr;
    const std::wstring subKey(name, nameLength);
    if (KRRegOpenKeyEx(parent, subKey.c_str(), 0, KRKEY_READ, &key) != KRERROR_SUCCESS)
      return false;
    const bool good = WriteOpenKey(parentPath, key, subKey, depth);
    KRRegCloseKey(key);
    return good;
  }

private:
  bool WriteOpenKey(const std::string& parentPath, HKEY key, const std::wstring& name, int depth) {
    std::string path = parentPath + "\\";
    AppendNarrow(path, name.data(), name.size());
    m_Text.append("\r\n[");
    m_Text.append(path);
    m_Text.append("]\r\n");
    std::uint32_t longestKey = 0;
    std::uint32_t longestName = 0;
    std::uint32_t largest = 0;
    if (KRRegQueryInfoKey(key, nullptr, &longestKey, nullptr, &longestName, &largest) != KRERROR_SUCCESS ||
        largest > CKRRegistry::kMaxValueSize)
      return false;
    std::vector<wchar_t> nameBuffer(std::size_t(std::max(longestName, longestKey)) + 1);
    std::vector<std::uint8_t> data(std::max<std::uint32_t>(largest, 1));
    for (std::uint32_t index = 0;; ++index) {
      auto length = std::uint32_t(nameBuffer.size());
      auto size = std::uint32_t(data.size());
      std::uint32_t type = 0;
      const long status = KRRegEnumValue(key, index, nameBuffer.data(), &length, &type, data.data(), &size);
      if (status == KRERROR_NO_MORE_ITEMS)
        break;
      if (status != KRERROR_SUCCESS)  // also a value that grew meanwhile
        return false;
      AppendValue(m_Text, nameBuffer.data(), length, type, data.data(), size);
      if (m_Text.size() >= kFlushSize && !Flush())
        return false;
    }
    // Subkeys listed first, so that writing one does not disturb the listing.
    std::vector<std::wstring> children;
    for (std::uint32_t index = 0;; ++index) {
      auto length = std::uint32_t(nameBuffer.size());
      const long status = KRRegEnumKeyEx(key, index, nameBuffer.data(), &length);
      if (status == KRERROR_NO_MORE_ITEMS)
        break;
      if (status != KRERROR_SUCCESS)
        return false;
      children.emplace_back(nameBuffer.data(), length);
    }
    for (const std::wstring& child : children)
      if (!WriteKey(path, key, child.data(), child.size(), depth + 1))
        return false;
    return true;
  }

  bool Flush() {
    const bool good = m_File.Write(m_Text.data(), m_Text.size());
    m_Text.clear();
    return good;
  }

  // Text is gathered and written in pieces of about this size (64 KiB: a
  // few system calls per thousand values, little memory).
  static constexpr std::size_t kFlushSize = 64 * 1024;

  SKRReplacementFile m_File;
  std::string m_Text;
};

}  // namespace

bool CKRRegistry::WriteRegistryTreeToFile(HKEY root, const wchar_t* subkey, const wchar_t* file) {
  std::string native;
  if (root == nullptr || subkey == nullptr || subkey[0] == L'\0' || file == nullptr ||
      !SKRNativePath::ToNative(file, native))
    return false;
  const char* rootName = "UNKNOWN";
  for (const SKRRootName& entry : kRootNames)
    if (entry.m_hKey == root)
      rootName = entry.m_pName;
  CKRRegistryExport writer;
  if (!writer.Begin(native.c_str()))
    return false;
  writer.Append("REGEDIT4\r\n");
  return writer.WriteKey(rootName, root, subkey, std::wcslen(subkey), 1) && writer.Commit();
}

bool CKRRegistry::WriteRegistryTreeToFile(const wchar_t* keyPath, const wchar_t* file) {
  if (keyPath == nullptr || keyPath[0] == L'\0' || file == nullptr || file[0] == L'\0')
    return false;
  const wchar_t* slash = std::wcschr(keyPath, L'\\');
  if (slash == nullptr)
    return false;
  static const struct {
    const wchar_t* m_pName;
    HKEY m_hKey;
  } kNames[] = {
      {L"HKEY_CLASSES_ROOT", HKEY_CLASSES_ROOT},   {L"HKCR", HKEY_CLASSES_ROOT},
      {L"HKEY_CURRENT_USER", HKEY_CURRENT_USER},   {L"HKCU", HKEY_CURRENT_USER},
      {L"HKEY_LOCAL_MACHINE", HKEY_LOCAL_MACHINE}, {L"HKLM", HKEY_LOCAL_MACHINE},
      {L"HKEY_CURRENT_CONFIG", HKEY_CURRENT_CONFIG}, {L"HKCC", HKEY_CURRENT_CONFIG},
      {L"HKEY_USERS", HKEY_USERS},                 {L"HKU", HKEY_USERS},
      {L"HKEY_PERFORMANCE_DATA", HKEY_PERFORMANCE_DATA}, {L"HKPD", HKEY_PERFORMANCE_DATA},
      {L"HKEY_DYN_DATA", HKEY_DYN_DATA},           {L"HKDD", HKEY_DYN_DATA},
  };
  // The whole first part must be the name: a bare prefix (even an empty
  // one) would pick the first root it begins.
  const auto length = std::size_t(slash - keyPath);
  for (const auto& entry : kNames)
    if (std::wcslen(entry.m_pName) == length && std::wcsncmp(keyPath, entry.m_pName, length) == 0)
      return WriteRegistryTreeToFile(entry.m_hKey, slash + 1, file);
  return false;
}
