#include <krCoreLib/core/CKRString.h>

#include "KRLocale.h"
#include "KRUtf8.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cwchar>
#include <climits>
#include <optional>
#include <cwctype>
#include <wctype.h>

namespace {

wchar_t AsciiUpper(wchar_t c) { return (c >= L'a' && c <= L'z') ? wchar_t(c - 32) : c; }
wchar_t AsciiLower(wchar_t c) { return (c >= L'A' && c <= L'Z') ? wchar_t(c + 32) : c; }

// Rewrites a format of the library's printf dialect into the C library's:
// "%s"/"%c" without a length become "%ls"/"%lc", "%S"/"%C" and "%hs"/"%hc"
// become narrow "%s"/"%c", "%ws" becomes "%ls", "%I64"/"%I32"/"%I" become
// "ll"/""/"z". Everything else is copied unchanged.
// `narrowText` tells whether a conversion takes narrow text.
std::wstring TranslateFormat(const wchar_t* format, bool& narrowText) {
  narrowText = false;
  std::wstring out;
  const std::size_t n = std::wcslen(format);
  out.reserve(n + 8);
  std::size_t i = 0;
  auto isDigit = [](wchar_t c) { return c >= L'0' && c <= L'9'; };
  while (i < n) {
    if (format[i] != L'%') {
      out += format[i++];
      continue;
    }
    out += format[i++];
    if (i < n && format[i] == L'%') {
      out += format[i++];
      continue;
    }
    // Positional argument "%N$".
    std::size_t mark = i;
    while (i < n && isDigit(format[i]))
      ++i;
    if (i < n && format[i] == L'$' && i > mark)
      out.append(format + mark, ++i - mark);
    else
      i = mark;
    while (i < n && std::wcschr(L"-+ #0'", format[i]) != nullptr)
      out += format[i++];
    while (i < n && (isDigit(format[i]) || format[i] == L'*' || format[i] == L'$'))
      out += format[i++];
    if (i < n && format[i] == L'.') {
      out += format[i++];
      while (i < n && (isDigit(format[i]) || format[i] == L'*' || format[i] == L'$'))
        out += format[i++];
    }
    // Length modifier.
    std::wstring length;
    bool narrow = false, wide = false;
    if (i + 2 < n && format[i] == L'I' && format[i + 1] == L'6' && format[i + 2] == L'4') {
      length = L"ll";
      i += 3;
    } else if (i + 2 < n && format[i] == L'I' && format[i + 1] == L'3' && format[i + 2] == L'2') {
      i += 3;
    } else if (i < n && format[i] == L'I') {
      length = L"z";
      ++i;
    } else if (i < n && format[i] == L'w') {
      wide = true;
      ++i;
    } else {
      while (i < n && std::wcschr(L"hlLqjzt", format[i]) != nullptr)
        length += format[i++];
      narrow = (length == L"h");
      wide = (length == L"l");
    }
    if (i >= n) {
      out += length;
      break;
    }
    const wchar_t conversion = format[i++];
    switch (conversion) {
    case L's':
    case L'c':
      out += narrow ? L"" : L"l";
      out += conversion;
      narrowText = narrowText || narrow;
      break;
    case L'S':
    case L'C':
      out += wide ? L"l" : L"";
      out += wchar_t(conversion == L'S' ? L's' : L'c');
      narrowText = narrowText || !wide;
      break;
    default:
      out += length;
      out += conversion;
      break;
    }
  }
  return out;
}

}  // namespace

CKRString::CKRString(const wchar_t* text) {
  if (text != nullptr)
    m_Text.assign(text);
}

CKRString::CKRString(const wchar_t* text, std::size_t length) {
  if (text != nullptr)
    m_Text.assign(text, length);
}

CKRString CKRString::FromUtf8(const char* text, std::ptrdiff_t length) {
  if (text == nullptr || length < -1)
    return CKRString();
  const std::size_t size = length == -1 ? std::char_traits<char>::length(text) : std::size_t(length);
  return FromUtf8(std::string_view(text, size));
}

CKRString CKRString::FromUtf8(std::string_view text) {
  CKRString result;
  SKRUtf8::Decode(text, result.m_Text);
  return result;
}

std::string CKRString::ToUtf8(const wchar_t* text, std::ptrdiff_t length) {
  std::string result;
  if (text == nullptr || length < -1)
    return result;
  const std::size_t size = length == -1 ? std::wcslen(text) : std::size_t(length);
  SKRUtf8::Encode(std::wstring_view(text, size), result);
  return result;
}

std::string CKRString::ToUtf8() const {
  std::string result;
  SKRUtf8::Encode(m_Text, result);
  return result;
}

wchar_t CKRString::GetAt(int index) const noexcept {
  if (index < 0 || std::size_t(index) >= m_Text.size())
    return L'\0';
  return m_Text[std::size_t(index)];
}

CKRString& CKRString::operator+=(const wchar_t* text) {
  if (text != nullptr)
    m_Text += text;
  return *this;
}

int CKRString::Compare(const wchar_t* text) const noexcept {
  const int order = m_Text.compare(text != nullptr ? text : L"");
  return order < 0 ? -1 : (order > 0 ? 1 : 0);
}

int CKRString::CompareNoCase(const wchar_t* text) const noexcept {
  if (text == nullptr)
    text = L"";
  std::size_t i = 0;
  for (;; ++i) {
    const wchar_t a = i < m_Text.size() ? AsciiLower(m_Text[i]) : L'\0';
    const wchar_t b = AsciiLower(text[i]);
    if (i >= m_Text.size() || b == L'\0')
      return (i < m_Text.size()) ? 1 : (b == L'\0' ? 0 : -1);
    if (a != b)
      return a < b ? -1 : 1;
  }
}

CKRString& CKRString::MakeUpper() noexcept {
  std::transform(m_Text.begin(), m_Text.end(), m_Text.begin(), AsciiUpper);
  return *this;
}

CKRString& CKRString::MakeLower() noexcept {
  std::transform(m_Text.begin(), m_Text.end(), m_Text.begin(), AsciiLower);
  return *this;
}

CKRString CKRString::Left(int count) const {
  // A negative count clamps to none; Mid would read it as "to the end".
  return Mid(0, std::max(count, 0));
}

CKRString CKRString::Right(int count) const {
  const int length = GetLength();
  count = std::clamp(count, 0, length);
  return Mid(length - count, count);
}

CKRString CKRString::Mid(int first, int count) const {
  const int length = GetLength();
  first = std::clamp(first, 0, length);
  const int available = length - first;
  count = (count < 0) ? available : std::min(count, available);
  return CKRString(m_Text.substr(std::size_t(first), std::size_t(count)));
}

int CKRString::Find(const wchar_t* text, int start) const noexcept {
  if (text == nullptr || start < 0 || start > GetLength())
    return -1;
  const std::size_t at = m_Text.find(text, std::size_t(start));
  return at == std::wstring::npos ? -1 : int(at);
}

int CKRString::Find(wchar_t character, int start) const noexcept {
  if (start < 0 || start > GetLength())
    return -1;
  const std::size_t at = m_Text.find(character, std::size_t(start));
  return at == std::wstring::npos ? -1 : int(at);
}

int CKRString::Replace(const wchar_t* from, const wchar_t* to) {
  if (from == nullptr || *from == L'\0')
    return 0;
  const std::wstring_view pattern(from);
  const std::wstring_view replacement(to != nullptr ? to : L"");
  std::wstring result;
  int count = 0;
  std::size_t position = 0;
  for (std::size_t hit; (hit = m_Text.find(pattern, position)) != std::wstring::npos;
       position = hit + pattern.size(), ++count) {
    result.append(m_Text, position, hit - position);
    result.append(replacement);
  }
  if (count > 0) {
    result.append(m_Text, position);
    m_Text.swap(result);
  }
  return count;
}

CKRString& CKRString::Trim() {
  auto blank = [](wchar_t c) { return IsSpace(c); };
  const auto first = std::find_if_not(m_Text.begin(), m_Text.end(), blank);
  const auto last = std::find_if_not(m_Text.rbegin(), std::make_reverse_iterator(first), blank).base();
  m_Text.assign(first, last);
  return *this;
}

void CKRString::Format(const wchar_t* format, ...) {
  std::va_list arguments;
  va_start(arguments, format);
  FormatV(format, arguments);
  va_end(arguments);
}

void CKRString::AppendFormat(const wchar_t* format, ...) {
  CKRString tail;
  std::va_list arguments;
  va_start(arguments, format);
  tail.FormatV(format, arguments);
  va_end(arguments);
  m_Text += tail.m_Text;
}

CKRString CKRString::Formatted(const wchar_t* format, ...) {
  CKRString result;
  std::va_list arguments;
  va_start(arguments, format);
  result.FormatV(format, arguments);
  va_end(arguments);
  return result;
}

void CKRString::FormatV(const wchar_t* format, std::va_list arguments) {
  m_Text.clear();
  if (format == nullptr)
    return;
  bool narrowText = false;
  const std::wstring translated = TranslateFormat(format, narrowText);
  // Narrow arguments are UTF-8 whatever the locale.
  std::optional<SKRUtf8TextScope> utf8;
  if (narrowText)
    utf8.emplace();

  // Most texts are short: one attempt into a stack buffer. vswprintf cannot
  // tell "too small" from an encoding error, so a failure falls back to a
  // growing memory stream, which can.
  wchar_t buffer[512];
  std::va_list attempt;
  va_copy(attempt, arguments);
  const int written = std::vswprintf(buffer, sizeof buffer / sizeof *buffer, translated.c_str(), attempt);
  va_end(attempt);
  if (written >= 0) {
    m_Text.assign(buffer, std::size_t(written));
    return;
  }
  wchar_t* streamed = nullptr;
  std::size_t size = 0;
  if (std::FILE* stream = open_wmemstream(&streamed, &size)) {
    std::va_list second;
    va_copy(second, arguments);
    std::vfwprintf(stream, translated.c_str(), second);
    va_end(second);
    std::fclose(stream);
  }
  if (streamed != nullptr) {
    m_Text.assign(streamed, size);
    std::free(streamed);
  }
}

void CKRString::FormatInvariantV(const wchar_t* format, std::va_list arguments) {
  // uselocale switches the calling thread only, so other threads keep
  // formatting in theirs.
  const locale_t previous = uselocale(SKRLocale::Get());
  FormatV(format, arguments);
  uselocale(previous);
}

CKRString CKRString::FormattedInvariant(const wchar_t* format, ...) {
  CKRString result;
  std::va_list arguments;
  va_start(arguments, format);
  result.FormatInvariantV(format, arguments);
  va_end(arguments);
  return result;
}

double CKRString::ToDouble(const wchar_t* text) noexcept {
  return text != nullptr ? wcstod_l(text, nullptr, SKRLocale::Get()) : 0.0;
}

int CKRString::ToInt(const wchar_t* text) noexcept {
  if (text == nullptr)
    return 0;
  const long long value = wcstoll_l(text, nullptr, 10, SKRLocale::Get());
  return int(std::clamp<long long>(value, INT_MIN, INT_MAX));
}

bool CKRString::IsAlpha(wchar_t character) noexcept {
  return iswalpha_l(static_cast<wint_t>(character), SKRLocale::Get()) != 0;
}

bool CKRString::IsAlnum(wchar_t character) noexcept {
  return iswalnum_l(static_cast<wint_t>(character), SKRLocale::Get()) != 0;
}

bool CKRString::IsSpace(wchar_t character) noexcept {
  return iswspace_l(static_cast<wint_t>(character), SKRLocale::Get()) != 0;
}
