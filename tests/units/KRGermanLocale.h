// Switches the calling thread to a German locale (decimal comma) while it
// lives, to show that text forms do not depend on the process locale.
#pragma once

#include <locale.h>

class CKRGermanLocale {
public:
  CKRGermanLocale() {
    m_Locale = newlocale(LC_ALL_MASK, "de_DE.UTF-8", static_cast<locale_t>(nullptr));
    if (m_Locale != static_cast<locale_t>(nullptr))
      m_Previous = uselocale(m_Locale);
  }
  ~CKRGermanLocale() {
    if (m_Locale != static_cast<locale_t>(nullptr)) {
      uselocale(m_Previous);
      freelocale(m_Locale);
    }
  }
  bool IsAvailable() const { return m_Locale != static_cast<locale_t>(nullptr); }

private:
  locale_t m_Locale = static_cast<locale_t>(nullptr);
  locale_t m_Previous = static_cast<locale_t>(nullptr);
};
