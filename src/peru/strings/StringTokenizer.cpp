#include "peru/strings/StringTokenizer.h"

#include "peru/Errors.h"

#include <utility>

namespace peru {

CStringPartEnum::CStringPartEnum(const P<IString>& text) : m_text(text ? text : CString::empty()) {}

int32_t CStringPartEnum::getCount() const {
    int32_t count = 0;
    for (SStringPos pos = kStringBegin; findPart(pos);) ++count;
    return count;
}

P<IBase> CStringPartEnum::getNext() {
    if (!m_next) throw CEndOfEnumError(P<IBase>::share(static_cast<IEnum*>(this)));
    P<IString> part = std::move(m_next);
    m_next = findPart(m_pos);
    return part;
}

void CStringPartEnum::reset() {
    m_pos = kStringBegin;
    m_next = findPart(m_pos);
}

CStringTokenizerEnum::CStringTokenizerEnum(const P<IString>& text, const CStringArg& separators,
                                           bool skipEmptyTokens)
    : CStringPartEnum(text), m_separators(CString::fromView(separators.getView())),
      m_skipEmptyTokens(skipEmptyTokens) {
    CStringTokenizerEnum::reset();
}

P<IString> CStringTokenizerEnum::findPart(SStringPos& pos) const {
    if (m_text->getDataSize() == 0) return nullptr;
    P<IString> token = m_text->nextToken(pos, m_separators);
    while (m_skipEmptyTokens && token && token->getDataSize() == 0)
        token = m_text->nextToken(pos, m_separators);
    return token;
}

CStringLineTokenizerEnum::CStringLineTokenizerEnum(const P<IString>& text) : CStringPartEnum(text) {
    CStringLineTokenizerEnum::reset();
}

P<IString> CStringLineTokenizerEnum::findPart(SStringPos& pos) const {
    if (!pos.isFound() || pos.offset >= m_text->getDataSize()) return nullptr;
    SStringPos start = pos;
    SStringPos end = m_text->findAnyOf("\r\n", start);
    pos = end;
    if (end.isFound() && m_text->getCharAndAdvance(pos) == '\r') {
        // Only an adjacent line feed belongs to the carriage return: malformed bytes may stand in between.
        SStringPos next = pos;
        const int32_t unit = pos.offset - end.offset;
        if (m_text->getCharAndAdvance(next) == '\n' && next.offset - pos.offset == unit) pos = next;
    }
    return m_text->substring(start, end);
}

} // namespace peru
