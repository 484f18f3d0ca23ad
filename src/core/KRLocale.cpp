#include "KRLocale.h"

#include <cstring>
#include <langinfo.h>

locale_t SKRLocale::Get() {
  static const locale_t s_Locale = [] {
    locale_t locale = newlocale(LC_ALL_MASK, "C.UTF-8", static_cast<locale_t>(nullptr));
    if (locale == static_cast<locale_t>(nullptr))
      locale = newlocale(LC_ALL_MASK, "C", static_cast<locale_t>(nullptr));
    return locale;
  }();
  return s_Locale;
}

SKRUtf8TextScope::SKRUtf8TextScope() {
  // nl_langinfo answers for the calling thread's locale.
  if (std::strcmp(nl_langinfo(CODESET), "UTF-8") == 0)
    return;
  const locale_t current = duplocale(uselocale(static_cast<locale_t>(nullptr)));
  if (current == static_cast<locale_t>(nullptr))
    return;
  m_Locale = newlocale(LC_CTYPE_MASK, "C.UTF-8", current);
  if (m_Locale == static_cast<locale_t>(nullptr)) {
    freelocale(current);
    return;
  }
  m_Previous = uselocale(m_Locale);
}

SKRUtf8TextScope::~SKRUtf8TextScope() {
  if (m_Locale == static_cast<locale_t>(nullptr))
    return;
  uselocale(m_Previous);
  freelocale(m_Locale);
}
