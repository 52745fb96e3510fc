// Counted boxes of one value, for lists and messages that hold objects.
#pragma once

#include "peru/Object.h"
#include "peru/strings/String.h"

namespace peru {

// The text forms are the same in every locale: "true" and "false", decimal integers, and the shortest decimal
// number that parses to the same floating point value. Parsing throws CParseError for anything else,
// including numbers out of range and white space; "nan" and "inf" are floating point values.
template <class T> class PERU_API TValueBox : public CObject {
public:
    explicit TValueBox(T value);
    ~TValueBox() override;

    T getValue() const { return m_value; }
    P<IString> toString() const { return formatValue(m_value); }

    static T parseValue(const CStringArg& text);
    static P<IString> formatValue(T value);

private:
    T m_value;
};

extern template class TValueBox<bool>;
extern template class TValueBox<int32_t>;
extern template class TValueBox<int64_t>;
extern template class TValueBox<float>;
extern template class TValueBox<double>;

class PERU_API CBool : public TValueBox<bool> {
public:
    using TValueBox::TValueBox;
    ~CBool() override;
    static P<CBool> parse(const CStringArg& text) { return make<CBool>(parseValue(text)); }
};

class PERU_API CInt : public TValueBox<int32_t> {
public:
    using TValueBox::TValueBox;
    ~CInt() override;
    static P<CInt> parse(const CStringArg& text) { return make<CInt>(parseValue(text)); }
};

class PERU_API CInt64 : public TValueBox<int64_t> {
public:
    using TValueBox::TValueBox;
    ~CInt64() override;
    static P<CInt64> parse(const CStringArg& text) { return make<CInt64>(parseValue(text)); }
};

class PERU_API CFloat : public TValueBox<float> {
public:
    using TValueBox::TValueBox;
    ~CFloat() override;
    static P<CFloat> parse(const CStringArg& text) { return make<CFloat>(parseValue(text)); }
};

class PERU_API CDouble : public TValueBox<double> {
public:
    using TValueBox::TValueBox;
    ~CDouble() override;
    static P<CDouble> parse(const CStringArg& text) { return make<CDouble>(parseValue(text)); }
};

} // namespace peru
