// Letter case and white space.
#include "peru/strings/RuntimeLocale.h"
#include "peru/strings/StringText.h"

#include <cwctype>

namespace peru::text {

char32_t toLower(char32_t ch) {
    if (ch < 0x80) return ch >= 'A' && ch <= 'Z' ? ch + 32 : ch;
    return static_cast<char32_t>(towlower_l(static_cast<wint_t>(ch), getUnicodeLocale()));
}

char32_t toUpper(char32_t ch) {
    if (ch < 0x80) return ch >= 'a' && ch <= 'z' ? ch - 32 : ch;
    return static_cast<char32_t>(towupper_l(static_cast<wint_t>(ch), getUnicodeLocale()));
}

// The runtime's table omits the no-break spaces, which often surround pasted text.
bool isWhiteSpace(char32_t ch) {
    if (ch < 0x80) return ch == ' ' || (ch >= 9 && ch <= 13);
    return ch == 0x85 || ch == 0xA0 || ch == 0x2007 || ch == 0x202F ||
           iswspace_l(static_cast<wint_t>(ch), getUnicodeLocale());
}

} // namespace peru::text
