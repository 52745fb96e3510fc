// Printf-like formatting over string objects.
#pragma once

#include "peru/String.h"

#include <vector>

namespace peru {

// Arguments are pushed one at a time in the order of the fields; the text is taken at the end.
//   CStringFormat("could not load plugin: %s").push(name).getText()
// Flags, width, precision (either may be "*") and the conversions c C d i o x X u e E f g G s S follow the C
// format strings; length modifiers are accepted and skipped, since the type of the pushed value decides.
// Throws CInvalidArgError on a bad format or a value of the wrong type, CError when text is taken too early.
class PERU_API CStringFormat : public CObject {
public:
    explicit CStringFormat(const CStringArg& format);
    ~CStringFormat() override;

    template <class I>
        requires(std::is_integral_v<I> && !std::is_same_v<I, char32_t> && !std::is_same_v<I, bool>)
    CStringFormat& push(I value) {
        if constexpr (std::is_signed_v<I>)
            return pushInt(static_cast<int64_t>(value));
        else
            return pushUInt(static_cast<uint64_t>(value), sizeof(I));
    }
    CStringFormat& push(double value) { return pushDouble(value); }
    CStringFormat& push(const CStringArg& value) { return pushString(value); }
    CStringFormat& push(const P<IString>& value) { return pushString(value); }
    CStringFormat& push(const char* latin1) { return pushString(latin1); }
    CStringFormat& push(char32_t value) { return pushChar(value); }

    CStringFormat& pushInt(int64_t value);
    // `size` in bytes tells how wide a negative value would print in hexadecimal.
    CStringFormat& pushUInt(uint64_t value, size_t size = 8);
    CStringFormat& pushDouble(double value);
    CStringFormat& pushString(const CStringArg& value);
    CStringFormat& pushChar(char32_t value);

    P<IString> getText();

private:
    struct SImpl;
    SImpl* m_impl;
};

// All arguments at once.
template <class... Args> P<IString> format(const CStringArg& text, const Args&... args) {
    P<CStringFormat> f = make<CStringFormat>(text);
    (f->push(args), ...);
    return f->getText();
}

} // namespace peru
