// Locales of the C runtime that do not depend on the process's own setting.
#pragma once

#include <locale.h>

namespace peru {

locale_t getUnicodeLocale(); // case and character classes of all of Unicode
locale_t getPlainLocale();   // "C": the point is the decimal separator

// Makes the plain locale current on this thread for the scope.
class CPlainLocaleScope {
public:
    CPlainLocaleScope() : m_previous(uselocale(getPlainLocale())) {}
    ~CPlainLocaleScope() { uselocale(m_previous); }
    CPlainLocaleScope(const CPlainLocaleScope&) = delete;
    CPlainLocaleScope& operator=(const CPlainLocaleScope&) = delete;

private:
    locale_t m_previous;
};

} // namespace peru
