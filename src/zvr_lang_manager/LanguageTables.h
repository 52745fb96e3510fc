// The tables of ISO 639-2 languages and ISO 3166-1 countries.
#pragma once

#include <span>

namespace zvr_lang {

struct SLanguageRow {
    const char16_t* bibliographicCode; // "aar", or "wel/cym" if the standard has two codes
    const char16_t* shortCode;
    const char16_t* name;
};

struct SCountryRow {
    const char16_t* code;
    const char16_t* name;
};

std::span<const SLanguageRow> getLanguageTable(); // sorted by code
std::span<const SCountryRow> getCountryTable();   // sorted by code

} // namespace zvr_lang
