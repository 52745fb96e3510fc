// Texts in the user's language.
#pragma once

#include <initializer_list>
#include <span>
#include <string>

namespace host {

// The language of the option --lang, otherwise of the environment. Without a translation for the latter,
// texts stay English. Returns false for an option that names no language with a translation.
bool setLanguage(const char* option);
bool isEnglish();

// A placeholder such as "%FILE%" and its value.
struct STextValue {
    const char* name;
    std::string value;
};

// The text of a key, such as "host.Convert.sameFile", in the user's language. The default text must be a
// literal that follows the key, so that the translators' tool finds it.
std::string tr(const char* key, const char* text, std::initializer_list<STextValue> values = {});
std::string tr(const char* key, const char* text, std::span<const STextValue> values);

} // namespace host
