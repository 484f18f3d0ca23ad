// UTF-16 <-> wide-string (UTF-32) transcoding, for libraries that speak
// UTF-16 at their boundary (the XML library's XMLCh, the registry).
#pragma once

#include <cstddef>
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

  // Stored texts (the registry's string data): little-endian UTF-16 bytes
  // ending in a null unit. Appends the encoded text and the null unit to a
  // byte container (std::string, std::vector<std::uint8_t>).
  template <class TBytes>
  static void EncodeTerminated(std::wstring_view text, TBytes& out) {
    std::u16string units;
    Encode(text, units);
    units.push_back(u'\0');
    out.reserve(out.size() + 2 * units.size());
    for (const char16_t unit : units) {
      out.push_back(static_cast<typename TBytes::value_type>(unit & 0xFF));
      out.push_back(static_cast<typename TBytes::value_type>(unit >> 8));
    }
  }
  // Appends the text of `size` such bytes up to the first null unit, or of
  // all of them when there is none; a stray odd last byte is no character.
  // Returns the bytes taken, the null unit included.
  static std::size_t DecodeTerminated(const void* bytes, std::size_t size, std::wstring& out);
};
