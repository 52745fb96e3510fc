#include "peru/strings/StringFormat.h"

#include "peru/Errors.h"
#include "peru/strings/RuntimeLocale.h"
#include "peru/strings/StringText.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <vector>

namespace peru {

namespace {

constexpr size_t kMaxFlags = 5;
// No message needs more; a larger number counts as an error in the format or the "*" argument.
constexpr int32_t kMaxWidth = 1000000;

constexpr const char* kGoToNextField = "CStringFormat::goToNextFormatField";
constexpr const char* kDoInt = "CStringFormat::doInt";
constexpr const char* kDoDouble = "CStringFormat::doDouble";
constexpr const char* kDoString = "CStringFormat::doString";
constexpr const char* kDoChar = "CStringFormat::doChar";

constexpr const char* kInvalidFormat = "invalid format string in '";
constexpr const char* kMismatch = "argument does not match the field's format spec"
                                  "ification for '";
constexpr const char* kExpectedWidth = "expected integer value (field width) in '";
constexpr const char* kExpectedPrecision = "expected integer value (field precision) in '";

bool isOneOf(char32_t ch, const char* set) {
    return ch != 0 && ch < 0x80 && std::strchr(set, static_cast<int>(ch)) != nullptr;
}

} // namespace

CStringFormat::CStringFormat(const CStringArg& format)
    : m_format(CString::fromView(format.getView())), m_encoding(m_format->getEncoding()) {
    goToNextFormatField();
}

CStringFormat::~CStringFormat() = default;

void CStringFormat::throwArgError(const char* text, const char* method) const {
    throw CInvalidArgError(text + m_format + "'", method);
}

char32_t CStringFormat::peekChar() const {
    SStringPos pos = m_pos;
    return m_format->getCharAndAdvance(pos);
}

void CStringFormat::skipChar() {
    m_format->getCharAndAdvance(m_pos);
}

// --- Reading the format ---

// Copies text up to the next field that needs an argument.
void CStringFormat::goToNextFormatField() {
    m_pending = EPending::none;
    while (m_pos.isFound()) {
        SStringPos percent = m_format->findChar('%', m_pos);
        append(m_format->substring(m_pos, percent));
        m_pos = percent;
        if (!m_pos.isFound()) return;
        skipChar();
        if (peekChar() != '%') return parseField();
        append("%");
        skipChar();
    }
}

void CStringFormat::parseField() {
    m_field = SField();
    for (char32_t ch; isOneOf(ch = peekChar(), "-+0 #"); skipChar()) {
        if (m_field.flags.size() == kMaxFlags)
            throwArgError("too many field flags specified in '", kGoToNextField);
        m_field.flags.push_back(static_cast<char>(ch));
    }
    if (parseNumber(m_field.width, EPending::width)) parseTail();
}

// Parses what follows the width: the precision and the conversion.
void CStringFormat::parseTail() {
    if (peekChar() == '.') {
        skipChar();
        m_field.precision = 0;
        if (!parseNumber(m_field.precision, EPending::precision)) return;
    }
    finishConversion();
}

// Returns false if the number is a "*" that waits for its argument.
bool CStringFormat::parseNumber(int32_t& number, EPending star) {
    if (peekChar() == '*') {
        skipChar();
        m_pending = star;
        return false;
    }
    for (char32_t ch; isOneOf(ch = peekChar(), "0123456789"); skipChar()) {
        number = number * 10 + static_cast<int32_t>(ch - '0');
        if (number > kMaxWidth) throwArgError(kInvalidFormat, kGoToNextField);
    }
    return true;
}

void CStringFormat::finishConversion() {
    if (m_format->startsWithAt(m_pos, "I64")) {
        for (int i = 0; i < 3; ++i) skipChar();
    } else if (char32_t modifier = peekChar(); isOneOf(modifier, "lhLzjt")) {
        skipChar();
        if ((modifier == 'l' || modifier == 'h') && peekChar() == modifier) skipChar();
    }
    char32_t ch = peekChar();
    if (!isOneOf(ch, "cCdioxXueEfgGsS")) throwArgError(kInvalidFormat, kGoToNextField);
    skipChar();
    m_field.conversion = static_cast<char>(ch);
    m_pending = EPending::value;
}

// --- Taking arguments ---

bool CStringFormat::takeStar(int64_t value, const char* method) {
    if (m_pending == EPending::width) {
        if (value > kMaxWidth || value < -kMaxWidth) throwArgError(kExpectedWidth, method);
        // As in C, a negative width is a "-" flag and a width.
        if (value < 0) m_field.flags.push_back('-');
        m_field.width = static_cast<int32_t>(value < 0 ? -value : value);
        m_pending = EPending::none;
        parseTail();
        return true;
    }
    if (m_pending == EPending::precision) {
        if (value > kMaxWidth) throwArgError(kExpectedPrecision, method);
        // As in C, a negative precision counts as not given.
        m_field.precision = value < 0 ? -1 : static_cast<int32_t>(value);
        finishConversion();
        return true;
    }
    return false;
}

void CStringFormat::requireNoStar(const char* method) const {
    if (m_pending == EPending::width) throwArgError(kExpectedWidth, method);
    if (m_pending == EPending::precision) throwArgError(kExpectedPrecision, method);
}

void CStringFormat::requireValue(const char* conversions, const char* method) {
    if (m_pending != EPending::value || !isOneOf(static_cast<unsigned char>(m_field.conversion), conversions))
        throwArgError(kMismatch, method);
}

CStringFormat& CStringFormat::pushInt(int64_t value, size_t size) {
    if (takeStar(value, kDoInt)) return *this;
    uint64_t bits = static_cast<uint64_t>(value);
    // As in C, arguments narrower than int are promoted.
    if (size <= 4) bits &= 0xFFFFFFFF;
    return appendInteger(value < 0, value < 0 ? 0 - static_cast<uint64_t>(value) : bits, bits);
}

CStringFormat& CStringFormat::pushUInt(uint64_t value, size_t) {
    if (takeStar(static_cast<int64_t>(std::min<uint64_t>(value, INT64_MAX)), kDoInt)) return *this;
    return appendInteger(false, value, value);
}

CStringFormat& CStringFormat::pushDouble(double value) {
    requireNoStar(kDoDouble);
    requireValue("eEfgG", kDoDouble);
    std::string field = "%";
    for (char flag : m_field.flags) field.push_back(flag);
    if (m_field.width > 0) field += std::to_string(m_field.width);
    if (m_field.precision >= 0) field.append(".").append(std::to_string(m_field.precision));
    field.push_back(m_field.conversion);

    CLocaleScope plain(getPlainLocale());
    char shortText[64];
    int length = std::snprintf(shortText, sizeof(shortText), field.c_str(), value);
    if (length < static_cast<int>(sizeof(shortText))) {
        append(shortText);
    } else {
        std::vector<char> text(static_cast<size_t>(length) + 1);
        std::snprintf(text.data(), text.size(), field.c_str(), value);
        append(text.data());
    }
    goToNextFormatField();
    return *this;
}

CStringFormat& CStringFormat::pushString(const CStringArg& value) {
    requireNoStar(kDoString);
    requireValue("sS", kDoString);
    SStringView view = text::clip(value.getView(), m_field.precision);
    appendPadded(CStringArg(view));
    goToNextFormatField();
    return *this;
}

CStringFormat& CStringFormat::pushChar(char32_t value) {
    requireNoStar(kDoChar);
    requireValue("cC", kDoChar);
    appendPadded(CStringArg(*getUTF32CharEncoding(), &value, sizeof(value)));
    goToNextFormatField();
    return *this;
}

// --- Writing ---

CStringFormat& CStringFormat::appendInteger(bool negative, uint64_t magnitude, uint64_t bits) {
    requireValue("dioxXu", kDoInt);
    const char conversion = m_field.conversion;
    const bool isSigned = conversion == 'd' || conversion == 'i';
    const char* table = conversion == 'X' ? "0123456789ABCDEF" : "0123456789abcdef";
    const uint64_t base = conversion == 'o' ? 8 : conversion == 'x' || conversion == 'X' ? 16 : 10;
    uint64_t value = isSigned ? magnitude : bits;

    std::string digits;
    for (uint64_t rest = value; rest != 0; rest /= base) digits.insert(digits.begin(), table[rest % base]);
    size_t minimum = m_field.precision < 0 ? 1 : static_cast<size_t>(m_field.precision);
    if (digits.size() < minimum) digits.insert(0, minimum - digits.size(), '0');

    std::string prefix;
    if (isSigned && negative)
        prefix = "-";
    else if (isSigned && m_field.has('+'))
        prefix = "+";
    else if (isSigned && m_field.has(' '))
        prefix = " ";
    if (m_field.has('#')) {
        if (base == 16 && value != 0) prefix = std::string("0") + conversion;
        if (base == 8 && (digits.empty() || digits[0] != '0')) digits.insert(0, 1, '0');
    }

    size_t width = static_cast<size_t>(m_field.width);
    size_t used = prefix.size() + digits.size();
    if (used < width && m_field.has('0') && !m_field.has('-') && m_field.precision < 0)
        digits.insert(0, width - used, '0');
    appendPadded((prefix + digits).c_str());
    goToNextFormatField();
    return *this;
}

void CStringFormat::appendPadded(const CStringArg& text) {
    size_t length = static_cast<size_t>(text.getLength());
    size_t width = static_cast<size_t>(m_field.width);
    std::string padding(width > length ? width - length : 0, ' ');
    if (!m_field.has('-')) append(padding.c_str());
    append(text);
    if (m_field.has('-')) append(padding.c_str());
}

void CStringFormat::append(const CStringArg& text) {
    const SStringView& view = text.getView();
    if (view.byteSize == 0) return;
    if (view.encodingId == m_encoding->getId()) {
        m_output.append(reinterpret_cast<const char*>(view.data), static_cast<size_t>(view.byteSize));
        return;
    }
    int64_t size = text::getEncodedSize(*m_encoding, view);
    if (size < 0) {
        // UTF-8 encodes everything, so this happens once.
        CStringArg sofar(*m_encoding, m_output.data(), static_cast<int32_t>(m_output.size()));
        m_output = CString::toStdString(sofar);
        m_encoding = getUTF8CharEncoding();
        return append(text);
    }
    size_t used = m_output.size();
    m_output.resize(used + static_cast<size_t>(size));
    text::encode(*m_encoding, view, reinterpret_cast<uint8_t*>(m_output.data() + used));
}

P<IString> CStringFormat::getText() {
    if (m_pending != EPending::none)
        throw CError("CStringFormat: not all parameters have been pushed in yet.");
    CStringArg output(*m_encoding, m_output.data(), static_cast<int32_t>(m_output.size()));
    return CString::fromView(output.getView());
}

} // namespace peru
