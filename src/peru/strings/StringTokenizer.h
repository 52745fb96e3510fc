// Enumerators over the parts of a text.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/strings/String.h"

namespace peru {

// Base of both enumerators: slices of one string, found one after the other.
class PERU_API CStringPartEnum : public CObject, public IEnum {
public:
    bool hasMore() const override { return m_next != nullptr; }
    int32_t getCount() const override; // scans the whole text
    PC<IBase> getNextConst() override { return getNext(); }
    P<IBase> getNext() override;
    void reset() override;

protected:
    explicit CStringPartEnum(const P<IString>& text);
    // Returns the part at `pos` and moves `pos` past it; empty at the end. Constructors of derived classes
    // must call reset() once this operation works.
    virtual P<IString> findPart(SStringPos& pos) const = 0;

    const P<IString> m_text;

private:
    SStringPos m_pos = kStringBegin;
    P<IString> m_next;
};

// The tokens between separator characters. An empty text has none.
class PERU_API CStringTokenizerEnum : public CStringPartEnum {
public:
    CStringTokenizerEnum(const P<IString>& text, const CStringArg& separators, bool skipEmptyTokens = false);

protected:
    P<IString> findPart(SStringPos& pos) const override;

private:
    P<IString> m_separators;
    bool m_skipEmptyTokens;
};

// The lines without their line ends: \n, \r\n or \r. An empty text has none, and a line end after the last
// line does not start another one.
class PERU_API CStringLineTokenizerEnum : public CStringPartEnum {
public:
    explicit CStringLineTokenizerEnum(const P<IString>& text);

protected:
    P<IString> findPart(SStringPos& pos) const override;
};

} // namespace peru
