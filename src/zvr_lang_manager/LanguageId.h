// Identifies a language and a country.
#pragma once

#include "peru/strings/String.h"
#include "zvr_lang_manager/Api.h"

namespace zvr_lang {

// What a look-up compares the text with. Case is ignored except for countryCode, which must match exactly.
enum class ELanguageIdKind {
    languageName = 0,
    shortCode = 1,
    bibliographicCode = 2,
    countryName = 3,
    countryCode = 4,
    languageAndCountry = 5, // "de-AT": a two-letter or three-letter language code, "-" and a country code
};

// Copied by value. The texts point into constant tables and are null if nothing was found.
struct SLanguageId {
    bool valid = false;                          // a look-up succeeded
    int32_t index = -1;                          // row of the table that was looked up
    const char16_t* bibliographicCode = nullptr; // ISO 639-2; "wel/cym" if the standard has two codes
    const char16_t* shortCode = nullptr;         // ISO 639-1; empty if there is none
    const char16_t* languageName = nullptr;      // in English
    const char16_t* countryCode = nullptr;       // ISO 3166-1, two letters
    const char16_t* countryName = nullptr;       // in English

    // The terminological three-letter code; empty in a record without a language.
    ZVR_LANG_API peru::P<peru::IString> getThreeLetterCode() const;
    // The form "de-AT", with the three-letter code of a language that has no shorter one; empty in a record
    // without a language or a country.
    ZVR_LANG_API peru::P<peru::IString> getText() const;
};

// Returns an invalid record if nothing matches or the text is empty. With languageAndCountry a language
// without a country is not a valid identifier.
ZVR_LANG_API SLanguageId findLanguageId(const peru::CStringArg& text, ELanguageIdKind kind);

} // namespace zvr_lang
