// CKRGuid: the 128-bit identifier of types, interfaces, fields, repositories,
// documents and object instances.
//
// A small value class: copying copies 16 bytes, comparisons work field by
// field, and neither allocates. The total order (operator<) is the order of
// every GUID-keyed map in the library; it equals the lexicographic order of
// the lower-case canonical text. Text forms allocate and are meant for
// storage boundaries:
//
//   braced       {3719246b-c3b0-4ae9-9723-6e998c42484a}
//   SQL          3719246b-c3b0-4ae9-9723-6e998c42484a
//   hex          3719246bc3b04ae997236e998c42484a
//   ADO hex      80e00a01 + the 16 bytes in memory order as hex
//   XML          GUID_3719246b-c3b0-4ae9-9723-6e998c42484a
//   XML64        the 16 bytes in memory order, URL-safe base64, 22 characters
//   XML element  "_" + XML64, usable as an XML element name
//
// No operation throws except the BSTR getters, which throw std::bad_alloc
// when memory is exhausted. Setters leave the value unchanged when they
// reject a text; they read exactly the characters of the given string (which
// may contain NULs) and never beyond. Not synchronised: a value is used from
// one thread at a time; CreateNewGUID may be called from any thread.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/platform/KRBStr.h>
#include <krCoreLib/platform/KRGuidDef.h>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

class KRCORELIB_API CKRGuid {
public:
  constexpr CKRGuid() noexcept : m_Guid{} {}
  constexpr CKRGuid(const GUID& guid) noexcept : m_Guid(guid) {}
  constexpr CKRGuid(const CKRGuid& other) noexcept = default;
  // Starts null and parses the braced form (SetSTLString); null text or a
  // text that does not parse leaves the value null.
  explicit CKRGuid(const wchar_t* text);
  constexpr virtual ~CKRGuid() {}

  constexpr CKRGuid& operator=(const CKRGuid& other) noexcept = default;
  constexpr CKRGuid& operator=(const GUID& guid) noexcept {
    m_Guid = guid;
    return *this;
  }

  // A compile-time constant from its canonical text, braced or not, in
  // either case: CKRGuid::Literal("{3719246B-C3B0-4AE9-9723-6E998C42484A}").
  // A malformed text does not compile.
  template <std::size_t N>
  static consteval CKRGuid Literal(const char (&text)[N]) {
    static_assert(N == 37 || N == 39, "a GUID literal has 36 digits and hyphens, optionally in braces");
    const char* digits = (N == 39) ? text + 1 : text;
    if (N == 39 && (text[0] != '{' || text[37] != '}'))
      throw "GUID literal: braces expected";
    GUID guid{};
    auto nibble = [](char c) -> unsigned {
      if (c >= '0' && c <= '9') return unsigned(c - '0');
      if (c >= 'a' && c <= 'f') return unsigned(c - 'a' + 10);
      if (c >= 'A' && c <= 'F') return unsigned(c - 'A' + 10);
      throw "GUID literal: hex digit expected";
    };
    auto hex = [&](int first, int count) {
      unsigned long long value = 0;
      for (int i = first; i < first + count; ++i)
        value = (value << 4) | nibble(digits[i]);
      return value;
    };
    if (digits[8] != '-' || digits[13] != '-' || digits[18] != '-' || digits[23] != '-')
      throw "GUID literal: hyphens expected";
    guid.Data1 = std::uint32_t(hex(0, 8));
    guid.Data2 = std::uint16_t(hex(9, 4));
    guid.Data3 = std::uint16_t(hex(14, 4));
    guid.Data4[0] = std::uint8_t(hex(19, 2));
    guid.Data4[1] = std::uint8_t(hex(21, 2));
    for (int i = 0; i < 6; ++i)
      guid.Data4[2 + i] = std::uint8_t(hex(24 + 2 * i, 2));
    return CKRGuid(guid);
  }

  // A fresh random (version 4) GUID. Thread-safe; values are never repeated
  // in a forked child.
  static CKRGuid CreateNewGUID();

  void SetEmpty() noexcept { m_Guid = GUID{}; }
  // Copies the value out into `guid` (the object is not changed).
  void SetGUID(GUID& guid) const noexcept { guid = m_Guid; }
  constexpr const GUID& GetGUID() const noexcept { return m_Guid; }

  int IsValid() const noexcept { return IsNull() ? 0 : 1; }
  int IsNull() const noexcept {
    return (m_Guid.Data1 | m_Guid.Data2 | m_Guid.Data3 | Data4Word()) == 0 ? 1 : 0;
  }

  bool operator==(const CKRGuid& other) const noexcept { return Equals(other.m_Guid); }
  bool operator==(const GUID& other) const noexcept { return Equals(other); }
  // True exactly when the value is null; the integer is not consulted
  // (callers write `id == 0`).
  bool operator==(int) const noexcept { return IsNull() != 0; }
  bool operator!=(const CKRGuid& other) const noexcept { return !Equals(other.m_Guid); }
  bool operator!=(const GUID& other) const noexcept { return !Equals(other); }
  bool operator!=(int) const noexcept { return IsNull() == 0; }
  bool operator<(const CKRGuid& other) const noexcept { return Compare(other) < 0; }
  bool operator>(const CKRGuid& other) const noexcept { return Compare(other) > 0; }
  // -1, 0 or 1 in the order described above.
  int Compare(const CKRGuid& other) const noexcept {
    const GUID& a = m_Guid;
    const GUID& b = other.m_Guid;
    if (a.Data1 != b.Data1)
      return a.Data1 < b.Data1 ? -1 : 1;
    if (a.Data2 != b.Data2)
      return a.Data2 < b.Data2 ? -1 : 1;
    if (a.Data3 != b.Data3)
      return a.Data3 < b.Data3 ? -1 : 1;
    const int order = std::memcmp(a.Data4, b.Data4, sizeof a.Data4);
    return order < 0 ? -1 : (order > 0 ? 1 : 0);
  }

  // Text forms.
  CKRString GetCString() const;
  std::wstring GetSTLString() const;
  BSTR GetBString() const;
  CKRString GetCStringUpperCase() const;
  std::wstring GetSTLStringSQL() const;
  CKRString GetCStringHex() const;
  BSTR GetBStringHex() const;
  std::wstring GetSTLStringADOHex() const;
  CKRString GetCStringXML() const;
  std::wstring GetSTLStringXML() const;
  BSTR GetBStringXML() const;
  CKRString GetCStringXML64() const;
  CKRString GetCStringXML64WS() const;
  BSTR GetBStringXML64() const;
  BSTR GetBStringXML64WS() const;
  CKRString GetCStringXMLElement() const;

  // Braced form: a text longer than 10 characters whose first and last
  // characters are dropped and whose remaining 36 are the canonical text.
  void SetSTLString(const std::wstring& text) noexcept;
  void SetCString(const CKRString& text) noexcept;
  void SetBString(BSTR text) noexcept;
  // SetCString that tells: true when the text was read, false when it was
  // refused (the value unchanged).
  bool ReadCString(const CKRString& text) noexcept;
  // XML form: a text longer than 10 characters whose first 5 characters are
  // dropped and whose remaining 36 are the canonical text.
  void SetSTLStringXML(const std::wstring& text) noexcept;
  void SetCStringXML(const CKRString& text) noexcept;
  void SetBStringXML(BSTR text) noexcept;
  // By length: 22 characters XML64, 32 hex, 41 the XML form.
  void SetCStringXML64(const CKRString& text) noexcept;
  void SetBStringXML64(BSTR text) noexcept;
  // "_" followed by 22 characters of XML64.
  void SetCStringXMLElement(const CKRString& text) noexcept;
  // "80e00a01" (either case) followed by 32 hex digits of the memory image.
  void SetSTLStringADOHex(const std::wstring& text) noexcept;

  // Narrow (UTF-8, the system's multibyte encoding) and wide conversions.
  // A length of -1 reads up to the terminating NUL, which is not part of the
  // result; null text or any other negative length gives an empty string.
  static CKRString toWideString(const char* text, int length = -1);
  static std::string toNarrowString(const wchar_t* text, int length = -1);

protected:
  // Base64 with the URL-and-filename-safe alphabet. Encoding inserts CR LF
  // after every 76 characters and pads the last group with "=". Decoding
  // skips characters outside the alphabet, stops at the first "=" and keeps
  // the whole bytes of a trailing partial group.
  static std::string Encode64(const unsigned char* data, std::size_t size);
  static std::vector<unsigned char> Decode64(const char* text, std::size_t length);
  static CKRString Encode64WS(const unsigned char* data, std::size_t size);
  static std::vector<unsigned char> Decode64WS(const wchar_t* text, std::size_t length);

private:
  bool Equals(const GUID& other) const noexcept {
    return m_Guid.Data1 == other.Data1 && m_Guid.Data2 == other.Data2 && m_Guid.Data3 == other.Data3 &&
           std::memcmp(m_Guid.Data4, other.Data4, sizeof other.Data4) == 0;
  }
  std::uint64_t Data4Word() const noexcept {
    std::uint64_t word;
    std::memcpy(&word, m_Guid.Data4, sizeof word);
    return word;
  }
  bool ParseBraced(const wchar_t* text, std::size_t length) noexcept;
  bool ParseXML(const wchar_t* text, std::size_t length) noexcept;
  bool ParseXML64(const wchar_t* text, std::size_t length) noexcept;

  GUID m_Guid;
};

template <>
struct std::hash<CKRGuid> {
  std::size_t operator()(const CKRGuid& guid) const noexcept {
    const GUID& value = guid.GetGUID();
    std::uint64_t tail;
    std::memcpy(&tail, value.Data4, sizeof tail);
    const std::uint64_t head = (std::uint64_t(value.Data1) << 32) ^ (std::uint64_t(value.Data2) << 16) ^ value.Data3;
    // Multiplier: 2^64 divided by the golden ratio, the usual Fibonacci hash.
    return std::size_t((head * 0x9E3779B97F4A7C15ull) ^ tail);
  }
};
