#include "peru/strings/RuntimeLocale.h"

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

} // namespace peru
