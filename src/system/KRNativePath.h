// Wide paths and names to the system's UTF-8 names, and back.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <string>
#include <string_view>

struct SKRNativePath {
  // Longest file name the system takes, in bytes, without the terminator
  // (PATH_MAX, 4096, counts the terminator).
  static constexpr std::size_t kMaxBytes = 4095;

  // The exact UTF-8 form of a text of any length. False for an embedded NUL
  // and for a character without a UTF-8 form (a lone surrogate or a value
  // above U+10FFFF): conversion would silently replace it, so that distinct
  // texts would become one name.
  static bool ToUtf8(std::wstring_view text, std::string& utf8);
  // The UTF-8 form of a path: as ToUtf8, and false, naming no file, for
  // null or empty text or a result beyond kMaxBytes.
  static bool ToNative(std::wstring_view path, std::string& native);
  static bool ToNative(const wchar_t* path, std::string& native) {
    return path != nullptr && ToNative(std::wstring_view(path), native);
  }
  // The wide form of a file name; false when the bytes are not valid UTF-8
  // (the name has no exact wide form).
  static bool FromNative(std::string_view native, CKRString& path);
};
