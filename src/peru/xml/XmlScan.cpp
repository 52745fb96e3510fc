#include "peru/xml/XmlScan.h"

#include "peru/xml/IXmlDocument.h"
#include "peru/xml/XmlText.h"

#include <algorithm>
#include <charconv>
#include <cstring>

namespace peru::xml {

namespace {

SFault checkCharacters(std::string_view text) {
    for (size_t at = 0; at < text.size();) {
        const auto byte = static_cast<uint8_t>(text[at]);
        if (byte >= 0x20 && byte < 0x80) {
            ++at;
            continue;
        }
        const size_t size = measureXmlCharacter(text.substr(at, 4));
        if (size == 0) return {byte < 0x80 ? EFault::syntax : EFault::encoding, at};
        at += size;
    }
    return {};
}

class CScanner {
public:
    explicit CScanner(std::string_view text) : m_text(text) {}

    SFault run() {
        while (m_fault.kind == EFault::none && m_at < m_text.size()) {
            if (m_text[m_at] == '<')
                scanMarkup();
            else
                scanText();
        }
        if (m_fault.kind == EFault::none && m_depth > 0) fail(m_text.size());
        return m_fault;
    }

private:
    bool startsWith(std::string_view start) const { return m_text.substr(m_at, start.size()) == start; }
    // In any letter case; `word` is in lower case.
    bool startsWithWord(std::string_view word) const {
        const std::string_view start = m_text.substr(m_at, word.size());
        return std::equal(start.begin(), start.end(), word.begin(), word.end(),
                          [](char a, char b) { return a == b || (a >= 'A' && a <= 'Z' && a + 32 == b); });
    }
    char peek() const { return m_at < m_text.size() ? m_text[m_at] : '\0'; }
    void fail(size_t offset, EFault kind = EFault::syntax) { m_fault = {kind, offset}; }
    void skipBlanks() {
        while (m_at < m_text.size() && isBlank(m_text[m_at])) ++m_at;
    }
    bool skipName() {
        if (!startsName(m_text.substr(m_at))) return false;
        while (isNamePart(peek())) ++m_at;
        return true;
    }

    void scanText() {
        const size_t end = std::min(m_text.find('<', m_at), m_text.size());
        if (m_depth == 0) {
            skipBlanks();
            if (m_at < end) return fail(m_at);
        }
        checkReferences(m_at, end);
        m_at = end;
    }

    // Skips a construct that starts with `size` characters and ends with the first `end` after them.
    void skipUntil(size_t size, std::string_view end) {
        const size_t found = m_text.find(end, m_at + size);
        if (found == std::string_view::npos) return fail(m_at);
        m_at = found + end.size();
    }

    void scanMarkup() {
        if (startsWith("<!--")) return skipUntil(4, "-->");
        if (startsWith("<![CDATA[")) return m_depth > 0 ? skipUntil(9, "]]>") : fail(m_at);
        if (startsWith("<!")) return scanDocumentType();
        if (startsWith("<?")) return scanInstruction();
        if (startsWith("</")) return scanEndTag();
        scanStartTag();
    }

    // The parser ends it at the first ">", wherever that is.
    void scanDocumentType() {
        const size_t start = m_at;
        const size_t end = m_text.find('>', m_at);
        if (!startsWith("<!DOCTYPE") || m_depth > 0 || m_rootSeen || end == std::string_view::npos)
            return fail(start);
        const std::string_view body = m_text.substr(start, end - start);
        const auto count = [&](char ch) { return std::count(body.begin(), body.end(), ch); };
        if (count('[') > 0 || count('"') % 2 != 0 || count('\'') % 2 != 0) return fail(start);
        m_at = end + 1;
    }

    void scanInstruction() {
        const size_t start = m_at;
        skipUntil(2, "?>");
        if (m_fault.kind != EFault::none) return;
        const size_t end = m_at;
        m_at = start + 2;
        if (m_text.find('>', start) + 1 != end || (startsWithWord("xml") && !scanDeclaration(end - 2)))
            return fail(start);
        m_at = end;
    }

    // The parser takes every instruction that starts with "xml" for a declaration. From a malformed one it
    // reads on into the document, or it stops without an error and drops the rest.
    bool scanDeclaration(size_t end) {
        m_at += 3;
        if (peek() == '-')
            while (isNamePart(peek())) ++m_at;
        for (;;) {
            const size_t before = m_at;
            skipBlanks();
            if (m_at == end) return true;
            if (m_at == before || !scanDeclared(end)) return false;
        }
    }

    bool scanDeclared(size_t end) {
        if (!scanEquals()) return false;
        const size_t close = m_text.find(peek(), m_at + 1);
        if (close >= end) return false;
        const std::string_view value = m_text.substr(m_at + 1, close - m_at - 1);
        if (value.find_first_of("\"'<") != std::string_view::npos) return false;
        // The parser looks for these words after every blank, even within a value.
        for (; m_at < close; ++m_at)
            if (isBlank(m_text[m_at - 1]) &&
                (startsWithWord("version") || startsWithWord("encoding") || startsWithWord("standalone")))
                return false;
        ++m_at;
        return true;
    }

    void scanEndTag() {
        const size_t start = m_at;
        m_at += 2;
        const bool named = skipName();
        skipBlanks();
        if (!named || m_depth == 0 || peek() != '>') return fail(start);
        ++m_at;
        --m_depth;
    }

    void scanStartTag() {
        const size_t start = m_at++;
        if (!skipName() || (m_depth == 0 && m_rootSeen)) return fail(start);
        m_rootSeen = true;
        for (int32_t properties = 0;; ++properties) {
            const size_t before = m_at;
            skipBlanks();
            if (peek() == '>' || startsWith("/>")) break;
            if (m_at == before || !scanProperty()) return fail(m_at);
            if (m_fault.kind != EFault::none) return;
            if (properties == IXmlDocument::kMaxProperties) return fail(start, EFault::limit);
        }
        if (m_depth == IXmlDocument::kMaxDepth) return fail(start, EFault::limit);
        const bool empty = peek() == '/';
        m_at += empty ? 2 : 1;
        m_depth += empty ? 0 : 1;
    }

    // A name and "=", up to the quotation mark of the value.
    bool scanEquals() {
        if (!skipName()) return false;
        skipBlanks();
        if (peek() != '=') return false;
        ++m_at;
        skipBlanks();
        return peek() == '"' || peek() == '\'';
    }

    bool scanProperty() {
        if (!scanEquals()) return false;
        const size_t end = m_text.find(peek(), m_at + 1);
        if (end == std::string_view::npos) return false;
        if (std::memchr(m_text.data() + m_at, '<', end - m_at)) return false;
        checkReferences(m_at + 1, end);
        m_at = end + 1;
        return true;
    }

    void checkReferences(size_t start, size_t end) {
        const std::string_view range = m_text.substr(0, end);
        for (size_t at = start; (at = range.find('&', at)) != std::string_view::npos;) {
            const size_t size = measureReference(range.substr(at));
            if (size == 0) return fail(at);
            at += size;
        }
    }

    // Size in bytes of the reference at the start of the text; 0 if there is none.
    static size_t measureReference(std::string_view text) {
        if (text.substr(1, 1) == "#") return measureNumber(text);
        for (std::string_view known : {"&amp;", "&lt;", "&gt;", "&quot;", "&apos;"})
            if (text.substr(0, known.size()) == known) return known.size();
        return 0;
    }

    // The same for a numeric reference, which must denote an XML character.
    static size_t measureNumber(std::string_view text) {
        const bool hexadecimal = text.substr(2, 1) == "x";
        const char* digits = text.data() + (hexadecimal ? 3 : 2);
        const char* end = text.data() + text.size();
        uint32_t ch = 0;
        const auto [stop, error] = std::from_chars(std::min(digits, end), end, ch, hexadecimal ? 16 : 10);
        if (error != std::errc() || stop == end || *stop != ';') return 0;
        const bool control = ch < 0x20 && ch != '\t' && ch != '\n' && ch != '\r';
        const bool surrogate = ch >= 0xD800 && ch <= 0xDFFF;
        if (control || surrogate || ch == 0xFFFE || ch == 0xFFFF || ch > 0x10FFFF) return 0;
        return static_cast<size_t>(stop + 1 - text.data());
    }

    std::string_view m_text;
    size_t m_at = 0;
    int32_t m_depth = 0;
    bool m_rootSeen = false;
    SFault m_fault;
};

} // namespace

SFault check(std::string_view text) {
    const SFault fault = checkCharacters(text);
    return fault.kind != EFault::none ? fault : CScanner(text).run();
}

int32_t getLine(std::string_view text, size_t offset) {
    int32_t line = 1;
    for (size_t i = 0; i < std::min(offset, text.size()); ++i)
        line += text[i] == '\n' || (text[i] == '\r' && text.substr(i + 1, 1) != "\n");
    return line;
}

} // namespace peru::xml
