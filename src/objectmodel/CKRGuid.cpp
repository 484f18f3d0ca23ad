#include <krCoreLib/objectmodel/CKRGuid.h>

#include "KRBase64.h"
#include "SKRRandomSource.h"

#include <new>

namespace {

constexpr char kLowerDigits[] = "0123456789abcdef";
constexpr char kUpperDigits[] = "0123456789ABCDEF";
constexpr std::size_t kCanonicalLength = 36;
constexpr std::size_t kXML64Length = 22;
// Prefix of the ADO hex form (a binary-literal marker of that format).
constexpr char kADOHexPrefix[] = "80e00a01";

// The 16 bytes of the value in memory order of the little-endian structure,
// as stored in the byte-oriented text forms.
void ToMemoryImage(const GUID& guid, unsigned char (&bytes)[16]) {
  for (int i = 0; i < 4; ++i)
    bytes[i] = static_cast<unsigned char>(guid.Data1 >> (8 * i));
  for (int i = 0; i < 2; ++i) {
    bytes[4 + i] = static_cast<unsigned char>(guid.Data2 >> (8 * i));
    bytes[6 + i] = static_cast<unsigned char>(guid.Data3 >> (8 * i));
  }
  for (int i = 0; i < 8; ++i)
    bytes[8 + i] = guid.Data4[i];
}

GUID FromMemoryImage(const unsigned char (&bytes)[16]) {
  GUID guid{};
  for (int i = 0; i < 4; ++i)
    guid.Data1 |= std::uint32_t(bytes[i]) << (8 * i);
  guid.Data2 = std::uint16_t(bytes[4] | (bytes[5] << 8));
  guid.Data3 = std::uint16_t(bytes[6] | (bytes[7] << 8));
  for (int i = 0; i < 8; ++i)
    guid.Data4[i] = bytes[8 + i];
  return guid;
}

// Writes the 36-character canonical text (8-4-4-4-12 hex digits).
template <class Char>
void WriteCanonical(const GUID& guid, Char* out, const char* digits) {
  auto hex = [&](std::uint64_t value, int count) {
    for (int i = count - 1; i >= 0; --i)
      *out++ = Char(digits[(value >> (4 * i)) & 15]);
  };
  hex(guid.Data1, 8);
  *out++ = Char('-');
  hex(guid.Data2, 4);
  *out++ = Char('-');
  hex(guid.Data3, 4);
  *out++ = Char('-');
  hex(guid.Data4[0], 2);
  hex(guid.Data4[1], 2);
  *out++ = Char('-');
  for (int i = 2; i < 8; ++i)
    hex(guid.Data4[i], 2);
}

// Value of a hex digit in either case, or -1 (also for every character
// beyond ASCII, whatever its width).
int HexValue(wchar_t character) {
  if (character >= L'0' && character <= L'9')
    return character - L'0';
  if (character >= L'a' && character <= L'f')
    return character - L'a' + 10;
  if (character >= L'A' && character <= L'F')
    return character - L'A' + 10;
  return -1;
}

// Reads `count` hex digits into the bytes at `out` (two digits a byte).
bool ReadHexBytes(const wchar_t* text, std::size_t count, unsigned char* out) {
  for (std::size_t i = 0; i < count; i += 2) {
    const int high = HexValue(text[i]);
    const int low = HexValue(text[i + 1]);
    if ((high | low) < 0)
      return false;
    *out++ = static_cast<unsigned char>((high << 4) | low);
  }
  return true;
}

// Parses exactly kCanonicalLength characters of canonical text.
bool ParseCanonical(const wchar_t* text, GUID& guid) {
  if (text[8] != L'-' || text[13] != L'-' || text[18] != L'-' || text[23] != L'-')
    return false;
  // The digits of the five groups are the 16 bytes most significant first.
  unsigned char be[16];
  if (!ReadHexBytes(text, 8, be) || !ReadHexBytes(text + 9, 4, be + 4) || !ReadHexBytes(text + 14, 4, be + 6) ||
      !ReadHexBytes(text + 19, 4, be + 8) || !ReadHexBytes(text + 24, 12, be + 10))
    return false;
  guid.Data1 = (std::uint32_t(be[0]) << 24) | (std::uint32_t(be[1]) << 16) | (std::uint32_t(be[2]) << 8) | be[3];
  guid.Data2 = std::uint16_t((be[4] << 8) | be[5]);
  guid.Data3 = std::uint16_t((be[6] << 8) | be[7]);
  for (int i = 0; i < 8; ++i)
    guid.Data4[i] = be[8 + i];
  return true;
}

BSTR AllocOrThrow(const std::wstring_view text) {
  BSTR result = SysAllocStringLen(text.data(), static_cast<unsigned int>(text.size()));
  if (result == nullptr)
    throw std::bad_alloc();
  return result;
}

std::wstring_view ViewOf(BSTR text) {
  return text == nullptr ? std::wstring_view() : std::wstring_view(text, SysStringLen(text));
}

}  // namespace

CKRGuid::CKRGuid(const wchar_t* text) : m_Guid{} {
  if (text != nullptr)
    ParseBraced(text, std::wcslen(text));
}

CKRGuid CKRGuid::CreateNewGUID() {
  GUID guid;
  SKRRandomSource::NewUuid(guid);
  return CKRGuid(guid);
}

// ---- text out ----------------------------------------------------------------

CKRString CKRGuid::GetCString() const {
  std::wstring text(kCanonicalLength + 2, L'{');
  WriteCanonical(m_Guid, &text[1], kLowerDigits);
  text.back() = L'}';
  return CKRString(std::move(text));
}

std::wstring CKRGuid::GetSTLString() const {
  return std::move(GetCString().str());
}

BSTR CKRGuid::GetBString() const {
  return AllocOrThrow(GetCString());
}

CKRString CKRGuid::GetCStringUpperCase() const {
  std::wstring text(kCanonicalLength + 2, L'{');
  WriteCanonical(m_Guid, &text[1], kUpperDigits);
  text.back() = L'}';
  return CKRString(std::move(text));
}

std::wstring CKRGuid::GetSTLStringSQL() const {
  std::wstring text(kCanonicalLength, L'\0');
  WriteCanonical(m_Guid, text.data(), kLowerDigits);
  return text;
}

CKRString CKRGuid::GetCStringHex() const {
  std::wstring text = GetSTLStringSQL();
  std::erase(text, L'-');
  return CKRString(std::move(text));
}

BSTR CKRGuid::GetBStringHex() const {
  return AllocOrThrow(GetCStringHex());
}

std::wstring CKRGuid::GetSTLStringADOHex() const {
  unsigned char bytes[16];
  ToMemoryImage(m_Guid, bytes);
  std::wstring text(kADOHexPrefix, kADOHexPrefix + 8);
  for (const unsigned char byte : bytes) {
    text += wchar_t(kLowerDigits[byte >> 4]);
    text += wchar_t(kLowerDigits[byte & 15]);
  }
  return text;
}

CKRString CKRGuid::GetCStringXML() const {
  return CKRString(GetSTLStringXML());
}

std::wstring CKRGuid::GetSTLStringXML() const {
  std::wstring text = L"GUID_";
  text.resize(5 + kCanonicalLength);
  WriteCanonical(m_Guid, &text[5], kLowerDigits);
  return text;
}

BSTR CKRGuid::GetBStringXML() const {
  return AllocOrThrow(GetSTLStringXML());
}

CKRString CKRGuid::GetCStringXML64() const {
  unsigned char bytes[16];
  ToMemoryImage(m_Guid, bytes);
  std::wstring text;
  text.reserve(24);
  SKRBase64::Encode(bytes, sizeof bytes, [&](char c) { text += wchar_t(c); });
  // 16 bytes are 22 significant characters; the "==" padding is dropped.
  text.resize(kXML64Length);
  return CKRString(std::move(text));
}

CKRString CKRGuid::GetCStringXML64WS() const {
  unsigned char bytes[16];
  ToMemoryImage(m_Guid, bytes);
  std::string narrow = Encode64(bytes, sizeof bytes);
  narrow.resize(kXML64Length);
  return toWideString(narrow.c_str());
}

BSTR CKRGuid::GetBStringXML64() const {
  return AllocOrThrow(GetCStringXML64());
}

BSTR CKRGuid::GetBStringXML64WS() const {
  return AllocOrThrow(GetCStringXML64WS());
}

CKRString CKRGuid::GetCStringXMLElement() const {
  return L"_" + GetCStringXML64();
}

// ---- text in -----------------------------------------------------------------

bool CKRGuid::ParseBraced(const wchar_t* text, std::size_t length) noexcept {
  // The first and last characters are dropped whatever they are.
  if (length <= 10 || length != kCanonicalLength + 2)
    return false;
  GUID guid;
  if (!ParseCanonical(text + 1, guid))
    return false;
  m_Guid = guid;
  return true;
}

bool CKRGuid::ParseXML(const wchar_t* text, std::size_t length) noexcept {
  // The first five characters (normally "GUID_") are dropped unread.
  if (length <= 10 || length != kCanonicalLength + 5)
    return false;
  GUID guid;
  if (!ParseCanonical(text + 5, guid))
    return false;
  m_Guid = guid;
  return true;
}

bool CKRGuid::ParseXML64(const wchar_t* text, std::size_t length) noexcept {
  if (length == kXML64Length) {
    // Strict: a character outside the alphabet would shift every following
    // bit, so such a text is rejected rather than decoded into garbage.
    for (std::size_t i = 0; i < length; ++i)
      if (SKRBase64::ValueOf(text[i]) < 0)
        return false;
    unsigned char bytes[16];
    std::size_t count = 0;
    SKRBase64::Decode(text, length, [&](unsigned char byte) {
      if (count < sizeof bytes)
        bytes[count++] = byte;
    });
    if (count != sizeof bytes)
      return false;
    m_Guid = FromMemoryImage(bytes);
    return true;
  }
  if (length == 32) {
    // The hex form: hyphens go after the 8th, 12th, 16th and 20th digit.
    wchar_t canonical[kCanonicalLength];
    std::size_t at = 0;
    for (std::size_t i = 0; i < 32; ++i) {
      if (i == 8 || i == 12 || i == 16 || i == 20)
        canonical[at++] = L'-';
      canonical[at++] = text[i];
    }
    GUID guid;
    if (!ParseCanonical(canonical, guid))
      return false;
    m_Guid = guid;
    return true;
  }
  if (length == kCanonicalLength + 5)
    return ParseXML(text, length);
  return false;
}

void CKRGuid::SetSTLString(const std::wstring& text) noexcept {
  ParseBraced(text.data(), text.size());
}

void CKRGuid::SetCString(const CKRString& text) noexcept {
  ParseBraced(text.GetString(), text.size());
}

bool CKRGuid::ReadCString(const CKRString& text) noexcept {
  return ParseBraced(text.GetString(), text.size());
}

void CKRGuid::SetBString(BSTR text) noexcept {
  const std::wstring_view view = ViewOf(text);
  ParseBraced(view.data(), view.size());
}

void CKRGuid::SetSTLStringXML(const std::wstring& text) noexcept {
  ParseXML(text.data(), text.size());
}

void CKRGuid::SetCStringXML(const CKRString& text) noexcept {
  ParseXML(text.GetString(), text.size());
}

void CKRGuid::SetBStringXML(BSTR text) noexcept {
  const std::wstring_view view = ViewOf(text);
  ParseXML(view.data(), view.size());
}

void CKRGuid::SetCStringXML64(const CKRString& text) noexcept {
  ParseXML64(text.GetString(), text.size());
}

void CKRGuid::SetBStringXML64(BSTR text) noexcept {
  const std::wstring_view view = ViewOf(text);
  ParseXML64(view.data(), view.size());
}

void CKRGuid::SetCStringXMLElement(const CKRString& text) noexcept {
  if (text.size() == kXML64Length + 1)
    ParseXML64(text.GetString() + 1, kXML64Length);
}

void CKRGuid::SetSTLStringADOHex(const std::wstring& text) noexcept {
  if (text.size() != 8 + 32)
    return;
  for (std::size_t i = 0; i < 8; ++i)
    if (HexValue(text[i]) != HexValue(wchar_t(kADOHexPrefix[i])))
      return;
  unsigned char bytes[16];
  if (ReadHexBytes(text.data() + 8, 32, bytes))
    m_Guid = FromMemoryImage(bytes);
}

// ---- conversions and base64 --------------------------------------------------

CKRString CKRGuid::toWideString(const char* text, int length) {
  return CKRString::FromUtf8(text, length);
}

std::string CKRGuid::toNarrowString(const wchar_t* text, int length) {
  return CKRString::ToUtf8(text, length);
}

std::string CKRGuid::Encode64(const unsigned char* data, std::size_t size) {
  std::string text;
  if (data != nullptr)
    SKRBase64::Encode(data, size, [&](char c) { text += c; });
  return text;
}

std::vector<unsigned char> CKRGuid::Decode64(const char* text, std::size_t length) {
  std::vector<unsigned char> bytes;
  if (text != nullptr)
    SKRBase64::Decode(text, length, [&](unsigned char byte) { bytes.push_back(byte); });
  return bytes;
}

CKRString CKRGuid::Encode64WS(const unsigned char* data, std::size_t size) {
  return toWideString(Encode64(data, size).c_str());
}

std::vector<unsigned char> CKRGuid::Decode64WS(const wchar_t* text, std::size_t length) {
  std::vector<unsigned char> bytes;
  if (text != nullptr)
    SKRBase64::Decode(text, length, [&](unsigned char byte) { bytes.push_back(byte); });
  return bytes;
}
