#include "base/Translation.h"

#include <tonewright/host.h>

#include <algorithm>
#include <clocale>
#include <cstdlib>
#include <libintl.h>
#include <new>
#include <vector>

namespace host {

namespace {

bool g_isEnglish = true; // set before other threads start

const char* getMessageLocale() {
    for (const char* name : {"LC_ALL", "LC_MESSAGES", "LANG"})
        if (const char* value = std::getenv(name); value && *value) return value;
    return "";
}

} // namespace

bool setLanguage(const char* option) {
    const std::string locale = option ? option : getMessageLocale();
    const std::string language = locale.substr(0, locale.find_first_of("_-.@"));
    if (language.empty() || language == "C" || language == "POSIX" || language == "en") return true;
    if (TONEWRIGHT_Host_SetLanguage(locale.c_str()) != 1) {
        TONEWRIGHT_Host_ClearLastFailure();
        return !option;
    }
    // The reasons that the system gives, if its locale for the language is installed.
    std::string name = option ? locale : "";
    std::replace(name.begin(), name.end(), '-', '_');
    if (option && name.find('.') == std::string::npos) name += ".UTF-8";
    std::setlocale(LC_MESSAGES, name.c_str());
    ::bind_textdomain_codeset("libc", "UTF-8");
    g_isEnglish = false;
    return true;
}

bool isEnglish() {
    return g_isEnglish;
}

std::string tr(const char* key, const char* text, std::initializer_list<STextValue> values) {
    return tr(key, text, std::span(values.begin(), values.size()));
}

std::string tr(const char* key, const char* text, std::span<const STextValue> values) {
    std::vector<const char*> placeholders;
    placeholders.reserve(values.size() * 2 + 1);
    for (const STextValue& each : values)
        placeholders.insert(placeholders.end(), {each.name, each.value.c_str()});
    placeholders.push_back(nullptr);
    char* const translated = TONEWRIGHT_Host_Localize(key, text, placeholders.data());
    if (!translated) throw std::bad_alloc();
    std::string result = translated;
    TONEWRIGHT_Host_Free(translated);
    return result;
}

} // namespace host
