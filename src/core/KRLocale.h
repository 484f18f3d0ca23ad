// The locale the library formats, parses and classifies text in, whatever
// locale the host process has set: "C" numbers (a "." decimal point, no
// grouping) and Unicode character classes.
#pragma once

#include <locale.h>

struct SKRLocale {
  // C.UTF-8 where the system has it, else "C". Created once, never freed.
  static locale_t Get();
};
