// CKRString: the library's wide string.
//
// A value class over std::wstring (wchar_t, UTF-32 on this platform). It may
// hold embedded NUL characters; GetString() is always NUL-terminated.
// Conversions to and from narrow text use UTF-8, the multibyte encoding of
// the system; malformed UTF-8 becomes U+FFFD, never a crash or an overread.
//
// Formatting follows the printf dialect of the library's texts: in a format,
// "%s" and "%c" take a wide string and a wide character; "%hs", "%S" and
// "%hc", "%C" take narrow ones; "%ls"/"%ws" are wide as well; "%I64d" is a
// 64-bit integer. Thread safety: as std::wstring (distinct objects may be
// used from different threads).
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <cstdarg>
#include <cstddef>
#include <functional>
#include <string>
#include <string_view>

class KRCORELIB_API CKRString {
public:
  CKRString() noexcept = default;
  // A null pointer gives the empty string.
  CKRString(const wchar_t* text);
  CKRString(const wchar_t* text, std::size_t length);
  CKRString(std::wstring text) noexcept : m_Text(std::move(text)) {}
  CKRString(std::wstring_view text) : m_Text(text) {}
  CKRString(std::size_t count, wchar_t character) : m_Text(count, character) {}

  // UTF-8 in and out. A length of -1 reads up to the terminating NUL (which
  // is not part of the result); any other negative length gives the empty
  // string; a null pointer gives the empty string.
  static CKRString FromUtf8(const char* text, std::ptrdiff_t length = -1);
  static CKRString FromUtf8(std::string_view text);
  static std::string ToUtf8(const wchar_t* text, std::ptrdiff_t length = -1);
  std::string ToUtf8() const;

  int GetLength() const noexcept { return static_cast<int>(m_Text.size()); }
  std::size_t size() const noexcept { return m_Text.size(); }
  bool IsEmpty() const noexcept { return m_Text.empty(); }
  void Empty() noexcept { m_Text.clear(); }

  const wchar_t* GetString() const noexcept { return m_Text.c_str(); }
  const wchar_t* c_str() const noexcept { return m_Text.c_str(); }
  const std::wstring& str() const noexcept { return m_Text; }
  std::wstring& str() noexcept { return m_Text; }
  operator std::wstring_view() const noexcept { return m_Text; }

  // Out-of-range indexes give L'\0'.
  wchar_t GetAt(int index) const noexcept;
  wchar_t operator[](std::size_t index) const noexcept { return m_Text[index]; }

  CKRString& operator+=(const CKRString& text) { m_Text += text.m_Text; return *this; }
  CKRString& operator+=(const wchar_t* text);
  CKRString& operator+=(wchar_t character) { m_Text += character; return *this; }

  friend CKRString operator+(CKRString left, const CKRString& right) { return left += right; }
  friend CKRString operator+(CKRString left, const wchar_t* right) { return left += right; }
  friend CKRString operator+(const wchar_t* left, const CKRString& right) { return CKRString(left) += right; }
  friend CKRString operator+(CKRString left, wchar_t right) { return left += right; }

  friend bool operator==(const CKRString& a, const CKRString& b) noexcept { return a.m_Text == b.m_Text; }
  friend bool operator==(const CKRString& a, const wchar_t* b) noexcept { return a.Compare(b) == 0; }
  friend auto operator<=>(const CKRString& a, const CKRString& b) noexcept { return a.m_Text <=> b.m_Text; }

  // Ordinal comparison; a null pointer compares as the empty string.
  int Compare(const wchar_t* text) const noexcept;
  // Comparison ignoring the case of ASCII letters.
  int CompareNoCase(const wchar_t* text) const noexcept;

  // Case mapping of ASCII letters only, so that results do not depend on the
  // process locale (identifiers, hex digits and keys are ASCII).
  CKRString& MakeUpper() noexcept;
  CKRString& MakeLower() noexcept;

  // Substrings; counts and positions beyond the ends are clamped.
  CKRString Left(int count) const;
  CKRString Right(int count) const;
  CKRString Mid(int first, int count = -1) const;
  // Position of the first occurrence at or after `start`, or -1.
  int Find(const wchar_t* text, int start = 0) const noexcept;
  int Find(wchar_t character, int start = 0) const noexcept;
  // Replaces every occurrence of `from` (non-empty) and returns the count.
  int Replace(const wchar_t* from, const wchar_t* to);
  CKRString& Trim();

  // printf-style formatting in the dialect described above. Narrow text
  // arguments are UTF-8 whatever the locale (also in a program that never
  // called setlocale). A format that the C library rejects, or narrow text
  // that is not UTF-8, leaves what was produced before the error.
  void Format(const wchar_t* format, ...);
  void FormatV(const wchar_t* format, std::va_list arguments);
  void AppendFormat(const wchar_t* format, ...);
  static CKRString Formatted(const wchar_t* format, ...);

  // The same, with numbers written as in the "C" locale ("1.5", no
  // grouping) whatever the process locale: for the text forms that stores
  // write and read back. Thread-safe.
  void FormatInvariantV(const wchar_t* format, std::va_list arguments);
  static CKRString FormattedInvariant(const wchar_t* format, ...);

  // Numbers read as the C library's wtof/wtoi read them, in the "C" locale:
  // leading white space is skipped, the longest number prefix is read, and
  // a text without one gives 0. ToInt saturates at the limits of int. A null
  // pointer gives 0.
  static double ToDouble(const wchar_t* text) noexcept;
  static int ToInt(const wchar_t* text) noexcept;

  // Unicode character classes, independent of the process locale.
  static bool IsAlpha(wchar_t character) noexcept;
  static bool IsAlnum(wchar_t character) noexcept;
  static bool IsSpace(wchar_t character) noexcept;

private:
  std::wstring m_Text;
};

template <>
struct std::hash<CKRString> {
  std::size_t operator()(const CKRString& text) const noexcept {
    return std::hash<std::wstring>()(text.str());
  }
};
