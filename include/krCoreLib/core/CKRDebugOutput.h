// CKRDebugOutput: the library's developer diagnostics channel.
//
// Diagnostics (for example the warning that a type still held instances when
// it was released) are texts for developers; they never change a result. By
// default they are discarded. A host switches them on by installing a
// handler: its own, or StandardError to print them. Thread-safe: handlers
// may be installed and texts written from any thread; a handler is called
// under the channel's lock, one text at a time, and must not write to the
// channel itself.
#pragma once

#include <krCoreLib/core/CKRString.h>

class KRCORELIB_API CKRDebugOutput {
public:
  using Handler = void (*)(const wchar_t* text, void* context);

  // Installs `handler` (null switches the output off) and returns the one it
  // replaces.
  static Handler SetHandler(Handler handler, void* context = nullptr);
  static bool IsEnabled() noexcept;

  // Hands `text` to the handler, if one is installed.
  static void Write(const wchar_t* text);
  // Formats (CKRString dialect) only when a handler is installed.
  static void Printf(const wchar_t* format, ...);

  // A ready-made handler that writes the text to the standard error stream
  // as UTF-8.
  static void StandardError(const wchar_t* text, void* context);
};
