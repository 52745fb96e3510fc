// Formatting with localised formats.
#pragma once

#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <array>
#include <functional>
#include <span>

namespace peru {

// The key of a text and its English default, both literals.
struct SLocalizedText {
    const char* key;
    const char* text;
};

using FormatField = std::function<void(CStringFormat&)>;
PERU_API P<IString> formatLocalized(const SLocalizedText& text, std::span<const FormatField> fields);

// The localised text of the key as a format of CStringFormat. A translation may reorder the fields by
// numbering all of them ("%2$s %1$d"). One that does not fit the arguments is replaced by the default text.
template <class... Args> P<IString> format(const SLocalizedText& text, const Args&... args) {
    const std::array<FormatField, sizeof...(Args)> fields{
        [&args](CStringFormat& target) { target.push(args); }...};
    return formatLocalized(text, fields);
}

} // namespace peru
