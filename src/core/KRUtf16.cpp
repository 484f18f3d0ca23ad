#include "KRUtf16.h"

static_assert(sizeof(wchar_t) == 4, "wide strings hold UTF-32 on this platform");

namespace {

constexpr char16_t kReplacement = 0xFFFD;

bool IsHighSurrogate(char32_t value) {
  return value >= 0xD800 && value <= 0xDBFF;
}
bool IsLowSurrogate(char32_t value) {
  return value >= 0xDC00 && value <= 0xDFFF;
}

}  // namespace

void SKRUtf16::Decode(std::u16string_view text, std::wstring& out) {
  out.reserve(out.size() + text.size());
  for (std::size_t i = 0; i < text.size(); ++i) {
    const char32_t unit = text[i];
    if (IsHighSurrogate(unit) && i + 1 < text.size() && IsLowSurrogate(text[i + 1])) {
      // 0x10000 + 10 bits from each half (the UTF-16 definition).
      out += wchar_t(0x10000 + ((unit - 0xD800) << 10) + (char32_t(text[i + 1]) - 0xDC00));
      ++i;
    } else if (IsHighSurrogate(unit) || IsLowSurrogate(unit)) {
      out += wchar_t(kReplacement);
    } else {
      out += wchar_t(unit);
    }
  }
}

void SKRUtf16::Encode(std::wstring_view text, std::u16string& out) {
  out.reserve(out.size() + text.size());
  for (const wchar_t character : text) {
    const char32_t value = static_cast<char32_t>(character);
    if (IsHighSurrogate(value) || IsLowSurrogate(value) || value > 0x10FFFF) {
      out += kReplacement;
    } else if (value >= 0x10000) {
      out += char16_t(0xD800 + ((value - 0x10000) >> 10));
      out += char16_t(0xDC00 + ((value - 0x10000) & 0x3FF));
    } else {
      out += char16_t(value);
    }
  }
}

std::size_t SKRUtf16::DecodeTerminated(const void* bytes, std::size_t size, std::wstring& out) {
  const auto* data = static_cast<const unsigned char*>(bytes);
  std::u16string units;
  units.reserve(size / 2);
  std::size_t taken = 0;
  while (taken + 1 < size) {
    const auto unit = char16_t(data[taken] | (data[taken + 1] << 8));
    taken += 2;
    if (unit == u'\0') {
      Decode(units, out);
      return taken;
    }
    units.push_back(unit);
  }
  Decode(units, out);
  return size;
}
