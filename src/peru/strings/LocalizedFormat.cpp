#include "peru/strings/LocalizedFormat.h"

#include "peru/Errors.h"

#include <string>
#include <vector>

namespace peru {

namespace {

// Removes the numbers from the fields ("%2$s") and returns them, starting at 0.
std::vector<size_t> takeNumbers(std::string& format) {
    std::vector<size_t> numbers;
    for (size_t at = 0; (at = format.find('%', at)) != std::string::npos;) {
        if (format.compare(++at, 1, "%") == 0) {
            ++at;
            continue;
        }
        const size_t end = format.find_first_not_of("0123456789", at);
        if (end == at || end - at > 2 || end == std::string::npos || format[end] != '$') continue;
        numbers.push_back(std::stoul(format.substr(at, end - at)) - 1);
        format.erase(at, end + 1 - at);
    }
    return numbers;
}

P<IString> formatInOrder(const P<IString>& text, std::span<const FormatField> fields) {
    const P<CStringFormat> format = make<CStringFormat>(text);
    for (const FormatField& push : fields) push(*format);
    return format->getText();
}

P<IString> formatByNumber(const P<IString>& text, std::span<const FormatField> fields) {
    std::string bytes = CString::toStdString(text);
    const std::vector<size_t> numbers = takeNumbers(bytes);
    if (numbers.empty()) return formatInOrder(text, fields);
    const P<CStringFormat> format = make<CStringFormat>(CString::fromUTF8(bytes));
    for (const size_t number : numbers) {
        if (number >= fields.size()) throw CError("The text numbers a field that does not exist.");
        fields[number](*format);
    }
    return format->getText();
}

} // namespace

P<IString> formatLocalized(const SLocalizedText& text, std::span<const FormatField> fields) {
    if (const P<IString> translation = getStringLocalizer()->findText(text.key)) {
        try {
            return formatByNumber(translation, fields);
        } catch (const CError&) {
            // The caller is often about to report another error, which must not get lost.
        }
    }
    return formatInOrder(newString(text.text), fields);
}

} // namespace peru
