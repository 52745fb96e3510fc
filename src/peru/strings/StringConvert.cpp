// Conversion between encodings, and numbers in text.
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/String.h"
#include "peru/strings/StringText.h"
#include "peru/strings/StringWindow.h"
#include "peru/strings/UTF8.h"

#include <charconv>
#include <climits>
#include <new>

namespace peru {

namespace {

constexpr char32_t kReplacementCharacter = 0xFFFD;

// The text of a number in ASCII without a leading "+"; empty if the text cannot be a number.
std::string getNumberText(const CStringArg& text) {
    const SStringView& view = text.getView();
    std::string digits;
    digits.reserve(static_cast<size_t>(view.length));
    CStringWindow window(*view.encoding, view.data, view.byteSize, 0);
    for (char32_t ch; window.next(ch);) {
        if (ch <= ' ' || ch >= 0x7F) return {};
        digits.push_back(static_cast<char>(ch));
    }
    if (!digits.empty() && digits[0] == '+') {
        digits.erase(0, 1);
        if (!digits.empty() && digits[0] == '-') return {};
    }
    return digits;
}

// The text in UTF-16 if it is valid UTF-8 that a UTF-8 string would not read completely, otherwise empty.
std::u16string decodeRejected(std::string_view bytes) {
    if (bytes.find('\xE0') == std::string_view::npos && bytes.find('\xF0') == std::string_view::npos)
        return {};
    std::u16string units;
    units.reserve(bytes.size());
    for (size_t at = 0; at < bytes.size();) {
        const size_t size = measureUTF8Character(bytes.substr(at, SUTF8Rules::kMaxCharSize));
        if (size == 0) return {};
        uint8_t unit[SUTF16Rules::kMaxCharSize];
        const int32_t written = SUTF16Rules::write(decodeUTF8Character(bytes.data() + at, size), unit);
        for (int32_t i = 0; i < written; i += 2) units.push_back(SUTF16Rules::load(unit + i));
        at += size;
    }
    return units;
}

} // namespace

P<IString> CString::fromUTF8(std::string_view bytes) {
    if (bytes.size() > INT32_MAX) throw std::bad_alloc();
    const std::u16string units = decodeRejected(bytes);
    if (!units.empty()) return fromUTF16(units.data(), static_cast<int32_t>(units.size()));
    return make<CUTF8String>(bytes.data(), static_cast<int32_t>(bytes.size()));
}

std::string CString::toStdString(const CStringArg& arg) {
    if (arg.getEncodingId() == ICharEncoding::kUTF8)
        return {reinterpret_cast<const char*>(arg.getData()), static_cast<size_t>(arg.getByteSize())};
    const SStringView& view = arg.getView();
    int64_t size = text::getEncodedSize(*getUTF8CharEncoding(), view);
    std::string bytes(static_cast<size_t>(size), '\0');
    text::encode(*getUTF8CharEncoding(), view, reinterpret_cast<uint8_t*>(bytes.data()));
    return bytes;
}

std::u16string CString::toStdU16String(const CStringArg& arg) {
    const SStringView& view = arg.getView();
    int64_t size = text::getEncodedSize(*getUTF16CharEncoding(), view);
    if (size < 0) return toStdU16String(text::convert(getUTF16CharEncoding(), view, kReplacementCharacter));
    std::u16string units(static_cast<size_t>(size / 2), u'\0');
    text::encode(*getUTF16CharEncoding(), view, reinterpret_cast<uint8_t*>(units.data()));
    return units;
}

P<IString> CString::convertTo(const P<ICharEncoding>& encoding, char32_t substitute) const {
    if (encoding->getId() == m_encodingId) return getTerminated();
    return text::convert(encoding, view(), substitute);
}

P<IString> CString::toCPString() const {
    return convertTo(getCPCharEncoding(), '?');
}
P<IString> CString::toUTF8String() const {
    return convertTo(getUTF8CharEncoding(), kReplacementCharacter);
}
P<IString> CString::toUTF16String() const {
    return convertTo(getUTF16CharEncoding(), kReplacementCharacter);
}
P<IString> CString::toUTF32String() const {
    return convertTo(getUTF32CharEncoding(), kReplacementCharacter);
}
P<IString> CString::toWCharString() const {
    return toUTF32String();
}
P<IString> CString::toLatin1String() const {
    return convertTo(getLatin1CharEncoding(), '?');
}

P<IString> CString::getTerminated() const {
    if (m_terminated) return P<IString>::share(const_cast<CString*>(this));
    return fromView(view());
}

int64_t parseInteger(const CStringArg& text, int base) {
    std::string digits = getNumberText(text);
    int64_t value = 0;
    const char* end = digits.data() + digits.size();
    auto [stop, error] = std::from_chars(digits.data(), end, value, base);
    if (digits.empty() || error != std::errc() || stop != end)
        throw CParseError(localize("peru.CInteger.parseError", "Error parsing integer."));
    return value;
}

double parseDouble(const CStringArg& text) {
    std::string digits = getNumberText(text);
    double value = 0;
    const char* end = digits.data() + digits.size();
    auto [stop, error] = std::from_chars(digits.data(), end, value);
    if (digits.empty() || error != std::errc() || stop != end)
        throw CParseError(localize("peru.CDouble.parseError", "Error parsing floating point value."));
    return value;
}

} // namespace peru
