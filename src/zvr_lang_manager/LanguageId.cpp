#include "zvr_lang_manager/LanguageId.h"

#include "zvr_lang_manager/LanguageTables.h"

#include <string_view>

namespace zvr_lang {

using peru::CString;
using peru::CStringArg;
using peru::IString;
using peru::P;

namespace {

const char16_t* threeLetterForm(const char16_t* bibliographicCode) {
    constexpr size_t kBothCodes = 7; // "wel/cym"
    return std::u16string_view(bibliographicCode).size() == kBothCodes ? bibliographicCode + 4
                                                                       : bibliographicCode;
}

// Empty text matches nothing: many languages have an empty short code.
bool matches(const P<IString>& text, const char16_t* entry) {
    return !text->isEmpty() && text->equalsIgnoreCase(entry);
}

template <class Row, class Predicate> int32_t findRow(std::span<const Row> table, Predicate predicate) {
    for (size_t i = 0; i < table.size(); ++i)
        if (predicate(table[i])) return static_cast<int32_t>(i);
    return -1;
}

void setLanguage(SLanguageId& id, int32_t row) {
    const SLanguageRow& language = getLanguageTable()[row];
    id.bibliographicCode = language.bibliographicCode;
    id.shortCode = language.shortCode;
    id.languageName = language.name;
}

void setCountry(SLanguageId& id, int32_t row) {
    const SCountryRow& country = getCountryTable()[row];
    id.countryCode = country.code;
    id.countryName = country.name;
}

SLanguageId findLanguageAndCountry(const P<IString>& text) {
    peru::SStringPos pos = peru::kStringBegin;
    P<IString> language = text->nextToken(pos, "-");
    P<IString> country = text->nextToken(pos, "-");
    if (!country || pos.isFound()) return {}; // one token, or more than two

    const int32_t languageRow = findRow(getLanguageTable(), [&](const SLanguageRow& row) {
        return matches(language, row.shortCode) || matches(language, threeLetterForm(row.bibliographicCode));
    });
    const int32_t countryRow =
        findRow(getCountryTable(), [&](const SCountryRow& row) { return matches(country, row.code); });
    if (languageRow < 0 || countryRow < 0) return {};

    SLanguageId id;
    id.valid = true;
    id.index = languageRow;
    setLanguage(id, languageRow);
    setCountry(id, countryRow);
    return id;
}

} // namespace

P<IString> SLanguageId::getThreeLetterCode() const {
    return bibliographicCode ? peru::newString(threeLetterForm(bibliographicCode)) : CString::empty();
}

P<IString> SLanguageId::getText() const {
    if (!bibliographicCode || !countryCode) return CString::empty();
    return (*shortCode ? peru::newString(shortCode) : getThreeLetterCode()) + "-" + countryCode;
}

SLanguageId findLanguageId(const CStringArg& text, ELanguageIdKind kind) {
    if (text.isEmpty()) return {};
    P<IString> wanted = CString::empty()->concat(text);
    if (kind == ELanguageIdKind::languageAndCountry) return findLanguageAndCountry(wanted);

    const bool isCountry = kind == ELanguageIdKind::countryName || kind == ELanguageIdKind::countryCode;
    SLanguageId id;
    if (isCountry) {
        id.index = findRow(getCountryTable(), [&](const SCountryRow& row) {
            return kind == ELanguageIdKind::countryCode ? wanted->equals(row.code)
                                                        : matches(wanted, row.name);
        });
        if (id.index >= 0) setCountry(id, id.index);
    } else {
        id.index = findRow(getLanguageTable(), [&](const SLanguageRow& row) {
            switch (kind) {
            case ELanguageIdKind::languageName:
                return matches(wanted, row.name);
            case ELanguageIdKind::shortCode:
                return matches(wanted, row.shortCode);
            default:
                return matches(wanted, row.bibliographicCode);
            }
        });
        if (id.index >= 0) setLanguage(id, id.index);
    }
    id.valid = id.index >= 0;
    return id;
}

} // namespace zvr_lang
