#include "peru/strings/RuntimeLocale.h"

#include <cstring>
#include <langinfo.h>

namespace peru {

locale_t getPlainLocale() {
    static const locale_t plain = newlocale(LC_ALL_MASK, "C", nullptr);
    return plain;
}

locale_t getUnicodeLocale() {
    static const locale_t unicode = [] {
        locale_t found = newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
        return found ? found : getPlainLocale();
    }();
    return unicode;
}

locale_t getCodePageLocale() {
    static const locale_t codePage = [] {
        const locale_t found = newlocale(LC_CTYPE_MASK, "", nullptr);
        if (found && std::strcmp(nl_langinfo_l(CODESET, found), "ANSI_X3.4-1968") != 0) return found;
        if (found) freelocale(found);
        return getUnicodeLocale();
    }();
    return codePage;
}

} // namespace peru
