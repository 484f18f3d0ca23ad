#include "KRLocale.h"

locale_t SKRLocale::Get() {
  static const locale_t s_Locale = [] {
    locale_t locale = newlocale(LC_ALL_MASK, "C.UTF-8", static_cast<locale_t>(nullptr));
    if (locale == static_cast<locale_t>(nullptr))
      locale = newlocale(LC_ALL_MASK, "C", static_cast<locale_t>(nullptr));
    return locale;
  }();
  return s_Locale;
}
