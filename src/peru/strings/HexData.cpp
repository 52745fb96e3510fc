#include "peru/strings/HexData.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace peru {

namespace {

[[noreturn]] void fail() {
    throw CParseError(localize("peru.HexData.parseError", "Error parsing hex data."));
}

uint8_t digitValue(char c) {
    if (c >= '0' && c <= '9') return static_cast<uint8_t>(c - '0');
    if (c >= 'a' && c <= 'f') return static_cast<uint8_t>(c - 'a' + 10);
    if (c >= 'A' && c <= 'F') return static_cast<uint8_t>(c - 'A' + 10);
    fail();
}

} // namespace

std::vector<uint8_t> parseHexData(const CStringArg& text) {
    const std::string digits = CString::toStdString(text);
    if (digits.size() % 2 != 0) fail();
    std::vector<uint8_t> bytes(digits.size() / 2);
    for (size_t i = 0; i < bytes.size(); ++i)
        bytes[i] = static_cast<uint8_t>(digitValue(digits[2 * i]) << 4 | digitValue(digits[2 * i + 1]));
    return bytes;
}

P<IString> formatHexData(const void* data, int64_t size) {
    constexpr char kDigits[] = "0123456789ABCDEF";
    const uint8_t* bytes = static_cast<const uint8_t*>(data);
    std::string text;
    text.reserve(static_cast<size_t>(size) * 2);
    for (int64_t i = 0; i < size; ++i) {
        text += kDigits[bytes[i] >> 4];
        text += kDigits[bytes[i] & 15];
    }
    return CString::fromUTF8(text);
}

} // namespace peru
