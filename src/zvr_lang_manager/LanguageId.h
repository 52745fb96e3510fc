// Which language, as spoken where.
#pragma once

#include "peru/strings/String.h"
#include "zvr_lang_manager/Api.h"

namespace zvr_lang {

// What a look-up compares the text with. Codes and names are compared without regard to case, except for
// the country code, which must be exact.
enum class ELanguageIdKind {
    languageName = 0,
    shortCode = 1,
    bibliographicCode = 2,
    countryName = 3,
    countryCode = 4,
    languageAndCountry = 5, // "de-AT": a two-letter or three-letter language code, "-" and a country code
};

// Copied by value. The texts lie in constant tables and are null where nothing was found.
struct SLanguageId {
    bool valid = false;                          // a look-up succeeded
    int32_t index = -1;                          // row of the table that was looked up
    const char16_t* bibliographicCode = nullptr; // ISO 639-2; "wel/cym" where the standard has two codes
    const char16_t* shortCode = nullptr;         // ISO 639-1; empty where there is none
    const char16_t* languageName = nullptr;      // in English
    const char16_t* countryCode = nullptr;       // ISO 3166-1, two letters
    const char16_t* countryName = nullptr;       // in English

    // The terminological three-letter code; empty in a record without a language.
    ZVR_LANG_API peru::P<peru::IString> getThreeLetterCode() const;
};

// An invalid record when nothing matches, and for an empty text. For languageAndCountry a language without
// a country is no valid identifier.
ZVR_LANG_API SLanguageId findLanguageId(const peru::CStringArg& text, ELanguageIdKind kind);

} // namespace zvr_lang
