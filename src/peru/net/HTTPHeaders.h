// The header lines of a request or a response.
#pragma once

#include "peru/strings/IString.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace peru::net {

// ASCII letters only, as protocol texts need it.
PERU_API bool equalsIgnoreCase(std::string_view a, std::string_view b);
PERU_API std::string_view trimBlanks(std::string_view text); // blanks and tabs at both ends

// Pairs of name and value in order. The look-up ignores case and finds the first match.
class PERU_API CHTTPHeaders {
public:
    struct SHeader {
        std::string name;
        std::string value;
    };

    // Throws CInvalidArgError for a name that is not a token and for a value with a line end or another
    // control character: it would change the rest of the head.
    void add(const CStringArg& name, const CStringArg& value);
    // Replaces the first of that name and removes the others, or adds.
    void set(const CStringArg& name, const CStringArg& value);
    void remove(std::string_view name);
    // Adds text that was received and may be anything.
    void addReceived(std::string_view name, std::string_view value);
    // Appends to the value of the last header, as a folded line does.
    void extendLast(std::string_view value);

    std::optional<std::string_view> find(std::string_view name) const;
    P<IString> getValue(const CStringArg& name) const; // empty handle if there is none
    bool isEmpty() const { return m_headers.empty(); }
    auto begin() const { return m_headers.begin(); }
    auto end() const { return m_headers.end(); }

private:
    std::vector<SHeader> m_headers;
};

PERU_API bool isHTTPToken(std::string_view text);

} // namespace peru::net
