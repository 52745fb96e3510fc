// The language of the library's messages, from the language files of an installation.
#pragma once

#include "zvr_lang_manager/LanguageId.h"

#include <string>

namespace zvr_lang {

// Language files are searched in the folder "Lang" beside the libraries and in share/tonewright/Lang of an
// installation; those in the folders of TONEWRIGHT_LANG_PATH, a list separated by ":", take precedence, the
// first one most. The folders are listed on the first call only.
//
// These functions are not thread-safe; other threads may log and fail meanwhile.

// Replaces the texts of all messages from now on. Texts without a translation are English.
ZVR_LANG_API void applyLanguage(const SLanguageId& id);

// The same by the name of a locale, such as "de", "de-AT" or "de_AT.UTF-8@euro". A language without a country
// is that of the first language file. English, and "C", need no language files. Returns false and changes
// nothing if there is no such language or no translation.
ZVR_LANG_API bool applyLocale(const std::string& name);

} // namespace zvr_lang
