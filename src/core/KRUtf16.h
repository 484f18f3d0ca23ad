// UTF-16 <-> wide-string (UTF-32) transcoding, for libraries that speak
// UTF-16 at their boundary (the XML library's XMLCh, the registry).
#pragma once

#include <string>
#include <string_view>

struct SKRUtf16 {
  // Appends the decoded text. An unpaired surrogate becomes U+FFFD, so the
  // result never holds a value that has no UTF-8 form.
  static void Decode(std::u16string_view text, std::wstring& out);
  // Appends the encoded text: values above U+FFFF as surrogate pairs;
  // surrogates and values above U+10FFFF, which are not characters, as
  // U+FFFD.
  static void Encode(std::wstring_view text, std::u16string& out);
};
