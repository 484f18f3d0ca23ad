#include "KRNativePath.h"

#include <cstdint>

bool SKRNativePath::ToUtf8(std::wstring_view text, std::string& utf8) {
  utf8.clear();
  for (const wchar_t c : text) {
    const auto value = static_cast<std::uint32_t>(c);
    if (value == 0 || value > 0x10FFFF || (value >= 0xD800 && value <= 0xDFFF))
      return false;
  }
  utf8 = CKRString::ToUtf8(text.data(), static_cast<std::ptrdiff_t>(text.size()));
  return true;
}

bool SKRNativePath::ToNative(std::wstring_view path, std::string& native) {
  native.clear();
  if (path.empty() || path.size() > kMaxBytes || !ToUtf8(path, native))
    return false;
  if (native.size() > kMaxBytes) {
    native.clear();
    return false;
  }
  return true;
}

bool SKRNativePath::FromNative(std::string_view native, CKRString& path) {
  path = CKRString::FromUtf8(native);
  // Decoding replaces ill-formed bytes with U+FFFD; the round trip tells
  // whether anything was replaced.
  return path.ToUtf8() == native;
}
