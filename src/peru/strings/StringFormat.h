// Printf-like formatting over string objects.
#pragma once

#include "peru/strings/String.h"

#include <string>
#include <type_traits>

namespace peru {

// Arguments are pushed one at a time in the order of the fields; the text is taken at the end.
//   CStringFormat("could not load plugin: %s").push(name).getText()
// Flags, width, precision (either may be "*") and the conversions c C d i o x X u e E f g G s S follow the C
// format strings; length modifiers are accepted and skipped, since the type of the pushed value decides.
// Width and precision of texts count characters; the decimal separator is the point in every locale.
// Throws CInvalidArgError for an invalid format or a value of the wrong type, CError if the text is taken
// too early.
class PERU_API CStringFormat : public CObject {
public:
    explicit CStringFormat(const CStringArg& format);
    ~CStringFormat() override;

    template <class I>
    requires std::is_integral_v<I> CStringFormat& push(I value) {
        static_assert(!std::is_same_v<I, bool>, "say what a bool shall print as");
        if constexpr (std::is_same_v<I, char>)
            return pushChar(static_cast<unsigned char>(value));
        else if constexpr (std::is_same_v<I, char16_t> || std::is_same_v<I, char32_t> ||
                           std::is_same_v<I, wchar_t>)
            return pushChar(static_cast<char32_t>(value));
        else if constexpr (std::is_signed_v<I>)
            return pushInt(static_cast<int64_t>(value), sizeof(I));
        else
            return pushUInt(static_cast<uint64_t>(value), sizeof(I));
    }
    CStringFormat& push(double value) { return pushDouble(value); }
    CStringFormat& push(const CStringArg& value) { return pushString(value); }
    CStringFormat& push(const P<IString>& value) { return pushString(value); }
    CStringFormat& push(const char* latin1) { return pushString(latin1); }

    // `size` is the argument's size in bytes; it determines how a negative value prints in an unsigned field.
    CStringFormat& pushInt(int64_t value, size_t size = 8);
    CStringFormat& pushUInt(uint64_t value, size_t size = 8);
    CStringFormat& pushDouble(double value);
    CStringFormat& pushString(const CStringArg& value);
    CStringFormat& pushChar(char32_t value);

    // In the format's encoding if that can hold the result, otherwise in UTF-8.
    P<IString> getText();

private:
    enum class EPending { none, width, precision, value }; // what the next pushed argument is for

    struct SField {
        std::string flags;
        int32_t width = 0;
        int32_t precision = -1; // -1: none given
        char conversion = 0;
        bool has(char flag) const { return flags.find(flag) != std::string::npos; }
    };

    void goToNextFormatField();
    void parseField();
    void parseTail();
    bool parseNumber(int32_t& number, EPending star);
    void finishConversion();
    char32_t peekChar() const; // 0 at the end of the format
    void skipChar();

    // Returns true if the argument was taken as a width or precision.
    bool takeStar(int64_t value, const char* method);
    void requireValue(const char* conversions, const char* method);
    void requireNoStar(const char* method) const;
    CStringFormat& appendInteger(bool negative, uint64_t magnitude, uint64_t bits);
    void appendPadded(const CStringArg& text);
    void append(const CStringArg& text);
    [[noreturn]] void throwArgError(const char* text, const char* method) const;

    P<IString> m_format;
    SStringPos m_pos = kStringBegin;
    EPending m_pending = EPending::none;
    SField m_field;
    P<ICharEncoding> m_encoding; // of the output
    std::string m_output;        // encoded bytes
};

// All arguments at once.
template <class... Args> P<IString> format(const CStringArg& text, const Args&... args) {
    P<CStringFormat> f = make<CStringFormat>(text);
    (f->push(args), ...);
    return f->getText();
}

} // namespace peru
