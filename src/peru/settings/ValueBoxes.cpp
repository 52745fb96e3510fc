#include "peru/settings/ValueBoxes.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

#include <charconv>
#include <limits>

namespace peru {

namespace {

constexpr const char* kIntegerFault = "Error parsing integer.";

// Parses directly to a float: rounding to a double first could round to the wrong float afterwards.
float parseFloat(const CStringArg& text) {
    parseDouble(text);
    const std::string digits = CString::toStdString(text);
    float value = 0;
    const size_t sign = digits.starts_with('+') ? 1 : 0;
    if (std::from_chars(digits.data() + sign, digits.data() + digits.size(), value).ec != std::errc())
        throw CParseError(localize("peru.CDouble.parseError", "Error parsing floating point value."));
    return value;
}

} // namespace

template <class T> TValueBox<T>::TValueBox(T value) : m_value(value) {}

template <class T> TValueBox<T>::~TValueBox() = default;

template <class T> T TValueBox<T>::parseValue(const CStringArg& text) {
    if constexpr (std::is_same_v<T, bool>) {
        const std::string word = CString::toStdString(text);
        if (word != "true" && word != "false") throw CParseError(kIntegerFault);
        return word == "true";
    } else if constexpr (std::is_same_v<T, float>) {
        return parseFloat(text);
    } else if constexpr (std::is_same_v<T, double>) {
        return parseDouble(text);
    } else {
        const int64_t value = parseInteger(text);
        if (value < std::numeric_limits<T>::min() || value > std::numeric_limits<T>::max())
            throw CParseError(kIntegerFault);
        return static_cast<T>(value);
    }
}

template <class T> P<IString> TValueBox<T>::formatValue(T value) {
    if constexpr (std::is_same_v<T, bool>) {
        return newString(value ? "true" : "false");
    } else {
        char digits[32];
        const auto end = std::to_chars(digits, digits + sizeof(digits), value).ptr;
        return CString::fromUTF8({digits, static_cast<size_t>(end - digits)});
    }
}

template class TValueBox<bool>;
template class TValueBox<int32_t>;
template class TValueBox<int64_t>;
template class TValueBox<float>;
template class TValueBox<double>;

CBool::~CBool() = default;
CInt::~CInt() = default;
CInt64::~CInt64() = default;
CFloat::~CFloat() = default;
CDouble::~CDouble() = default;

} // namespace peru
