// The locale the library formats, parses and classifies text in, whatever
// locale the host process has set: "C" numbers (a "." decimal point, no
// grouping) and Unicode character classes.
#pragma once

#include <locale.h>

struct SKRLocale {
  // C.UTF-8 where the system has it, else "C". Created once, never freed.
  static locale_t Get();
};

// While it lives, the calling thread reads narrow text as UTF-8: its locale
// keeps every category but the character type, which becomes C.UTF-8. Does
// nothing when the thread's locale reads UTF-8 already (or when C.UTF-8 is
// missing). A program that never called setlocale runs in "C", which refuses
// every byte above 0x7F.
class SKRUtf8TextScope {
public:
  SKRUtf8TextScope();
  ~SKRUtf8TextScope();
  SKRUtf8TextScope(const SKRUtf8TextScope&) = delete;
  SKRUtf8TextScope& operator=(const SKRUtf8TextScope&) = delete;

private:
  locale_t m_Locale = static_cast<locale_t>(nullptr);
  locale_t m_Previous = static_cast<locale_t>(nullptr);
};
