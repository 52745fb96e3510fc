// Locales of the C runtime that do not depend on the process's own setting.
#pragma once

#include <locale.h>

namespace peru {

locale_t getUnicodeLocale(); // case and character classes of all of Unicode
locale_t getPlainLocale();   // "C": the point is the decimal separator
// The character set that the environment had on the first call (LC_ALL, LC_CTYPE, LANG). UTF-8 if it names a
// locale that is not installed, and in place of pure ASCII, which it includes.
locale_t getCodePageLocale();

// Makes a locale current on this thread for the scope.
class CLocaleScope {
public:
    explicit CLocaleScope(locale_t locale) : m_previous(uselocale(locale)) {}
    ~CLocaleScope() { uselocale(m_previous); }
    CLocaleScope(const CLocaleScope&) = delete;
    CLocaleScope& operator=(const CLocaleScope&) = delete;

private:
    locale_t m_previous;
};

} // namespace peru
