// UTF-8 <-> UTF-32 transcoding shared by the library's string conversions.
#pragma once

#include <string>
#include <string_view>

struct SKRUtf8 {
  // Appends the decoded text. Ill-formed input becomes U+FFFD per maximal
  // ill-formed subsequence (the Unicode recommendation), so the result never
  // depends on bytes beyond `text`.
  static void Decode(std::string_view text, std::wstring& out);
  // Appends the encoded text. Surrogates and values above U+10FFFF, which
  // have no UTF-8 form, are written as U+FFFD.
  static void Encode(std::wstring_view text, std::string& out);
};
