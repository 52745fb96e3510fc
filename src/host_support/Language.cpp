// The language of the messages, and of a host's own texts.
#include "host_support/Guard.h"
#include "peru/strings/LocalizedFormat.h"
#include "zvr_lang_manager/InstalledLanguages.h"
#include "zvr_lang_manager/LanguageManager.h"

using namespace tonewright::host_support;
using peru::CString;

namespace {

// Byte by byte, since values may be paths, which need not be UTF-8. What a value contains is not replaced
// again.
std::string fill(std::string_view text, const char* const* placeholders) {
    std::string filled;
    while (!text.empty()) {
        size_t found = std::string_view::npos;
        const char* const* next = nullptr;
        for (const char* const* each = placeholders; each && each[0] && each[1]; each += 2)
            if (const size_t at = text.find(each[0]); each[0][0] && at < found) {
                found = at;
                next = each;
            }
        filled += text.substr(0, found);
        if (!next) break;
        filled += next[1];
        text.remove_prefix(found + std::strlen(next[0]));
    }
    return filled;
}

} // namespace

int32_t TONEWRIGHT_Host_SetLanguage(const char* locale) {
    return guard(0, [&] {
        const bool isSet =
            zvr_lang::applyLocale(locale ? locale : zvr_lang::CLanguageManager::getMessageLocale());
        if (!isSet && locale)
            throw peru::CError(
                peru::format({"tonewright.Language.unknown", "There is no translation for the language '%s'"},
                             CString::fromUTF8(locale)));
        return 1;
    });
}

char* TONEWRIGHT_Host_Localize(const char* key, const char* defaultText, const char* const* placeholders) {
    return guard<char*>(nullptr, [&]() -> char* {
        if (!key || !defaultText) return nullptr;
        const P<peru::IString> text = peru::getStringLocalizer()->findText(key);
        return ::strdup(fill(text ? CString::toStdString(text) : defaultText, placeholders).c_str());
    });
}
