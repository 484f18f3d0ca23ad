// Wide paths to the system's UTF-8 file names, and back.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <string>
#include <string_view>

struct SKRNativePath {
  // Longest file name the system takes, in bytes, without the terminator
  // (PATH_MAX, 4096, counts the terminator).
  static constexpr std::size_t kMaxBytes = 4095;

  // The UTF-8 form of a path. False, naming no file, for null or empty
  // text, an embedded NUL, a character without a UTF-8 form (a lone
  // surrogate or a value above U+10FFFF, which conversion would silently
  // replace and so name another file) or a result beyond kMaxBytes.
  static bool ToNative(std::wstring_view path, std::string& native);
  static bool ToNative(const wchar_t* path, std::string& native) {
    return path != nullptr && ToNative(std::wstring_view(path), native);
  }
  // The wide form of a file name; false when the bytes are not valid UTF-8
  // (the name has no exact wide form).
  static bool FromNative(std::string_view native, CKRString& path);
};
